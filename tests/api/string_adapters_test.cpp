#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/string_adapters.h"
#include "api/text_encoding.h"

namespace {

using zel::ZELObsoleteStringImp;
using zel::ZELROStringArrayWrapper;
using zel::ZELROStringWrapper;
using zel::ZELServerString;
using zel::ZELServerStringArray;

constexpr int kUtf8 = ZELObsoleteStringImp::kUtf8Selector;
constexpr int kLatin1 = ZELObsoleteStringImp::kLatin1Selector;

std::string bytesOf(const IZELString& text)
{
    return text.data() ? std::string(text.data(), text.length()) : std::string("(null)");
}

// --- ZELROStringWrapper ----------------------------------------------------------------------

TEST(ReadOnlyStringWrapper, NothingBorrowedReadsAsNull)
{
    ZELROStringWrapper wrapper;
    EXPECT_EQ(wrapper.data(), nullptr);
    EXPECT_EQ(wrapper.c_str(), nullptr);
    EXPECT_EQ(wrapper.length(), 0u);
    EXPECT_EQ(wrapper.assign("x"), nullptr);
    wrapper.set("x", 1);
    EXPECT_EQ(wrapper.data(), nullptr);
}

TEST(ReadOnlyStringWrapper, ReadsTheBorrowedStringLive)
{
    ZELServerString target("a\0b", 3);
    ZELROStringWrapper wrapper(&target);
    EXPECT_EQ(wrapper.data(), target.data());
    EXPECT_EQ(wrapper.c_str(), target.data());
    EXPECT_EQ(wrapper.length(), 3u);
    target.assign("longer text");
    EXPECT_STREQ(wrapper.data(), "longer text");
    EXPECT_EQ(wrapper.length(), 11u);
}

TEST(ReadOnlyStringWrapper, WritesAndReencodingsChangeNothing)
{
    ZELServerString target("caf\xC3\xA9");
    ZELROStringWrapper wrapper(&target);
    EXPECT_EQ(wrapper.assign("other"), nullptr);
    wrapper.set("other", 5);
    for (const int selector : {kUtf8, kLatin1}) {
        wrapper.encodeTo(selector);
        wrapper.decodeFrom(selector);
        wrapper.encodeToSecondary(selector);
        wrapper.decodeFromSecondary(selector);
    }
    EXPECT_EQ(target.str(), "caf\xC3\xA9");
    EXPECT_EQ(bytesOf(wrapper), "caf\xC3\xA9");
}

TEST(ReadOnlyStringWrapper, RebindTakesOverTheOtherWrappersTarget)
{
    ZELServerString first("first");
    ZELServerString second("second");
    ZELROStringWrapper wrapper(&first);
    wrapper.rebind(ZELROStringWrapper(&second));
    EXPECT_STREQ(wrapper.data(), "second");
    wrapper.rebind(ZELROStringWrapper());
    EXPECT_EQ(wrapper.data(), nullptr);
    EXPECT_EQ(wrapper.length(), 0u);
    EXPECT_EQ(first.str(), "first");
}

// --- ZELROStringArrayWrapper -----------------------------------------------------------------

TEST(ReadOnlyStringArrayWrapper, NothingBorrowedReadsAsEmpty)
{
    ZELROStringArrayWrapper wrapper;
    EXPECT_EQ(wrapper.entries(), 0u);
    EXPECT_STREQ(wrapper.element(0), "");
    ZELObsoleteStringImp out("untouched");
    EXPECT_EQ(wrapper.getElement(0, out), 1);
    EXPECT_EQ(out.str(), "untouched");
    EXPECT_FALSE(wrapper.contains(""));
    EXPECT_FALSE(wrapper.contains(ZELObsoleteStringImp("")));
    EXPECT_TRUE(wrapper.isReadOnly());
}

TEST(ReadOnlyStringArrayWrapper, ReadsTheBorrowedList)
{
    ZELServerStringArray list({"one"});
    list.append(ZELServerString("t\0o", 3));
    ZELROStringArrayWrapper wrapper(&list);
    EXPECT_EQ(wrapper.entries(), 2u);
    EXPECT_STREQ(wrapper.element(0), "one");
    EXPECT_STREQ(wrapper.element(2), "");

    ZELObsoleteStringImp out("before");
    EXPECT_EQ(wrapper.getElement(1, out), 0);
    EXPECT_EQ(out.str(), std::string("t\0o", 3));
    EXPECT_EQ(wrapper.getElement(2, out), 1);
    EXPECT_EQ(out.str(), std::string("t\0o", 3));

    list.append("three");
    EXPECT_EQ(wrapper.entries(), 3u);
    EXPECT_STREQ(wrapper.element(2), "three");
}

// A list that, like any caller's implementation may, does no range checks of its own: the wrapper
// must never hand it an index past the end.
class UncheckedList final : public IZELServerStringArray {
public:
    explicit UncheckedList(std::vector<std::string> items) : list_(std::move(items)) {}
    void append(const IZELServerString& value) override { list_.append(value); }
    void append(const char* value) override { list_.append(value); }
    const char* element(unsigned index) const override
    {
        EXPECT_LT(index, list_.entries()) << "element read past the end";
        return list_.element(index);
    }
    int getElement(unsigned index, IZELServerString& out) const override
    {
        EXPECT_LT(index, list_.entries()) << "getElement past the end";
        return list_.getElement(index, out);
    }
    int setElement(unsigned index, const IZELServerString& value) override { return list_.setElement(index, value); }
    unsigned entries() const override { return list_.entries(); }
    void clear() override { list_.clear(); }
    bool contains(const IZELServerString& value) const override { return list_.contains(value); }
    bool contains(const char* value) const override { return list_.contains(value); }
    void appendTokens(const char* text, const char* delimiter) override { list_.appendTokens(text, delimiter); }
    void appendTokensAnyOf(const char* text, const char* delimiters) override { list_.appendTokensAnyOf(text, delimiters); }
    unsigned removeAll(const IZELServerString& value) override { return list_.removeAll(value); }
    unsigned removeAll(const char* value) override { return list_.removeAll(value); }

private:
    ZELServerStringArray list_;
};

TEST(ReadOnlyStringArrayWrapper, NeverReadsTheBorrowedListPastItsEnd)
{
    const UncheckedList list({"only"});
    ZELROStringArrayWrapper wrapper(&list);
    EXPECT_STREQ(wrapper.element(0), "only");
    EXPECT_STREQ(wrapper.element(1), "");
    ZELObsoleteStringImp out("kept");
    EXPECT_EQ(wrapper.getElement(1, out), 1);
    EXPECT_EQ(wrapper.getElement(4000000000u, out), 1);
    EXPECT_EQ(out.str(), "kept");
}

TEST(ReadOnlyStringArrayWrapper, SearchesAreExact)
{
    ZELServerStringArray list({"Alpha", "beta"});
    list.append(ZELServerString("n\0l", 3));
    ZELROStringArrayWrapper wrapper(&list);
    EXPECT_TRUE(wrapper.contains("Alpha"));
    EXPECT_FALSE(wrapper.contains("alpha"));
    EXPECT_FALSE(wrapper.contains(static_cast<const char*>(nullptr)));
    EXPECT_TRUE(wrapper.contains(ZELObsoleteStringImp("beta")));
    EXPECT_FALSE(wrapper.contains(ZELObsoleteStringImp("BETA")));
    EXPECT_TRUE(wrapper.contains(ZELObsoleteStringImp(std::string("n\0l", 3))));
    EXPECT_FALSE(wrapper.contains(ZELObsoleteStringImp("n")));
    // A read-only string that borrows nothing searches for the empty text.
    EXPECT_FALSE(wrapper.contains(ZELROStringWrapper()));
    list.append("");
    EXPECT_TRUE(wrapper.contains(ZELROStringWrapper()));
}

TEST(ReadOnlyStringArrayWrapper, ModifiersChangeNothingAndReturnZero)
{
    ZELServerStringArray list({"a", "b", "a"});
    ZELROStringArrayWrapper wrapper(&list);
    wrapper.append("c");
    wrapper.append(ZELObsoleteStringImp("c"));
    EXPECT_EQ(wrapper.setElement(0, ZELObsoleteStringImp("z")), 0);
    wrapper.insertAt(0, "z");
    EXPECT_EQ(wrapper.removeAt(0), 0);
    EXPECT_EQ(wrapper.removeAll("a"), 0);
    wrapper.sort();
    wrapper.clear();
    EXPECT_EQ(list.items(), (std::vector<std::string>{"a", "b", "a"}));
    EXPECT_TRUE(wrapper.isReadOnly());
}

// --- ZELObsoleteStringImp --------------------------------------------------------------------

TEST(ObsoleteString, OwnsAWritableCopy)
{
    ZELObsoleteStringImp text;
    const char* source = "hello";
    EXPECT_EQ(text.assign(source), source);
    EXPECT_STREQ(text.data(), "hello");
    EXPECT_EQ(text.data(), text.c_str());
    text.set("x\0y", 3);
    EXPECT_EQ(text.length(), 3u);
    EXPECT_EQ(bytesOf(text), std::string("x\0y", 3));
    text.set(nullptr, 3);
    EXPECT_EQ(text.length(), 0u);
    EXPECT_EQ(text.assign(nullptr), nullptr);
    EXPECT_STREQ(text.data(), "");

    ZELObsoleteStringImp copy(ZELObsoleteStringImp("orig"));
    ZELObsoleteStringImp other;
    other = copy;
    copy.assign("changed");
    EXPECT_EQ(other.str(), "orig");
}

TEST(ObsoleteString, EncodeToLatin1KeepsTheLossyText)
{
    const struct {
        std::string utf8;
        std::string latin1;
    } cases[] = {
        {"plain", "plain"},
        {"caf\xC3\xA9", "caf\xE9"},
        {"\xC2\xA0\xC3\xBF", "\xA0\xFF"},
        {"price \xE2\x82\xAC" "5", "price ?5"},       // U+20AC has no Latin-1 form
        {"\xF0\x9F\x98\x80!", "?!"},                   // one character outside the BMP, one '?'
        {"\xFF" "a", "?a"},                            // a byte that starts nothing
        {"\xC0\xAF", "??"},                            // overlong form of '/'
        {"\xED\xA0\x80", "???"},                       // encoded surrogate
        {"ab\xE2\x82", "ab??"},                        // truncated at the end
        {"a\xC3" "b", "a?b"},                          // lead byte without continuation
        {std::string("n\0l", 3), std::string("n\0l", 3)},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.utf8);
        ZELObsoleteStringImp text(c.utf8);
        text.encodeTo(kLatin1);
        EXPECT_EQ(text.str(), c.latin1);

        ZELObsoleteStringImp secondary(c.utf8);
        secondary.encodeToSecondary(kLatin1);
        EXPECT_EQ(secondary.str(), c.latin1);
    }
}

