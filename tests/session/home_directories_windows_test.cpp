// Home directory discovery as only Windows has it: the machine-wide registry behind the framework
// home, backslash separators, file-search probes, and homes taken from the file names of loaded
// DLLs. The test program links the library statically; a test that needs the library as a DLL
// loads zelserverapi.dll (or a copy of it) beside that.

#if defined(_WIN32)

#include <winsock2.h>
#include <windows.h>

#include <gtest/gtest.h>
#include <zelserverapi/zelserverapi.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <memory>
#include <optional>
#include <string>

#include "api/message_numbers.h"
#include "api/status.h"
#include "platform/environment.h"
#include "session/ZELLocalizedMessageDatabase.h"
#include "session/home_directories.h"
#include "support/environment.h"
#include "support/platform.h"

namespace fs = std::filesystem;

namespace {

using zeltest::ScopedEnv;

// The values scripts/wine-prefix.sh writes into every test prefix.
constexpr const char* kProductKey = "SOFTWARE\\Corvane\\Quorlith";
constexpr const char* kBuildKey = "SOFTWARE\\Corvane\\Quorlith\\BUILD\\18286";
constexpr const char* kNumbersKey = "SOFTWARE\\Corvane\\Quorlith\\Numbers";
constexpr const char* kExpandableKey = "SOFTWARE\\Corvane\\Quorlith\\Expandable";

const std::string kWebAddressRefused = "Connections given as a web address are not supported by this session.";

std::string readRegistry(const char* key, const char* value)
{
    return zel::platform::readMachineRegistryString(key, value);
}

std::optional<std::string> env(const char* name) { return zel::platform::getEnvironmentVariable(name); }

// A DLL loaded for one test and unloaded afterwards.
class LoadedDll {
public:
    explicit LoadedDll(const fs::path& file) : module_(::LoadLibraryA(file.string().c_str())) {}
    ~LoadedDll()
    {
        if (module_ != nullptr) {
            ::FreeLibrary(module_);
        }
    }
    LoadedDll(const LoadedDll&) = delete;
    LoadedDll& operator=(const LoadedDll&) = delete;

    HMODULE module() const { return module_; }

