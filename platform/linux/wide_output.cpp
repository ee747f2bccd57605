#include "platform/linux/wide_output.h"

#include "platform/linux/wide_strings.h"

#include <cwchar>
#include <iconv.h>
#include <langinfo.h>

// Sets `bytes` to the text with what the locale lacks transliterated, as far as that goes. True
// when it went to the end.
static bool transliterate(const wchar_t* text, std::string& bytes)
{
    bytes.clear();
    const std::string encoding = std::string(nl_langinfo(CODESET)) + "//TRANSLIT";
    iconv_t conversion = iconv_open(encoding.c_str(), "WCHAR_T");
    // iconv_open reports a failure as a pointer of all ones.
    if (reinterpret_cast<intptr_t>(conversion) == -1)
        return false;
    char* in = reinterpret_cast<char*>(const_cast<wchar_t*>(text));
    size_t inLeft = wcslen(text) * sizeof(wchar_t);
    bool converted = true;
    while (converted && inLeft > 0) {
        char piece[256];
        char* out = piece;
        size_t outLeft = sizeof piece;
        const size_t before = inLeft;
        iconv(conversion, &in, &inLeft, &out, &outLeft);
        bytes.append(piece, static_cast<size_t>(out - piece));
        converted = inLeft < before;
    }
    iconv_close(conversion);
    return converted;
}

bool putWide(FILE* fp, const std::wstring& text)
{
    std::string bytes;
    const bool whole = wstrtocs(bytes, text) >= 0 || transliterate(text.c_str(), bytes);
    const bool written = fwrite(bytes.data(), 1, bytes.size(), fp) == bytes.size();
    return whole && written;
}
