#include "platform/environment.h"

#include <dirent.h>
#include <dlfcn.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <vector>

namespace zel::platform {
namespace {

// Any function of the library itself: dladdr on it names the object the library's code lives in,
// the shared library when loaded as one, the program when linked statically.
void moduleAnchor() {}

std::string selfExecutablePath()
{
    std::vector<char> buffer(4096);
    const ssize_t length = ::readlink("/proc/self/exe", buffer.data(), buffer.size() - 1);
    return length > 0 ? std::string(buffer.data(), static_cast<std::size_t>(length)) : std::string();
}

}  // namespace

std::optional<std::string> getEnvironmentVariable(const char* name)
{
    const char* value = std::getenv(name);
    if (value == nullptr) {
        return std::nullopt;
    }
    return std::string(value);
}

bool setEnvironmentVariable(const char* name, const std::string& value)
{
    return ::setenv(name, value.c_str(), 1) == 0;
}

void putRuntimeEnvironmentEntry(char* entry) { ::putenv(entry); }

std::string libraryModulePath()
{
    Dl_info info{};
    if (::dladdr(reinterpret_cast<void*>(&moduleAnchor), &info) == 0 || info.dli_fname == nullptr ||
        info.dli_fname[0] == '\0') {
        return selfExecutablePath();
    }
    const std::string name = info.dli_fname;
    if (name.front() == '/') {
        return name;
    }
    // The program itself is reported by the name it was started with, which need not be a path
    // at all; the kernel knows the real one.
    if (name.find('/') == std::string::npos) {
        return selfExecutablePath();
    }
    char* resolved = ::realpath(name.c_str(), nullptr);
    if (resolved == nullptr) {
        return selfExecutablePath();
    }
    std::string path = resolved;
    std::free(resolved);
    return path;
}

std::string frameworkModulePath() { return libraryModulePath(); }

bool findFirstFile(const std::string& pattern)
{
    if (!pattern.empty() && pattern.back() == '*') {
        const std::string folder = pattern.substr(0, pattern.size() - 1);
        DIR* directory = ::opendir(folder.empty() ? "." : folder.c_str());
        if (directory == nullptr) {
            return false;
        }
        ::closedir(directory);
        return true;
    }
    struct stat info {};
    return ::stat(pattern.c_str(), &info) == 0;
}

NewFile createNewFile(const std::string& path, std::FILE** writer)
{
    const int fd = ::open(path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0666);
    if (fd < 0) {
        return errno == EEXIST ? NewFile::Exists : NewFile::Failed;
    }
    if (writer == nullptr) {
        return ::close(fd) == 0 ? NewFile::Created : NewFile::Failed;
    }
    *writer = ::fdopen(fd, "wb");
    if (*writer == nullptr) {
        ::close(fd);
        ::unlink(path.c_str());
        return NewFile::Failed;
    }
    return NewFile::Created;
}

std::string readMachineRegistryString(const char* /*keyPath*/, const char* /*valueName*/) { return std::string(); }

}  // namespace zel::platform
