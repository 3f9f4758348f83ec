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

using namespace std::string_literals;
using zel::ZELObsoleteStringImp;
using zel::ZELROStringArrayWrapper;
using zel::ZELServerStringArray;

constexpr int kLatin1 = ZELObsoleteStringImp::kLatin1Selector;

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

TEST(ReadOnlyStringArrayWrapper, ReadsEntriesWithTheirNulsAndNeverPastTheEnd)
{
    const UncheckedList list({"only", "t\0o"s});
    ZELROStringArrayWrapper wrapper(&list);
    EXPECT_STREQ(wrapper.element(0), "only");
    EXPECT_STREQ(wrapper.element(2), "");
    ZELObsoleteStringImp out("kept");
    EXPECT_EQ(wrapper.getElement(2, out), 1);
    EXPECT_EQ(wrapper.getElement(4000000000u, out), 1);
    EXPECT_EQ(out.str(), "kept");
    EXPECT_EQ(wrapper.getElement(1, out), 0);
    EXPECT_EQ(out.str(), "t\0o"s);
}

TEST(ObsoleteString, KeepsNulsAndReencodesOnlyForLatin1)
{
    ZELObsoleteStringImp text;
    text.set("x\0y", 3);
    EXPECT_EQ(text.str(), "x\0y"s);
    text.set(nullptr, 3);
    EXPECT_EQ(text.length(), 0u);

    const struct {
        std::string utf8;
        std::string latin1;
    } cases[] = {
        {"caf\xC3\xA9", "caf\xE9"},  {"price \xE2\x82\xAC!", "price ?!"},  // U+20AC has no Latin-1 form
        {"\xF0\x9F\x98\x80!", "?!"},                                       // one character outside the BMP, one '?'
        {"\xED\xA0\x80", "???"},                                           // encoded surrogate
        {"ab\xE2\x82", "ab??"},                                            // truncated at the end
        {"n\0l"s, "n\0l"s},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.utf8);
        ZELObsoleteStringImp encoded(c.utf8);
        encoded.encodeTo(kLatin1);
        EXPECT_EQ(encoded.str(), c.latin1);
        encoded.encodeTo(ZELObsoleteStringImp::kUtf8Selector);
        EXPECT_EQ(encoded.str(), c.latin1);
    }
    std::string all;
    for (int byte = 1; byte < 256; ++byte) {
        all.push_back(static_cast<char>(byte));
    }
    ZELObsoleteStringImp roundTrip(all);
    roundTrip.decodeFrom(kLatin1);
    EXPECT_TRUE(zel::isValidUtf8(roundTrip.str()));
    roundTrip.encodeTo(kLatin1);
    EXPECT_EQ(roundTrip.str(), all);
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

}  // namespace
