// Home directory discovery. The tests link the library statically, so the "module" whose folder
// is the fallback home is the test program, which the build places beside the catalogue.

#include "session/home_directories.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <optional>
#include <string>

#include "platform/environment.h"

namespace fs = std::filesystem;

namespace {

class ScopedEnv {
public:
    ScopedEnv(const char* name, const char* value) : name_(name) {
        if (const char* old = std::getenv(name)) {
            old_ = old;
        }
        if (value != nullptr) {
            ::setenv(name, value, 1);
        } else {
            ::unsetenv(name);
        }
    }
    ~ScopedEnv() {
        if (old_) {
            ::setenv(name_.c_str(), old_->c_str(), 1);
        } else {
            ::unsetenv(name_.c_str());
        }
    }

private:
    std::string name_;
    std::optional<std::string> old_;
};

std::string programFolder() { return fs::canonical("/proc/self/exe").parent_path().string() + "/"; }

std::optional<std::string> env(const char* name) {
    return zel::platform::getEnvironmentVariable(name);
}

TEST(ServerLibraryHome, VariableGetsATrailingSeparator) {
    ScopedEnv home("ZEL_SERVERAPI_HOME", "/opt/zel/x");
    EXPECT_EQ(zel::serverLibraryHomeDirectory(), "/opt/zel/x/");
}

TEST(ServerLibraryHome, VariableEndingInASeparatorIsTakenUnchanged) {
    ScopedEnv home("ZEL_SERVERAPI_HOME", "/opt/zel/x/");
    EXPECT_EQ(zel::serverLibraryHomeDirectory(), "/opt/zel/x/");
    ScopedEnv missing("ZEL_SERVERAPI_HOME", "relative/and/missing/");
    EXPECT_EQ(zel::serverLibraryHomeDirectory(), "relative/and/missing/");
}

TEST(ServerLibraryHome, UnsetOrEmptyVariableFallsBackToTheModuleFolder) {
    ScopedEnv unset("ZEL_SERVERAPI_HOME", nullptr);
    const std::string home = zel::serverLibraryHomeDirectory();
    EXPECT_EQ(home, programFolder());
    EXPECT_EQ(fs::canonical(home), fs::canonical(ZEL_TEST_OUTPUT_DIR));
    EXPECT_TRUE(fs::exists(fs::path(home) / "messages" / "zelserverapi.msg"));

    ScopedEnv empty("ZEL_SERVERAPI_HOME", "");
    EXPECT_EQ(zel::serverLibraryHomeDirectory(), programFolder());
}

TEST(ServerLibraryHome, ModuleFolderIsFoundAfterTheWorkingDirectoryChanges) {
    ScopedEnv unset("ZEL_SERVERAPI_HOME", nullptr);
    const fs::path before = fs::current_path();
    fs::current_path(fs::temp_directory_path());
    const std::string home = zel::serverLibraryHomeDirectory();
    fs::current_path(before);
    EXPECT_EQ(home, programFolder());
}

TEST(FrameworkHome, OverrideIsUsedOnceAndThenEmptied) {
    ScopedEnv override("ZEL_HOME_OVERRIDE", "/opt/override");
    ScopedEnv zelHome("ZEL_HOME", "/opt/zelhome");

    EXPECT_EQ(zel::frameworkHomeDirectory("/opt/caller"), "/opt/override/");
    EXPECT_EQ(env("ZEL_HOME_OVERRIDE"), std::optional<std::string>(""));
    EXPECT_EQ(env("ZEL_HOME"), std::optional<std::string>("/opt/override/"));

    // Used up: the caller's folder is next in line.
    EXPECT_EQ(zel::frameworkHomeDirectory("/opt/caller/"), "/opt/caller/");
    EXPECT_EQ(env("ZEL_HOME"), std::optional<std::string>("/opt/caller/"));
}

TEST(FrameworkHome, CallerFolderComesBeforeZelHome) {
    ScopedEnv override("ZEL_HOME_OVERRIDE", nullptr);
    ScopedEnv zelHome("ZEL_HOME", "/opt/zelhome");
    EXPECT_EQ(zel::frameworkHomeDirectory("/opt/caller"), "/opt/caller/");
}

TEST(FrameworkHome, ZelHomeIsUsedWithoutOverrideOrCaller) {
    ScopedEnv override("ZEL_HOME_OVERRIDE", "");
    ScopedEnv zelHome("ZEL_HOME", "/opt/zelhome");
    EXPECT_EQ(zel::frameworkHomeDirectory(), "/opt/zelhome/");
    EXPECT_EQ(env("ZEL_HOME"), std::optional<std::string>("/opt/zelhome/"));
}

TEST(FrameworkHome, ModuleFolderWhenNothingIsSetAndTheResultIsKept) {
    ScopedEnv override("ZEL_HOME_OVERRIDE", nullptr);
    ScopedEnv zelHome("ZEL_HOME", nullptr);
    EXPECT_EQ(zel::frameworkHomeDirectory(), programFolder());
    EXPECT_EQ(env("ZEL_HOME"), std::optional<std::string>(programFolder()));

    // A later search that finds nothing new keeps the earlier result, even with ZEL_HOME gone.
    ::unsetenv("ZEL_HOME");
    EXPECT_EQ(zel::frameworkHomeDirectory(), programFolder());
}

TEST(FrameworkHome, AnEarlierResultOutlivesItsSource) {
    ScopedEnv override("ZEL_HOME_OVERRIDE", nullptr);
    ScopedEnv zelHome("ZEL_HOME", nullptr);
    EXPECT_EQ(zel::frameworkHomeDirectory("/opt/once"), "/opt/once/");
    ::unsetenv("ZEL_HOME");
    EXPECT_EQ(zel::frameworkHomeDirectory(), "/opt/once/");
}

TEST(Platform, FileProbesAndEnvironment) {
    std::string pattern = (fs::temp_directory_path() / "zel-probe-XXXXXX").string();
    const fs::path folder = ::mkdtemp(pattern.data());
    const std::string sep(1, zel::platform::kPathSeparator);

    EXPECT_TRUE(zel::platform::findFirstFile(folder.string() + sep + "*"));
    EXPECT_FALSE(zel::platform::findFirstFile(folder.string() + sep + "messages" + sep + "*"));
    EXPECT_FALSE(zel::platform::findFirstFile(folder.string() + sep + "file"));
    std::ofstream(folder / "file") << "x";
    EXPECT_TRUE(zel::platform::findFirstFile(folder.string() + sep + "file"));
    fs::remove_all(folder);

    EXPECT_EQ(zel::platform::readMachineRegistryString("SOFTWARE\\Corvane\\Quorlith", "ZEL_HOME"),
              "");

    ScopedEnv cleanup("ZEL_TEST_VARIABLE", nullptr);
    EXPECT_EQ(env("ZEL_TEST_VARIABLE"), std::nullopt);
    EXPECT_TRUE(zel::platform::setEnvironmentVariable("ZEL_TEST_VARIABLE", ""));
    EXPECT_EQ(env("ZEL_TEST_VARIABLE"), std::optional<std::string>(""));
    EXPECT_TRUE(zel::platform::setEnvironmentVariable("ZEL_TEST_VARIABLE", "v"));
    EXPECT_EQ(env("ZEL_TEST_VARIABLE"), std::optional<std::string>("v"));
}

}  // namespace
