// Home directory discovery as only Windows has it: backslash separators, and homes taken from the
// file names of loaded DLLs. The test program links the library statically; a test that needs the
// library as a DLL loads zelserverapi.dll (or a copy of it) beside that.

#if defined(_WIN32)

#include <winsock2.h>
#include <windows.h>

#include <gtest/gtest.h>
#include <zelserverapi/ZELServerOwned.h>

#include <filesystem>
#include <memory>
#include <string>

#include "api/message_numbers.h"
#include "api/status.h"
#include "platform/environment.h"
#include "session/home_directories.h"
#include "support/environment.h"
#include "support/platform.h"

namespace fs = std::filesystem;

namespace {

using zeltest::ScopedEnv;

const std::string kWebAddressRefused = "Connections given as a web address are not supported by this session.";

// A DLL loaded for one test and unloaded afterwards.
struct LoadedDll {
    explicit LoadedDll(const fs::path& file) : module(::LoadLibraryA(file.string().c_str())) {}
    ~LoadedDll() { ::FreeLibrary(module); }
    HMODULE module;
};

// The text of a status that the DLL's own code makes and fills in from the catalogue of its own
// home: a session refuses a connection given as a web address without touching the network.
std::string statusTextFromTheDll(const LoadedDll& dll)
{
    const auto entry = [&](const char* name) { return reinterpret_cast<void*>(::GetProcAddress(dll.module, name)); };
    const auto create = reinterpret_cast<decltype(&ZEL_createServerSession)>(entry("ZEL_createServerSession"));
    const auto destroy = reinterpret_cast<decltype(&ZEL_destroyServerSession)>(entry("ZEL_destroyServerSession"));
    IZELServerSession* session = nullptr;
    if (create == nullptr || destroy == nullptr || create(&session) == nullptr) {
        return "(the DLL made no session)";
    }
    std::string text;
    {
        const auto address = zelServerOwn(*session, session->createString());
        address->assign("http://server.example:80");
        const auto info = zelServerOwn(*session, session->createConnectionInfo(*address, *address, *address));
        const auto status = zelServerOwn(*session, session->init(*info, nullptr));
        text = status ? status->getMessage() : "(no status)";
    }
    destroy(&session);
    return text;
}

TEST(WindowsSeparators, HomesEndInABackslash)
{
    const std::pair<const char*, const char*> homes[] = {
        {"C:\\x", "C:\\x\\"}, {"C:\\x\\", "C:\\x\\"}, {"C:/x/", "C:/x/\\"}};
    for (const auto& [value, home] : homes) {
        ScopedEnv variable("ZEL_SERVERAPI_HOME", value);
        EXPECT_EQ(zel::serverLibraryHomeDirectory(), home);
    }
    // The doubled backslash the home search produces does not hide anything.
    EXPECT_TRUE(zel::platform::findFirstFile(zeltest::programFolder() + "\\" + zel::platform::kLibraryModuleName));
}

TEST(WindowsModuleHome, ACopyOfTheLibraryDllElsewhereReadsTheCatalogueInItsOwnFolder)
{
    ScopedEnv unset("ZEL_SERVERAPI_HOME", nullptr);
    const zeltest::TempDir folder("zel-dll-copy");
    fs::copy_file(fs::path(zeltest::programFolder()) / zel::platform::kLibraryModuleName,
                  folder.path() / zel::platform::kLibraryModuleName);
    const LoadedDll dll(folder.path() / zel::platform::kLibraryModuleName);
    ASSERT_NE(dll.module, nullptr) << ::GetLastError();
    // Both the DLL and the program's own copy of the library now name the DLL's folder, although
    // the program lies beside a catalogue.
    EXPECT_EQ(zel::serverLibraryHomeDirectory(), folder.string() + "\\");
    EXPECT_EQ(statusTextFromTheDll(dll), "Could not load resource: 393639");
    EXPECT_STREQ(std::unique_ptr<IZELServerStatus>(zel::makeStatus(zel::msg::kConnectFailed))->getMessage(),
                 "Could not load resource: 393601");
    fs::create_directory(folder.path() / "messages");
    fs::copy_file(fs::path(zeltest::programFolder()) / "messages" / "zelserverapi.msg",
                  folder.path() / "messages" / "zelserverapi.msg");
    EXPECT_EQ(statusTextFromTheDll(dll), kWebAddressRefused);
}

}  // namespace

#endif  // _WIN32
