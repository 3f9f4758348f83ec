// Status objects, the message catalogue and the error records. Each case runs in its own process,
// so the process-wide database, the show-numbers flag and the last-error record start fresh.

#include "api/status.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <memory>
#include <string>
#include <vector>

#include "api/StatusInfo.h"
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

const std::string kInternat = "..\\..\\framework\\engine\\internat";

std::string frame(int line) { return "(" + kInternat + ":" + std::to_string(line) + ")"; }

// A home directory of the test's own; `writeCatalogue` fills messages/zelserverapi.msg.
class TempHome {
public:
    void writeCatalogue(const std::string& text) const
    {
        fs::create_directories(path() / "messages");
        std::ofstream(path() / "messages" / "zelserverapi.msg", std::ios::binary) << text;
    }
    std::string str() const { return folder_.string(); }
    const fs::path& path() const { return folder_.path(); }

private:
    zeltest::TempDir folder_{"zel-status"};
};

std::string message(const StatusPtr& status) { return status->getMessage(); }

TEST(ServerStatus, TextsComeFromTheShippedCatalogueWithCodeAndParametersFilledIn)
{
    ScopedEnv home("ZEL_SERVERAPI_HOME", nullptr);
    const struct {
        StatusPtr status;
        unsigned number;
        unsigned code;
        const char* text;
    } cases[] = {
        {StatusPtr(zel::makeStatus(zel::msg::kConnectFailed)), 393601, 0, "Could not connect to the server."},
        {StatusPtr(zel::makeStatus(zel::msg::kSendFailed, "392009")), 393607, 0,
         "Sending a request to the server failed (socket error 392009)."},
        {StatusPtr(zel::makeStatus(zel::msg::kInvalidArgument, std::vector<std::string>{"keyword", "  "})), 393617, 0,
         "The argument \"keyword\" has an invalid value: \"  \"."},
        // A parameter is inserted as it is, its own percent signs and slot-like text included.
        {StatusPtr(zel::makeStatus(zel::msg::kForbiddenCharacter, "\\/:*?\"<>|&='+%1")), 393626, 0,
         "A name may not contain any of these characters: \\/:*?\"<>|&='+%1"},
        {StatusPtr(zel::makeStatusWithCode(2, zel::msg::kServerError, "Unknown request type")), 393625, 2,
         "Unknown request type"},
        {StatusPtr(zel::makeStatusWithCode(7, zel::msg::kNotConnected)), 393622, 7,
         "There is no open connection to the server."},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(message(c.status), c.text);
        EXPECT_EQ(c.status->getMessageNumber(), c.number) << c.text;
        EXPECT_EQ(c.status->getCode(), c.code) << c.text;
    }
}

TEST(ServerStatus, MissingUnreadableOrDamagedCatalogueGivesTheFallbackText)
{
    TempHome empty;
    TempHome folderInstead;
    fs::create_directories(folderInstead.path() / "messages" / "zelserverapi.msg");
    TempHome damaged;
    damaged.writeCatalogue("393619 fine\nthis line is not a message\n");
    // A framework home holding a good catalogue must not stand in for the library's own.
    ScopedEnv framework("ZEL_HOME", ZEL_TEST_OUTPUT_DIR);

    for (const TempHome* bad : {&empty, &folderInstead, &damaged}) {
        ScopedEnv home("ZEL_SERVERAPI_HOME", bad->str().c_str());
        StatusPtr status(zel::makeStatus(zel::msg::kRequiredValueMissing));
        EXPECT_STREQ(status->getMessage(), "Could not load resource: 393619") << bad->str();
        EXPECT_EQ(status->getMessageNumber(), 393619u);
        StatusPtr coded(zel::makeStatusWithCode(2, zel::msg::kServerError, "server said no"));
        EXPECT_STREQ(coded->getMessage(), "Could not load resource: 393625") << bad->str();
        EXPECT_EQ(coded->getCode(), 2u);
        EXPECT_FALSE(zel::messageDatabaseStarted());
    }
}

TEST(ServerStatus, MessageNumbersAreShownOnceTheVariableWasDefined)
{
    {
        ScopedEnv numbers("ZEL_MSG_NUM_OUTPUT", nullptr);
        StatusPtr status(zel::makeStatus(zel::msg::kNotConnected));
        EXPECT_EQ(message(status), "There is no open connection to the server.");
        EXPECT_FALSE(zel::showMessageNumbers());
    }
    {
        ScopedEnv numbers("ZEL_MSG_NUM_OUTPUT", "");
        StatusPtr status(zel::makeStatus(zel::msg::kNotConnected));
        EXPECT_EQ(message(status), "393622: There is no open connection to the server.");
        EXPECT_TRUE(zel::showMessageNumbers());
    }
    // The flag is never cleared, even after teardown and with the variable gone.
    StatusPtr later(zel::makeStatus(zel::msg::kConnectFailed));
    EXPECT_EQ(message(later), "393601: Could not connect to the server.");
}

