#include "launcher/properties/replacement.h"

const unsigned long long MOST_BROUGHT_IN = 1ULL << 20;

static bool hasAtEnd(const std::wstring& s, const std::wstring& end)
{
    return s.size() >= end.size() && s.back() == end.back() &&
           s.compare(s.size() - end.size(), end.size(), end) == 0;
}

// `s` with those that stand there replaced, from the left to the right.
static std::wstring replacedOnce(const std::wstring& placeholder, const std::wstring& value,
                                 const std::wstring& s)
{
    std::wstring out;
    std::wstring::size_type at = 0;
    std::wstring::size_type found = s.find(placeholder);
    while (found != std::wstring::npos) {
        out.append(s, at, found - at);
        out += value;
        at = found + placeholder.size();
        found = s.find(placeholder, at);
    }
    return out.append(s, at);
}

bool replaceEvery(const std::wstring& placeholder, const std::wstring& value, std::wstring& s)
{
    if (s.find(placeholder) == std::wstring::npos)
        return true;
    // Decision: a value that holds its own placeholder would be put in for ever, and so would some
    // that complete one with what they meet. Values that only grow are replaced to the end.
    if (value.find(placeholder) != std::wstring::npos)
        return false;
    // Seldom does a value complete one, and then it still stands there: its first character is none
    // of its others, so none that came in has any of one that was there.
    std::wstring once = replacedOnce(placeholder, value, s);
    if (once.find(placeholder) == std::wstring::npos) {
        s.swap(once);
        return true;
    }
    unsigned long long left = MOST_BROUGHT_IN;
    left += s.size() / placeholder.size() * (value.size() + 1ULL);
    // The search that begins at the start again each time finds the placeholder that ends first,
    // since none overlaps itself. `rest` is what has not been looked at, back to front.
    const std::wstring backwards(value.rbegin(), value.rend());
    std::wstring rest(s.rbegin(), s.rend());
    s.clear();
    while (!rest.empty()) {
        s += rest.back();
        rest.pop_back();
        if (!hasAtEnd(s, placeholder))
            continue;
        if (left <= value.size()) {
            s.append(rest.rbegin(), rest.rend());
            return false;
        }
        left -= value.size() + 1;
        s.resize(s.size() - placeholder.size());
        rest += backwards;
    }
    return true;
}
