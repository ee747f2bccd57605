#include "launcher/properties/property_text.h"

#include <gtest/gtest.h>

static std::wstring trimmed(std::wstring s)
{
    trimString(s);
    return s;
}

static std::wstring filteredValue(std::wstring value)
{
    FilterValue(value);
    return value;
}

struct Filtered {
    bool dropped;
    std::wstring line;
};

static Filtered filteredLine(std::wstring line)
{
    const bool dropped = processFilterKey(line);
    return {dropped, line};
}

#define EXPECT_KEPT_AS(in, out)                                                                    \
    do {                                                                                           \
        const Filtered result = filteredLine(in);                                                  \
        EXPECT_FALSE(result.dropped);                                                              \
        EXPECT_EQ(result.line, out);                                                               \
    } while (false)

TEST(trimString, RemovesSpacesFromBothEnds)
{
    EXPECT_EQ(trimmed(L"  a b   "), L"a b");
    EXPECT_EQ(trimmed(L" a"), L"a");
    EXPECT_EQ(trimmed(L"a "), L"a");
    EXPECT_EQ(trimmed(L"a"), L"a");
}

TEST(trimString, LeavesOtherWhiteSpace)
{
    EXPECT_EQ(trimmed(L"\ta\t"), L"\ta\t");
    EXPECT_EQ(trimmed(L" \t a \n "), L"\t a \n");
    EXPECT_EQ(trimmed(L"\u00a0a\u00a0"), L"\u00a0a\u00a0");
}

TEST(trimString, LeavesATextOfSpacesAlone)
{
    EXPECT_EQ(trimmed(L"   "), L"   ");
    EXPECT_EQ(trimmed(L" "), L" ");
    EXPECT_EQ(trimmed(L""), L"");
}

TEST(FilterProp, TrimsTheKeyAndResolvesNothing)
{
    std::wstring key = L"  a\\u0041 b  ";
    FilterProp(key);
    EXPECT_EQ(key, L"a\\u0041 b");
}

TEST(FilterValue, DoubledBackslashGivesOne)
{
    EXPECT_EQ(filteredValue(L"C:\\\\dir\\\\sub"), L"C:\\dir\\sub");
    EXPECT_EQ(filteredValue(L"\\\\\\\\"), L"\\\\");
}

TEST(FilterValue, GoesOnBehindADoubledBackslash)
{
    EXPECT_EQ(filteredValue(L"\\\\t"), L"\\t");
    EXPECT_EQ(filteredValue(L"\\\\u0041"), L"\\u0041");
    EXPECT_EQ(filteredValue(L"\\\\\\u0041"), L"\\A");
}

TEST(FilterValue, UnicodeEscapeGivesTheCharacter)
{
    EXPECT_EQ(filteredValue(L"\\u0041"), L"A");
    EXPECT_EQ(filteredValue(L"x\\u00e9y\\u00E9z"), L"x\u00e9y\u00e9z");
    EXPECT_EQ(filteredValue(L"\\u20aC"), L"\u20ac");
    EXPECT_EQ(filteredValue(L"\\uffff"), std::wstring(1, wchar_t(0xffff)));
}

TEST(FilterValue, UnicodeEscapeIsResolvedOnce)
{
    // 005c is the backslash.
    EXPECT_EQ(filteredValue(L"\\u005cu0041"), L"\\u0041");
    EXPECT_EQ(filteredValue(L"\\u005c\\u005c"), L"\\\\");
}

TEST(FilterValue, UnicodeEscapeMayBeShortAtTheEnd)
{
    EXPECT_EQ(filteredValue(L"\\u041"), L"A");
    EXPECT_EQ(filteredValue(L"\\u41"), L"A");
    EXPECT_EQ(filteredValue(L"\\u9"), L"\t");
    EXPECT_EQ(filteredValue(L"a\\u"), std::wstring(L"a\0", 2));
}

TEST(FilterValue, SixCharactersGoWhateverTheLastFourAre)
{
    EXPECT_EQ(filteredValue(L"\\u41xy"), L"A");
    EXPECT_EQ(filteredValue(L"\\u41xyz"), L"Az");
    EXPECT_EQ(filteredValue(L"\\u41\\\\b"), L"Ab");
    EXPECT_EQ(filteredValue(L"\\u00411"), L"A1");
}

TEST(FilterValue, OnlyHexadecimalDigitsCount)
{
    const std::wstring zero(1, L'\0');
    EXPECT_EQ(filteredValue(L"\\u  41"), zero);
    EXPECT_EQ(filteredValue(L"\\u+041"), zero);
    EXPECT_EQ(filteredValue(L"\\u-041"), zero);
    EXPECT_EQ(filteredValue(L"\\u0x41"), zero);
    EXPECT_EQ(filteredValue(L"\\ug041"), zero);
    EXPECT_EQ(filteredValue(L"\\u/041"), zero);
    EXPECT_EQ(filteredValue(L"\\u:041"), zero);
    EXPECT_EQ(filteredValue(L"\\u@041"), zero);
    EXPECT_EQ(filteredValue(L"\\u`041"), zero);
    EXPECT_EQ(filteredValue(L"\\u41G1"), L"A");
}

TEST(FilterValue, BackslashGoesBeforeAnyOtherCharacter)
{
    EXPECT_EQ(filteredValue(L"\\t\\n\\r\\x\\=\\U0041"), L"tnrx=U0041");
    EXPECT_EQ(filteredValue(L"a\\ b"), L"a b");
}

TEST(FilterValue, LastBackslashGoes)
{
    EXPECT_EQ(filteredValue(L"a\\"), L"a");
    EXPECT_EQ(filteredValue(L"a\\\\\\"), L"a\\");
    EXPECT_EQ(filteredValue(L"\\"), L"");
}

