#pragma once
// The operating-system services behind home directory discovery (environment variables, the file
// the library's code was loaded from, file probes, the machine-wide registry) and the one file
// operation the C++ library has no portable form for: creating a file only when it is new. Implemented once
// for POSIX (platform/posix) and once for Windows (platform/windows).

#include <cstdio>
#include <optional>
#include <string>

namespace zel::platform {

#if defined(_WIN32)
inline constexpr char kPathSeparator = '\\';
inline constexpr const char* kLibraryModuleName = "zelserverapi.dll";
inline constexpr const char* kFrameworkModuleName = "zel.dll";
#else
inline constexpr char kPathSeparator = '/';
inline constexpr const char* kLibraryModuleName = "libzelserverapi.so";
// There is no separate framework library on POSIX: the library stands in for it.
inline constexpr const char* kFrameworkModuleName = kLibraryModuleName;
#endif

// The variable's value; nullopt when it is not defined (an empty value is defined).
std::optional<std::string> getEnvironmentVariable(const char* name);

// Sets the variable in the process environment (an empty value keeps it defined but empty).
// Returns false when the system refuses.
bool setEnvironmentVariable(const char* name, const std::string& value);

// Hands a "NAME=value" entry to the C runtime's environment. The runtime keeps the pointer, so the
// entry must live as long as the process.
void putRuntimeEnvironmentEntry(char* entry);

// Full path of the file that holds the library's code; empty when it cannot be told.
std::string libraryModulePath();

// Full path of the product family's framework library; empty when it is not loaded. On POSIX there
// is no separate framework library and this is the library's own file.
std::string frameworkModulePath();

// True when a file search for `pattern` finds something. A pattern may end in a "*" wildcard,
// which then matches anything in the folder (an existing folder always matches).
bool findFirstFile(const std::string& pattern);

enum class NewFile { Created, Exists, Failed };

// Creates an empty file at `path` only when nothing of that name exists, in one step, so that two
// processes guessing the same name cannot both have it. With `writer`, the file is left open for
// writing in binary mode through *writer (the caller closes it), so nothing has to open it again.
NewFile createNewFile(const std::string& path, std::FILE** writer = nullptr);

// Reads a text value under HKEY_LOCAL_MACHINE\keyPath. A missing key or value, or a system without
// a registry, gives the empty string.
std::string readMachineRegistryString(const char* keyPath, const char* valueName);

}  // namespace zel::platform
