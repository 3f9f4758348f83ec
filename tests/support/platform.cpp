#include "support/platform.h"

#include <filesystem>

#if defined(_WIN32)
#include <windows.h>
#endif

namespace zeltest {

std::string programFolder()
{
#if defined(_WIN32)
    char buffer[MAX_PATH * 4] = {};
    const DWORD length = ::GetModuleFileNameA(nullptr, buffer, sizeof buffer);
    const std::string program(buffer, length < sizeof buffer ? length : 0);
    return program.substr(0, program.find_last_of('\\') + 1);
#else
    return std::filesystem::canonical("/proc/self/exe").parent_path().string() + "/";
#endif
}

}  // namespace zeltest
