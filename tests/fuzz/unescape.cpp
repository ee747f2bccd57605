// Unescaping a value: what the same steps give when they are done literally; never longer than
// before, and a value without backslashes loses nothing but its outer spaces.
#include "launcher/properties/property_text.h"
#include "tests/fuzz/harness.h"
#include "tests/fuzz/literal.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    const std::wstring before = wide(std::string(reinterpret_cast<const char*>(data), size));
    std::wstring after = before;
    FilterValue(after);
    if (after.size() > before.size())
        finding("a value that grows");
    if (size < 10000 && after != literalValue(before))
        finding("another value");
    if (before.find(L'\\') == std::wstring::npos) {
        std::wstring trimmed = before;
        trimString(trimmed);
        if (after != trimmed)
            finding("a value without an escape that changes");
    }
    isContinuationLine(before);
    isComment(before);
    std::wstring line = before;
    processFilterKey(line);
    if (line.size() > before.size())
        finding("a line that grows");
    return 0;
}
