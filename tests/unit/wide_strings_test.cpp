#include "platform/linux/wide_strings.h"

#include "tests/unit/separate_process.h"
#include "tests/unit/support.h"

#include <cerrno>
#include <clocale>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <cwchar>

// So many characters that no allocator has room for them.
static const size_t TOO_MANY = SIZE_MAX / sizeof(wchar_t) - 3;

// Half of a pair: in no encoding a character of its own.
static const wchar_t NO_CHARACTER = 0xd800;

static const size_t MEGABYTE = 1024 * 1024;

// The sanitizer ends the process at an allocation that is too large, unless it is told otherwise.
static bool allocationsMayFail()
{
    const char* options = getenv("ASAN_OPTIONS");
    return !underAddressSanitizer() ||
           (options != nullptr && strstr(options, "allocator_may_return_null=1") != nullptr);
}

TEST(newString, GivesAnEmptyString)
{
    wchar_t* text = newString(0);
    EXPECT_STREQ(text, L"");
    freeString(text);
}

TEST(newString, HasRoomForItsCharactersAndTheZero)
{
    wchar_t* text = newString(3);
    EXPECT_STREQ(text, L"");
    wcscpy(text, L"abc");
    EXPECT_STREQ(text, L"abc");
    freeString(text);
}

TEST(newString, EndsTheProcessWithoutMemory)
{
    if (!allocationsMayFail())
        GTEST_SKIP() << "needs allocator_may_return_null=1 in ASAN_OPTIONS";
    EXPECT_TRUE(endsWith([] { newString(TOO_MANY); },
                         "QVMRL0004E: newString malloc failed.  Failed with error 12: "
                         "Cannot allocate memory"));
}

TEST(mallocString, GivesAnEmptyString)
{
    wchar_t* none = mallocString(0);
    EXPECT_STREQ(none, L"");
    freeString(none);
    wchar_t* text = mallocString(3);
    EXPECT_STREQ(text, L"");
    wcscpy(text, L"abc");
    EXPECT_STREQ(text, L"abc");
    freeString(text);
}

TEST(mallocString, EndsTheProcessWithoutMemory)
{
    if (!allocationsMayFail())
        GTEST_SKIP() << "needs allocator_may_return_null=1 in ASAN_OPTIONS";
    EXPECT_TRUE(endsWith([] { mallocString(TOO_MANY); }, "QVMRL0004E: mallocString malloc failed!",
                         ENOMEM));
}

TEST(freeString, GivesNull)
{
    EXPECT_EQ(freeString(newString(5)), nullptr);
    EXPECT_EQ(freeString(nullptr), nullptr);
}

TEST(initMemString, CopiesToAFreshString)
{
    wchar_t* text = newString(3);
    EXPECT_EQ(initMemString(text, L"abc"), text);
    EXPECT_STREQ(text, L"abc");
    freeString(text);
}

TEST(initMemString, DeliberatelyAppends)
{
    wchar_t* text = newString(5);
    initMemString(text, L"ab");
    EXPECT_EQ(initMemString(text, L"cde"), text);
    EXPECT_STREQ(text, L"abcde");
    freeString(text);
}

TEST(decode, FillsTheRoomAndNoMore)
{
    const wchar_t untouched = L'#';
    for (const char* bytes : {"abc", "ab\xc3\xa9"}) {
        const std::wstring text = bytes[2] == 'c' ? L"abc" : L"ab\u00e9";
        for (size_t room = 0; room <= 5; ++room) {
            wchar_t out[6] = {untouched, untouched, untouched, untouched, untouched, untouched};
            EXPECT_EQ(decode(out, bytes, room), room < 3 ? room : 3) << bytes << room;
            for (size_t i = 0; i < 6; ++i) {
                const wchar_t behind = i == 3 && room > 3 ? L'\0' : untouched;
                EXPECT_EQ(out[i], i < 3 && i < room ? text[i] : behind) << bytes << room << i;
            }
        }
    }
}

TEST(decode, RefusesWhatTheLocaleCannotConvertWhereverItStands)
{
    wchar_t out[8];
    const auto refused = static_cast<size_t>(-1);
    EXPECT_EQ(decode(out, "\x80", 8), refused);
    EXPECT_EQ(decode(out, "ab\xff", 8), refused);
    EXPECT_EQ(decode(out, "ab\xff", 2), 2u);
    EXPECT_TRUE(holdsInChild([&] {
        setlocale(LC_CTYPE, "C");
        EXPECT_EQ(decode(out, "ab\xc3\xa9", 8), refused);
        EXPECT_EQ(decode(out, "ab\x7f", 8), 3u);
        EXPECT_EQ(std::wstring(out), L"ab\x7f");
    }));
}

TEST(chartowcs, ConvertsTheLocalesBytes)
{
    wchar_t* text = chartowcs("a\xc3\xa9\xe2\x82\xac\xf0\x9f\x98\x80z");
    EXPECT_STREQ(text, L"a\u00e9\u20ac\U0001f600z");
    freeString(text);
    wchar_t* empty = chartowcs("");
    EXPECT_STREQ(empty, L"");
    freeString(empty);
}

TEST(chartowcs, GivesABlockOfItsOwn)
{
    char source[] = "abc";
    wchar_t* text = chartowcs(source);
    source[0] = 'x';
    EXPECT_STREQ(text, L"abc");
    freeString(text);
}

TEST(chartowcs, MakesTheWholeResultEmptyForBytesThatCannotBeConverted)
{
    for (const char* bytes : {"good\xff", "\xc3", "\xed\xa0\x80"}) {
        wchar_t* text = chartowcs(bytes);
        EXPECT_STREQ(text, L"");
        freeString(text);
    }
}

