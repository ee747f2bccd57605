#include "platform/linux/lock_content.h"

#include <algorithm>
#include <cctype>
#include <cstdlib>
#include <unistd.h>

static bool isBlank(char c)
{
    return isspace(static_cast<unsigned char>(c)) != 0;
}

static bool endsANumber(char c)
{
    return c != '+' && c != '-' && isdigit(static_cast<unsigned char>(c)) == 0;
}

LockContent readLockContent(int fd, long& pid)
{
    char block[4096];
    std::string text; // what has come behind the blanks
    off_t at = 0;
    ssize_t length = 1;
    bool ended = false;
    // A block further as long as the number may go on there.
    while (!ended && length > 0) {
        // Decision: each look sees the file as it is now, which a stream's buffer would not show.
        // What has no place to read from, a FIFO, is refused at once.
        length = pread(fd, block, sizeof block, at);
        const char* start = block;
        const char* end = block + std::max<ssize_t>(length, 0);
        if (text.empty())
            start = std::find_if_not(start, end, isBlank);
        text.append(start, end);
        ended = std::any_of(start, end, endsANumber);
        at += length;
    }
    // Decision: what cannot be read is no empty file. A platform may run, and a second one must not
    // be started beside it.
    if (text.empty())
        return length == 0 ? NO_DATA : UNREADABLE;
    char* behind = nullptr;
    const long number = strtol(text.c_str(), &behind, 10);
    if (behind == text.c_str())
        return UNREADABLE;
    pid = number;
    return PLATFORM_NUMBER;
}

bool writeLockContent(int fd, const std::string& text)
{
    return pwrite(fd, text.data(), text.size(), 0) == static_cast<ssize_t>(text.size());
}
