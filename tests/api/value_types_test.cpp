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

std::vector<std::string> itemsOf(const ZELServerStringArray& list)
{
    return list.items();
}

// --- ZELServerString -------------------------------------------------------------------------

TEST(ServerString, AssignReturnsItsArgumentAndReplacesTheContent)
{
    ZELServerString text("old content");
    const char* source = "new";
    EXPECT_EQ(text.assign(source), source);
    EXPECT_STREQ(text.data(), "new");
    EXPECT_EQ(text.length(), 3u);

    EXPECT_EQ(text.assign(nullptr), nullptr);
    EXPECT_EQ(text.length(), 0u);
    EXPECT_STREQ(text.c_str(), "");
}

TEST(ServerString, SetKeepsEmbeddedNulsAndTerminates)
{
    ZELServerString text;
    text.set("a\0b\0", 4);
    EXPECT_EQ(text.length(), 4u);
    EXPECT_EQ(std::string(text.data(), 5), std::string("a\0b\0\0", 5));
    EXPECT_EQ(text.data(), text.c_str());

    text.set("ignored", 0);
    EXPECT_EQ(text.length(), 0u);
    text.set(nullptr, 5);
    EXPECT_EQ(text.length(), 0u);
}

TEST(ServerString, SetFromItsOwnContent)
{
    ZELServerString text("abcdef");
    text.set(text.data() + 2, 3);
    EXPECT_EQ(text.str(), "cde");
}

TEST(ServerString, EqualsComparesLengthAndBytesExactly)
{
    ZELServerString text("abc");
    EXPECT_TRUE(text.equals("abc"));
    EXPECT_FALSE(text.equals("ABC"));
    EXPECT_FALSE(text.equals("ab"));
    EXPECT_FALSE(text.equals("abcd"));

    ZELServerString withNul("ab\0c", 4);
    EXPECT_FALSE(withNul.equals("ab"));

    ZELServerString empty;
    EXPECT_TRUE(empty.equals(""));
    EXPECT_TRUE(empty.equals(nullptr));
    EXPECT_FALSE(text.equals(nullptr));
}

TEST(ServerString, CopiesAreIndependent)
{
    ZELServerString original("one");
    ZELServerString copy(original);
    copy.assign("two");
    EXPECT_EQ(original.str(), "one");
    original = copy;
    EXPECT_EQ(original.str(), "two");
    EXPECT_EQ(zel::toStdString(ZELServerString("x\0y", 3)), std::string("x\0y", 3));
}

TEST(ServerString, AllocationFailureYieldsNull)
{
    zel::heap::failNextAllocations(1);
    IZELServerString* text = new ZELServerString();
    EXPECT_EQ(text, nullptr);
    text = new ZELServerString("fine");
    ASSERT_NE(text, nullptr);
    EXPECT_STREQ(text->data(), "fine");
    delete text;
}

// --- ZELServerStringArray --------------------------------------------------------------------

TEST(ServerStringArray, AppendCopiesAndKeepsOrderAndDuplicates)
{
    ZELServerStringArray list;
    ZELServerString value("v");
    list.append(value);
    list.append("w");
    list.append(value);
    list.append(static_cast<const char*>(nullptr));
    value.assign("changed");
    EXPECT_EQ(itemsOf(list), (std::vector<std::string>{"v", "w", "v", ""}));
    EXPECT_EQ(list.entries(), 4u);
    EXPECT_STREQ(list.element(1), "w");
}

TEST(ServerStringArray, ElementsKeepEmbeddedNuls)
{
    ZELServerStringArray list;
    list.append(ZELServerString("a\0b", 3));
    ZELServerString out("previous");
    EXPECT_EQ(list.getElement(0, out), 0);
    EXPECT_EQ(out.length(), 3u);
    EXPECT_EQ(out.str(), std::string("a\0b", 3));
    EXPECT_TRUE(list.contains(ZELServerString("a\0b", 3)));
    EXPECT_FALSE(list.contains("a"));
}

TEST(ServerStringArray, SetElementReplacesOneElement)
{
    ZELServerStringArray list({"a", "b", "c"});
    EXPECT_EQ(list.setElement(1, ZELServerString("B")), 0);
    EXPECT_EQ(itemsOf(list), (std::vector<std::string>{"a", "B", "c"}));
}

