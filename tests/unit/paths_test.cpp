#include "platform/linux/paths.h"

#include "tests/unit/separate_process.h"
#include "tests/unit/support.h"

#include <cerrno>

static std::wstring folded(std::wstring path)
{
    convertToStandardPathForm(path);
    return path;
}

TEST(convertToStandardPathForm, FoldsDoubleSlashesAndDots)
{
    EXPECT_EQ(folded(L"/opt//app/./lib"), L"/opt/app/lib");
    EXPECT_EQ(folded(L"//opt///app"), L"/opt/app");
    EXPECT_EQ(folded(L"/opt/app"), L"/opt/app");
}

TEST(convertToStandardPathForm, BeginsWithASlashAlsoForARelativePath)
{
    EXPECT_EQ(folded(L"a/b"), L"/a/b");
    EXPECT_EQ(folded(L"a"), L"/a");
}

TEST(convertToStandardPathForm, KeepsASlashAtTheEnd)
{
    EXPECT_EQ(folded(L"/x/y/"), L"/x/y/");
    EXPECT_EQ(folded(L"x/y//"), L"/x/y/");
    EXPECT_EQ(folded(L"/"), L"/");
    EXPECT_EQ(folded(L"///"), L"/");
}

TEST(convertToStandardPathForm, RemovesADotOnlyBehindAnotherSegment)
{
    EXPECT_EQ(folded(L"./a"), L"/./a");
    EXPECT_EQ(folded(L"."), L"/.");
    EXPECT_EQ(folded(L"a/."), L"/a");
    EXPECT_EQ(folded(L"a/./"), L"/a/");
    EXPECT_EQ(folded(L"a/./b"), L"/a/b");
}

// The segment behind a dot becomes the current one without being looked at.
TEST(convertToStandardPathForm, KeepsTheSecondOfTwoDots)
{
    EXPECT_EQ(folded(L"a/././b"), L"/a/./b");
    EXPECT_EQ(folded(L"a/./.."), L"/a/..");
    EXPECT_EQ(folded(L"a/./../b"), L"/a/../b");
}

TEST(convertToStandardPathForm, DropsTheSegmentBeforeTwoDots)
{
    EXPECT_EQ(folded(L"/a/../b"), L"/b");
    EXPECT_EQ(folded(L"/a/b/../c"), L"/a/c");
    EXPECT_EQ(folded(L"/x/y/.."), L"/x");
    EXPECT_EQ(folded(L"/x/y/../"), L"/x/");
    EXPECT_EQ(folded(L"a/.."), L"");
    EXPECT_EQ(folded(L"a/../"), L"/");
}

TEST(convertToStandardPathForm, KeepsTwoDotsThatNothingStandsBefore)
{
    EXPECT_EQ(folded(L".."), L"/..");
    EXPECT_EQ(folded(L"../a"), L"/../a");
    EXPECT_EQ(folded(L"a/../.."), L"/..");
}

TEST(convertToStandardPathForm, DeliberatelyLosesTheSegmentBehindTheNewCurrentOne)
{
    EXPECT_EQ(folded(L"/a/../b/c/d"), L"/b/d");
    EXPECT_EQ(folded(L"/a/../b/c"), L"/b");
    EXPECT_EQ(folded(L"/a/../b/c/"), L"/b/");
    EXPECT_EQ(folded(L"/a/../b/c/../d"), L"/d");
    EXPECT_EQ(folded(L"/x/a/../b/c/d/e"), L"/x/b/d/e");
    EXPECT_EQ(folded(L"/a/../b/../c"), L"/b/c");
}

TEST(convertToStandardPathForm, DecisionAnEmptyPathStaysEmpty)
{
    EXPECT_EQ(folded(L""), L"");
}

TEST(convertToStandardPathForm, LeavesBackslashesAlone)
{
    EXPECT_EQ(folded(L"/a\\..\\b/c"), L"/a\\..\\b/c");
}

