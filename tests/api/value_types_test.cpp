// The value types handed to callers: strings with embedded NULs, string lists and their token
// splitters, the owning vector of interface pointers; the older string types statuses are filled
// through, and the UTF-8 check and Latin-1 conversion of text bound for the wire. Then texts from the
// wire: what each number and truth-value reader accepts and where it overflows, and how a reply is
// cut into status word and body.

#include <gtest/gtest.h>

#include <optional>
#include <string>
#include <vector>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/ZELServerVector.h"
#include "api/heap.h"
#include "api/string_adapters.h"
#include "api/conversions.h"
#include "api/text_encoding.h"
#include "api/text_split.h"

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

// How the transport cuts a reply: the status word, then the body verbatim (the reply splitter's own
// table has the rest).
TEST(SplitOnce, StatusWordThenTheBodyVerbatim)
{
    const std::pair<std::string, Items> cases[] = {
        {"\0\0SUCCESS\0a\0b"s, {"SUCCESS", "a\0b"s}},  // leading NULs skipped, the body keeps its NULs
        {"\0\0"s, {}},
    };
    for (const auto& [text, expected] : cases) {
        Items out{"kept"};
        EXPECT_EQ(zel::splitOnce(text, "\0"s, 2, out), expected.size()) << text;
        out.erase(out.begin());
        EXPECT_EQ(out, expected) << text;
    }
}

}  // namespace