TEST(FilterValue, TrimsWhatTheEscapesGave)
{
    EXPECT_EQ(filteredValue(L" a "), L"a");
    EXPECT_EQ(filteredValue(L"\\u0020a\\u0020\\u0020"), L"a");
    EXPECT_EQ(filteredValue(L"\\u0009a\\u0020"), L"\ta");
    EXPECT_EQ(filteredValue(L"\\u0020"), L" ");
    EXPECT_EQ(filteredValue(L""), L"");
}

TEST(isComment, BothMarksCount)
{
    EXPECT_TRUE(isComment(L"# a"));
    EXPECT_TRUE(isComment(L"#"));
    EXPECT_TRUE(isComment(L"!a=b"));
}

TEST(isComment, FirstCharacterAloneCounts)
{
    EXPECT_FALSE(isComment(L" # a"));
    EXPECT_FALSE(isComment(L"a#!"));
    EXPECT_FALSE(isComment(L""));
}

TEST(isContinuationLine, OddNumberOfBackslashesAtTheEnd)
{
    EXPECT_TRUE(isContinuationLine(L"a\\"));
    EXPECT_FALSE(isContinuationLine(L"a\\\\"));
    EXPECT_TRUE(isContinuationLine(L"a\\\\\\"));
    EXPECT_FALSE(isContinuationLine(L"a"));
    EXPECT_FALSE(isContinuationLine(L"a\\ "));
    EXPECT_FALSE(isContinuationLine(L"a\\b"));
    EXPECT_FALSE(isContinuationLine(L""));
}

TEST(isContinuationLine, FirstCharacterIsNeverLookedAt)
{
    EXPECT_FALSE(isContinuationLine(L"\\"));
    EXPECT_TRUE(isContinuationLine(L"\\\\"));
    EXPECT_FALSE(isContinuationLine(L"\\\\\\"));
}

TEST(processFilterKey, RemovesThisSystemsName)
{
    EXPECT_KEPT_AS(L"osgi.os.linux=x", L"osgi.os=x");
    EXPECT_KEPT_AS(L"a.linux:x", L"a:x");
    EXPECT_KEPT_AS(L"a.linux x", L"a x");
    EXPECT_KEPT_AS(L"a.linux", L"a");
    EXPECT_KEPT_AS(L".linux=x", L"=x");
}

TEST(processFilterKey, RemovesTheWholeLastPiece)
{
    EXPECT_KEPT_AS(L"a.linux64=x", L"a=x");
    EXPECT_KEPT_AS(L"a.linuxppc.linux.x86=x", L"a.linuxppc.linux.x86=x");
    EXPECT_KEPT_AS(L"a.win32.linux=x", L"a.win32=x");
}

TEST(processFilterKey, KeepsTheRestOfTheLine)
{
    EXPECT_KEPT_AS(L"a.linux = b.linux : c.win32\\", L"a = b.linux : c.win32\\");
}

TEST(processFilterKey, DropsTheLinesOfOtherSystems)
{
    EXPECT_TRUE(filteredLine(L"a.win32=x").dropped);
    EXPECT_TRUE(filteredLine(L"a.win32x86:x").dropped);
    EXPECT_TRUE(filteredLine(L"a.macosx x").dropped);
    EXPECT_TRUE(filteredLine(L"a.macosx").dropped);
    EXPECT_TRUE(filteredLine(L".win32=x").dropped);
    EXPECT_TRUE(filteredLine(L"a.linux.win32=x").dropped);
    EXPECT_TRUE(filteredLine(L"   a.win32=x").dropped);
}

TEST(processFilterKey, KeepsEveryOtherKey)
{
    EXPECT_KEPT_AS(L"linux=x", L"linux=x");
    EXPECT_KEPT_AS(L"win32=x", L"win32=x");
    EXPECT_KEPT_AS(L"a.win=x", L"a.win=x");
    EXPECT_KEPT_AS(L"a.WIN32=x", L"a.WIN32=x");
    EXPECT_KEPT_AS(L"a.macos=x", L"a.macos=x");
    EXPECT_KEPT_AS(L"a.xlinux=x", L"a.xlinux=x");
    EXPECT_KEPT_AS(L"a.=x", L"a.=x");
    EXPECT_KEPT_AS(L"a.win32.b=x", L"a.win32.b=x");
    EXPECT_KEPT_AS(L"", L"");
}

TEST(processFilterKey, KeyEndsAtTheFirstBlankColonOrEqualsSign)
{
    EXPECT_KEPT_AS(L"a b.win32=x", L"a b.win32=x");
    EXPECT_KEPT_AS(L"a:b.win32=x", L"a:b.win32=x");
    EXPECT_KEPT_AS(L"a=b.win32", L"a=b.win32");
    EXPECT_TRUE(filteredLine(L"a\tb.win32=x").dropped);
}

TEST(processFilterKey, RemovesLeadingSpaces)
{
    EXPECT_KEPT_AS(L"   a=x ", L"a=x ");
    EXPECT_KEPT_AS(L"  a.linux=x", L"a=x");
    EXPECT_KEPT_AS(L"\ta=x", L"\ta=x");
    EXPECT_KEPT_AS(L"   ", L"");
}

TEST(processFilterKey, SystemPropertiesAreNotJudged)
{
    EXPECT_KEPT_AS(L"-Da.win32=x", L"-Da.win32=x");
    EXPECT_KEPT_AS(L"-Da.linux=x", L"-Da.linux=x");
    EXPECT_KEPT_AS(L"  -Da.win32=x", L"-Da.win32=x");
    EXPECT_TRUE(filteredLine(L"-da.win32=x").dropped);
}
