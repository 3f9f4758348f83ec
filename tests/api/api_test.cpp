// The library's own value types (strings with embedded NULs, string lists and their token splitters,
// the owning vector of interface pointers, the older string types statuses are filled through, the
// UTF-8 check and Latin-1 conversion of text bound for the wire, the number and truth-value readers);
// status objects and the message catalogue; and the slot layout of the public interfaces. Each case
// runs in its own process, so the process-wide database and the show-numbers flag start fresh.

#include <gtest/gtest.h>
#include <zelserverapi/interfaces.h>

#include <atomic>
#include <cstddef>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <memory>
#include <optional>
#include <string>
#include <thread>
#include <vector>

#include "api/ZELServerStatus.h"
#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/ZELServerVector.h"
#include "api/conversions.h"
#include "api/heap.h"
#include "api/message_numbers.h"
#include "api/status.h"
#include "api/string_adapters.h"
#include "api/text_encoding.h"
#include "session/ZELLocalizedMessageDatabase.h"
#include "session/message_startup.h"
#include "support/environment.h"

namespace fs = std::filesystem;

namespace {

using namespace std::string_literals;
using zel::ZELObsoleteStringImp;
using zel::ZELROStringArrayWrapper;
using zel::ZELServerString;
using zel::ZELServerStringArray;
using Items = std::vector<std::string>;

TEST(ServerString, KeepsNulsComparesExactlyAndSetsFromItsOwnContent)
{
    ZELServerString text;
    text.set("a\0b", 3);
    EXPECT_EQ(text.str(), "a\0b"s);
    EXPECT_FALSE(text.equals("a"));
    EXPECT_TRUE(ZELServerString().equals(nullptr));
    text.assign("abcdef");
    text.set(text.data() + 2, 3);
    EXPECT_EQ(text.str(), "cde");
}

TEST(ServerStringArray, MembershipRemovalAndTokenSplitters)
{
    ZELServerStringArray list({"x", "a", "A", "a\0b"s, "a"});
    EXPECT_TRUE(list.contains(ZELServerString("a\0b", 3)));
    EXPECT_FALSE(list.contains("alpha"));
    EXPECT_EQ(list.removeAll("a"), 2u);
    EXPECT_EQ(list.items(), (Items{"x", "A", "a\0b"s}));

    const struct {
        bool anyOf;
        const char* text;
        const char* delimiter;
        Items expected;
    } cases[] = {
        // appendTokens splits at every occurrence of the first delimiter character
        {false, ";a,;;b", ";,", {"", "a,", "", "b"}},
        {false, "a;b", "", {"a;b"}},
        // appendTokensAnyOf skips runs of any of the delimiters
        {true, ";;a; b;;", "; ", {"a", "b"}},
        {true, nullptr, ";", {}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(std::string(c.anyOf ? "any of, " : "first, ") + (c.text ? c.text : "(null)"));
        ZELServerStringArray tokens({"existing"});
        c.anyOf ? tokens.appendTokensAnyOf(c.text, c.delimiter) : tokens.appendTokens(c.text, c.delimiter);
        Items expected{"existing"};
        expected.insert(expected.end(), c.expected.begin(), c.expected.end());
        EXPECT_EQ(tokens.items(), expected);
    }
}

class IThing {
public:
    virtual int id() const = 0;
    virtual ~IThing() = default;
};

std::vector<int> destroyed;

class Thing final : public IThing, public zel::HeapObject {
public:
    explicit Thing(int id) : id_(id) {}
    ~Thing() override { destroyed.push_back(id_); }
    int id() const override { return id_; }

private:
    int id_;
};

TEST(ServerVector, PlacesItemsIgnoresNullAndDestroysLastFirst)
{
    zel::ZELServerVector<IThing, Thing> vector;
    vector.append(nullptr);
    vector.append(new Thing(1));
    vector.append(new Thing(2));
    vector.insertAt(9, new Thing(3));
    vector.insertAt(0, new Thing(4));
    vector.insertAt(2, new Thing(5));
    std::vector<int> ids;
    for (unsigned i = 0; i < vector.entries(); ++i) {
        ids.push_back(vector.element(i)->id());
    }
    EXPECT_EQ(ids, (std::vector<int>{4, 1, 5, 2, 3}));
    vector.clearAndDestroy();
    EXPECT_EQ(vector.entries(), 0u);
    EXPECT_EQ(destroyed, (std::vector<int>{3, 2, 5, 1, 4}));
}

// ---- The older string types, which statuses fill their texts through

TEST(ReadOnlyStringArrayWrapper, ReadsEntriesWithTheirNulsAndNothingPastTheEnd)
{
    const ZELServerStringArray list({"only", "t\0o"s});
    const ZELROStringArrayWrapper wrapper(&list);
    EXPECT_STREQ(wrapper.element(2), "");
    ZELObsoleteStringImp out("kept");
    EXPECT_EQ(wrapper.getElement(2, out), 1);
    EXPECT_EQ(out.str(), "kept");
    EXPECT_EQ(wrapper.getElement(1, out), 0);
    EXPECT_EQ(out.str(), "t\0o"s);
}

TEST(ObsoleteString, NullClearsAndLatin1TextBecomesUtf8)
{
    ZELObsoleteStringImp text("x");
    text.set(nullptr, 3);
    EXPECT_EQ(text.length(), 0u);
    EXPECT_EQ(zel::latin1ToUtf8("caf\xE9 \xFF\x80\0"s), "caf\xC3\xA9 \xC3\xBF\xC2\x80\0"s);
}

TEST(TextEncoding, RecognisesWellFormedUtf8)
{
    const struct {
        const char* text;
        bool valid;
    } cases[] = {
        {"caf\xC3\xA9 \xE2\x82\xAC \xF0\x9F\x98\x80", true},
        {"\xF4\x8F\xBF\xBF", true},   // U+10FFFF
        {"\xF4\x90\x80\x80", false},  // past U+10FFFF
        {"\xC0\x80", false},
        {"\xED\xBF\xBF", false},
        {"\xE2\x82", false},
        {"\xF8\x88\x80\x80\x80", false},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(zel::isValidUtf8(c.text), c.valid) << c.text;
    }
}

// ---- Texts from the wire

template <class T>
std::string shown(const zel::NumberReading<T>& r)
{
    return (r.read ? std::to_string(r.value) : std::string("-")) + (r.complete ? " whole" : "");
}

TEST(NumberConversion, ReadersAcceptDecimalHexAndZeroFractionsAndRefuseOverflow)
{
    enum Reader { U32, AnyBase, I64 };
    const struct {
        Reader reader;
        const char* text;
        const char* expected;  // value read ("-" for none), " whole" when nothing else follows
    } cases[] = {
        {U32, " 0x1F ", "31 whole"},
        {U32, "0Xaf", "175 whole"},
        {U32, "010", "10 whole"},  // no octal
        {U32, "12.000", "12 whole"},
        {U32, "12.5", "12"},
        {U32, "-0x1F", "0"},  // a sign hides the x from the base choice
        {U32, "4294967295", "4294967295 whole"},
        {U32, "4294967296", "-"},
        {U32, "0x100000000", "-"},
        {U32, "-1", "4294967295 whole"},  // a minus wraps
        {AnyBase, "-1", "-"},
        {AnyBase, "4294967296", "-"},
        {I64, "3600.5", "3600"},
        {I64, "", "-"},
        {I64, "-9223372036854775808", "-9223372036854775808 whole"},
        {I64, "9223372036854775808", "-"},
        {I64, "-9223372036854775809", "-"},
    };
    for (const auto& c : cases) {
        const std::string got = c.reader == U32       ? shown(zel::readUInt32(c.text))
                                : c.reader == AnyBase ? shown(zel::readUInt32AnyBase(c.text))
                                                      : shown(zel::readInt64(c.text));
        EXPECT_EQ(got, c.expected) << "reader " << c.reader << " text \"" << c.text << "\"";
    }
}

TEST(BooleanConversion, FirstLetterThenNumber)
{
    const struct {
        std::string text;
        std::optional<bool> expected;
    } cases[] = {
        {"yes", true},           {"T", true},           {"No", false},          {"f", false},
        {"0.0", false},          {"+0", false},         {".5", true},           {"2", true},
        {"maybe", std::nullopt}, {"", std::nullopt},    {".", std::nullopt},    {"1.2.3", std::nullopt},
        {"10abc", std::nullopt}, {"1e3", std::nullopt}, {" yes", std::nullopt},  // the letter rule looks at the very first character only
    };
    for (const auto& c : cases) {
        EXPECT_EQ(zel::toBoolean(c.text), c.expected) << c.text;
    }
}

// ---- Status objects and the message catalogue

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
TEST(ServerStatus, NoMemoryMakesNoStatus)
{
    zel::heap::failNextAllocations(1);
    EXPECT_EQ(zel::makeStatus(zel::msg::kConnectFailed), nullptr);
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
        {"5 as it is: %1", {"%1%"}, false, "as it is: %1%"},  // a parameter's own slot-like text stays
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

// ---- Slot positions of the public interfaces' overloads. A client calls every operation through its
// position in the virtual table, so an overload moved next to its namesake in a header breaks clients
// that still compile without a murmur. Positions are read from pointers to member functions, whose
// bytes the Itanium C++ ABI defines (x86): the byte offset of the table entry plus one. A virtual
// destructor takes two entries, so every slot behind it sits one entry further on.

#if defined(_MSC_VER) || !(defined(__x86_64__) || defined(__i386__))

TEST(InterfaceLayout, NeedsTheItaniumAbiOnX86) { GTEST_SKIP() << "member function pointers are read the Itanium way"; }

#else

// The slot of a virtual member function, counting the destructor at `destructorSlot` once; -1 when
// the pointer is not virtual.
template <class Signature, class Interface>
long slotOf(Signature Interface::*member, long destructorSlot)
{
    std::ptrdiff_t bits[2];
    static_assert(sizeof member == sizeof bits, "not an Itanium member function pointer");
    std::memcpy(bits, &member, sizeof bits);
    if ((bits[0] & 1) == 0) {
        return -1;
    }
    const long entry = static_cast<long>((bits[0] - 1) / static_cast<std::ptrdiff_t>(sizeof(void*)));
    return entry > destructorSlot ? entry - 1 : entry;
}

TEST(InterfaceLayout, OverloadsKeepTheirSlots)
{
    using Str = const IZELServerString&;
    using A = IZELServerStringArray;
    using S = IZELServerSession;
    using R = IZELServerTransformationResult;
    using Rep = IZELServerRepository;
    using M = IZELServerMountPoint;
    const struct {
        const char* name;
        long slot;
        long expected;
    } cases[] = {
        {"append(string)", slotOf<void(Str)>(&A::append, 13), 0},
        {"append(char*)", slotOf<void(const char*)>(&A::append, 13), 1},
        {"removeAll(string)", slotOf<unsigned(Str)>(&A::removeAll, 13), 11},
        {"createConnectionInfo", slotOf<IZELServerConnectionInfo*(Str, Str, Str)>(&S::createConnectionInfo, 78), 2},
        {"createService", slotOf<IZELServerService*()>(&S::createService, 78), 21},
        {"getBoolProperty(string)", slotOf<unsigned(Str, unsigned&) const>(&R::getBoolProperty, 25), 24},
        {"getBoolProperty(std)", slotOf<unsigned(const std::string&, unsigned&) const>(&R::getBoolProperty, 25), 31},
        {"getItemResource",
         slotOf<IZELServerStatus*(Str, Str, Str, unsigned&, IZELServerProgressListener*)>(&Rep::getItemResource, 33),
         11},
        {"createPath", slotOf<IZELServerPath*(Str, Str)>(&M::createPath, 18), 16},
        {"createUserToken", slotOf<IZELServerUserToken*()>(&IZELServerSecurityManager::createUserToken, 9), 2},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(c.slot, c.expected) << c.name;
    }
}

#endif

}  // namespace
