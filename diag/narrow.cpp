#include "diag/narrow.h"

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <cwchar>
#include <fcntl.h>
#include <langinfo.h>
#include <unistd.h>

bool asciiIsItself()
{
    const char* encoding = nl_langinfo(CODESET);
    return strcmp(encoding, "UTF-8") == 0 || strcmp(encoding, "ANSI_X3.4-1968") == 0;
}

static bool isAscii(const wchar_t* text)
{
    while (*text > 0 && *text < 0x80)
        ++text;
    return *text == L'\0';
}

std::string narrow(const wchar_t* text)
{
    if (asciiIsItself() && isAscii(text))
        return std::string(text, text + wcslen(text));
    const size_t length = wcstombs(nullptr, text, 0);
    if (length == static_cast<size_t>(-1))
        return std::string();
    std::string out(length, '\0');
    wcstombs(&out[0], text, length);
    return out;
}

std::wstring withSlashes(std::wstring path)
{
    for (wchar_t& c : path) {
        if (c == L'\\')
            c = L'/';
    }
    return path;
}

std::string narrowPath(const std::wstring& path)
{
    return narrow(withSlashes(path).c_str());
}

bool fileExists(const char* path)
{
    // A FIFO opens at once: in /tmp anybody could put one there, for everybody's starts to wait at.
    int fd = open(path, O_RDONLY | O_NONBLOCK | O_CLOEXEC);
    // Where somebody holds a lease on the file, only a patient open has it given up.
    if (fd < 0 && errno == EWOULDBLOCK)
        fd = open(path, O_RDONLY | O_CLOEXEC);
    if (fd < 0)
        return false;
    close(fd);
    return true;
}