TEST(chartowstr, ConvertsAndReturnsTheCharacters)
{
    std::wstring out = L"before";
    const wchar_t* characters = chartowstr("\xc3\xa9t\xc3\xa9", out);
    EXPECT_EQ(out, L"\u00e9t\u00e9");
    EXPECT_EQ(characters, out.c_str());
    chartowstr("", out);
    EXPECT_EQ(out, L"");
}

TEST(chartowstr, MakesTheWholeResultEmptyForBytesThatCannotBeConverted)
{
    std::wstring out = L"before";
    chartowstr("good\xff", out);
    EXPECT_EQ(out, L"");
}

TEST(wcstochar, ConvertsToTheLocalesBytes)
{
    std::string out = "before";
    wcstochar(out, L"a\u00e9\u20ac\U0001f600z");
    EXPECT_EQ(out, "a\xc3\xa9\xe2\x82\xac\xf0\x9f\x98\x80z");
    wcstochar(out, L"");
    EXPECT_EQ(out, "");
}

TEST(wcstochar, TakesALongTextOfFourBytesACharacter)
{
    std::string expected;
    for (int i = 0; i < 3000; ++i)
        expected += "\xf0\x9f\x98\x80";
    std::string out;
    wcstochar(out, std::wstring(3000, L'\U0001f600').c_str());
    EXPECT_EQ(out, expected);
}

TEST(wcstochar, DecisionTextThatCannotBeConvertedBecomesEmpty)
{
    std::string out = "before";
    wcstochar(out, (std::wstring(L"good") + NO_CHARACTER).c_str());
    EXPECT_EQ(out, "");
    ASSERT_STREQ(setlocale(LC_CTYPE, "C"), "C");
    out = "before";
    wcstochar(out, L"a\u20ac");
    setlocale(LC_CTYPE, "C.UTF-8");
    EXPECT_EQ(out, "");
}

// 4 million characters are counted as 4 million bytes and one: 16 megabytes and 4 bytes.
static std::string convertedWithin(size_t megabytes)
{
    const std::wstring text(4 * MEGABYTE, L'a');
    std::string out;
    boundMemory(megabytes * MEGABYTE);
    wcstochar(out, text.c_str());
    return out;
}

TEST(wcstochar, DeliberatelyTakesFourTimesTheCountedLength)
{
    if (underAddressSanitizer())
        GTEST_SKIP() << "the address sanitizer's memory cannot be bounded";
    EXPECT_TRUE(endsWith([] { convertedWithin(15); }, "QVMRL0004E: malloc failed!", ENOMEM));
    EXPECT_TRUE(
        holdsInChild([] { EXPECT_EQ(convertedWithin(24), std::string(4 * MEGABYTE, 'a')); }));
}

// There and back, by each of the four.
static void expectConverted(const std::string& bytes, const std::wstring& text)
{
    std::wstring wide = L"before";
    chartowstr(bytes.c_str(), wide);
    EXPECT_EQ(wide, text) << text.size();
    wchar_t* block = chartowcs(bytes.c_str());
    EXPECT_EQ(block, text) << text.size();
    freeString(block);
    std::string narrow = "before";
    EXPECT_EQ(wstrtocs(narrow, text), static_cast<int>(bytes.size()));
    EXPECT_EQ(narrow, bytes) << text.size();
    wcstochar(narrow, text.c_str());
    EXPECT_EQ(narrow, bytes) << text.size();
}

// Texts on both sides of 512, beyond which a text does not fit into the converters' own memory:
// ASCII alone, and with a character of four bytes, or one that cannot be converted, at the end.
TEST(conversions, AreTheSameForTextsOfEveryLength)
{
    for (size_t length = 480; length < 530; ++length) {
        expectConverted(std::string(length, 'a'), std::wstring(length, L'a'));
        expectConverted(std::string(length, 'a') + "\xf0\x9f\x98\x80",
                        std::wstring(length, L'a') + L'\U0001f600');
    }
}

TEST(conversions, MakeTextsOfEveryLengthEmptyThatCannotBeConverted)
{
    for (size_t length = 480; length < 530; ++length) {
        const std::string bytes = std::string(length, 'a') + "\xff";
        std::wstring wide = L"before";
        chartowstr(bytes.c_str(), wide);
        EXPECT_EQ(wide, L"") << length;
        wchar_t* block = chartowcs(bytes.c_str());
        EXPECT_STREQ(block, L"") << length;
        freeString(block);
        std::string narrow = "before";
        EXPECT_EQ(wstrtocs(narrow, std::wstring(length, L'a') + NO_CHARACTER), -1);
        EXPECT_EQ(narrow, "") << length;
    }
}

TEST(wstrtocs, ReturnsTheNumberOfBytes)
{
    std::string out = "before";
    EXPECT_EQ(wstrtocs(out, L"a\u00e9\u20ac"), 6);
    EXPECT_EQ(out, "a\xc3\xa9\xe2\x82\xac");
    EXPECT_EQ(wstrtocs(out, L""), 0);
    EXPECT_EQ(out, "");
}

TEST(wstrtocs, EndsAtAZero)
{
    std::string out;
    EXPECT_EQ(wstrtocs(out, std::wstring(L"ab\0cd", 5)), 2);
    EXPECT_EQ(out, "ab");
}

TEST(wstrtocs, DecisionTextThatCannotBeConvertedBecomesEmpty)
{
    std::string out = "before";
    EXPECT_EQ(wstrtocs(out, std::wstring(L"good") + NO_CHARACTER), -1);
    EXPECT_EQ(out, "");
}
