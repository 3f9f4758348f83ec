#include "support/shared_library.h"

#include <gtest/gtest.h>

#if defined(_WIN32)
#include <windows.h>
#else
#include <cstdio>
#include <memory>
#include <sstream>
#endif

namespace zeltest {

#if defined(_WIN32)

// The DLL is mapped without running its start-up code or loading what it imports; only its headers
// and export directory are read.
std::set<std::string> exportedSymbols(const std::string& library)
{
    HMODULE module = ::LoadLibraryExA(library.c_str(), nullptr, DONT_RESOLVE_DLL_REFERENCES);
    if (module == nullptr) {
        ADD_FAILURE() << "cannot map " << library << " (error " << ::GetLastError() << ")";
        return {};
    }
    const auto* base = reinterpret_cast<const unsigned char*>(module);
    const auto* dos = reinterpret_cast<const IMAGE_DOS_HEADER*>(base);
    const auto* nt = reinterpret_cast<const IMAGE_NT_HEADERS*>(base + dos->e_lfanew);
    const IMAGE_DATA_DIRECTORY& entry = nt->OptionalHeader.DataDirectory[IMAGE_DIRECTORY_ENTRY_EXPORT];
    std::set<std::string> names;
    if (entry.VirtualAddress != 0 && entry.Size != 0) {
        const auto* exports = reinterpret_cast<const IMAGE_EXPORT_DIRECTORY*>(base + entry.VirtualAddress);
        const auto* nameOffsets = reinterpret_cast<const DWORD*>(base + exports->AddressOfNames);
        for (DWORD i = 0; i < exports->NumberOfNames; ++i) {
            names.insert(reinterpret_cast<const char*>(base + nameOffsets[i]));
        }
    }
    ::FreeLibrary(module);
    return names;
}

#else

std::set<std::string> exportedSymbols(const std::string& library)
{
    const std::string command = "nm -D --defined-only --format=posix '" + library + "' 2>&1";
    std::unique_ptr<FILE, int (*)(FILE*)> pipe(::popen(command.c_str(), "r"), ::pclose);
    if (!pipe) {
        ADD_FAILURE() << "cannot run nm";
        return {};
    }
    std::set<std::string> names;
    char line[4096];
    while (std::fgets(line, sizeof line, pipe.get())) {
        std::istringstream fields(line);
        std::string name, type;
        fields >> name >> type;
        // Version definition entries (type A, absolute) name the version node, not code or data.
        if (!name.empty() && type != "A") {
            names.insert(name);
        }
    }
    return names;
}

#endif

}  // namespace zeltest
