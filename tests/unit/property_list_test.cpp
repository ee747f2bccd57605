#include "launcher/properties/property_list.h"

#include "diag/SvcDebug_linux.h"
#include "tests/unit/support.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <cstdlib>
#include <cwchar>
#include <malloc.h>
#include <sys/resource.h>

// A list of its own, freed at the end of the test.
struct OwnList {
    OwnList(std::initializer_list<const wchar_t*> keysAndValues) : list(pairs(keysAndValues)) {}
    ~OwnList()
    {
        freeProperties(list);
    }
    OwnList(const OwnList&) = delete;
    OwnList& operator=(const OwnList&) = delete;

    PropertyList list;
};

typedef std::vector<std::wstring> Texts;

// The texts of what findProperties returned, without the end.
static Texts found(const wchar_t* prefix, const PropertyList& list)
{
    const FoundProperties result(prefix, list);
    Texts out;
    for (size_t i = 0; result.pairs[i][0] != L'\0'; ++i)
        out.push_back(result.pairs[i]);
    return out;
}

TEST(appendProperty, AppendsThePairAsItStands)
{
    OwnList own({L"a", L"1"});
    appendProperty(own.list, L"  k ", L" \\u0041 ");
    EXPECT_EQ(texts(own.list), Texts({L"a", L"1", L"  k ", L" \\u0041 "}));
}

TEST(appendProperty, EachEntryIsABlockOfItsOwn)
{
    OwnList own({});
    const std::wstring text = L"same";
    appendProperty(own.list, text, text);
    EXPECT_NE(own.list[0], text.c_str());
    EXPECT_NE(own.list[0], own.list[1]);
}

TEST(appendProperty, ANulEndsTheText)
{
    OwnList own({});
    appendProperty(own.list, std::wstring(L"k\0x", 3), std::wstring(L"\0x", 2));
    EXPECT_EQ(texts(own.list), Texts({L"k", L""}));
}

TEST(pushBackProperty, TrimsTheKeyAndUnescapesTheValue)
{
    OwnList own({L"a", L"1"});
    std::wstring key = L"  my key ";
    std::wstring value = L" C:\\\\x\\u0041\\t ";
    pushBackProperty(own.list, key, value);
    EXPECT_EQ(texts(own.list), Texts({L"a", L"1", L"my key", L"C:\\xAt"}));
}

TEST(pushBackProperty, ChangesBothTexts)
{
    OwnList own({});
    std::wstring key = L" k\\u0041 ";
    std::wstring value = L" v\\u0041 ";
    pushBackProperty(own.list, key, value);
    EXPECT_EQ(key, L"k\\u0041");
    EXPECT_EQ(value, L"vA");
}

TEST(pushBackProperty, TracesTheKeyAndTheValue)
{
    OwnList own({});
    std::wstring key = L" k ";
    std::wstring value = L" v\\= ";
    EXPECT_EQ(logOf(true, [&] { pushBackProperty(own.list, key, value); }),
              "QVMRL0126I:   key = \"k\"\n"
              "QVMRL0127I:   value  = \"v=\"\n");
}

TEST(pushBackProperty, SaysNothingWithoutTracing)
{
    OwnList own({});
    std::wstring key = L"k";
    std::wstring value = L"v";
    EXPECT_EQ(logOf(false, [&] { pushBackProperty(own.list, key, value); }), "");
}

TEST(findProperty, FirstOfSeveralCounts)
{
    OwnList own({L"b", L"0", L"a", L"1", L"a", L"2"});
    EXPECT_STREQ(findProperty(L"a", own.list), L"1");
}

TEST(findProperty, WholeKeyCounts)
{
    OwnList own({L"ab", L"1", L"A", L"2", L"a", L"3"});
    EXPECT_STREQ(findProperty(L"a", own.list), L"3");
    EXPECT_EQ(findProperty(L"B", own.list), nullptr);
    EXPECT_EQ(findProperty(L"abc", own.list), nullptr);
}

TEST(findProperty, ValuesAreNoKeys)
{
    OwnList own({L"a", L"b", L"c", L"d"});
    EXPECT_EQ(findProperty(L"b", own.list), nullptr);
    EXPECT_EQ(findProperty(L"d", own.list), nullptr);
}