TEST(ObsoleteString, DecodeFromLatin1GivesUtf8)
{
    ZELObsoleteStringImp text(std::string("caf\xE9 \xFF\x80", 7));
    text.decodeFrom(kLatin1);
    EXPECT_EQ(text.str(), "caf\xC3\xA9 \xC3\xBF\xC2\x80");
    EXPECT_TRUE(zel::isValidUtf8(text.str()));

    ZELObsoleteStringImp secondary("\xE9");
    secondary.decodeFromSecondary(kLatin1);
    EXPECT_EQ(secondary.str(), "\xC3\xA9");

    // Every Latin-1 text survives the round trip.
    std::string all;
    for (int byte = 1; byte < 256; ++byte) {
        all.push_back(static_cast<char>(byte));
    }
    ZELObsoleteStringImp roundTrip(all);
    roundTrip.decodeFrom(kLatin1);
    roundTrip.encodeTo(kLatin1);
    EXPECT_EQ(roundTrip.str(), all);
}

TEST(ObsoleteString, Utf8SelectorAndUnknownSelectorsLeaveTheBytes)
{
    const std::string mixed = "caf\xC3\xA9 \xFF";
    for (const int selector : {kUtf8, 5, -1}) {
        SCOPED_TRACE(selector);
        ZELObsoleteStringImp text(mixed);
        text.encodeTo(selector);
        text.decodeFrom(selector);
        text.encodeToSecondary(selector);
        text.decodeFromSecondary(selector);
        EXPECT_EQ(text.str(), mixed);
    }
}

TEST(TextEncoding, RecognisesWellFormedUtf8)
{
    EXPECT_TRUE(zel::isValidUtf8(""));
    EXPECT_TRUE(zel::isValidUtf8("plain ascii"));
    EXPECT_TRUE(zel::isValidUtf8("caf\xC3\xA9 \xE2\x82\xAC \xF0\x9F\x98\x80"));
    EXPECT_TRUE(zel::isValidUtf8("\xF4\x8F\xBF\xBF"));   // U+10FFFF
    EXPECT_FALSE(zel::isValidUtf8("\xF4\x90\x80\x80"));  // past U+10FFFF
    EXPECT_FALSE(zel::isValidUtf8("caf\xE9"));
    EXPECT_FALSE(zel::isValidUtf8("\xC0\x80"));
    EXPECT_FALSE(zel::isValidUtf8("\xE0\x80\xAF"));
    EXPECT_FALSE(zel::isValidUtf8("\xED\xBF\xBF"));
    EXPECT_FALSE(zel::isValidUtf8("\xE2\x82"));
    EXPECT_FALSE(zel::isValidUtf8("\x80"));
    EXPECT_FALSE(zel::isValidUtf8("\xF8\x88\x80\x80\x80"));
}

}  // namespace
