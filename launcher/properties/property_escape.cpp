#include "launcher/properties/property_escape.h"

#include <cwchar>

void addHexDigits(std::wstring& out, unsigned code)
{
    wchar_t digits[16];
    swprintf(digits, 16, L"%04x", code);
    // Deliberate: the last four alone, so characters beyond U+FFFF lose their upper bits.
    out += digits + wcslen(digits) - 4;
}

static void appendEscaped(wchar_t c, const wchar_t* special, std::wstring& out)
{
    const unsigned code = std::char_traits<wchar_t>::to_int_type(c);
    if (code < 0x20 || code >= 0x7f) {
        out += L"\\u";
        addHexDigits(out, code);
        return;
    }
    if (wcschr(special, c) != nullptr)
        out += L'\\';
    out += c;
}

void convWcharTo8859_1_Key(const std::wstring& in, std::wstring& out)
{
    for (const wchar_t c : in)
        appendEscaped(c, L"#!=:\\ ", out);
}

void convWcharTo8859_1_Value(const std::wstring& in, std::wstring& out)
{
    for (const wchar_t c : in)
        appendEscaped(c, L"#!=:\\", out);
}

void convWcharTo8859_1(const std::wstring& key, const std::wstring& value, std::wstring& out)
{
    convWcharTo8859_1_Key(key, out);
    out += L'=';
    convWcharTo8859_1_Value(value, out);
}
