#include "support/shared_library.h"

#if !defined(_WIN32)
#include <gtest/gtest.h>

#include <cstdio>
#include <memory>
#include <sstream>

namespace zeltest {

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

}  // namespace zeltest
#endif
