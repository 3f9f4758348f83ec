// The shared library must export its three entry points and nothing else: any other symbol would
// become part of the binary interface that clients can bind to.

#include <gtest/gtest.h>

#include <set>
#include <string>

#include "platform/environment.h"
#include "support/platform.h"
#include "support/shared_library.h"

namespace {

#if !defined(_WIN32)  // the DLL's exports: the zel_dll_exports test
TEST(Exports, ExactlyTheThreeEntryPoints)
{
    // The build puts the shared library beside the test programs, under the name it is loaded by.
    const std::string library = zeltest::programFolder() + zel::platform::kLibraryModuleName;
    const std::set<std::string> expected = {"ZEL_createServerSession", "ZEL_destroyServerSession",
                                            "DllSetMemoryErrorHandler"};
    EXPECT_EQ(zeltest::exportedSymbols(library), expected);
}
#endif

}  // namespace
