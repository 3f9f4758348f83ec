#pragma once
// What a built shared library offers its users, read from the file itself.

#include <set>
#include <string>

namespace zeltest {

// The names of the functions and data that `library` exports: the defined dynamic symbols of a
// shared object (a Windows DLL's exports are checked by the zel_dll_exports test). A library that
// cannot be read gives an empty set and a test failure that says why.
std::set<std::string> exportedSymbols(const std::string& library);

}  // namespace zeltest