TEST(ServerStringArray, IndexesPastTheEndTouchNothing)
{
    ZELServerStringArray list({"a"});
    EXPECT_STREQ(list.element(1), "");
    ZELServerString out("kept");
    EXPECT_EQ(list.getElement(7, out), 0);
    EXPECT_EQ(out.str(), "kept");
    EXPECT_EQ(list.setElement(1, ZELServerString("x")), 0);
    EXPECT_EQ(itemsOf(list), (std::vector<std::string>{"a"}));
}

TEST(ServerStringArray, ContainsIsExactAndCaseSensitive)
{
    ZELServerStringArray list({"Alpha", "beta"});
    EXPECT_TRUE(list.contains("Alpha"));
    EXPECT_FALSE(list.contains("alpha"));
    EXPECT_FALSE(list.contains("Alph"));
    EXPECT_TRUE(list.contains(ZELServerString("beta")));
    EXPECT_FALSE(list.contains(ZELServerString("BETA")));
    EXPECT_FALSE(list.contains(static_cast<const char*>(nullptr)));
}

TEST(ServerStringArray, RemoveAllKeepsTheOrderOfTheRest)
{
    ZELServerStringArray list({"a", "b", "a"});
    EXPECT_EQ(list.removeAll("a"), 2u);
    EXPECT_EQ(itemsOf(list), (std::vector<std::string>{"b"}));

    ZELServerStringArray longer({"x", "A", "y", "a", "z", "a"});
    EXPECT_EQ(longer.removeAll(ZELServerString("a")), 2u);
    EXPECT_EQ(itemsOf(longer), (std::vector<std::string>{"x", "A", "y", "z"}));
    EXPECT_EQ(longer.removeAll("missing"), 0u);
    EXPECT_EQ(longer.entries(), 4u);
}

TEST(ServerStringArray, ClearEmpties)
{
    ZELServerStringArray list({"a", "b"});
    list.clear();
    EXPECT_EQ(list.entries(), 0u);
    list.append("c");
    EXPECT_EQ(itemsOf(list), (std::vector<std::string>{"c"}));
}

