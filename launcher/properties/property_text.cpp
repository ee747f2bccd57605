#include "launcher/properties/property_text.h"

#include "platform/linux/process.h"

#include <cwchar>

void trimString(std::wstring& s)
{
    const std::wstring::size_type first = s.find_first_not_of(L' ');
    if (first == std::wstring::npos)
        return;
    s.erase(s.find_last_not_of(L' ') + 1);
    s.erase(0, first);
}

void FilterProp(std::wstring& key)
{
    trimString(key);
}

// Decision: only hexadecimal digits count in a "\u" escape; no blank, sign or "0x" is one.
static int hexDigit(wchar_t c)
{
    if (c >= L'0' && c <= L'9')
        return c - L'0';
    if (c >= L'a' && c <= L'f')
        return c - L'a' + 10;
    if (c >= L'A' && c <= L'F')
        return c - L'A' + 10;
    return -1;
}

static wchar_t escapedCharacter(const std::wstring& digits)
{
    int code = 0;
    for (const wchar_t c : digits) {
        const int digit = hexDigit(c);
        if (digit < 0)
            break;
        code = code * 16 + digit;
    }
    return static_cast<wchar_t>(code);
}

void FilterValue(std::wstring& value)
{
    if (value.find(L'\\') == std::wstring::npos) {
        trimString(value);
        return;
    }
    std::wstring out;
    out.reserve(value.size());
    for (std::wstring::size_type i = 0; i < value.size(); ++i) {
        if (value[i] != L'\\') {
            out += value[i];
            continue;
        }
        ++i;
        if (i >= value.size())
            break;
        if (value[i] != L'u') {
            out += value[i];
            continue;
        }
        // Deliberate: six characters go, whatever the last four are: "\u41xy" gives "A".
        out += escapedCharacter(value.substr(i + 1, 4));
        i += 4;
    }
    value = out;
    trimString(value);
}

bool isComment(const std::wstring& line)
{
    return !line.empty() && (line[0] == L'#' || line[0] == L'!');
}

bool isContinuationLine(const std::wstring& line)
{
    // Deliberate: the first character is never looked at, so a lone backslash continues nothing.
    std::wstring::size_type count = 0;
    while (count + 1 < line.size() && line[line.size() - 1 - count] == L'\\')
        ++count;
    return count % 2 == 1;
}

static bool beginsWith(const std::wstring& s, const wchar_t* start)
{
    return s.compare(0, wcslen(start), start) == 0;
}

bool processFilterKey(std::wstring& line)
{
    line.erase(0, line.find_first_not_of(L' '));
    if (beginsWith(line, L"-D"))
        return false;
    const std::wstring key = line.substr(0, line.find_first_of(L" :="));
    const std::wstring::size_type point = key.rfind(L'.');
    if (point == std::wstring::npos)
        return false;
    const std::wstring suffix = key.substr(point + 1);
    if (!beginsWith(suffix, L"win32") && !beginsWith(suffix, L"linux") &&
        !beginsWith(suffix, L"macosx"))
        return false;
    if (!beginsWith(suffix, getOS()))
        return true;
    line.erase(point, suffix.size() + 1);
    return false;
}
