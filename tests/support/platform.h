#pragma once
// What differs between POSIX and Windows for the tests: where the running program lies, where the
// temporary folder comes from, and whether a case applies at all.

#include <string>

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

// What the system's temporary folder (std::filesystem::temp_directory_path, and so the library's
// temporary files) is taken from: Windows reads "TMP" before "TEMP", POSIX systems "TMPDIR".
inline constexpr const char* kTemporaryFolderVariable = kWindows ? "TMP" : "TMPDIR";

}  // namespace zeltest
