#include "platform/environment.h"

#ifndef WIN32_LEAN_AND_MEAN
#define WIN32_LEAN_AND_MEAN
#endif
#ifndef NOMINMAX
#define NOMINMAX
#endif
#include <windows.h>

#include <fcntl.h>
#include <io.h>

#include <cstdint>
#include <cstdlib>
#include <vector>

namespace zel::platform {
namespace {

// The module file name is read into a fixed buffer of 1024 bytes, as the installers of the product
// family never place the libraries deeper than that.
constexpr DWORD kModuleNameBufferSize = 1024;

std::string moduleFileName(HMODULE module)
{
    if (module == nullptr) {
        return std::string();
    }
    char buffer[kModuleNameBufferSize] = {};
    const DWORD length = ::GetModuleFileNameA(module, buffer, kModuleNameBufferSize);
    if (length == 0 || length >= kModuleNameBufferSize) {
        return std::string();
    }
    return std::string(buffer, length);
}

std::string moduleFileName(const char* moduleName) { return moduleFileName(::GetModuleHandleA(moduleName)); }

// Any function of the library itself: the module that contains it is the one the library's code
// was loaded with.
void moduleAnchor() {}

// With the library linked into a program there is no module of the library's name; its code then
// lives in the program, whose folder is the home, as on POSIX.
std::string moduleHoldingThisCode()
{
    HMODULE module = nullptr;
    if (!::GetModuleHandleExA(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
                              reinterpret_cast<LPCSTR>(&moduleAnchor), &module)) {
        return std::string();
    }
    return moduleFileName(module);
}

}  // namespace

std::optional<std::string> getEnvironmentVariable(const char* name)
{
    std::vector<char> buffer(2048);
    for (;;) {
        ::SetLastError(ERROR_SUCCESS);
        const DWORD length = ::GetEnvironmentVariableA(name, buffer.data(), static_cast<DWORD>(buffer.size()));
        if (length == 0) {
            // Zero is both "not defined" and "defined but empty"; only the error code tells them
            // apart.
            if (::GetLastError() == ERROR_ENVVAR_NOT_FOUND) {
                return std::nullopt;
            }
            return std::string();
        }
        if (length < buffer.size()) {
            return std::string(buffer.data(), length);
        }
        // Too small: the result is the size needed, terminating NUL included.
        buffer.resize(length);
    }
}

bool setEnvironmentVariable(const char* name, const std::string& value)
{
    return ::SetEnvironmentVariableA(name, value.c_str()) != FALSE;
}

void putRuntimeEnvironmentEntry(char* entry) { ::_putenv(entry); }

std::string libraryModulePath()
{
    const std::string byName = moduleFileName(kLibraryModuleName);
    return byName.empty() ? moduleHoldingThisCode() : byName;
}

std::string frameworkModulePath() { return moduleFileName(kFrameworkModuleName); }

bool findFirstFile(const std::string& pattern)
{
    WIN32_FIND_DATAA data{};
    HANDLE found = ::FindFirstFileA(pattern.c_str(), &data);
    if (found == INVALID_HANDLE_VALUE) {
        return false;
    }
    ::FindClose(found);
    return true;
}

NewFile createNewFile(const std::string& path, std::FILE** writer)
{
    HANDLE file = ::CreateFileA(path.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_NEW, FILE_ATTRIBUTE_NORMAL, nullptr);
    if (file == INVALID_HANDLE_VALUE) {
        const DWORD error = ::GetLastError();
        return error == ERROR_FILE_EXISTS || error == ERROR_ALREADY_EXISTS ? NewFile::Exists : NewFile::Failed;
    }
    if (writer == nullptr) {
        return ::CloseHandle(file) ? NewFile::Created : NewFile::Failed;
    }
    // The handle becomes a C runtime descriptor and then a stream; each step owns what it wraps.
    const int descriptor = ::_open_osfhandle(reinterpret_cast<intptr_t>(file), _O_WRONLY | _O_BINARY);
    if (descriptor < 0) {
        ::CloseHandle(file);
        ::DeleteFileA(path.c_str());
        return NewFile::Failed;
    }
    *writer = ::_fdopen(descriptor, "wb");
    if (*writer == nullptr) {
        ::_close(descriptor);
        ::DeleteFileA(path.c_str());
        return NewFile::Failed;
    }
    return NewFile::Created;
}

std::string readMachineRegistryString(const char* keyPath, const char* valueName)
{
    HKEY key = nullptr;
    if (::RegOpenKeyExA(HKEY_LOCAL_MACHINE, keyPath, 0, KEY_QUERY_VALUE, &key) != ERROR_SUCCESS) {
        return std::string();
    }
    std::string result;
    DWORD type = 0;
    DWORD size = 0;
    if (::RegQueryValueExA(key, valueName, nullptr, &type, nullptr, &size) == ERROR_SUCCESS &&
        (type == REG_SZ || type == REG_EXPAND_SZ) && size > 0) {
        std::vector<char> buffer(size + 1, '\0');
        if (::RegQueryValueExA(key, valueName, nullptr, &type, reinterpret_cast<BYTE*>(buffer.data()), &size) ==
            ERROR_SUCCESS) {
            // The stored text may or may not carry its terminating NUL.
            buffer[size] = '\0';
            result = buffer.data();
        }
    }
    ::RegCloseKey(key);
    return result;
}

}  // namespace zel::platform
