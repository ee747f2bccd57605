#include "launcher/properties/property_index.h"

#include "launcher/properties/placeholders.h"
#include "launcher/properties/vmarg_map.h"
#include "tests/unit/support.h"

#include <gtest/gtest.h>

// "key<n>" with "value<n>", for n from 0 on.
static PropertyList numbered(size_t pairs)
{
    PropertyList list;
    for (size_t n = 0; n < pairs; ++n)
        appendProperty(list, L"key" + std::to_wstring(n), L"value" + std::to_wstring(n));
    return list;
}

// Searches until the list has an index.
static void search(const PropertyList& list)
{
    for (unsigned i = 0; i <= UNINDEXED_SEARCHES; ++i)
        findProperty(L"key1", list);
}

static std::wstring found(const wchar_t* key, const PropertyList& list)
{
    const wchar_t* value = findProperty(key, list);
    return value == nullptr ? L"(none)" : value;
}

TEST(isIndexed, BeginsBehindAFewSearchesOfTheSameList)
{
    PropertyList list = numbered(INDEXED_PAIRS);
    for (unsigned i = 0; i < UNINDEXED_SEARCHES; ++i)
        EXPECT_FALSE(isIndexed(list));
    EXPECT_TRUE(isIndexed(list));
    EXPECT_TRUE(isIndexed(list));
    const PropertyList copy = list;
    EXPECT_TRUE(isIndexed(copy));
    appendProperty(list, L"another", L"1");
    EXPECT_FALSE(isIndexed(list));
    freeProperties(list);
}

TEST(isIndexed, LeavesAShortListAlone)
{
    PropertyList list = numbered(INDEXED_PAIRS - 1);
    for (unsigned i = 0; i < 2 * UNINDEXED_SEARCHES; ++i)
        EXPECT_FALSE(isIndexed(list));
    freeProperties(list);
}

TEST(findByIndex, FindsEveryKeyAndNoOther)
{
    PropertyList list = numbered(3000);
    search(list);
    ASSERT_TRUE(isIndexed(list));
    for (size_t n = 0; n < 3000; ++n)
        EXPECT_EQ(findByIndex((L"key" + std::to_wstring(n)).c_str(), list), 2 * n);
    for (const wchar_t* key : {L"", L"key", L"key3000", L"key01", L"value1", L"Key1"})
        EXPECT_EQ(findByIndex(key, list), list.size()) << key;
    freeProperties(list);
}

TEST(findByIndex, LetsTheFirstOfEqualKeysWin)
{
    PropertyList list = numbered(1000);
    appendProperty(list, L"key7", L"a second one");
    appendProperty(list, L"", L"no key");
    appendProperty(list, L"", L"none again");
    search(list);
    EXPECT_TRUE(isIndexed(list));
    EXPECT_EQ(found(L"key7", list), L"value7");
    EXPECT_EQ(found(L"", list), L"no key");
    freeProperties(list);
}

TEST(findByIndex, PassesOverAKeyWithoutAValue)
{
    PropertyList list = numbered(1000);
    wchar_t last[] = L"last";
    list.push_back(last);
    search(list);
    EXPECT_TRUE(isIndexed(list));
    EXPECT_EQ(found(L"last", list), L"(none)");
    EXPECT_EQ(found(L"key999", list), L"value999");
    list.pop_back();
    freeProperties(list);
}

TEST(findByIndex, SeesWhatWasAppended)
{
    PropertyList list = numbered(1000);
    search(list);
    EXPECT_EQ(found(L"late", list), L"(none)");
    appendProperty(list, L"late", L"1");
    EXPECT_EQ(found(L"late", list), L"1");
    search(list);
    EXPECT_EQ(found(L"late", list), L"1");
    freeProperties(list);
}

TEST(findByIndex, SeesReplacedValuesAndKeys)
{
    PropertyList list = numbered(1000);
    search(list);
    replaceValue(L"key5", L"five", list);
    EXPECT_EQ(found(L"key5", list), L"five");
    // Behind a value stands the next key.
    replaceValue(L"value9", L"new key", list);
    EXPECT_EQ(found(L"key10", list), L"(none)");
    EXPECT_EQ(found(L"new key", list), L"value10");
    search(list);
    EXPECT_EQ(found(L"key10", list), L"(none)");
    EXPECT_EQ(found(L"new key", list), L"value10");
    freeProperties(list);
}

TEST(findByIndex, SeesThatVmArgumentsHaveGone)
{
    PropertyList list = numbered(1000);
    PropertyList more = numbered(1000);
    appendProperty(list, L"vmarg.a", L"-Xa");
    list.insert(list.end(), more.begin(), more.end());
    search(list);
    EXPECT_EQ(found(L"vmarg.a", list), L"-Xa");
    VmargMap map;
    insertPropToVmargMap(map, list);
    EXPECT_EQ(found(L"vmarg.a", list), L"(none)");
    EXPECT_EQ(found(L"key999", list), L"value999");
    search(list);
    EXPECT_EQ(found(L"vmarg.a", list), L"(none)");
    EXPECT_EQ(found(L"key999", list), L"value999");
    freeProperties(list);
}

TEST(findByIndex, DoesNotOutliveItsList)
{
    for (const wchar_t* mark : {L"one", L"two"}) {
        PropertyList list = numbered(500);
        appendProperty(list, mark, mark);
        appendProperty(list, L"end", L"");
        search(list);
        EXPECT_EQ(found(mark, list), mark);
        EXPECT_EQ(found(wcscmp(mark, L"one") == 0 ? L"two" : L"one", list), L"(none)");
        freeProperties(list);
    }
}

TEST(findByIndex, ServesPlaceholdersOfALongList)
{
    PropertyList list;
    for (int n = 0; n < 2000; ++n)
        appendProperty(list, L"key" + std::to_wstring(n),
                       L"${prop.base" + std::to_wstring(n) + L"}");
    for (int n = 0; n < 2000; ++n)
        appendProperty(list, L"base" + std::to_wstring(n), std::to_wstring(n));
    replacePlaceholdersInRcpInstallProp(L"/w", L"/r", list);
    for (int n = 0; n < 2000; ++n)
        EXPECT_EQ(list[static_cast<size_t>(2 * n) + 1], std::to_wstring(n));
    freeProperties(list);
}
