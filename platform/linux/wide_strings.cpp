#include "platform/linux/wide_strings.h"

#include "diag/SvcDebug_linux.h"
#include "diag/narrow.h"

#include <climits>
#include <cstdlib>
#include <cstring>
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

size_t decode(wchar_t* out, const char* s, size_t room)
{
    const bool shortWay = asciiIsItself();
    for (size_t i = 0; shortWay && static_cast<unsigned char>(s[i]) < 0x80; ++i) {
        if (i == room)
            return room;
        out[i] = static_cast<wchar_t>(s[i]);
        if (s[i] == '\0')
            return i;
    }
    return mbstowcs(out, s, room);
}

static size_t encode(char* out, const wchar_t* s, size_t room)
{
    const bool shortWay = asciiIsItself();
    for (size_t i = 0; shortWay && s[i] >= 0 && s[i] < 0x80; ++i) {
        if (i == room)
            return room;
        out[i] = static_cast<char>(s[i]);
        if (s[i] == L'\0')
            return i;
    }
    return wcstombs(out, s, room);
}

// What the locale makes of `s`: in `near` when it fits there, so that most texts are converted just
// once. Returns the number of characters, 0 also for bytes that the locale cannot convert.
static const size_t NEAR = 512;

static size_t convertNear(const char* s, wchar_t (&near)[NEAR], bool& fits)
{
    size_t length = decode(near, s, NEAR);
    fits = length < NEAR;
    if (length == NEAR)
        length = mbstowcs(nullptr, s, 0);
    if (length != static_cast<size_t>(-1))
        return length;
    fits = true;
    near[0] = L'\0';
    return 0;
}

// Fills `block`, which has room for `length` characters and the terminating zero.
static wchar_t* fillWide(wchar_t* block, const char* s, const wchar_t (&near)[NEAR], bool fits,
                         size_t length)
{
    if (fits)
        wmemcpy(block, near, length + 1);
    else
        decode(block, s, length + 1);
    return block;
}

wchar_t* chartowcs(const char* s)
{
    wchar_t near[NEAR];
    bool fits = false;
    const size_t length = convertNear(s, near, fits);
    return fillWide(newString(length), s, near, fits, length);
}

const wchar_t* chartowstr(const char* s, std::wstring& out)
{
    wchar_t near[NEAR];
    bool fits = false;
    const size_t length = convertNear(s, near, fits);
    wchar_t* block = fillWide(mallocString(length), s, near, fits, length);
    out = block;
    freeString(block);
    return out.c_str();
}

// Decision: text that the locale cannot convert becomes an empty word: in paths, the log and the
// child's words. What is written to a file is transliterated (wide_output.h).
static int convert(std::string& out, const wchar_t* s)
{
    out.clear();
    char near[NEAR];
    size_t count = encode(near, s, NEAR);
    // With less room left than a character may need, the text may have been cut before one.
    if (count < NEAR - MB_LEN_MAX) {
        out.assign(near, count);
        return static_cast<int>(count);
    }
    const size_t length = wcstombs(nullptr, s, 0) + 1;
    if (length == 0)
        return -1;
    // Deliberate: four times the counted length.
    auto* buffer = static_cast<char*>(malloc(length * 4));
    if (buffer == nullptr) {
        fatalErrorA("QVMRL0004E: malloc failed!", EXIT_PROCESS, WITH_ERRNO);
        return -1;
    }
    count = encode(buffer, s, length);
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
