#include "session/home_directories.h"

#include <mutex>
#include <optional>

#include "platform/environment.h"

namespace zel {
namespace {

using platform::kPathSeparator;

constexpr unsigned kBuildNumber = 18286;
constexpr const char* kProductKey = "SOFTWARE\\Corvane\\Quorlith";

std::string nonEmptyVariable(const char* name)
{
    return platform::getEnvironmentVariable(name).value_or(std::string());
}

// The folder of a module, its separator kept.
std::string folderOf(const std::string& modulePath)
{
    const std::size_t cut = modulePath.find_last_of(kPathSeparator);
    return cut == std::string::npos ? std::string() : modulePath.substr(0, cut + 1);
}

// The module's own file name; the expected name when the module could not be found at all. (When
// the library is linked into a program, the module is the program.)
std::string fileNameOf(const std::string& modulePath, const char* expectedName)
{
    const std::size_t cut = modulePath.find_last_of(kPathSeparator);
    return cut == std::string::npos || cut + 1 == modulePath.size() ? std::string(expectedName)
                                                                    : modulePath.substr(cut + 1);
}

// The folder already ends in a separator; the doubled separator that follows is harmless to a file
// search.
bool moduleFolderLooksInstalled(const std::string& folder, const std::string& moduleFileName)
{
    const std::string prefix = folder + kPathSeparator;
    if (platform::findFirstFile(prefix + moduleFileName)) {
        return true;
    }
    return platform::findFirstFile(prefix + "messages" + kPathSeparator + "*");
}

void ensureTrailingSeparator(std::string& directory)
{
    if (directory.empty() || directory.back() != kPathSeparator) {
        directory += kPathSeparator;
    }
}

std::string registryHome()
{
    const std::string buildKey = std::string(kProductKey) + "\\BUILD" + "\\" + std::to_string(kBuildNumber);
    std::string home = platform::readMachineRegistryString(buildKey.c_str(), "ZEL_HOME");
    if (home.empty()) {
        home = platform::readMachineRegistryString(kProductKey, "ZEL_HOME");
    }
    return home;
}

// Process-wide state of the framework home search.
std::mutex frameworkHomeMutex;
std::string frameworkHome;
std::once_flag runtimeEntryOnce;
// The C runtime keeps a pointer to the entry it is given, so the entry lives for the process; it is
// built from the first search's result only.
char* runtimeEntry = nullptr;

void publishFrameworkHome(const std::string& home)
{
    std::call_once(runtimeEntryOnce, [&home] {
        static std::string entry = "ZEL_HOME=" + home;
        runtimeEntry = entry.data();
    });
    platform::putRuntimeEnvironmentEntry(runtimeEntry);
    platform::setEnvironmentVariable("ZEL_HOME", home);
}

}  // namespace

std::string serverLibraryHomeDirectory()
{
    std::string home = nonEmptyVariable("ZEL_SERVERAPI_HOME");
    if (home.empty()) {
        const std::string modulePath = platform::libraryModulePath();
        home = folderOf(modulePath);
        // The module's folder is the home whatever the probe finds: a missing catalogue shows up
        // later, as the fallback text of every status, rather than as a home somewhere else.
        moduleFolderLooksInstalled(home, fileNameOf(modulePath, platform::kLibraryModuleName));
    }
    ensureTrailingSeparator(home);
    return home;
}

std::string frameworkHomeDirectory(const std::string& callerDirectory)
{
    std::lock_guard<std::mutex> lock(frameworkHomeMutex);

    const std::string overrideHome = nonEmptyVariable("ZEL_HOME_OVERRIDE");
    if (!overrideHome.empty()) {
        frameworkHome = overrideHome;
        platform::setEnvironmentVariable("ZEL_HOME_OVERRIDE", std::string());
    } else if (!callerDirectory.empty()) {
        frameworkHome = callerDirectory;
    } else if (std::string fromEnvironment = nonEmptyVariable("ZEL_HOME"); !fromEnvironment.empty()) {
        frameworkHome = fromEnvironment;
    }

    if (frameworkHome.empty()) {
        const std::string modulePath = platform::frameworkModulePath();
        const std::string moduleFolder = folderOf(modulePath);
        if (!moduleFolderLooksInstalled(moduleFolder, fileNameOf(modulePath, platform::kFrameworkModuleName))) {
            frameworkHome = registryHome();
        }
        if (frameworkHome.empty()) {
            frameworkHome = moduleFolder;
        }
    }
    ensureTrailingSeparator(frameworkHome);

    publishFrameworkHome(frameworkHome);
    // The family's date-time library would be told its time-zone data lies under
    // home + "datetime" + separator + "tzdata" here; this build carries no date-time library, so
    // there is nothing to tell.
    return frameworkHome;
}

}  // namespace zel