TEST(convertToStandardPathForm, KeepsOtherCharactersAsTheyAre)
{
    EXPECT_EQ(folded(L"/\u00e9 x/.../..a/b./"), L"/\u00e9 x/.../..a/b./");
}

TEST(convertToStandardPathForm, TakesALongPath)
{
    std::wstring path;
    for (int i = 0; i < 5000; ++i)
        path += L"/a";
    EXPECT_EQ(folded(path), path);
    EXPECT_EQ(folded(path.substr(1)), path);
}

TEST(convertToStandardPathForm, EndsTheProcessWithoutMemory)
{
    if (underAddressSanitizer())
        GTEST_SKIP() << "the address sanitizer's memory cannot be bounded";
    EXPECT_TRUE(endsWith(
        [] {
            // 64 MB; each of the two work buffers needs as much again.
            std::wstring path(16 * 1024 * 1024, L'a');
            boundMemory(32 * 1024 * 1024);
            convertToStandardPathForm(path);
        },
        "QVMRL0004E: mallocString malloc failed!", ENOMEM));
}

TEST(normalizePath, IsTheSameUnderASecondName)
{
    std::wstring path = L"opt//app/./lib/x/../y/z/";
    normalizePath(path);
    EXPECT_EQ(path, L"/opt/app/lib/y/");
}

TEST(convertBS2S, TurnsEveryBackslashIntoASlash)
{
    std::wstring text = L"C:\\a\\b";
    convertBS2S(text);
    EXPECT_EQ(text, L"C:/a/b");
    text = L"\\\\a/b\\";
    convertBS2S(text);
    EXPECT_EQ(text, L"//a/b/");
    text = L"";
    convertBS2S(text);
    EXPECT_EQ(text, L"");
}

TEST(convertS2BS, ReversesIt)
{
    std::wstring text = L"C:/a/b";
    convertS2BS(text);
    EXPECT_EQ(text, L"C:\\a\\b");
    text = L"//a\\b/";
    convertS2BS(text);
    EXPECT_EQ(text, L"\\\\a\\b\\");
}

TEST(convertToOsSeparator, IsASlashOnThisSystem)
{
    std::wstring text = L"\\opt\\app/rcp\\";
    convertToOsSeparator(text);
    EXPECT_EQ(text, L"/opt/app/rcp/");
}

TEST(BS_CHAR, IsOneBackslash)
{
    EXPECT_STREQ(BS_CHAR, L"\\");
}

TEST(endsIn, FindsASuffix)
{
    EXPECT_TRUE(endsIn(L"abc", L"bc"));
    EXPECT_TRUE(endsIn(L"abc", L"abc"));
    EXPECT_TRUE(endsIn(L"abc", L"c"));
    EXPECT_TRUE(endsIn(L"abc", L""));
    EXPECT_TRUE(endsIn(L"", L""));
    EXPECT_TRUE(endsIn(L"aXbX", L"X"));
}

TEST(endsIn, IsFalseForAnotherEnd)
{
    EXPECT_FALSE(endsIn(L"abc", L"ab"));
    EXPECT_FALSE(endsIn(L"abc", L"b"));
    EXPECT_FALSE(endsIn(L"abc", L"C"));
    EXPECT_FALSE(endsIn(L"abc", L"xbc"));
}

TEST(endsIn, ReadsTheSuffixUpToItsFirstZero)
{
    EXPECT_TRUE(endsIn(L"abc", std::wstring(L"bc\0zz", 5)));
    EXPECT_FALSE(endsIn(L"abc", std::wstring(L"ab\0c", 4)));
}

TEST(endsIn, DeliberatelyFindsASuffixThatIsOneCharacterTooLong)
{
    EXPECT_TRUE(endsIn(L"ab", L"abc"));
    EXPECT_TRUE(endsIn(L"ab", L"xab"));
    EXPECT_TRUE(endsIn(L"", L"x"));
}

TEST(endsIn, IsFalseForASuffixThatIsTwoCharactersTooLong)
{
    EXPECT_FALSE(endsIn(L"ab", L"xyab"));
    EXPECT_FALSE(endsIn(L"", L"xy"));
}
