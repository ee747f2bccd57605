// Folding a path: the result begins with "/" (or is empty), holds no "//", and keeps its end.
#include "platform/linux/paths.h"
#include "tests/fuzz/harness.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    const std::wstring before = wide(std::string(reinterpret_cast<const char*>(data), size));
    std::wstring after = before;
    if (!runs([&] { convertToStandardPathForm(after); }))
        finding("a path ends the start");
    if (before.empty() != after.empty() && !before.empty() && before.back() == L'/')
        finding("a path with an end that is lost");
    if (!after.empty() && after[0] != L'/')
        finding("a path without a root");
    if (after.find(L"//") != std::wstring::npos)
        finding("an empty segment");
    if (!before.empty() && before.back() == L'/' && after.back() != L'/')
        finding("a lost separator at the end");
    std::wstring slashes = before;
    convertToOsSeparator(slashes);
    if (slashes.find(L'\\') != std::wstring::npos || slashes.size() != before.size())
        finding("a backslash that stays");
    endsIn(before, after);
    endsIn(after, before);
    return 0;
}
