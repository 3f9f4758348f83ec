// The read-only wrappers that lend a caller's string or list to code expecting the older string
// types, and the owning older string with its Latin-1 re-encodings.

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

void reencodeEveryWay(IZELString& text, int selector)
{
    text.encodeTo(selector);
    text.decodeFrom(selector);
    text.encodeToSecondary(selector);
    text.decodeFromSecondary(selector);
}

// --- ZELROStringWrapper

TEST(ReadOnlyStringWrapper, ReadsTheBorrowedStringLiveAndNeverWritesIt)
{
    ZELServerString target("a\0b", 3);
    ZELROStringWrapper wrapper(&target);
    EXPECT_EQ(wrapper.data(), target.data());
    EXPECT_EQ(wrapper.c_str(), target.data());
    EXPECT_EQ(wrapper.length(), 3u);
    target.assign("caf\xC3\xA9");
    EXPECT_STREQ(wrapper.data(), "caf\xC3\xA9");
    EXPECT_EQ(wrapper.length(), 5u);

    EXPECT_EQ(wrapper.assign("other"), nullptr);
    wrapper.set("other", 5);
    reencodeEveryWay(wrapper, kUtf8);
    reencodeEveryWay(wrapper, kLatin1);
    EXPECT_EQ(target.str(), "caf\xC3\xA9");
    EXPECT_EQ(bytesOf(wrapper), "caf\xC3\xA9");
}

// --- ZELROStringArrayWrapper

TEST(ReadOnlyStringArrayWrapper, ReadsTheBorrowedListLive)
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
    unsigned entries() const override { return list_.entries(); }
    void append(const IZELServerString&) override {}
    void append(const char*) override {}
    int setElement(unsigned, const IZELServerString&) override { return 0; }
    void clear() override {}
    bool contains(const IZELServerString&) const override { return false; }
    bool contains(const char*) const override { return false; }
    void appendTokens(const char*, const char*) override {}
    void appendTokensAnyOf(const char*, const char*) override {}
    unsigned removeAll(const IZELServerString&) override { return 0; }
    unsigned removeAll(const char*) override { return 0; }

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
}

// --- ZELObsoleteStringImp

TEST(ObsoleteString, OwnsAWritableCopy)
{
    ZELObsoleteStringImp text;
    const char* source = "hello";
    EXPECT_EQ(text.assign(source), source);
    EXPECT_STREQ(text.data(), "hello");
    EXPECT_EQ(text.data(), text.c_str());
    text.set("x\0y", 3);
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
        {"price \xE2\x82\xAC"
         "5",
         "price ?5"},                 // U+20AC has no Latin-1 form
        {"\xF0\x9F\x98\x80!", "?!"},  // one character outside the BMP, one '?'
        {"\xFF"
         "a",
         "?a"},                   // a byte that starts nothing
        {"\xED\xA0\x80", "???"},  // encoded surrogate
        {"ab\xE2\x82", "ab??"},   // truncated at the end
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

TEST(ObsoleteString, DecodeFromLatin1GivesUtf8AndEveryLatin1TextRoundTrips)
{
    ZELObsoleteStringImp text(std::string("caf\xE9 \xFF\x80", 7));
    text.decodeFrom(kLatin1);
    EXPECT_EQ(text.str(), "caf\xC3\xA9 \xC3\xBF\xC2\x80");
    EXPECT_TRUE(zel::isValidUtf8(text.str()));
    ZELObsoleteStringImp secondary("\xE9");
    secondary.decodeFromSecondary(kLatin1);
    EXPECT_EQ(secondary.str(), "\xC3\xA9");

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
        ZELObsoleteStringImp text(mixed);
        reencodeEveryWay(text, selector);
        EXPECT_EQ(text.str(), mixed) << selector;
    }
}

TEST(TextEncoding, RecognisesWellFormedUtf8)
{
    const struct {
        const char* text;
        bool valid;
    } cases[] = {
        {"", true},
        {"plain ascii", true},
        {"caf\xC3\xA9 \xE2\x82\xAC \xF0\x9F\x98\x80", true},
        {"\xF4\x8F\xBF\xBF", true},   // U+10FFFF
        {"\xF4\x90\x80\x80", false},  // past U+10FFFF
        {"caf\xE9", false},
        {"\xC0\x80", false},
        {"\xED\xBF\xBF", false},
        {"\xE2\x82", false},
        {"\xF8\x88\x80\x80\x80", false},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(zel::isValidUtf8(c.text), c.valid) << c.text;
    }
}

}  // namespace
