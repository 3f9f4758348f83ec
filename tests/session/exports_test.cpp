// The shared library must export its three entry points and nothing else: any other symbol would
// become part of the binary interface that clients can bind to.

#include <gtest/gtest.h>

#include <cstdio>
#include <memory>
#include <set>
#include <sstream>
#include <string>

namespace {

std::set<std::string> exportedSymbols(const std::string& library)
{
    const std::string command = "nm -D --defined-only --format=posix '" + library + "' 2>&1";
    std::unique_ptr<FILE, int (*)(FILE*)> pipe(popen(command.c_str(), "r"), pclose);
    if (!pipe) {
        ADD_FAILURE() << "cannot run nm";
        return {};
    }
    std::set<std::string> names;
    char line[4096];
    while (fgets(line, sizeof line, pipe.get())) {
        std::istringstream fields(line);
        std::string name, type;
        fields >> name >> type;
        // Version definition entries (type A, absolute) name the version node, not code or data.
        if (!name.empty() && type != "A")
            names.insert(name);
    }
    return names;
}

TEST(Exports, ExactlyTheThreeEntryPoints)
{
    const std::set<std::string> expected = {
        "ZEL_createServerSession", "ZEL_destroyServerSession", "DllSetMemoryErrorHandler"};
    EXPECT_EQ(exportedSymbols(ZEL_TEST_SHARED_LIBRARY), expected);
}

}  // namespace
