// Placeholders: the product against the same steps done literally on the whole string.
#include "launcher/properties/placeholders.h"
#include "tests/fuzz/harness.h"

#include <vector>

// Each step as it is prescribed, with positions in the whole text and unsigned arithmetic.
static bool resolveLiterally(std::wstring& s, const PropertyList& props, int& steps)
{
    typedef std::wstring::size_type Position;
    Position pos = s.size() - 1;
    Position lastStart = std::wstring::npos;
    bool ok = true;
    int repeats = 0;
    Position length = 0;
    std::wstring name;
    for (;;) {
        const Position start = findLastPlaceholder(s, pos, length, name);
        if (start == std::wstring::npos)
            return ok;
        std::wstring value;
        if (!getPlaceholderValue(name, value, props))
            ok = false;
        s.replace(start, length, value);
        pos = start + value.size() - 1;
        if (lastStart != std::wstring::npos && start >= lastStart) {
            if (++repeats > 9)
                return false;
        } else {
            repeats = 0;
        }
        if (!ok) {
            if (start == 0)
                return false;
            pos = start - 1;
        }
        lastStart = start;
        // One that never ends is not for this comparison; the product must end it by itself.
        if (++steps > 3000)
            return ok;
    }
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    if (size > 400)
        return 0;
    Bytes bytes = {data, size};
    PropertyList props;
    for (const wchar_t* key : {L"a", L"b", L"c"})
        appendProperty(props, key, wide(bytes.line()));
    const std::wstring text = wide(bytes.rest());
    std::wstring literal = text;
    int steps = 0;
    const bool expected = resolveLiterally(literal, props, steps);
    std::wstring fast = text;
    const bool resolved = replaceUserPlaceholders(fast, props);
    if (steps <= 3000 && resolved != expected)
        finding("another result");
    if (steps <= 3000 && fast != literal)
        finding("another text");
    std::wstring all = text;
    runs([&] { replaceAllPlaceholders(L"/w", L"/h", all, props); });
    std::wstring path = text;
    fixUpJvmLibPath(path);
    freeProperties(props);
    return 0;
}
