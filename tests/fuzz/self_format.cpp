// Texts that are their own format: never longer, unchanged without "%", and the same in both widths.
#include "diag/self_format.h"
#include "diag/SvcDebug_linux.h"
#include "tests/fuzz/harness.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    const std::string bytes(reinterpret_cast<const char*>(data), size);
    const std::string out = formatOfItself(bytes);
    if (out.size() > bytes.size())
        finding("a text that grows");
    if (bytes.find('%') == std::string::npos && out != bytes)
        finding("a text without a conversion that changes");
    const std::wstring text = wide(bytes);
    if (bytes.find('\0') == std::string::npos && !text.empty() && wide(out) != formatOfItself(text))
        finding("bytes and characters differ");
    runs([&] {
        const ForcedTrace forced;
        std::wstring word = text;
        wchar_t* words[] = {&word[0], &word[0]};
        SvcDebugOutW(L"name", 2, words);
        fatalErrorA(bytes.c_str(), EXIT_PROCESS, WITH_ERRNO);
    });
    return 0;
}