TEST(ServerStatus, DestroyingAnyTokenHolderTearsTheDatabaseDown)
{
    TempHome temp;
    temp.writeCatalogue("393619 first text\n");
    ScopedEnv home("ZEL_SERVERAPI_HOME", temp.str().c_str());

    StatusPtr first(zel::makeStatus(zel::msg::kRequiredValueMissing));
    EXPECT_EQ(message(first), "first text");
    EXPECT_TRUE(static_cast<zel::ZELServerStatus*>(first.get())->holdsDatabaseToken());
    EXPECT_TRUE(zel::messageDatabaseStarted());

    // While the database lives, a changed file is not read again.
    temp.writeCatalogue("393619 second text\n");
    StatusPtr second(zel::makeStatus(zel::msg::kRequiredValueMissing));
    EXPECT_EQ(message(second), "first text");

    // The younger status goes first and still takes the database with it.
    second.reset();
    EXPECT_FALSE(zel::messageDatabaseStarted());
    StatusPtr third(zel::makeStatus(zel::msg::kRequiredValueMissing));
    EXPECT_EQ(message(third), "second text");

    first.reset();
    EXPECT_FALSE(zel::messageDatabaseStarted());
    third.reset();
    EXPECT_FALSE(zel::messageDatabaseStarted());

    temp.writeCatalogue("393619 third text\n");
    StatusPtr fourth(zel::makeStatus(zel::msg::kRequiredValueMissing));
    EXPECT_EQ(message(fourth), "third text");
}

TEST(ServerStatus, NullWhenMemoryIsExhausted)
{
    zel::heap::failNextAllocations(1);
    EXPECT_EQ(zel::makeStatus(zel::msg::kConnectFailed), nullptr);
    StatusPtr next(zel::makeStatus(zel::msg::kConnectFailed));
    ASSERT_NE(next, nullptr);
    EXPECT_EQ(message(next), "Could not connect to the server.");
}

// ---- StatusInfo

TEST(StatusInfo, DefaultsThenFramesNewestFirstCopiedToTheLastErrorRecord)
{
    const zel::StatusInfo defaults;
    EXPECT_EQ(defaults.type(), 16u);
    EXPECT_EQ(defaults.message(), "Internal Error -- No Descriptive Message Available");
    EXPECT_EQ(defaults.stackTrace(), "Internal Error -- No Stack Trace Available");
    EXPECT_EQ(defaults.number(), 0);
    EXPECT_EQ(defaults.flag(), 0);
    // Before any failure the last-error record holds the defaults.
    EXPECT_EQ(zel::lastStatusInfo().message(), defaults.message());
    EXPECT_EQ(zel::lastStatusInfo().stackTrace(), defaults.stackTrace());
    EXPECT_EQ(zel::lastStatusInfo().number(), 0);

    zel::StatusInfo info(3, "broken", "f", 7, "a");
    EXPECT_EQ(info.stackTrace(), "f(a:7)");
    EXPECT_EQ(info.number(), -1);
    EXPECT_EQ(zel::lastStatusInfo().stackTrace(), "f(a:7)");

    info.addFrame("g", 9, "b");
    EXPECT_EQ(info.stackTrace(), "g(b:9) - f(a:7)");
    const zel::StatusInfo last = zel::lastStatusInfo();
    EXPECT_EQ(last.type(), 3u);
    EXPECT_EQ(last.message(), "broken");
    EXPECT_EQ(last.stackTrace(), "g(b:9) - f(a:7)");
    EXPECT_EQ(last.number(), -1);
    EXPECT_EQ(last.flag(), 0);

    // Another record's frame replaces the whole last-error record; a frame without a file is the
    // function alone, one without a function the parenthesised part alone.
    zel::StatusInfo other(16, "other", "h", 1, "");
    EXPECT_EQ(other.stackTrace(), "h");
    EXPECT_EQ(zel::lastStatusInfo().message(), "other");
    EXPECT_EQ(zel::lastStatusInfo().stackTrace(), "h");
    EXPECT_EQ(zel::StatusInfo(16, "m", "", 148, kInternat).stackTrace(), frame(148));
}

std::vector<std::string> hookReports;

