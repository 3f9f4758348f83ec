#pragma once
// The two home directories of the library. Both results always end in the platform's path
// separator.

#include <string>

namespace zel {

// The library's own home, where messages/zelserverapi.msg lies: "ZEL_SERVERAPI_HOME" when set and
// non-empty, else the folder of the library's module.
std::string serverLibraryHomeDirectory();

// The framework home of the product family, used for message look-ups that happen before the
// library's own start-up: "ZEL_HOME_OVERRIDE" (once; the variable is emptied), else
// `callerDirectory`, else "ZEL_HOME", else the framework module's folder (after probing it and the
// registry). The result is remembered for the process: a later search that finds nothing new keeps
// it. Also sets "ZEL_HOME" in the environment to the result.
std::string frameworkHomeDirectory(const std::string& callerDirectory = std::string());

}  // namespace zel
