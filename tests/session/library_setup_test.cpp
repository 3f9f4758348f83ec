// What the library sets up around a session: connection information, home directories, the entry
// points it exports, and the out-of-memory entry point.

#include <gtest/gtest.h>
#include <zelserverapi/zelserverapi.h>

#include <algorithm>
#include <cstdio>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/heap.h"
#include "platform/environment.h"
#include "session/ZELServerConnectionInfo.h"
#include "session/home_directories.h"
#include "support/environment.h"
#include "support/platform.h"

namespace zel {
namespace {

using namespace std::string_literals;
using Info = ZELServerConnectionInfo;
using Str = ZELServerString;
using List = std::vector<std::string>;

TEST(ConnectionInfo, WebAddressesGiveHostAndPort)
{
    const struct {
        const char* address;
        const char* host;
        unsigned short port;
    } cases[] = {
        {"https://srv/x", "srv", 443},       {"https://srv:8443/x", "srv", 8443},
        {"https://srv:81x", "srv", 80},       // a bad explicit port never falls back to 443
        {"http://srv:70000/x", "srv", 4464},  // only the low 16 bits of a port are kept
        {"http://h/p:1", "h/p", 1},           // the colon is searched before the slash
        {"HTTP://srv", "HTTP://srv", 80},     // no scheme: the whole text is the host
    };
    for (const auto& c : cases) {
        const Info info(Str(c.address), ZELServerStringArray(List{}));
        Str host("stale");
        info.getHost(host);
        EXPECT_EQ(host.str(), c.host) << c.address;
        EXPECT_EQ(info.getPort(), c.port) << c.address;
    }
}

TEST(ConnectionInfo, AuthenticationKindFollowsThePropertyKeysAndTheFirstValueWins)
{
    const struct {
        List properties;
        unsigned kind;
    } cases[] = {
        {{"SSO_AUTH_DATA", ""}, kSingleSignOnAuthentication},
        {{"USER_TOKEN", "t1"}, kTokenAuthentication},
        {{"USER_TOKEN", "t1", "SSO_AUTH_DATA", "d"}, kSingleSignOnAuthentication},
        {{"CLIENT_ID", "c1", "USER_TOKEN"}, kPropertyAuthentication},           // a key without value is no key
        {{"user_token", "t1", "sso_auth_data", "d"}, kPropertyAuthentication},  // keys are exact bytes
    };
    for (const auto& c : cases) {
        EXPECT_EQ(Info(Str("srv"), 7071, ZELServerStringArray(c.properties)).getAuthenticationKind(), c.kind);
        EXPECT_EQ(Info(Str("http://srv"), ZELServerStringArray(c.properties)).getAuthenticationKind(), c.kind);
    }
    const Info info(Str("srv"), 1, ZELServerStringArray(List{"CLIENT_ID", "c1", "V", "a\0b"s, "CLIENT_ID", "c2"}));
    Str value("untouched");
    EXPECT_FALSE(info.getProperty(Str("client_id"), value));
    EXPECT_EQ(value.str(), "untouched");
    EXPECT_TRUE(info.getProperty(Str("CLIENT_ID\0junk"s), value));
    EXPECT_EQ(value.str(), "c1");
    EXPECT_TRUE(info.getProperty(Str("V"), value));
    EXPECT_EQ(value.str(), "a\0b"s);

    // The credential forms hold no properties, whatever the user name says.
    const Info named(Str("http://srv"), Str("SSO_AUTH_DATA"), Str("x"));
    EXPECT_FALSE(named.getProperty(Str("SSO_AUTH_DATA"), value));
    EXPECT_EQ(named.getAuthenticationKind(), kPasswordAuthentication);
}

// Home directory discovery. The tests link the library statically, so the "module" whose folder
// is the fallback home is the test program, which the build places beside the catalogue. The
// Windows-only lookups (a loaded DLL) are in home_directories_windows_test.cpp.

using zeltest::ScopedEnv;

// A rooted folder name in the platform's own notation: "/opt/x" here, "\opt\x" on Windows.
std::string native(std::string path)
{
    std::replace(path.begin(), path.end(), '/', zel::platform::kPathSeparator);
    return path;
}

TEST(HomeDirectories, LibraryHomeIsTheVariableWithASeparatorOrTheModuleFolder)
{
    for (const char* value : {"/opt/zel/x", "/opt/zel/x/"}) {
        ScopedEnv home("ZEL_SERVERAPI_HOME", native(value));
        EXPECT_EQ(zel::serverLibraryHomeDirectory(), native("/opt/zel/x/")) << value;
    }
    ScopedEnv empty("ZEL_SERVERAPI_HOME", "");
    EXPECT_EQ(zel::serverLibraryHomeDirectory(), zeltest::programFolder());
}

TEST(HomeDirectories, FrameworkHomeIsTheModuleFolderWhenNothingIsSet)
{
    if (zeltest::kWindows) {
        GTEST_SKIP() << "Windows has a framework module of its own and the registry behind it";
    }
    ScopedEnv override("ZEL_HOME_OVERRIDE", nullptr);
    ScopedEnv zelHome("ZEL_HOME", nullptr);
    EXPECT_EQ(zel::frameworkHomeDirectory(), zeltest::programFolder());
    EXPECT_EQ(zel::platform::getEnvironmentVariable("ZEL_HOME"), zeltest::programFolder());
}

// The shared library must export its three entry points and nothing else: any other symbol would
// become part of the binary interface that clients can bind to.
#if !defined(_WIN32)  // the DLL's exports: the zel_dll_exports test
// The defined dynamic symbols of a shared object, as nm lists them. Version definition entries (type
// A, absolute) name the version node, not code or data.
std::set<std::string> exportedSymbols(const std::string& library)
{
    const std::string command =
        "nm -D --defined-only --format=posix '" + library + "' | awk '$2 != \"A\" { print $1 }'";
    const std::unique_ptr<FILE, int (*)(FILE*)> pipe(::popen(command.c_str(), "r"), ::pclose);
    std::set<std::string> names;
    char name[4096];
    while (pipe && std::fscanf(pipe.get(), "%4095s", name) == 1) {
        names.insert(name);
    }
    return names;
}

TEST(Exports, ExactlyTheThreeEntryPoints)
{
    // The build puts the shared library beside the test programs, under the name it is loaded by.
    const std::string library = zeltest::programFolder() + zel::platform::kLibraryModuleName;
    const std::set<std::string> expected = {"ZEL_createServerSession", "ZEL_destroyServerSession",
                                            "DllSetMemoryErrorHandler"};
    EXPECT_EQ(exportedSymbols(library), expected);
}
#endif

// The out-of-memory entry point. The routine ends the process, so every report is checked in a
// death test: the sink writes what it is given to standard error, which the death test matches.

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
}  // namespace zel
