#include "platform/linux/lock_content.h"

#include <cctype>
#include <cstdlib>
#include <unistd.h>

static void dropBlanks(std::string& text)
{
    std::string::size_type blanks = 0;
    while (isspace(static_cast<unsigned char>(text[blanks])) != 0)
        ++blanks;
    text.erase(0, blanks);
}

LockContent readLockContent(int fd, long& pid)
{
    char block[4096];
    std::string text; // what has come behind the blanks
    ssize_t length = 1;
    // A block further as long as the number may go on there.
    for (off_t at = 0; length > 0 && text.find_first_not_of("+-0123456789") == std::string::npos;) {
        // Decision: each look sees the file as it is now, which a stream's buffer would not show.
        // What has no place to read from, a FIFO, is refused at once.
        length = pread(fd, block, sizeof block, at);
        if (length > 0) {
            text.append(block, static_cast<size_t>(length));
            at += length;
        }
        dropBlanks(text);
    }
    // Decision: what cannot be read is no empty file. A platform may run, and a second one must not
    // be started beside it.
    if (text.empty())
        return length == 0 ? NO_DATA : UNREADABLE;
    char* end = nullptr;
    const long number = strtol(text.c_str(), &end, 10);
    if (end == text.c_str())
        return UNREADABLE;
    pid = number;
    return PLATFORM_NUMBER;
}

bool writeLockContent(int fd, const std::string& text)
{
    return pwrite(fd, text.data(), text.size(), 0) == static_cast<ssize_t>(text.size());
}