    template <typename Function>
    Function entry(const char* name) const
    {
        return reinterpret_cast<Function>(reinterpret_cast<void*>(::GetProcAddress(module_, name)));
    }

private:
    HMODULE module_;
};

// The text of a status that the DLL's own code makes and fills in from the catalogue of its own
// home: a session refuses a connection given as a web address without touching the network.
std::string statusTextFromTheDll(const LoadedDll& dll)
{
    const auto create = dll.entry<decltype(&ZEL_createServerSession)>("ZEL_createServerSession");
    const auto destroy = dll.entry<decltype(&ZEL_destroyServerSession)>("ZEL_destroyServerSession");
    if (create == nullptr || destroy == nullptr) {
        ADD_FAILURE() << "the DLL lacks its entry points";
        return std::string();
    }
    IZELServerSession* session = nullptr;
    if (create(&session) == nullptr) {
        ADD_FAILURE() << "the DLL made no session";
        return std::string();
    }
    IZELServerString* address = session->createString();
    IZELServerString* user = session->createString();
    IZELServerString* password = session->createString();
    address->assign("http://server.example:80");
    IZELServerConnectionInfo* info = session->createConnectionInfo(*address, *user, *password);
    IZELServerStatus* status = session->init(*info, nullptr);

    std::string text;
    if (status == nullptr || status->getMessageNumber() != zel::msg::kUnsupportedConnection) {
        ADD_FAILURE() << "the DLL's session did not refuse the web address";
    } else {
        text = status->getMessage();
    }
    session->destroyStatus(&status);
    session->destroyConnectionInfo(&info);
    session->destroyString(&address);
    session->destroyString(&user);
    session->destroyString(&password);
    destroy(&session);
    return text;
}

std::string statusTextHere(unsigned number)
{
    std::unique_ptr<IZELServerStatus> status(zel::makeStatus(number));
    return status ? status->getMessage() : std::string("(no status)");
}

fs::path shippedCatalogue() { return fs::path(zeltest::programFolder()) / "messages" / "zelserverapi.msg"; }

// ---- The registry
// --------------------------------------------------------------------------------

TEST(WindowsRegistry, TextValuesUnderTheMachineKeyAreReadAsStored)
{
    EXPECT_EQ(readRegistry(kProductKey, "ZEL_HOME"), "C:\\zel\\product\\");
    EXPECT_EQ(readRegistry(kBuildKey, "ZEL_HOME"), "C:\\zel\\build18286\\");
    EXPECT_EQ(readRegistry(kExpandableKey, "ZEL_HOME"), "C:\\zel\\expandable\\");
}

TEST(WindowsRegistry, NonTextValuesMissingKeysAndMissingValuesGiveEmptyText)
{
    EXPECT_EQ(readRegistry(kNumbersKey, "ZEL_HOME"), "");
    EXPECT_EQ(readRegistry("SOFTWARE\\Corvane\\Quorlith\\BUILD\\18287", "ZEL_HOME"), "");
    EXPECT_EQ(readRegistry("SOFTWARE\\Corvane\\Nothing", "ZEL_HOME"), "");
    EXPECT_EQ(readRegistry(kProductKey, "ZEL_HOME_MISSING"), "");
    // The build key exists only as a path to its number; it holds no value of its own.
    EXPECT_EQ(readRegistry("SOFTWARE\\Corvane\\Quorlith\\BUILD", "ZEL_HOME"), "");
}

TEST(WindowsFrameworkHome, RegistryBuildKeyWhenNoFrameworkModuleIsLoadedAndNothingIsSet)
{
    ASSERT_EQ(::GetModuleHandleA(zel::platform::kFrameworkModuleName), nullptr);
    ScopedEnv override("ZEL_HOME_OVERRIDE", nullptr);
    ScopedEnv zelHome("ZEL_HOME", nullptr);

    EXPECT_EQ(zel::frameworkHomeDirectory(), "C:\\zel\\build18286\\");
    EXPECT_EQ(env("ZEL_HOME"), "C:\\zel\\build18286\\");
    const char* runtimeCopy = std::getenv("ZEL_HOME");
    ASSERT_NE(runtimeCopy, nullptr);
    EXPECT_STREQ(runtimeCopy, "C:\\zel\\build18286\\");

    // Found once, kept: a later search with nothing set does not read the registry again.
    zeltest::setEnv("ZEL_HOME", std::nullopt);
    EXPECT_EQ(zel::frameworkHomeDirectory(), "C:\\zel\\build18286\\");
}

TEST(WindowsFrameworkHome, EnvironmentComesBeforeTheRegistry)
{
    ScopedEnv override("ZEL_HOME_OVERRIDE", nullptr);
    ScopedEnv zelHome("ZEL_HOME", "D:\\family");
    EXPECT_EQ(zel::frameworkHomeDirectory(), "D:\\family\\");
}

TEST(WindowsFrameworkHome, TheLoadedFrameworkDllsFolderNeedsNoRegistry)
{
    const zeltest::TempDir folder("zel-framework");
    fs::copy_file(fs::path(zeltest::programFolder()) / zel::platform::kLibraryModuleName,
                  folder.path() / zel::platform::kFrameworkModuleName);
    const LoadedDll framework(folder.path() / zel::platform::kFrameworkModuleName);
    ASSERT_NE(framework.module(), nullptr) << ::GetLastError();
    ScopedEnv override("ZEL_HOME_OVERRIDE", nullptr);
    ScopedEnv zelHome("ZEL_HOME", nullptr);

    EXPECT_EQ(zel::frameworkHomeDirectory(), folder.string() + "\\");
}

// ---- Separators
// ----------------------------------------------------------------------------------

TEST(WindowsSeparators, HomeDirectoriesEndInABackslash)
{
    {
        ScopedEnv home("ZEL_SERVERAPI_HOME", "C:\\x");
        EXPECT_EQ(zel::serverLibraryHomeDirectory(), "C:\\x\\");
    }
    {
        ScopedEnv home("ZEL_SERVERAPI_HOME", "C:\\x\\");
        EXPECT_EQ(zel::serverLibraryHomeDirectory(), "C:\\x\\");
    }
    {
        // Only the backslash is the separator a home must end in.
        ScopedEnv home("ZEL_SERVERAPI_HOME", "C:/x/");
        EXPECT_EQ(zel::serverLibraryHomeDirectory(), "C:/x/\\");
    }
    ScopedEnv override("ZEL_HOME_OVERRIDE", "D:\\override");
    EXPECT_EQ(zel::frameworkHomeDirectory(), "D:\\override\\");
    EXPECT_EQ(zel::frameworkHomeDirectory("D:\\caller\\"), "D:\\caller\\");
}

TEST(WindowsSeparators, TheCatalogueIsLookedForBehindBackslashes)
{
    for (const char* home : {"C:\\nowhere", "C:\\nowhere\\"}) {
        zel::ZELLocalizedMessageDatabase database;
        EXPECT_FALSE(database.initialize(home));
        EXPECT_STREQ(database.getLastErrorMessage(),
                     "Cannot read the message catalogue C:\\nowhere\\messages\\zelserverapi.msg");
    }

    const zeltest::TempDir home("zel-catalogue");
    fs::create_directory(home.path() / "messages");
    std::ofstream(home.path() / "messages" / "zelserverapi.msg", std::ios::binary) << "7 seven\n";
    zel::ZELLocalizedMessageDatabase database;
    ASSERT_EQ(home.string().find('/'), std::string::npos) << home.string();
    EXPECT_TRUE(database.initialize(home.string())) << database.getLastErrorMessage();
    EXPECT_EQ(database.size(), 1u);
}

// ---- File-search probes
// --------------------------------------------------------------------------

TEST(WindowsFileProbes, FilesFoldersPatternsAndMissingNames)
{
    const zeltest::TempDir dir("zel-probe");
    const std::string root = dir.string();

    // An empty folder still matches "*": the search finds its "." entry.
    EXPECT_TRUE(zel::platform::findFirstFile(root + "\\*"));
    EXPECT_FALSE(zel::platform::findFirstFile(root + "\\messages\\*"));
    EXPECT_FALSE(zel::platform::findFirstFile(root + "\\zelserverapi.dll"));

    fs::create_directory(dir.path() / "messages");
    EXPECT_TRUE(zel::platform::findFirstFile(root + "\\messages\\*"));
    std::ofstream(dir.path() / "zelserverapi.dll", std::ios::binary) << "MZ";
    EXPECT_TRUE(zel::platform::findFirstFile(root + "\\zelserverapi.dll"));
    // The doubled backslash the home search produces does not hide anything.
    EXPECT_TRUE(zel::platform::findFirstFile(root + "\\\\zelserverapi.dll"));

    EXPECT_FALSE(zel::platform::findFirstFile(root + "\\missing\\*"));
    EXPECT_FALSE(zel::platform::findFirstFile(root + "\\missing.dll"));
}

// ---- Homes from loaded DLLs
// ----------------------------------------------------------------------

TEST(WindowsModuleHome, TheLibraryDllBesideTheProgramIsTheHomeUnlessTheVariableIsSet)
{
    // The program carries the library's code itself and does not import the DLL.
    ASSERT_EQ(::GetModuleHandleA(zel::platform::kLibraryModuleName), nullptr);
    ScopedEnv unset("ZEL_SERVERAPI_HOME", nullptr);
    const LoadedDll dll(fs::path(zeltest::programFolder()) / zel::platform::kLibraryModuleName);
    ASSERT_NE(dll.module(), nullptr) << ::GetLastError();
    ASSERT_EQ(::GetModuleHandleA(zel::platform::kLibraryModuleName), dll.module());

    const std::string home = zel::serverLibraryHomeDirectory();
    EXPECT_EQ(home, zeltest::programFolder());
    EXPECT_EQ(home.back(), '\\');
    EXPECT_EQ(statusTextFromTheDll(dll), kWebAddressRefused);

    const zeltest::TempDir empty("zel-no-catalogue");
    ScopedEnv override("ZEL_SERVERAPI_HOME", empty.string());
    EXPECT_EQ(zel::serverLibraryHomeDirectory(), empty.string() + "\\");
    EXPECT_EQ(statusTextFromTheDll(dll), "Could not load resource: 393639");
}

TEST(WindowsModuleHome, ACopyOfTheDllElsewhereReadsTheCatalogueInItsOwnFolder)
{
    ScopedEnv unset("ZEL_SERVERAPI_HOME", nullptr);
    const zeltest::TempDir folder("zel-dll-copy");
    fs::copy_file(fs::path(zeltest::programFolder()) / zel::platform::kLibraryModuleName,
                  folder.path() / zel::platform::kLibraryModuleName);
    const LoadedDll dll(folder.path() / zel::platform::kLibraryModuleName);
    ASSERT_NE(dll.module(), nullptr) << ::GetLastError();

    // Both the DLL and the program's own copy of the library now name the DLL's folder, although
    // the program lies beside a catalogue.
    EXPECT_EQ(zel::serverLibraryHomeDirectory(), folder.string() + "\\");
    EXPECT_EQ(statusTextFromTheDll(dll), "Could not load resource: 393639");
    EXPECT_EQ(statusTextHere(zel::msg::kConnectFailed), "Could not load resource: 393601");

    fs::create_directory(folder.path() / "messages");
    fs::copy_file(shippedCatalogue(), folder.path() / "messages" / "zelserverapi.msg");
    EXPECT_EQ(statusTextFromTheDll(dll), kWebAddressRefused);
    EXPECT_EQ(statusTextHere(zel::msg::kConnectFailed), "Could not connect to the server.");
}

}  // namespace

#endif  // _WIN32
