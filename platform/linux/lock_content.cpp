#include "platform/linux/lock_content.h"

#include <cctype>
#include <cstdlib>
#include <unistd.h>

static const char* withoutBlanks(const char* text)
{
    while (isspace(static_cast<unsigned char>(*text)) != 0)
        ++text;
    return text;
}

LockContent readLockContent(int fd, long& pid)
{
    char text[4096];
    off_t at = 0;
    for (;;) {
        // Decision: each look sees the file as it is now, which a stream's buffer would not show.
        // What has no place to read from, a FIFO, is refused at once.
        const ssize_t length = pread(fd, text, sizeof text - 1, at);
        // Decision: what cannot be read is no empty file. A platform may run, and a second one must
        // not be started beside it.
        if (length <= 0)
            return length == 0 ? NO_DATA : UNREADABLE;
        text[length] = '\0';
        const char* start = withoutBlanks(text);
        if (start == text)
            break;
        // Once more from there on: it may go on behind what was read.
        at += start - text;
    }
    char* end = nullptr;
    const long number = strtol(text, &end, 10);
    if (end == text)
        return UNREADABLE;
    pid = number;
    return PLATFORM_NUMBER;
}

bool writeLockContent(int fd, const std::string& text)
{
    return pwrite(fd, text.data(), text.size(), 0) == static_cast<ssize_t>(text.size());
}