TEST(findProperty, EmptyListHasNone)
{
    EXPECT_EQ(findProperty(L"a", PropertyList()), nullptr);
    EXPECT_EQ(findProperty(L"", PropertyList()), nullptr);
}

TEST(findProperty, LendsTheListsOwnText)
{
    OwnList own({L"a", L""});
    EXPECT_EQ(findProperty(L"a", own.list), own.list[1]);
}

TEST(findProperty, GoesOnBehindAnEmptyKey)
{
    OwnList own({L"", L"0", L"a", L"1"});
    EXPECT_STREQ(findProperty(L"a", own.list), L"1");
    EXPECT_STREQ(findProperty(L"", own.list), L"0");
}

TEST(findProperties, PairsWhoseKeyBeginsWithThePrefix)
{
    OwnList own({L"a.2", L"x", L"b", L"a.", L"a.1", L"y", L"A.1", L"z", L"a", L"w", L"a.2", L"v"});
    EXPECT_EQ(found(L"a.", own.list), Texts({L"a.2", L"x", L"a.1", L"y", L"a.2", L"v"}));
}

TEST(findProperties, KeyEqualToThePrefixCounts)
{
    OwnList own({L"a.", L"1"});
    EXPECT_EQ(found(L"a.", own.list), Texts({L"a.", L"1"}));
}

TEST(findProperties, EndsInAnEmptyText)
{
    OwnList own({L"a", L"1"});
    const FoundProperties none(L"b", own.list);
    EXPECT_STREQ(none.pairs[0], L"");
    const FoundProperties one(L"a", own.list);
    EXPECT_STREQ(one.pairs[2], L"");
    const FoundProperties empty(L"a", PropertyList());
    EXPECT_STREQ(empty.pairs[0], L"");
}

TEST(findProperties, LendsTheListsOwnTexts)
{
    OwnList own({L"b", L"0", L"a", L"1"});
    const FoundProperties result(L"a", own.list);
    EXPECT_EQ(result.pairs[0], own.list[2]);
    EXPECT_EQ(result.pairs[1], own.list[3]);
}

TEST(findProperties, PairWithoutAKeyHidesEverythingBehindIt)
{
    OwnList own({L"a.1", L"x", L"", L"y", L"a.2", L"z"});
    EXPECT_EQ(found(L"a.", own.list), Texts({L"a.1", L"x"}));
    EXPECT_EQ(found(L"", own.list), Texts({L"a.1", L"x"}));
}

TEST(findProperties, GrowsAtTenTwentyAndFortyPointers)
{
    for (const size_t count : {4u, 5u, 6u, 10u, 11u, 20u, 21u, 41u}) {
        OwnList own({L"other", L"0"});
        Texts wanted;
        for (size_t i = 0; i < count; ++i) {
            wanted.push_back(L"vmarg." + std::to_wstring(i));
            wanted.push_back(L"-X" + std::to_wstring(i));
            appendProperty(own.list, wanted[2 * i], wanted[2 * i + 1]);
        }
        const FoundProperties result(L"vmarg.", own.list);
        ASSERT_EQ(Texts(result.pairs, result.pairs + 2 * count), wanted);
        ASSERT_STREQ(result.pairs[2 * count], L"");
    }
}

#if defined(__SANITIZE_ADDRESS__)
static const bool SANITIZED = true;
#else
static const bool SANITIZED = false;
#endif

// Blocks of 8 to 1000 bytes, but none that serves a request of `size` bytes. Given back, they wait
// for requests of just their size; a larger one is not cut for a smaller request.
static std::vector<void*> reserveButFor(size_t size)
{
    void* unserved = malloc(size);
    std::vector<void*> blocks;
    for (size_t other = 8; other <= 1000; other += 8) {
        for (int i = 0; i < 2; ++i) {
            void* block = malloc(other);
            if (malloc_usable_size(block) != malloc_usable_size(unserved))
                blocks.push_back(block);
        }
    }
    return blocks;
}

