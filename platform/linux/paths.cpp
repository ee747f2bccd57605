#include "platform/linux/paths.h"

#include "platform/linux/wide_strings.h"

#include <algorithm>
#include <cwchar>

const wchar_t* const BS_CHAR = L"\\";

static void appendSegment(wchar_t* result, const wchar_t* segment)
{
    wcscat(result, segment);
    wcscat(result, L"/");
}

// Appends to `result`, which holds "/", the folded segments of `work`, each with a "/" behind it.
static void foldSegments(wchar_t* result, wchar_t* work)
{
    wchar_t* state = nullptr;
    const wchar_t* current = wcstok(work, L"/", &state);
    while (current != nullptr) {
        const wchar_t* next = wcstok(nullptr, L"/", &state);
        if (next == nullptr) {
            appendSegment(result, current);
            return;
        }
        if (wcscmp(next, L"..") == 0) {
            current = wcstok(nullptr, L"/", &state);
            if (current == nullptr)
                return;
            // Deliberate: the segment behind the new current one is lost; "/a/../b/c/d" is "/b/d".
            wcstok(nullptr, L"/", &state);
            continue;
        }
        appendSegment(result, current);
        if (wcscmp(next, L".") == 0)
            next = wcstok(nullptr, L"/", &state);
        current = next;
    }
}

void convertToStandardPathForm(std::wstring& path)
{
    // Decision: an empty path has no last character to look at and stays empty.
    if (path.empty())
        return;
    const bool keepsEnd = path.back() == L'/';
    wchar_t* work = initMemString(mallocString(path.size()), path.c_str());
    wchar_t* result = initMemString(mallocString(path.size() + 2), L"/");
    foldSegments(result, work);
    std::wstring folded = result;
    freeString(work);
    freeString(result);
    if (!keepsEnd)
        folded.pop_back();
    path = folded;
}

void normalizePath(std::wstring& path)
{
    convertToStandardPathForm(path);
}

void convertBS2S(std::wstring& s)
{
    std::replace(s.begin(), s.end(), BS_CHAR[0], L'/');
}

void convertS2BS(std::wstring& s)
{
    std::replace(s.begin(), s.end(), L'/', BS_CHAR[0]);
}

void convertToOsSeparator(std::wstring& s)
{
    convertBS2S(s);
}

bool endsIn(const std::wstring& s, const std::wstring& suffix)
{
    const std::wstring::size_type length = wcslen(suffix.c_str());
    // Deliberate: unsigned. A suffix one character too long compares npos with npos and is found.
    const std::wstring::size_type start = s.size() - length;
    return s.find(suffix.c_str(), start, length) == start;
}
