#pragma once
// What differs between POSIX and Windows for the tests: where the running program lies, how the
// system's temporary folder is redirected, and whether a case applies at all.

#include <filesystem>
#include <string>

#include "support/environment.h"

namespace zeltest {

#if defined(_WIN32)
inline constexpr bool kWindows = true;
#else
inline constexpr bool kWindows = false;
#endif

// The folder of the running program, in the form the library itself reads its module's file name
// and with the platform's separator at the end. The build places every test program in the output
// folder beside the library and its catalogue.
std::string programFolder();

// Points the system's temporary folder (what std::filesystem::temp_directory_path gives, and so the
// library's temporary files) at `folder` while the object lives.
class ScopedTemporaryFolder {
public:
    explicit ScopedTemporaryFolder(const std::filesystem::path& folder);

private:
    ScopedEnv variable_;
};

}  // namespace zeltest
