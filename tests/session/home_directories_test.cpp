// Home directory discovery. The tests link the library statically, so the "module" whose folder
// is the fallback home is the test program, which the build places beside the catalogue. The
// Windows-only lookups (a loaded DLL) are in home_directories_windows_test.cpp.

#include "session/home_directories.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <optional>
#include <string>

#include "platform/environment.h"
#include "support/environment.h"
#include "support/platform.h"

namespace {

using zeltest::ScopedEnv;

// A rooted folder name in the platform's own notation: "/opt/x" here, "\opt\x" on Windows.
std::string native(std::string path)
{
    std::replace(path.begin(), path.end(), '/', zel::platform::kPathSeparator);
    return path;
}

std::optional<std::string> env(const char* name) { return zel::platform::getEnvironmentVariable(name); }

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
    EXPECT_EQ(env("ZEL_HOME"), zeltest::programFolder());
}

}  // namespace