TEST(StatusInfo, DiagnosticHookReportsEveryFullyConstructedRecord)
{
    zel::StatusInfo silent(16, "before", "f", 1, "a");  // no hook yet: nothing to observe, no crash

    EXPECT_EQ(zel::setDiagnosticHook([](const char* text) { hookReports.emplace_back(text); }), nullptr);
    zel::StatusInfo info(16, "boom", "f", 7, "a");
    info.addFrame("g", 9, "b");  // frames added later are not reported again
    const zel::StatusInfo defaults;
    ASSERT_EQ(hookReports.size(), 1u);
    EXPECT_EQ(hookReports[0], "BADNEWS: boom f(a:7)");

    zel::setDiagnosticHook(nullptr);
    zel::StatusInfo after(16, "after", "f", 1, "a");
    EXPECT_EQ(hookReports.size(), 1u);
}

// ---- The fill-in routine and the start-up records

TEST(MessageStartup, FillInFillsFromTheFrameworkHomeWhenNoDatabaseExists)
{
    TempHome framework;
    framework.writeCatalogue("393617 %1=%2 (%3)\n");
    ScopedEnv override("ZEL_HOME_OVERRIDE", framework.str().c_str());

    zel::ZELServerStringArray parameters(std::vector<std::string>{"name", "value"});
    std::string out = "old";
    std::unique_ptr<zel::StatusInfo> failure(zel::fillInMessage(393617, &parameters, out, false));
    EXPECT_EQ(failure, nullptr);
    EXPECT_EQ(out, "name=value ()");
    EXPECT_TRUE(zel::messageDatabaseStarted());

    // The caller flag keeps slots without a parameter.
    failure.reset(zel::fillInMessage(393617, &parameters, out, true));
    EXPECT_EQ(out, "name=value (%3)");
    failure.reset(zel::fillInMessage(393617, nullptr, out, false));
    EXPECT_EQ(out, "= ()");
    zel::destroyMessageDatabase();
}

TEST(MessageStartup, FillInReportsAnUnknownNumberWithLine148)
{
    TempHome framework;
    framework.writeCatalogue("393617 known\n");
    ScopedEnv override("ZEL_HOME_OVERRIDE", framework.str().c_str());

    std::string out = "untouched";
    std::unique_ptr<zel::StatusInfo> failure(zel::fillInMessage(393618, nullptr, out, false));
    ASSERT_NE(failure, nullptr);
    EXPECT_EQ(out, "untouched");
    EXPECT_NE(failure->message().find("393618"), std::string::npos) << failure->message();
    EXPECT_EQ(failure->stackTrace(), frame(148));
    EXPECT_EQ(failure->number(), -1);
    zel::destroyMessageDatabase();
}

TEST(MessageStartup, AFailedStartUpIsReportedWithLines139And100AndRetriedLater)
{
    TempHome temp;
    ScopedEnv override("ZEL_HOME_OVERRIDE", temp.str().c_str());
    std::string out = "untouched";
    std::unique_ptr<zel::StatusInfo> failure(zel::fillInMessage(393619, nullptr, out, false));
    ASSERT_NE(failure, nullptr);
    EXPECT_EQ(out, "untouched");
    EXPECT_EQ(failure->type(), 16u);
    EXPECT_NE(failure->message().find("zelserverapi.msg"), std::string::npos) << failure->message();
    EXPECT_EQ(failure->stackTrace(), frame(139) + " - " + frame(100));
    EXPECT_EQ(zel::lastStatusInfo().stackTrace(), failure->stackTrace());
    EXPECT_FALSE(zel::messageDatabaseStarted());

    failure.reset(zel::startMessageDatabase(temp.str()));
    ASSERT_NE(failure, nullptr);
    EXPECT_EQ(failure->stackTrace(), frame(100));
    EXPECT_FALSE(zel::messageDatabaseStarted());

    temp.writeCatalogue("1 one\n");
    failure.reset(zel::startMessageDatabase(temp.str()));
    EXPECT_EQ(failure, nullptr);
    EXPECT_TRUE(zel::messageDatabaseStarted());

    // An existing database is left alone, even when another home is named.
    TempHome other;
    failure.reset(zel::startMessageDatabase(other.str()));
    EXPECT_EQ(failure, nullptr);
    zel::destroyMessageDatabase();
    EXPECT_FALSE(zel::messageDatabaseStarted());
}

// ---- The catalogue format

