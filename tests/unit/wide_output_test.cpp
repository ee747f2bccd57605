#include "platform/linux/wide_output.h"

#include "platform/linux/files.h"
#include "tests/unit/support.h"

#include <clocale>
#include <cwchar>

static bool putInto(const TempDir& dir, const wchar_t* mode, const std::wstring& text)
{
    FILE* file = nullptr;
    open_file(file, dir.wide("out").c_str(), mode);
    const bool put = putWide(file, text);
    fclose(file);
    return put;
}

// What the C library's own wide output makes of the same text.
static std::string wideStreamOutput(const TempDir& dir, const std::wstring& text)
{
    FILE* file = fopen(dir.path("reference").c_str(), "w");
    fwide(file, 1);
    fputws(text.c_str(), file);
    fclose(file);
    return dir.read("reference");
}

TEST(putWide, WritesTheLocalesBytes)
{
    const TempDir dir;
    EXPECT_TRUE(putInto(dir, L"w", L"a\u00e9\u20ac\n"));
    EXPECT_EQ(dir.read("out"), "a\xc3\xa9\xe2\x82\xac\n");
}

TEST(putWide, EndsAtTheFirstNul)
{
    const TempDir dir;
    EXPECT_TRUE(putInto(dir, L"w", std::wstring(L"ab\0cd", 5)));
    EXPECT_EQ(dir.read("out"), "ab");
}

TEST(putWide, AppendsWhereTheModeDoes)
{
    const TempDir dir;
    dir.write("out", "x");
    EXPECT_TRUE(putInto(dir, L"a+", L"y\n"));
    EXPECT_EQ(dir.read("out"), "xy\n");
}

TEST(putWide, TransliteratesWhatTheLocaleLacksAsWideOutputDoes)
{
    const TempDir dir;
    ASSERT_NE(setlocale(LC_CTYPE, "C"), nullptr);
    const std::wstring text = L"a\u00e9b\u20acc\u4e2dd\n";
    EXPECT_TRUE(putInto(dir, L"w", text));
    EXPECT_EQ(dir.read("out"), wideStreamOutput(dir, text));
    EXPECT_EQ(dir.read("out"), "a?bEURc?d\n");
}

TEST(putWide, TransliteratesLongTextsToTheirEnd)
{
    const TempDir dir;
    ASSERT_NE(setlocale(LC_CTYPE, "C"), nullptr);
    EXPECT_TRUE(putInto(dir, L"w", std::wstring(5000, L'\u00e9')));
    EXPECT_EQ(dir.read("out"), std::string(5000, '?'));
}

TEST(putWide, SaysThatTheDiskIsFull)
{
    FILE* full = fopen("/dev/full", "w");
    ASSERT_NE(full, nullptr);
    EXPECT_FALSE(putWide(full, std::wstring(100000, L'x')));
    fclose(full);
}

TEST(putWide, TransliteratesASurrogateInUtf8Too)
{
    const TempDir dir;
    for (const size_t before : {0, 300, 600}) {
        const std::wstring text = std::wstring(before, L'x') + L"a\xd800" + L"b\n";
        EXPECT_TRUE(putInto(dir, L"w", text));
        EXPECT_EQ(dir.read("out"), wideStreamOutput(dir, text));
        EXPECT_EQ(dir.read("out"), std::string(before, 'x') + "a?b\n");
    }
}
