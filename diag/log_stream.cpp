#include "diag/log_stream.h"

#include <cwchar>
#include <fcntl.h>

FILE* openLogStream(const char* path, LogPlace place)
{
    static char buffer[4096];
    FILE* file = fopen(path, "w+e");
    if (file == nullptr)
        return nullptr;
    // A stream without a buffer of its own asks for the file's block size first.
    setvbuf(file, buffer, _IOFBF, sizeof buffer);
    fwide(file, -1);
    if (place == LOG_FOR_EVERYBODY)
        fcntl(fileno(file), F_SETFL, O_NONBLOCK);
    return file;
}
