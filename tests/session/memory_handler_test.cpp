// The out-of-memory entry point. The routine ends the process, so every report is checked in a
// death test: the sink appends what it is given to a file, which the test reads once the child
// process has gone.

#include <gtest/gtest.h>
#include <zelserverapi/zelserverapi.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <optional>
#include <string>

#include "api/heap.h"
#include "support/environment.h"
#include "support/helpers.h"

namespace fs = std::filesystem;

namespace {

const std::string kReport = "Insufficient memory available -- error code was 12. Offending plug-in is '";

// Appends "<severity>|<message>\n" to a file per message. With `failWhileWriting` set it runs out
// of memory itself while writing, the way a host's log can when the whole process is short.
class FileSink : public IZELLogSink {
public:
    explicit FileSink(std::string path, bool failWhileWriting = false)
        : path_(std::move(path)), failWhileWriting_(failWhileWriting)
    {}

    void setSeverityThreshold(int severity) override { threshold_ = severity; }
    int getSeverityThreshold() const override { return threshold_; }
    void flush() override {}
    void logMessageString(const char* message, int severity) override
    {
        if (std::FILE* file = std::fopen(path_.c_str(), "ab")) {
            std::fprintf(file, "%d|%s\n", severity, message);
            std::fclose(file);
        }
        if (failWhileWriting_) {
            zel::heap::failNextAllocations(1);
            zel::heap::allocate(64);
        }
    }

private:
    std::string path_;
    bool failWhileWriting_;
    int threshold_ = 0;
};

// A death test's child is on Windows this program started once more, not a fork, so it runs the
// fixture again; it finds the parent's report file through the environment instead of making its
// own.
constexpr const char* kReportVariable = "ZEL_TEST_OOM_REPORT";

class MemoryHandler : public ::testing::Test {
protected:
    MemoryHandler()
    {
        if (std::optional<std::string> inherited = zeltest::getEnv(kReportVariable)) {
            path_ = *inherited;
        } else {
            folder_.emplace("zel-oom");
            path_ = (folder_->path() / "report").string();
            variable_.emplace(kReportVariable, path_);
        }
    }
    ~MemoryHandler() override { zel::heap::setFailureRoutine(nullptr); }

    static void exhaust()
    {
        zel::heap::failNextAllocations(1);
        zel::heap::allocate(32);
    }

    std::optional<zeltest::TempDir> folder_;
    std::optional<zeltest::ScopedEnv> variable_;
    std::string path_;
};

// How the routine is set up before the heap runs out, and the one report expected afterwards.
struct ReportCase {
    const char* what;
    enum { kSink, kFailingSink, kNoSink } sink;
    const char* earlierName;  // set first, then replaced by `name`
    std::string name;
    std::string report;
};

class MemoryReport : public MemoryHandler, public ::testing::WithParamInterface<ReportCase> {};

TEST_P(MemoryReport, IsSentOnceAndTheProcessExitsWithOne)
{
    const ReportCase& c = GetParam();
    EXPECT_EXIT(
        {
            // A failing sink runs out of memory itself while it writes the first report.
            FileSink sink(path_, c.sink == ReportCase::kFailingSink);
            IZELLogSink* used = c.sink == ReportCase::kNoSink ? nullptr : &sink;
            if (c.earlierName != nullptr) {
                DllSetMemoryErrorHandler(used, c.earlierName);
            }
            DllSetMemoryErrorHandler(used, c.name == "(null)" ? nullptr : c.name.c_str());
            exhaust();
        },
        ::testing::ExitedWithCode(1), "");
    EXPECT_EQ(zeltest::slurp(path_), c.report);
}

const ReportCase kReportCases[] = {
    {"long name cut to 200", ReportCase::kSink, nullptr, std::string(199, 'a') + "bc" + std::string(49, 'd'),
     "3|" + kReport + std::string(199, 'a') + "b'\n"},
    {"null name reported empty", ReportCase::kSink, "earlier name", "(null)", "3|" + kReport + "'\n"},
    {"second report not sent", ReportCase::kFailingSink, nullptr, "p", "3|" + kReport + "p'\n"},
    {"no sink, no report", ReportCase::kNoSink, nullptr, "quiet", ""},
};

INSTANTIATE_TEST_SUITE_P(Table, MemoryReport, ::testing::ValuesIn(kReportCases),
                         [](const auto& info) { return "case" + std::to_string(info.index); });

TEST_F(MemoryHandler, ReturnsThePreviousRoutine)
{
    const ZELMemoryFailureRoutine own = [](int) {};
    EXPECT_EQ(zel::heap::setFailureRoutine(own), nullptr);

    EXPECT_EQ(DllSetMemoryErrorHandler(nullptr, "first"), own);
    const ZELMemoryFailureRoutine library = DllSetMemoryErrorHandler(nullptr, "second");
    EXPECT_NE(library, own);
    EXPECT_EQ(zel::heap::setFailureRoutine(nullptr), library);
}

}  // namespace