TEST(Catalogue, FillsTheText)
{
    const struct {
        const char* catalogue;
        unsigned number;
        std::vector<std::string> parameters;
        bool keepUnfilled;
        bool showNumbers;
        const char* expected;
    } cases[] = {
        {"5 plain", 5, {}, false, false, "plain"},
        {"# comment\n\n  \t\n5 after comments\n", 5, {}, false, false, "after comments"},
        {"5 crlf line\r\n6 next\r\n", 5, {}, false, false, "crlf line"},
        {"5 %2 before %1", 5, {"a", "b"}, false, false, "b before a"},
        {"5 100%% sure, %%1 is not a slot", 5, {"x"}, false, false, "100% sure, %1 is not a slot"},
        {"5 50% off, %a and %0 stay, so does a last %",
         5,
         {"x"},
         false,
         false,
         "50% off, %a and %0 stay, so does a last %"},
        {"5 [%1][%2][%9]", 5, {"x"}, false, false, "[x][][]"},
        {"5 [%1][%2][%9]", 5, {"x"}, true, false, "[x][%2][%9]"},
        {"5 %10", 5, {"a"}, false, false, "a0"},  // only nine slots
        {"393619 text", 393619, {}, false, true, "393619: text"},
        {"4294967295 largest", 4294967295u, {}, false, false, "largest"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.catalogue);
        zel::ZELLocalizedMessageDatabase database;
        ASSERT_TRUE(database.load(c.catalogue, "test")) << database.getLastErrorMessage();
        zel::ZELServerStringArray parameters(c.parameters);
        const zel::ZELROStringArrayWrapper wrapped(&parameters);
        zel::ZELObsoleteStringImp out;
        ASSERT_TRUE(database.createFilledInMessage(c.number, &wrapped, &out, c.keepUnfilled, c.showNumbers))
            << database.getLastErrorMessage();
        EXPECT_EQ(out.str(), c.expected);
    }
}

TEST(Catalogue, MalformedCataloguesAreRefusedWithTheirLine)
{
    const std::string layout = "expected a message number, a blank and a text";
    const struct {
        const char* text;
        std::string reason;
    } cases[] = {
        {"5 ok\nfive text\n", "test:2: " + layout},
        {"5text", "test:1: " + layout},
        {"5", "test:1: " + layout},
        {"5   \n", "test:1: message 5 has no text"},
        {"5 a\n6 b\n5 c\n", "test:3: message 5 appears twice"},
        {"4294967296 too large", "test:1: " + layout},
        {"-5 negative", "test:1: " + layout},
    };
    for (const auto& bad : cases) {
        zel::ZELLocalizedMessageDatabase database;
        EXPECT_FALSE(database.load(bad.text, "test")) << bad.text;
        EXPECT_EQ(database.getLastErrorMessage(), bad.reason) << bad.text;
        EXPECT_EQ(database.size(), 0u) << bad.text;
    }
}

TEST(Catalogue, InitializeReadsTheHomeDirectoryWithOrWithoutSeparator)
{
    TempHome temp;
    temp.writeCatalogue("7 seven\n");
    for (const std::string& home : {temp.str(), temp.str() + "/"}) {
        zel::ZELLocalizedMessageDatabase database;
        ASSERT_TRUE(database.initialize(home)) << database.getLastErrorMessage();
        zel::ZELObsoleteStringImp out;
        ASSERT_TRUE(database.createFilledInMessage(7, nullptr, &out, false, false));
        EXPECT_EQ(out.str(), "seven");
    }
    zel::ZELLocalizedMessageDatabase missing;
    EXPECT_FALSE(missing.initialize(temp.str() + "/nowhere"));
    EXPECT_NE(std::string(missing.getLastErrorMessage()).find("nowhere"), std::string::npos);
}

TEST(Catalogue, UnknownNumberLeavesTheOutputAlone)
{
    zel::ZELLocalizedMessageDatabase database;
    ASSERT_TRUE(database.load("5 five", "test"));
    zel::ZELObsoleteStringImp out("kept");
    EXPECT_FALSE(database.createFilledInMessage(6, nullptr, &out, false, false));
    EXPECT_EQ(out.str(), "kept");
    EXPECT_STREQ(database.getLastErrorMessage(), "Message 6 is not in the message catalogue test");
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
    zel::ZELLocalizedMessageDatabase shipped;
    ASSERT_TRUE(shipped.initialize(ZEL_TEST_SOURCE_DIR)) << shipped.getLastErrorMessage();
    EXPECT_EQ(shipped.size(), std::size(raised));

    for (const auto& e : raised) {
        zel::ZELObsoleteStringImp raw;
        ASSERT_TRUE(shipped.createFilledInMessage(e.number, nullptr, &raw, true, false)) << e.number;
        EXPECT_FALSE(raw.str().empty()) << e.number;
        for (unsigned slot = 1; slot <= 9; ++slot) {
            const std::string slotText = std::string("%").append(std::to_string(slot));
            EXPECT_EQ(raw.str().find(slotText) != std::string::npos, slot <= e.parameters)
                << e.number << " slot " << slot << ": " << raw.str();
        }
    }
}

}  // namespace