TEST(ServerStringArray, AppendTokensSplitsAtEveryFirstDelimiterCharacter)
{
    const struct {
        const char* text;
        const char* delimiter;
        std::vector<std::string> expected;
    } cases[] = {
        {"a;b;c", ";", {"a", "b", "c"}},
        {"a;;b", ";", {"a", "", "b"}},
        {";a;", ";", {"", "a", ""}},
        {";", ";", {"", ""}},
        {"abc", ";", {"abc"}},
        {"a,b;c", ";,", {"a,b", "c"}},  // only the first delimiter character counts
        {"a%b%%c", "%", {"a", "b", "", "c"}},
        {"", ";", {}},
        {nullptr, ";", {}},
        {"a;b", "", {"a;b"}},
        {"a;b", nullptr, {"a;b"}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(std::string("text ") + (c.text ? c.text : "(null)"));
        ZELServerStringArray list({"existing"});
        list.appendTokens(c.text, c.delimiter);
        std::vector<std::string> expected{"existing"};
        expected.insert(expected.end(), c.expected.begin(), c.expected.end());
        EXPECT_EQ(itemsOf(list), expected);
    }
}

TEST(ServerStringArray, AppendTokensAnyOfSkipsRunsOfDelimiters)
{
    const struct {
        const char* text;
        const char* delimiters;
        std::vector<std::string> expected;
    } cases[] = {
        {";;a; b;;", "; ", {"a", "b"}},
        {"a b\tc", " \t", {"a", "b", "c"}},
        {"abc", ";", {"abc"}},
        {";;;", ";", {}},
        {"", ";", {}},
        {nullptr, ";", {}},
        {"a;b", "", {"a;b"}},
        {"a;b", nullptr, {"a;b"}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(std::string("text ") + (c.text ? c.text : "(null)"));
        ZELServerStringArray list;
        list.appendTokensAnyOf(c.text, c.delimiters);
        EXPECT_EQ(itemsOf(list), c.expected);
    }
}

// --- ZELServerVector -------------------------------------------------------------------------

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

class IOther {
public:
    virtual ~IOther() = default;
};
class Other final : public IOther, public zel::HeapObject {};

using ThingVector = zel::ZELServerVector<IThing, Thing>;

std::vector<int> idsOf(ThingVector& vector)
{
    std::vector<int> ids;
    for (unsigned i = 0; i < vector.entries(); ++i) {
        ids.push_back(vector.element(i)->id());
    }
    return ids;
}

class ServerVector : public ::testing::Test {
protected:
    void SetUp() override { destroyed.clear(); }
};

TEST_F(ServerVector, NullItemsAreIgnored)
{
    ThingVector vector;
    vector.append(nullptr);
    vector.insertAt(0, nullptr);
    EXPECT_EQ(vector.entries(), 0u);
    vector.append(new Thing(1));
    vector.insertAt(0, nullptr);
    vector.append(nullptr);
    EXPECT_EQ(idsOf(vector), (std::vector<int>{1}));
}

TEST_F(ServerVector, InsertAtPlacesBeforeTheIndexOrAppends)
{
    ThingVector vector;
    vector.append(new Thing(1));
    vector.append(new Thing(2));
    vector.insertAt(5, new Thing(3));
    EXPECT_EQ(idsOf(vector), (std::vector<int>{1, 2, 3}));
    vector.insertAt(0, new Thing(4));
    vector.insertAt(2, new Thing(5));
    vector.insertAt(vector.entries(), new Thing(6));
    EXPECT_EQ(idsOf(vector), (std::vector<int>{4, 1, 5, 2, 3, 6}));
}

TEST_F(ServerVector, ElementPastTheEndLendsAResetNullSlot)
{
    ThingVector vector;
    vector.append(new Thing(1));
    IThing*& slot = vector.element(1);
    EXPECT_EQ(slot, nullptr);

    Thing stray(99);
    slot = &stray;
    EXPECT_EQ(vector.entries(), 1u);
    EXPECT_EQ(vector.element(0)->id(), 1);
    EXPECT_EQ(vector.element(1), nullptr);
    EXPECT_EQ(slot, nullptr);  // the same slot, reset by the call above
    EXPECT_EQ(vector.at(1), nullptr);
}

TEST_F(ServerVector, NullSlotIsSharedPerElementType)
{
    ThingVector first;
    ThingVector second;
    zel::ZELServerVector<IOther, Other> other;
    EXPECT_EQ(&first.element(0), &second.element(3));
    EXPECT_NE(static_cast<void*>(&first.element(0)), static_cast<void*>(&other.element(0)));
}

TEST_F(ServerVector, WritingThroughAnElementReplacesIt)
{
    ThingVector vector;
    vector.append(new Thing(1));
    Thing* replaced = static_cast<Thing*>(vector.element(0));
    vector.element(0) = new Thing(2);
    delete replaced;
    EXPECT_EQ(idsOf(vector), (std::vector<int>{2}));
}

TEST_F(ServerVector, RemoveLastHandsOwnershipToTheCaller)
{
    ThingVector vector;
    EXPECT_EQ(vector.removeLast(), nullptr);
    vector.append(new Thing(1));
    vector.append(new Thing(2));
    IThing* last = vector.removeLast();
    ASSERT_NE(last, nullptr);
    EXPECT_EQ(last->id(), 2);
    EXPECT_EQ(vector.entries(), 1u);
    EXPECT_TRUE(destroyed.empty());
    delete last;
    EXPECT_EQ(destroyed, (std::vector<int>{2}));
}

TEST_F(ServerVector, ClearForgetsWithoutDestroying)
{
    auto* one = new Thing(1);
    auto* two = new Thing(2);
    {
        ThingVector vector;
        vector.append(one);
        vector.append(two);
        vector.clear();
        EXPECT_EQ(vector.entries(), 0u);
    }
    EXPECT_TRUE(destroyed.empty());
    delete one;
    delete two;
}

TEST_F(ServerVector, ClearAndDestroyDestroysLastFirst)
{
    ThingVector vector;
    for (int id = 1; id <= 3; ++id) {
        vector.append(new Thing(id));
    }
    vector.clearAndDestroy();
    EXPECT_EQ(vector.entries(), 0u);
    EXPECT_EQ(destroyed, (std::vector<int>{3, 2, 1}));
    vector.append(new Thing(4));
    EXPECT_EQ(vector.entries(), 1u);
}

TEST_F(ServerVector, ClearAndDestroyGoesPastANullStoredByTheCaller)
{
    ThingVector vector;
    for (int id = 1; id <= 3; ++id) {
        vector.append(new Thing(id));
    }
    IThing* middle = vector.element(1);
    vector.element(1) = nullptr;
    vector.clearAndDestroy();
    EXPECT_EQ(destroyed, (std::vector<int>{3, 1}));
    delete middle;
}

TEST_F(ServerVector, DestroyingTheVectorDestroysItsElements)
{
    auto* vector = new ThingVector;
    ASSERT_NE(vector, nullptr);
    vector->append(new Thing(1));
    vector->append(new Thing(2));
    IZELServerVector<IThing>* asInterface = vector;
    delete asInterface;
    EXPECT_EQ(destroyed, (std::vector<int>{2, 1}));
}

TEST_F(ServerVector, AllocationFailureYieldsNull)
{
    zel::heap::failNextAllocations(1);
    EXPECT_EQ(new ThingVector, nullptr);
}

// --- StringDict ------------------------------------------------------------------------------

TEST(StringDict, ShortListsGiveAnEmptyDictionary)
{
    EXPECT_TRUE(zel::StringDict(ZELServerStringArray()).empty());
    EXPECT_TRUE(zel::StringDict(ZELServerStringArray({"lonely"})).empty());
}

TEST(StringDict, OddLastElementIsIgnored)
{
    const zel::StringDict dict(ZELServerStringArray({"k1", "v1", "k2"}));
    EXPECT_EQ(dict.entries(), 1u);
    ASSERT_NE(dict.find("k1"), nullptr);
    EXPECT_EQ(*dict.find("k1"), "v1");
    EXPECT_EQ(dict.find("k2"), nullptr);
}

TEST(StringDict, FirstOccurrenceOfAKeyWins)
{
    const zel::StringDict dict(ZELServerStringArray({"CLIENT_ID", "first", "other", "x", "CLIENT_ID", "second"}));
    EXPECT_EQ(dict.entries(), 2u);
    EXPECT_EQ(*dict.find("CLIENT_ID"), "first");

    zel::StringDict built;
    EXPECT_TRUE(built.insert("k", "one"));
    EXPECT_FALSE(built.insert("k", "two"));
    EXPECT_EQ(*built.find("k"), "one");
}

TEST(StringDict, KeysAreExactBytes)
{
    ZELServerStringArray pairs({"SSO_AUTH_DATA", ""});
    pairs.append(ZELServerString("a\0b", 3));
    pairs.append(ZELServerString("v\0w", 3));
    const zel::StringDict dict(pairs);
    EXPECT_TRUE(dict.contains("SSO_AUTH_DATA"));
    EXPECT_EQ(*dict.find("SSO_AUTH_DATA"), "");
    EXPECT_FALSE(dict.contains("sso_auth_data"));
    EXPECT_FALSE(dict.contains("SSO_AUTH_DATA "));
    ASSERT_NE(dict.find(std::string("a\0b", 3)), nullptr);
    EXPECT_EQ(*dict.find(std::string("a\0b", 3)), std::string("v\0w", 3));
    EXPECT_FALSE(dict.contains("a"));
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

TEST(StringDict, PublicDictionaryWritesPairsInKeyOrder)
{
    ZELServerStringDict dict;
    dict.insert("zeta", "last");
    dict.insert("alpha", "first");
    dict.insert(std::string("n\0ul", 4), std::string("v\0", 2));
    ZELServerStringArray out({"already"});
    zel::appendPairs(dict, out);
    EXPECT_EQ(itemsOf(out), (std::vector<std::string>{"already", "alpha", "first", std::string("n\0ul", 4),
                                                      std::string("v\0", 2), "zeta", "last"}));

    ZELServerStringArray pairsOnly;
    zel::appendPairs(dict, pairsOnly);
    const ZELServerStringDict back = zel::toStringDict(pairsOnly);
    EXPECT_EQ(back.entries(), 3u);
    EXPECT_EQ(*back.find(std::string("n\0ul", 4)), std::string("v\0", 2));
}

}  // namespace