static void takeAllOf(size_t size)
{
    static void* volatile taken = nullptr;
    do
        taken = malloc(size);
    while (taken != nullptr);
}

// After this a request of `size` bytes fails.
static void leaveNoMemoryFor(size_t size)
{
    static std::vector<void*> reserve;
    reserve = reserveButFor(size);
    const struct rlimit nothing = {1, 1};
    setrlimit(RLIMIT_AS, &nothing);
    for (size_t piece = 1u << 20; piece > 2000; piece /= 2)
        takeAllOf(piece);
    for (size_t piece = 2000; piece > 0; piece -= 8)
        takeAllOf(piece);
    for (void* block : reserve)
        free(block);
    errno = ENOMEM;
}

static const char* const NO_MEMORY =
    "QVMRL0046E: findProperties malloc for property strings failed!";

TEST(findProperties, EndsWhenThereIsNoMemory)
{
    if (SANITIZED)
        GTEST_SKIP() << "the sanitizer's allocator ends the process itself";
    OwnList own({L"a", L"1"});
    EXPECT_TRUE(endsWith(
        [&] {
            leaveNoMemoryFor(11 * sizeof(wchar_t*));
            findProperties(L"a", own.list);
        },
        NO_MEMORY, ENOMEM));
}

TEST(findProperties, FailureToGrowEndsAsAFailureToBegin)
{
    if (SANITIZED)
        GTEST_SKIP() << "the sanitizer's allocator ends the process itself";
    wchar_t key[] = L"a";
    PropertyList list(2 * 11, key);
    EXPECT_TRUE(endsWith(
        [&] {
            leaveNoMemoryFor(41 * sizeof(wchar_t*));
            findProperties(L"a", list);
        },
        NO_MEMORY, ENOMEM));
}

TEST(replaceValue, ReplacesTheFirstValueOfTheKey)
{
    OwnList own({L"a", L"1", L"b", L"2", L"b", L"3"});
    replaceValue(L"b", L"new", own.list);
    EXPECT_EQ(texts(own.list), Texts({L"a", L"1", L"b", L"new", L"b", L"3"}));
}

TEST(replaceValue, TakesACopy)
{
    OwnList own({L"a", L"1"});
    const wchar_t newValue[] = L"";
    replaceValue(L"a", newValue, own.list);
    EXPECT_STREQ(own.list[1], L"");
    EXPECT_NE(own.list[1], newValue);
}

TEST(replaceValue, DoesNothingWithoutTheKey)
{
    OwnList own({L"a", L"1"});
    replaceValue(L"A", L"new", own.list);
    replaceValue(L"", L"new", own.list);
    EXPECT_EQ(texts(own.list), Texts({L"a", L"1"}));
    PropertyList empty;
    replaceValue(L"a", L"new", empty);
    EXPECT_TRUE(empty.empty());
}

TEST(replaceValue, AValueThatEqualsTheKeyIsFoundToo)
{
    OwnList own({L"a", L"b", L"c", L"1", L"b", L"2"});
    replaceValue(L"b", L"new", own.list);
    EXPECT_EQ(texts(own.list), Texts({L"a", L"b", L"new", L"1", L"b", L"2"}));
}

TEST(replaceValue, BehindTheLastValueThereIsNothing)
{
    OwnList own({L"a", L"b"});
    replaceValue(L"b", L"new", own.list);
    EXPECT_EQ(texts(own.list), Texts({L"a", L"b"}));
}

TEST(setArgProperty, TheNulCountsInTheLength)
{
    std::wstring out = L"before";
    setArgProperty(out, L"key", L"a=b");
    EXPECT_EQ(out, std::wstring(L"key=a=b\0", 8));
    EXPECT_STREQ(out.c_str(), L"key=a=b");
}

TEST(setArgProperty, EmptyKeyAndValueLeaveTheEqualsSign)
{
    std::wstring out;
    setArgProperty(out, L"", L"");
    EXPECT_EQ(out, std::wstring(L"=\0", 2));
}

TEST(freeProperties, EmptiesTheList)
{
    PropertyList list = pairs({L"a", L"1"});
    freeProperties(list);
    EXPECT_TRUE(list.empty());
}
