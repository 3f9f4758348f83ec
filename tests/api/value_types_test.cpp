// The value types handed to callers: strings with embedded NULs, string lists and their token
// splitters, the owning vector of interface pointers, and the pair dictionaries.

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "api/StringDict.h"
#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/ZELServerVector.h"
#include "api/heap.h"

namespace {

using zel::ZELServerString;
using zel::ZELServerStringArray;
using Items = std::vector<std::string>;

// --- ZELServerString

TEST(ServerString, AssignAndSetReplaceTheContentKeepingNulsAndTheTerminator)
{
    ZELServerString text("old content");
    const char* source = "new";
    EXPECT_EQ(text.assign(source), source);
    EXPECT_STREQ(text.data(), "new");
    EXPECT_EQ(text.length(), 3u);
    EXPECT_EQ(text.assign(nullptr), nullptr);
    EXPECT_EQ(text.length(), 0u);
    EXPECT_STREQ(text.c_str(), "");

    text.set("a\0b\0", 4);
    EXPECT_EQ(text.length(), 4u);
    EXPECT_EQ(std::string(text.data(), 5), std::string("a\0b\0\0", 5));
    EXPECT_EQ(text.data(), text.c_str());
    text.set("ignored", 0);
    EXPECT_EQ(text.length(), 0u);
    text.set(nullptr, 5);
    EXPECT_EQ(text.length(), 0u);

    // From its own content.
    text.assign("abcdef");
    text.set(text.data() + 2, 3);
    EXPECT_EQ(text.str(), "cde");
}

TEST(ServerString, EqualsComparesLengthAndBytesExactly)
{
    const ZELServerString text("abc");
    EXPECT_TRUE(text.equals("abc"));
    EXPECT_FALSE(text.equals("ABC"));
    EXPECT_FALSE(text.equals("ab"));
    EXPECT_FALSE(text.equals("abcd"));
    EXPECT_FALSE(text.equals(nullptr));
    EXPECT_FALSE(ZELServerString("ab\0c", 4).equals("ab"));
    EXPECT_TRUE(ZELServerString().equals(""));
    EXPECT_TRUE(ZELServerString().equals(nullptr));
}

// --- ZELServerStringArray

TEST(ServerStringArray, AppendCopiesKeepingOrderDuplicatesAndNuls)
{
    ZELServerStringArray list;
    ZELServerString value("v");
    list.append(value);
    list.append("w");
    list.append(value);
    list.append(static_cast<const char*>(nullptr));
    list.append(ZELServerString("a\0b", 3));
    value.assign("changed");
    EXPECT_EQ(list.items(), (Items{"v", "w", "v", "", std::string("a\0b", 3)}));
    EXPECT_EQ(list.entries(), 5u);
    EXPECT_STREQ(list.element(1), "w");

    ZELServerString out("previous");
    EXPECT_EQ(list.getElement(4, out), 0);
    EXPECT_EQ(out.str(), std::string("a\0b", 3));
    EXPECT_TRUE(list.contains(ZELServerString("a\0b", 3)));
    EXPECT_FALSE(list.contains("a"));

    list.clear();
    EXPECT_EQ(list.entries(), 0u);
    list.append("c");
    EXPECT_EQ(list.items(), (Items{"c"}));
}

TEST(ServerStringArray, ContainsAndRemoveAllAreExactAndKeepTheOrderOfTheRest)
{
    ZELServerStringArray list({"Alpha", "beta"});
    EXPECT_TRUE(list.contains("Alpha"));
    EXPECT_FALSE(list.contains("alpha"));
    EXPECT_FALSE(list.contains("Alph"));
    EXPECT_TRUE(list.contains(ZELServerString("beta")));
    EXPECT_FALSE(list.contains(ZELServerString("BETA")));
    EXPECT_FALSE(list.contains(static_cast<const char*>(nullptr)));

    ZELServerStringArray longer({"x", "a", "A", "y", "a", "z", "a"});
    EXPECT_EQ(longer.removeAll("a"), 3u);
    EXPECT_EQ(longer.items(), (Items{"x", "A", "y", "z"}));
    longer.append("A");
    EXPECT_EQ(longer.removeAll(ZELServerString("A")), 2u);
    EXPECT_EQ(longer.removeAll("missing"), 0u);
    EXPECT_EQ(longer.items(), (Items{"x", "y", "z"}));
}

TEST(ServerStringArray, TokenSplitters)
{
    const struct {
        bool anyOf;
        const char* text;
        const char* delimiter;
        Items expected;
    } cases[] = {
        // appendTokens splits at every occurrence of the first delimiter character
        {false, "a;b;c", ";", {"a", "b", "c"}},
        {false, "a;;b", ";", {"a", "", "b"}},
        {false, ";a;", ";", {"", "a", ""}},
        {false, "a,b;c", ";,", {"a,b", "c"}},
        {false, "a%b%%c", "%", {"a", "b", "", "c"}},
        {false, nullptr, ";", {}},
        {false, "a;b", "", {"a;b"}},
        {false, "a;b", nullptr, {"a;b"}},
        // appendTokensAnyOf skips runs of any of the delimiters
        {true, ";;a; b;;", "; ", {"a", "b"}},
        {true, ";;;", ";", {}},
        {true, nullptr, ";", {}},
        {true, "a;b", "", {"a;b"}},
        {true, "a;b", nullptr, {"a;b"}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(std::string(c.anyOf ? "any of, " : "first, ") + (c.text ? c.text : "(null)"));
        ZELServerStringArray list({"existing"});
        if (c.anyOf) {
            list.appendTokensAnyOf(c.text, c.delimiter);
        } else {
            list.appendTokens(c.text, c.delimiter);
        }
        Items expected{"existing"};
        expected.insert(expected.end(), c.expected.begin(), c.expected.end());
        EXPECT_EQ(list.items(), expected);
    }
}

// --- ZELServerVector

class IThing {
public:
    virtual int id() const = 0;
    virtual ~IThing() = default;
};

// Records the order in which elements are destroyed.
std::vector<int> destroyed;

class Thing final : public IThing, public zel::HeapObject {
public:
    explicit Thing(int id) : id_(id) {}
    ~Thing() override { destroyed.push_back(id_); }
    int id() const override { return id_; }

private:
    int id_;
};

using ThingVector = zel::ZELServerVector<IThing, Thing>;

class ServerVector : public ::testing::Test {
protected:
    void SetUp() override { destroyed.clear(); }

    static std::vector<int> idsOf(ThingVector& vector)
    {
        std::vector<int> ids;
        for (unsigned i = 0; i < vector.entries(); ++i) {
            ids.push_back(vector.element(i)->id());
        }
        return ids;
    }
    static void fill(ThingVector& vector, int count)
    {
        for (int id = 1; id <= count; ++id) {
            vector.append(new Thing(id));
        }
    }
};

TEST_F(ServerVector, InsertAtPlacesBeforeTheIndexOrAppendsAndNullItemsAreIgnored)
{
    ThingVector vector;
    vector.append(nullptr);
    vector.insertAt(0, nullptr);
    EXPECT_EQ(vector.entries(), 0u);
    fill(vector, 2);
    vector.insertAt(5, new Thing(3));
    vector.insertAt(0, nullptr);
    vector.append(nullptr);
    EXPECT_EQ(idsOf(vector), (std::vector<int>{1, 2, 3}));
    vector.insertAt(0, new Thing(4));
    vector.insertAt(2, new Thing(5));
    vector.insertAt(vector.entries(), new Thing(6));
    EXPECT_EQ(idsOf(vector), (std::vector<int>{4, 1, 5, 2, 3, 6}));
}

TEST_F(ServerVector, RemoveLastAndClearHandOwnershipToTheCaller)
{
    ThingVector vector;
    EXPECT_EQ(vector.removeLast(), nullptr);
    fill(vector, 2);
    IThing* last = vector.removeLast();
    ASSERT_NE(last, nullptr);
    EXPECT_EQ(last->id(), 2);
    EXPECT_EQ(vector.entries(), 1u);
    IThing* first = vector.element(0);
    vector.clear();
    EXPECT_EQ(vector.entries(), 0u);
    EXPECT_TRUE(destroyed.empty());
    delete last;
    delete first;
    EXPECT_EQ(destroyed, (std::vector<int>{2, 1}));
}

TEST_F(ServerVector, ClearAndDestroyDestroysLastFirstAndGoesPastANullStoredByTheCaller)
{
    ThingVector vector;
    fill(vector, 3);
    vector.clearAndDestroy();
    EXPECT_EQ(vector.entries(), 0u);
    EXPECT_EQ(destroyed, (std::vector<int>{3, 2, 1}));

    destroyed.clear();
    fill(vector, 3);
    IThing* middle = vector.element(1);
    vector.element(1) = nullptr;
    vector.clearAndDestroy();
    EXPECT_EQ(destroyed, (std::vector<int>{3, 1}));
    delete middle;
}

// --- StringDict

TEST(StringDict, ShortListsAndAnOddLastElementAreIgnoredAndTheFirstOccurrenceWins)
{
    EXPECT_TRUE(zel::StringDict(ZELServerStringArray()).empty());
    EXPECT_TRUE(zel::StringDict(ZELServerStringArray({"lonely"})).empty());

    const zel::StringDict dict(
        ZELServerStringArray({"CLIENT_ID", "first", "other", "x", "CLIENT_ID", "second", "odd"}));
    EXPECT_EQ(dict.entries(), 2u);
    ASSERT_NE(dict.find("CLIENT_ID"), nullptr);
    EXPECT_EQ(*dict.find("CLIENT_ID"), "first");
    EXPECT_EQ(dict.find("odd"), nullptr);

    zel::StringDict built;
    EXPECT_TRUE(built.insert("k", "one"));
    EXPECT_FALSE(built.insert("k", "two"));
    EXPECT_EQ(*built.find("k"), "one");
}

TEST(StringDict, PublicDictionaryFromPairsLetsALaterValueWin)
{
    const ZELServerStringDict dict = zel::toStringDict(ZELServerStringArray({"b", "1", "a", "2", "b", "3", "odd"}));
    EXPECT_EQ(dict.entries(), 2u);
    EXPECT_STREQ(dict.lookup("b"), "3");
    EXPECT_STREQ(dict.lookup("a"), "2");
    EXPECT_EQ(dict.lookup("odd"), nullptr);

    ZELServerStringDict existing;
    existing.insert("keep", "me");
    zel::insertPairs(ZELServerStringArray({"x"}), existing);
    EXPECT_EQ(existing.entries(), 1u);
}

}  // namespace
