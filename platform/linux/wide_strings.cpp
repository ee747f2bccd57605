#include "platform/linux/wide_strings.h"

#include "diag/SvcDebug_linux.h"

#include <cstdlib>
#include <cwchar>

static wchar_t* allocate(size_t n)
{
    auto* block = static_cast<wchar_t*>(malloc((n + 1) * sizeof(wchar_t)));
    if (block != nullptr)
        block[0] = L'\0';
    return block;
}

wchar_t* newString(size_t n)
{
    wchar_t* block = allocate(n);
    if (block == nullptr) {
        std::wstring reason;
        GetLastErrorMsg(reason);
        fatalErrorA("QVMRL0004E: newString malloc failed. %ls", reason.c_str(), EXIT_PROCESS,
                    WITHOUT_ERRNO);
    }
    return block;
}

wchar_t* mallocString(size_t n)
{
    wchar_t* block = allocate(n);
    if (block == nullptr)
        fatalErrorA("QVMRL0004E: mallocString malloc failed!", EXIT_PROCESS, WITH_ERRNO);
    return block;
}

wchar_t* freeString(void* p)
{
    free(p);
    return nullptr;
}

// Deliberate: this appends, although it is meant for fresh strings.
wchar_t* initMemString(wchar_t* dst, const wchar_t* src)
{
    return wcscat(dst, src);
}

// What the counting call reports, plus one; 0 for bytes that the locale cannot convert.
static size_t wideLength(const char* s)
{
    return mbstowcs(nullptr, s, 0) + 1;
}

wchar_t* chartowcs(const char* s)
{
    const size_t length = wideLength(s);
    wchar_t* block = newString(length);
    mbstowcs(block, s, length);
    return block;
}

const wchar_t* chartowstr(const char* s, std::wstring& out)
{
    const size_t length = wideLength(s);
    wchar_t* block = mallocString(length);
    mbstowcs(block, s, length);
    out = block;
    freeString(block);
    return out.c_str();
}

// Decision: text that the locale cannot convert becomes an empty word, wherever it goes.
static int convert(std::string& out, const wchar_t* s)
{
    out.clear();
    const size_t length = wcstombs(nullptr, s, 0) + 1;
    if (length == 0)
        return -1;
    // Deliberate: four times the counted length.
    auto* buffer = static_cast<char*>(malloc(length * 4));
    if (buffer == nullptr) {
        fatalErrorA("QVMRL0004E: malloc failed!", EXIT_PROCESS, WITH_ERRNO);
        return -1;
    }
    const size_t count = wcstombs(buffer, s, length);
    out.assign(buffer, length - 1);
    free(buffer);
    return static_cast<int>(count);
}

void wcstochar(std::string& out, const wchar_t* s)
{
    convert(out, s);
}

int wstrtocs(std::string& out, const std::wstring& s)
{
    return convert(out, s.c_str());
}
