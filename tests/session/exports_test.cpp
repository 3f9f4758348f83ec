// The shared library must export its three entry points and nothing else: any other symbol would
// become part of the binary interface that clients can bind to.

#include <gtest/gtest.h>

#include <cstdio>
#include <memory>
#include <set>
#include <sstream>
#include <string>

#include "platform/environment.h"
#include "support/platform.h"

namespace {

#if !defined(_WIN32)  // the DLL's exports: the zel_dll_exports test
// The defined dynamic symbols of a shared object, as nm lists them.
std::set<std::string> exportedSymbols(const std::string& library)
{
    const std::string command = "nm -D --defined-only --format=posix '" + library + "' 2>&1";
    const std::unique_ptr<FILE, int (*)(FILE*)> pipe(::popen(command.c_str(), "r"), ::pclose);
    std::set<std::string> names;
    char line[4096];
    while (pipe && std::fgets(line, sizeof line, pipe.get())) {
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

TEST(Exports, ExactlyTheThreeEntryPoints)
{
    // The build puts the shared library beside the test programs, under the name it is loaded by.
    const std::string library = zeltest::programFolder() + zel::platform::kLibraryModuleName;
    const std::set<std::string> expected = {"ZEL_createServerSession", "ZEL_destroyServerSession",
                                            "DllSetMemoryErrorHandler"};
    EXPECT_EQ(exportedSymbols(library), expected);
}
#endif

}  // namespace
