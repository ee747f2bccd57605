#include "launcher/properties/property_escape.h"

#include <gtest/gtest.h>

static std::wstring escapedKey(const std::wstring& key)
{
    std::wstring out;
    convWcharTo8859_1_Key(key, out);
    return out;
}

static std::wstring escapedValue(const std::wstring& value)
{
    std::wstring out;
    convWcharTo8859_1_Value(value, out);
    return out;
}

static std::wstring digits(unsigned code)
{
    std::wstring out;
    addHexDigits(out, code);
    return out;
}

static const wchar_t* const PLAIN = L"\"$%&'()*+,-./0123456789;<>?@ABCDEFGHIJKLMNOPQRSTUVWXYZ"
                                    L"[]^_`abcdefghijklmnopqrstuvwxyz{|}~";

TEST(addHexDigits, FourLowerCaseDigits)
{
    EXPECT_EQ(digits(0xe9), L"00e9");
    EXPECT_EQ(digits(0), L"0000");
    EXPECT_EQ(digits(0xABC), L"0abc");
    EXPECT_EQ(digits(0xffff), L"ffff");
}

TEST(addHexDigits, LargerCodesKeepTheirLastFourDigits)
{
    EXPECT_EQ(digits(0x10000), L"0000");
    EXPECT_EQ(digits(0x1f600), L"f600");
    EXPECT_EQ(digits(0xabcdef12), L"ef12");
}

TEST(addHexDigits, Appends)
{
    std::wstring out = L"a";
    addHexDigits(out, 0x41);
    EXPECT_EQ(out, L"a0041");
}

TEST(convWcharTo8859_1_Key, SpecialCharactersGetABackslash)
{
    EXPECT_EQ(escapedKey(L"#!=:\\ "), L"\\#\\!\\=\\:\\\\\\ ");
    EXPECT_EQ(escapedKey(L"a b=c"), L"a\\ b\\=c");
    EXPECT_EQ(escapedKey(L"  a  "), L"\\ \\ a\\ \\ ");
}

TEST(convWcharTo8859_1_Key, OtherPrintableCharactersStay)
{
    EXPECT_EQ(escapedKey(PLAIN), PLAIN);
    EXPECT_EQ(std::wstring(PLAIN).size(), 95u - 6u);
}

TEST(convWcharTo8859_1_Key, EverythingElseIsEscaped)
{
    EXPECT_EQ(escapedKey(L"\t\n\r\x1f\x7f"), L"\\u0009\\u000a\\u000d\\u001f\\u007f");
    EXPECT_EQ(escapedKey(L"\u00e9\u20ac\u0080"), L"\\u00e9\\u20ac\\u0080");
    EXPECT_EQ(escapedKey(std::wstring(L"a\0b", 3)), L"a\\u0000b");
}

TEST(convWcharTo8859_1_Value, SpecialCharactersGetABackslashAndSpacesStay)
{
    EXPECT_EQ(escapedValue(L"#!=:\\ "), L"\\#\\!\\=\\:\\\\ ");
    EXPECT_EQ(escapedValue(L"a b=c"), L"a b\\=c");
    EXPECT_EQ(escapedValue(L"  a  "), L"  a  ");
}

TEST(convWcharTo8859_1_Value, OtherPrintableCharactersStay)
{
    EXPECT_EQ(escapedValue(PLAIN), PLAIN);
}

TEST(convWcharTo8859_1_Value, EverythingElseIsEscaped)
{
    EXPECT_EQ(escapedValue(L"\t\n\r\x1f\x7f"), L"\\u0009\\u000a\\u000d\\u001f\\u007f");
    EXPECT_EQ(escapedValue(L"\u00e9\u20ac\u0080"), L"\\u00e9\\u20ac\\u0080");
    EXPECT_EQ(escapedValue(std::wstring(L"a\0b", 3)), L"a\\u0000b");
}

TEST(convWcharTo8859_1_Value, BothSidesOfPrintableAscii)
{
    EXPECT_EQ(escapedValue(L"\x1f \x7e\x7f"), L"\\u001f ~\\u007f");
}

TEST(convWcharTo8859_1_Value, CharactersBeyondSixteenBitsLoseTheirUpperBits)
{
    EXPECT_EQ(escapedValue(L"\U00010000"), L"\\u0000");
    EXPECT_EQ(escapedValue(L"\U0001f600"), L"\\uf600");
    EXPECT_EQ(escapedValue(L"\U00010041"), L"\\u0041");
    EXPECT_EQ(escapedKey(L"\U0001f600"), L"\\uf600");
}

TEST(convWcharTo8859_1, KeyEqualsValue)
{
    std::wstring out;
    convWcharTo8859_1(L"a b=c", L"a b=c", out);
    EXPECT_EQ(out, L"a\\ b\\=c=a b\\=c");
}

TEST(convWcharTo8859_1, EmptyKeyAndValueGiveTheEqualsSign)
{
    std::wstring out;
    convWcharTo8859_1(L"", L"", out);
    EXPECT_EQ(out, L"=");
}

TEST(convWcharTo8859_1, AppendsWithoutALineEnd)
{
    std::wstring out = L"first=1\n";
    convWcharTo8859_1(L"k", L"v", out);
    EXPECT_EQ(out, L"first=1\nk=v");
}
