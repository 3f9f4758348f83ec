// Status objects and the message catalogue. Each case runs in its own process,
// so the process-wide database and the show-numbers flag start fresh.

#include "api/status.h"

#include <gtest/gtest.h>

#include <atomic>
#include <filesystem>
#include <fstream>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "api/ZELServerStatus.h"
#include "api/ZELServerStringArray.h"
#include "api/heap.h"
#include "api/message_numbers.h"
#include "api/string_adapters.h"
#include "session/ZELLocalizedMessageDatabase.h"
#include "session/message_startup.h"
#include "support/environment.h"

namespace fs = std::filesystem;

namespace {

using StatusPtr = std::unique_ptr<IZELServerStatus>;
using zeltest::ScopedEnv;

using Home = zeltest::TempDir;

void writeCatalogue(const Home& home, const std::string& text)
{
    fs::create_directories(home.path() / "messages");
    std::ofstream(home.path() / "messages" / "zelserverapi.msg", std::ios::binary) << text;
}

std::string message(const StatusPtr& status) { return status->getMessage(); }

// The shipped catalogue's texts with their slots filled are the messages the other suites compare.
TEST(ServerStatus, AParameterIsInsertedAsItIsAndNoMemoryMakesNoStatus)
{
    ScopedEnv home("ZEL_SERVERAPI_HOME", nullptr);
    const StatusPtr status(zel::makeStatus(zel::msg::kForbiddenCharacter, "%1%"));
    EXPECT_EQ(message(status), "A name may not contain any of these characters: %1%");
    EXPECT_EQ(status->getMessageNumber(), 393626u);
    EXPECT_EQ(status->getCode(), 0u);
    zel::heap::failNextAllocations(1);
    EXPECT_EQ(zel::makeStatus(zel::msg::kConnectFailed), nullptr) << "no memory, no status";
}

TEST(ServerStatus, MissingUnreadableOrDamagedCatalogueGivesTheFallbackText)
{
    const Home empty("zel-status");
    const Home folder("zel-status");  // a folder in place of the catalogue opens, but fails when read
    fs::create_directories(folder.path() / "messages" / "zelserverapi.msg");
    const Home damaged("zel-status");
    writeCatalogue(damaged, "393619 fine\nthis line is not a message\n");
    // A framework home holding a good catalogue must not stand in for the library's own.
    ScopedEnv framework("ZEL_HOME", ZEL_TEST_OUTPUT_DIR);

    for (const Home* bad : {&empty, &folder, &damaged}) {
        ScopedEnv home("ZEL_SERVERAPI_HOME", bad->string().c_str());
        StatusPtr coded(zel::makeStatusWithCode(2, zel::msg::kServerError, "server said no"));
        EXPECT_STREQ(coded->getMessage(), "Could not load resource: 393625") << bad->string();
        EXPECT_EQ(coded->getCode(), 2u);
        EXPECT_FALSE(zel::messageDatabaseStarted());
    }
}

TEST(ServerStatus, MessageNumbersAreShownOnceTheVariableWasDefined)
{
    {
        ScopedEnv numbers("ZEL_MSG_NUM_OUTPUT", nullptr);
        EXPECT_EQ(message(StatusPtr(zel::makeStatus(zel::msg::kNotConnected))),
                  "There is no open connection to the server.");
    }
    {
        ScopedEnv numbers("ZEL_MSG_NUM_OUTPUT", "");
        EXPECT_EQ(message(StatusPtr(zel::makeStatus(zel::msg::kNotConnected))),
                  "393622: There is no open connection to the server.");
    }
    // The flag is never cleared, even after teardown and with the variable gone.
    EXPECT_EQ(message(StatusPtr(zel::makeStatus(zel::msg::kConnectFailed))),
              "393601: Could not connect to the server.");
}

TEST(ServerStatus, DestroyingAnyTokenHolderTearsTheDatabaseDown)
{
    const Home temp("zel-status");
    writeCatalogue(temp, "393619 first text\n");
    ScopedEnv home("ZEL_SERVERAPI_HOME", temp.string().c_str());

    StatusPtr first(zel::makeStatus(zel::msg::kRequiredValueMissing));
    EXPECT_TRUE(zel::messageDatabaseStarted());
    // While the database lives, a changed file is not read again.
    writeCatalogue(temp, "393619 second text\n");
    StatusPtr second(zel::makeStatus(zel::msg::kRequiredValueMissing));
    EXPECT_EQ(message(second), "first text");
    // The younger status goes first and still takes the database with it.
    second.reset();
    EXPECT_FALSE(zel::messageDatabaseStarted());
    EXPECT_EQ(message(StatusPtr(zel::makeStatus(zel::msg::kRequiredValueMissing))), "second text");
}

// Statuses built and destroyed on several threads at once, with the library's catalogue and the
// framework's catalogue giving different texts: a teardown slipping in between one status's start-up
// and its look-up would send that look-up to the framework's catalogue, which shows in the text.
TEST(MessageCatalogue, EveryStatusOnEveryThreadReadsTheLibrarysOwnCatalogue)
{
    const Home library("zel-library");
    const Home framework("zel-framework");
    writeCatalogue(library, "393623 library %1\n");
    writeCatalogue(framework, "393623 framework %1\n");
    const ScopedEnv home("ZEL_SERVERAPI_HOME", library.path().string());
    const ScopedEnv frameworkHome("ZEL_HOME", framework.path().string());

    std::atomic<int> wrong{0};
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t) {
        threads.emplace_back([&wrong, t] {
            for (int i = 0; i < 1000; ++i) {
                const std::string name = std::string("f").append(std::to_string(t * 1000 + i));
                if (message(StatusPtr(zel::makeStatus(zel::msg::kLocalFileRead, name))) != "library " + name) {
                    ++wrong;
                }
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(wrong.load(), 0);
    EXPECT_FALSE(zel::messageDatabaseStarted());
}

TEST(Catalogue, FillsTheTextOrRefusesAMalformedLine)
{
    const std::string layout = "expected a message number, a blank and a text";
    const struct {
        const char* catalogue;
        std::vector<std::string> parameters;
        bool keepUnfilled;
        std::string expected;  // the text of message 5, or the refusal
    } cases[] = {
        {"# comment\n\n  \t\n5 after comments\r\n6 next\n", {}, false, "after comments"},
        {"5 %2 before %1", {"a", "b"}, false, "b before a"},
        {"5 100%% sure, %%1 is not a slot", {"x"}, false, "100% sure, %1 is not a slot"},
        {"5 50% off, %a and %0 stay, so does a last %", {"x"}, false, "50% off, %a and %0 stay, so does a last %"},
        {"5 [%1][%2][%9]", {"x"}, true, "[x][%2][%9]"},
        {"5 %10", {"a"}, false, "a0"},  // only nine slots
        {"4294967295 largest\n5 x", {}, false, "x"},
        {"5 ok\nfive text\n", {}, false, "test:2: " + layout},
        {"5   \n", {}, false, "test:1: message 5 has no text"},
        {"5 a\n6 b\n5 c\n", {}, false, "test:3: message 5 appears twice"},
        {"4294967296 too large", {}, false, "test:1: " + layout},
        {"6 six", {}, false, "Message 5 is not in the message catalogue test"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.catalogue);
        zel::ZELLocalizedMessageDatabase database;
        const zel::ZELServerStringArray parameters(c.parameters);
        const zel::ZELROStringArrayWrapper wrapped(&parameters);
        zel::ZELObsoleteStringImp out("kept");
        if (database.load(c.catalogue, "test") &&
            database.createFilledInMessage(5, &wrapped, &out, c.keepUnfilled, false)) {
            EXPECT_EQ(out.str(), c.expected);
        } else {
            EXPECT_EQ(database.getLastErrorMessage(), c.expected);
            EXPECT_EQ(out.str(), "kept");
        }
    }
}

// Every number the library raises has a text in the shipped catalogue, with one slot per parameter
// that the raising places pass, and no slot beyond them.
TEST(Catalogue, ShippedCatalogueCoversEveryRaisedNumber)
{
    const struct {
        unsigned number;
        unsigned parameters;
    } raised[] = {
        {393601, 0}, {393602, 1}, {393604, 1}, {393607, 1}, {393608, 1}, {393617, 2}, {393618, 0}, {393619, 0},
        {393620, 1}, {393621, 0}, {393622, 0}, {393623, 1}, {393624, 1}, {393625, 1}, {393626, 1}, {393627, 0},
        {393630, 1}, {393631, 0}, {393635, 0}, {393638, 1}, {393639, 0}, {392001, 0}, {392002, 0}, {392003, 0},
        {392004, 0}, {392005, 0}, {392006, 0}, {392007, 0}, {392008, 0}, {392009, 0}, {392011, 0}, {392012, 0},
    };
    for (const std::string home : {ZEL_TEST_SOURCE_DIR, ZEL_TEST_SOURCE_DIR "/"}) {
        zel::ZELLocalizedMessageDatabase database;
        EXPECT_TRUE(database.initialize(home)) << database.getLastErrorMessage();
    }
    zel::ZELLocalizedMessageDatabase shipped;
    ASSERT_TRUE(shipped.initialize(ZEL_TEST_SOURCE_DIR)) << shipped.getLastErrorMessage();
    EXPECT_EQ(shipped.size(), std::size(raised));

    for (const auto& e : raised) {
        zel::ZELObsoleteStringImp raw;
        ASSERT_TRUE(shipped.createFilledInMessage(e.number, nullptr, &raw, true, false)) << e.number;
        for (unsigned slot = 1; slot <= 9; ++slot) {
            const std::string slotText = std::string("%").append(std::to_string(slot));
            EXPECT_EQ(raw.str().find(slotText) != std::string::npos, slot <= e.parameters)
                << e.number << " slot " << slot << ": " << raw.str();
        }
    }
}

}  // namespace
