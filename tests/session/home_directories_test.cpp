// Home directory discovery. The tests link the library statically, so the "module" whose folder
// is the fallback home is the test program, which the build places beside the catalogue. The
// Windows-only lookups (registry, a loaded DLL) are in home_directories_windows_test.cpp.

#include "session/home_directories.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <optional>
#include <string>

#include "platform/environment.h"
#include "support/environment.h"
#include "support/platform.h"

namespace fs = std::filesystem;

namespace {

using zeltest::ScopedEnv;

const std::string kSep(1, zel::platform::kPathSeparator);

// A rooted folder name in the platform's own notation: "/opt/x" here, "\opt\x" on Windows, where
// only a backslash counts as the separator a home directory must end in.
std::string native(std::string path)
{
    std::replace(path.begin(), path.end(), '/', zel::platform::kPathSeparator);
    return path;
}

std::optional<std::string> env(const char* name) { return zel::platform::getEnvironmentVariable(name); }

TEST(ServerLibraryHome, VariableGetsATrailingSeparatorUnlessItEndsInOne)
{
    const struct {
        const char* value;
        const char* home;
    } cases[] = {
        {"/opt/zel/x", "/opt/zel/x/"},
        {"/opt/zel/x/", "/opt/zel/x/"},
        {"relative/and/missing/", "relative/and/missing/"},
    };
    for (const auto& c : cases) {
        ScopedEnv home("ZEL_SERVERAPI_HOME", native(c.value));
        EXPECT_EQ(zel::serverLibraryHomeDirectory(), native(c.home)) << c.value;
    }
}

TEST(ServerLibraryHome, UnsetOrEmptyVariableFallsBackToTheModuleFolder)
{
    ScopedEnv unset("ZEL_SERVERAPI_HOME", nullptr);
    EXPECT_EQ(zel::serverLibraryHomeDirectory(), zeltest::programFolder());
    EXPECT_TRUE(fs::exists(fs::path(zeltest::programFolder()) / "messages" / "zelserverapi.msg"));
    // Also after the working directory changes.
    const fs::path before = fs::current_path();
    fs::current_path(fs::temp_directory_path());
    const std::string home = zel::serverLibraryHomeDirectory();
    fs::current_path(before);
    EXPECT_EQ(home, zeltest::programFolder());

    ScopedEnv empty("ZEL_SERVERAPI_HOME", "");
    EXPECT_EQ(zel::serverLibraryHomeDirectory(), zeltest::programFolder());
}

TEST(FrameworkHome, OverrideIsUsedOnceAndThenEmptied)
{
    ScopedEnv override("ZEL_HOME_OVERRIDE", native("/opt/override"));
    ScopedEnv zelHome("ZEL_HOME", native("/opt/zelhome"));

    EXPECT_EQ(zel::frameworkHomeDirectory(native("/opt/caller")), native("/opt/override/"));
    EXPECT_EQ(env("ZEL_HOME_OVERRIDE"), std::optional<std::string>(""));
    EXPECT_EQ(env("ZEL_HOME"), native("/opt/override/"));

    // Used up: the caller's folder is next in line.
    EXPECT_EQ(zel::frameworkHomeDirectory(native("/opt/caller/")), native("/opt/caller/"));
    EXPECT_EQ(env("ZEL_HOME"), native("/opt/caller/"));
}

TEST(FrameworkHome, CallerFolderComesBeforeZelHomeWhichIsUsedWithoutOverrideOrCaller)
{
    ScopedEnv override("ZEL_HOME_OVERRIDE", "");
    ScopedEnv zelHome("ZEL_HOME", native("/opt/zelhome"));
    EXPECT_EQ(zel::frameworkHomeDirectory(native("/opt/caller")), native("/opt/caller/"));
    zeltest::setEnv("ZEL_HOME", native("/opt/zelhome"));
    EXPECT_EQ(zel::frameworkHomeDirectory(), native("/opt/zelhome/"));
    EXPECT_EQ(env("ZEL_HOME"), native("/opt/zelhome/"));
}

TEST(FrameworkHome, ModuleFolderWhenNothingIsSetAndTheResultIsKept)
{
    if (zeltest::kWindows) {
        GTEST_SKIP() << "Windows has a framework module of its own and the registry behind it";
    }
    ScopedEnv override("ZEL_HOME_OVERRIDE", nullptr);
    ScopedEnv zelHome("ZEL_HOME", nullptr);
    EXPECT_EQ(zel::frameworkHomeDirectory(), zeltest::programFolder());
    EXPECT_EQ(env("ZEL_HOME"), zeltest::programFolder());

    // A later search that finds nothing new keeps the earlier result, even with ZEL_HOME gone.
    zeltest::setEnv("ZEL_HOME", std::nullopt);
    EXPECT_EQ(zel::frameworkHomeDirectory(), zeltest::programFolder());
}

TEST(Platform, FileProbes)
{
    const zeltest::TempDir temp("zel-probe");
    const std::string folder = temp.string();

    EXPECT_TRUE(zel::platform::findFirstFile(folder + kSep + "*"));
    EXPECT_FALSE(zel::platform::findFirstFile(folder + kSep + "messages" + kSep + "*"));
    EXPECT_FALSE(zel::platform::findFirstFile(folder + kSep + "file"));
    std::ofstream(temp.path() / "file") << "x";
    EXPECT_TRUE(zel::platform::findFirstFile(folder + kSep + "file"));
    fs::create_directory(temp.path() / "messages");
    EXPECT_TRUE(zel::platform::findFirstFile(folder + kSep + "messages" + kSep + "*"));
}

TEST(Platform, EnvironmentKeepsEmptyValuesDefinedAndWithoutARegistryValuesAreEmpty)
{
    ScopedEnv cleanup("ZEL_TEST_VARIABLE", nullptr);
    EXPECT_EQ(env("ZEL_TEST_VARIABLE"), std::nullopt);
    EXPECT_TRUE(zel::platform::setEnvironmentVariable("ZEL_TEST_VARIABLE", ""));
    EXPECT_EQ(env("ZEL_TEST_VARIABLE"), std::optional<std::string>(""));
    EXPECT_TRUE(zel::platform::setEnvironmentVariable("ZEL_TEST_VARIABLE", "v"));
    EXPECT_EQ(env("ZEL_TEST_VARIABLE"), std::optional<std::string>("v"));
    if (!zeltest::kWindows) {  // Windows has a registry; its values are read in the Windows-only cases
        EXPECT_EQ(zel::platform::readMachineRegistryString("SOFTWARE\\Corvane\\Quorlith", "ZEL_HOME"), "");
    }
}

}  // namespace
