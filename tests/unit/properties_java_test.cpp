// What the escaped form means to its reader: java.util.Properties gets back what was written. The
// reader here is a model of that class, from its documentation; the launch tests ask the class.
#include "launcher/properties/property_escape.h"

#include <gtest/gtest.h>

#include <random>

// A key and a value in the reader's 16-bit characters.
struct JavaProperty {
    std::wstring key;
    std::wstring value;

    bool operator==(const JavaProperty& other) const
    {
        return key == other.key && value == other.value;
    }
};

static bool isJavaBlank(wchar_t c)
{
    return c == L' ' || c == L'\t' || c == L'\f';
}

// The character that begins at `at`, which goes behind it; `escaped` tells how it was written.
static wchar_t javaCharacter(const std::wstring& line, size_t& at, bool& escaped)
{
    escaped = line[at] == L'\\';
    if (!escaped)
        return line[at++];
    const wchar_t c = line.at(at + 1);
    at += 2;
    if (c == L'u') {
        at += 4;
        return static_cast<wchar_t>(std::stoi(line.substr(at - 4, 4), nullptr, 16));
    }
    const std::wstring letters = L"tnrf";
    const size_t letter = letters.find(c);
    return letter == std::wstring::npos ? c : L"\t\n\r\f"[letter];
}

// Reads one line without an end in it. What is a comment, blank or continued has no property.
static JavaProperty loadedByJava(const std::wstring& line)
{
    size_t at = 0;
    while (at < line.size() && isJavaBlank(line[at]))
        ++at;
    size_t backslashes = 0;
    while (backslashes < line.size() && line[line.size() - 1 - backslashes] == L'\\')
        ++backslashes;
    if (at == line.size() || line[at] == L'#' || line[at] == L'!' || backslashes % 2 == 1 ||
        line.find_first_of(L"\r\n") != std::wstring::npos)
        return {L"no property", line};
    JavaProperty loaded;
    bool escaped = false;
    while (at < line.size()) {
        const size_t before = at;
        const wchar_t c = javaCharacter(line, at, escaped);
        if (!escaped && (c == L'=' || c == L':' || isJavaBlank(c))) {
            at = before;
            break;
        }
        loaded.key += c;
    }
    bool separator = false;
    for (; at < line.size(); ++at) {
        if (!separator && (line[at] == L'=' || line[at] == L':'))
            separator = true;
        else if (!isJavaBlank(line[at]))
            break;
    }
    while (at < line.size())
        loaded.value += javaCharacter(line, at, escaped);
    return loaded;
}

static JavaProperty throughJava(const std::wstring& key, const std::wstring& value)
{
    std::wstring line;
    convWcharTo8859_1(key, value, line);
    return loadedByJava(line);
}

static std::wstring cutTo16Bits(std::wstring s)
{
    for (wchar_t& c : s)
        c = static_cast<wchar_t>(static_cast<unsigned>(c) & 0xffffu);
    return s;
}

static std::wstring withoutLeadingSpaces(const std::wstring& s)
{
    const size_t first = s.find_first_not_of(L' ');
    return first == std::wstring::npos ? L"" : s.substr(first);
}

static std::wstring anyText(std::mt19937& random, size_t longest)
{
    static const std::wstring letters =
        L" \\#!=:\t\n\r\f\"'ab\u007f\u00e9\u20ac\U0001f600\U00010020";
    std::wstring s;
    for (size_t left = random() % (longest + 1); left > 0; --left) {
        if (random() % 8 == 0)
            s += static_cast<wchar_t>(1 + random() % 0x10ffff);
        else
            s += letters[random() % letters.size()];
    }
    return s;
}

TEST(javaReadsBack, EveryPrintableCharacterOfAKeyAndAValue)
{
    for (wchar_t c = 0x21; c < 0x7f; ++c) {
        const std::wstring text = std::wstring(L"a") + c + L"b" + c;
        EXPECT_EQ(throughJava(text, text).key, text);
        EXPECT_EQ(throughJava(text, text).value, text);
        const std::wstring first = c + std::wstring(L"a");
        EXPECT_EQ(throughJava(first, first).key, first);
        EXPECT_EQ(throughJava(first, first).value, first);
    }
}

TEST(javaReadsBack, WhatIsNoPrintableCharacter)
{
    const std::wstring text(L"\0\x01\t\n\r\f\x1f\x7f\u0080\u00e9\u20ac\uffff", 12);
    EXPECT_EQ(throughJava(text, text).key, text);
    EXPECT_EQ(throughJava(text, text).value, text);
}

TEST(javaReadsBack, SpacesInAKey)
{
    EXPECT_EQ(throughJava(L"  a  b  ", L"v").key, L"  a  b  ");
    EXPECT_EQ(throughJava(L"  a  b  ", L"v").value, L"v");
}

TEST(javaReadsBack, SpacesInsideAndBehindAValue)
{
    EXPECT_EQ(throughJava(L"k", L"a  b  ").value, L"a  b  ");
    EXPECT_EQ(throughJava(L"k", L"\t  a").value, L"\t  a");
}

TEST(javaReadsBack, LeadingSpacesOfAValueAreLost)
{
    EXPECT_EQ(throughJava(L"k", L"  a").value, L"a");
    EXPECT_EQ(throughJava(L"k", L"   ").value, L"");
}

TEST(javaReadsBack, EmptyKeyAndEmptyValue)
{
    EXPECT_EQ(throughJava(L"", L"").key, L"");
    EXPECT_EQ(throughJava(L"", L"").value, L"");
    EXPECT_EQ(throughJava(L"", L"v").value, L"v");
    EXPECT_EQ(throughJava(L"k", L"").key, L"k");
}

TEST(javaReadsBack, TheLowSixteenBitsOfLargerCharacters)
{
    EXPECT_EQ(throughJava(L"\U00010041", L"\U0001f600").key, L"A");
    EXPECT_EQ(throughJava(L"\U00010041", L"\U0001f600").value, std::wstring(1, wchar_t(0xf600)));
    // Truncated to a space, it is escaped all the same.
    EXPECT_EQ(throughJava(L"k", L"\U00010020a").value, L" a");
}

TEST(javaReadsBack, TenThousandTexts)
{
    std::mt19937 random(20131002);
    for (int i = 0; i < 10000; ++i) {
        const std::wstring key = anyText(random, 12);
        const std::wstring value = anyText(random, 12);
        const JavaProperty wanted = {cutTo16Bits(key), cutTo16Bits(withoutLeadingSpaces(value))};
        std::wstring line;
        convWcharTo8859_1(key, value, line);
        ASSERT_TRUE(loadedByJava(line) == wanted)
            << "text " << i << ": " << testing::PrintToString(line);
    }
}
