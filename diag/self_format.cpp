#include "diag/self_format.h"

#include <cwchar>

// What stands behind a width or precision at `at`: digits, or one "*", or nothing at all.
static std::wstring::size_type behindNumber(const std::wstring& text, std::wstring::size_type at)
{
    if (at >= text.size())
        return std::wstring::npos;
    return text[at] == L'*' ? at + 1 : text.find_first_not_of(L"0123456789", at);
}

// The length of the complete conversion that begins at `start`, which holds "%"; 0 if there is
// none.
static std::wstring::size_type conversionLength(const std::wstring& text,
                                                std::wstring::size_type start)
{
    std::wstring::size_type at = text.find_first_not_of(L"-+ #0'", start + 1);
    at = behindNumber(text, at);
    if (at < text.size() && text[at] == L'.')
        at = behindNumber(text, at + 1);
    if (at < text.size() && wcschr(L"hlqLjzt", text[at]) != nullptr && text[at] != L'\0') {
        const bool doubled =
            (text[at] == L'h' || text[at] == L'l') && text.compare(at + 1, 1, text, at, 1) == 0;
        at += doubled ? 2 : 1;
    }
    if (at >= text.size())
        return 0;
    if (text[at] == L'\0' || wcschr(L"diouxXeEfFgGaAcsCSpnm", text[at]) == nullptr)
        return 0;
    return at + 1 - start;
}

// Decision: "%%" gives "%", a complete conversion gives nothing since it has no argument, and
// everything else stays: what a link or a file puts into such a text can neither read nor write
// memory. An incomplete conversion loses none of its characters; the walk goes on right behind
// its "%", so a conversion that begins inside it is still one.
std::wstring formatOfItself(const std::wstring& text)
{
    std::wstring out;
    std::wstring::size_type at = 0;
    while (at < text.size()) {
        const std::wstring::size_type percent = text.find(L'%', at);
        out.append(text, at, percent - at);
        if (percent == std::wstring::npos)
            break;
        const std::wstring::size_type length = conversionLength(text, percent);
        if (text.compare(percent, 2, L"%%") == 0) {
            out += L'%';
            at = percent + 2;
        } else if (length > 0) {
            at = percent + length;
        } else {
            out += L'%';
            at = percent + 1;
        }
    }
    return out;
}

std::string formatOfItself(const std::string& text)
{
    if (text.find('%') == std::string::npos)
        return text;
    std::wstring units;
    for (const char c : text)
        units += static_cast<wchar_t>(static_cast<unsigned char>(c));
    std::string out;
    for (const wchar_t unit : formatOfItself(units))
        out += static_cast<char>(static_cast<unsigned char>(unit));
    return out;
}
