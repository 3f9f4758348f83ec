// The out-of-memory entry point. The routine ends the process, so every report is checked in a
// death test: the sink writes what it is given to standard error, which the death test matches.

#include <gtest/gtest.h>
#include <zelserverapi/zelserverapi.h>

#include <cstdio>
#include <string>

#include "api/heap.h"

namespace {

// Writes "<severity>:<message>" to standard error. With `failWhileWriting` set it runs out of memory
// itself while writing, the way a host's log can when the whole process is short.
struct StderrSink : IZELLogSink {
    explicit StderrSink(bool failWhileWriting) : failWhileWriting(failWhileWriting) {}
    void setSeverityThreshold(int) override {}
    int getSeverityThreshold() const override { return 0; }
    void flush() override {}
    void logMessageString(const char* message, int severity) override
    {
        std::fprintf(stderr, "%d:%s\n", severity, message);
        std::fflush(stderr);
        if (failWhileWriting) {
            zel::heap::failNextAllocations(1);
            zel::heap::allocate(64);
        }
    }
    bool failWhileWriting;
};

TEST(MemoryHandler, TheFirstExhaustionIsReportedOnceAndEndsTheProcessWithOne)
{
    const std::string report = "^3:Insufficient memory available -- error code was 12. Offending plug-in is '";
    const std::string longName = std::string(199, 'a') + "bc";
    const struct {
        bool sink;
        bool failingSink;  // runs out of memory itself while it writes the first report
        const char* earlierName;
        const char* name;
        std::string expected;  // what standard error holds
    } cases[] = {
        {true, false, nullptr, "converter", report + "converter'\n$"},
        {true, false, nullptr, longName.c_str(), report + longName.substr(0, 200) + "'\n$"},
        {true, false, "earlier name", nullptr, report + "'\n$"},
        {true, true, nullptr, "p", report + "p'\n$"},
        {false, false, nullptr, "quiet", "^$"},
    };
    for (const auto& c : cases) {
        EXPECT_EXIT(
            {
                StderrSink sink(c.failingSink);
                if (c.earlierName != nullptr) {
                    DllSetMemoryErrorHandler(&sink, c.earlierName);
                }
                DllSetMemoryErrorHandler(c.sink ? &sink : nullptr, c.name);
                zel::heap::failNextAllocations(1);
                zel::heap::allocate(32);
            },
            ::testing::ExitedWithCode(1), c.expected);
    }
}

TEST(MemoryHandler, ReturnsThePreviousRoutine)
{
    const ZELMemoryFailureRoutine own = [](int) {};
    EXPECT_EQ(zel::heap::setFailureRoutine(own), nullptr);
    EXPECT_EQ(DllSetMemoryErrorHandler(nullptr, "first"), own);
    const ZELMemoryFailureRoutine library = DllSetMemoryErrorHandler(nullptr, "second");
    EXPECT_NE(library, own);
    EXPECT_EQ(zel::heap::setFailureRoutine(nullptr), library);
}

}  // namespace
