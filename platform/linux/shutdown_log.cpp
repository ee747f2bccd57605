#include "platform/linux/shutdown_log.h"

#include "diag/SvcDebug_linux.h"
#include "platform/linux/files.h"
#include "platform/linux/paths.h"
#include "platform/linux/wide_output.h"
#include "platform/linux/wide_strings.h"

#include <algorithm>
#include <cctype>
#include <cstdio>
#include <cstring>
#include <ctime>
#include <cwchar>
#include <unistd.h>

static const int LONGEST_HISTORY = 200;
static const wchar_t* const LINE_FORMAT = L"%2024[^\n]\n";

static std::wstring historyPath(const std::wstring& logDir)
{
    std::wstring path = logDir + L"/shutdown.log";
    convertToOsSeparator(path);
    return path;
}

void doShutdownLogUpdate(const std::wstring& workspace)
{
    std::wstring logDir;
    getLogLocation(logDir, workspace);
    updateShutdownLog(logDir);
    truncateShutdownLog(logDir);
}

void updateShutdownLog(const std::wstring& logDir)
{
    const time_t now = time(nullptr);
    struct tm local = {};
    localtime_r(&now, &local);
    char text[64] = "";
    std::wstring started;
    chartowstr(asctime_r(&local, text), started);

    const std::wstring path = historyPath(logDir);
    FILE* file = nullptr;
    open_file(file, path.c_str(), L"a+");
    if (file == nullptr) {
        fatalErrorA("QVMRL0098E: Could not open %ls for writing!", path.c_str(), EXIT_PROCESS,
                    WITH_ERRNO);
        return;
    }
    // Decision: what the system would not take is not written, though it fits the stream's buffer.
    if (!putWide(file, L"Started " + started) || fflush(file) != 0)
        fatalErrorA("QVMRL0118E: Error writing to %ls file.", path.c_str(), EXIT_PROCESS,
                    WITH_ERRNO);
    fclose(file);
}

// Counts what LINE_FORMAT reads as lines: at most 2024 bytes each, and the white space behind one
// belongs to its end. Only counted, not read: with scanf this would be a quarter of a whole start.
struct LineCounter {
    int lines = 0;

    // Takes the next bytes of the file. False when no more lines can be read.
    bool take(const char* at, const char* end)
    {
        while (at != end) {
            if (betweenLines && lines > 0 && isspace(static_cast<unsigned char>(*at)) != 0) {
                ++at;
                continue;
            }
            if (betweenLines) {
                // So at the very head of the file: nothing matches there, and the reading stops.
                if (*at == '\n')
                    return false;
                ++lines;
                length = 0;
            }
            at = takePiece(at, std::min<size_t>(end - at, LONGEST - length));
        }
        return true;
    }

private:
    static const size_t LONGEST = 2024;
    size_t length = 0;
    bool betweenLines = true;

    const char* takePiece(const char* at, size_t size)
    {
        const void* lineEnd = memchr(at, '\n', size);
        length += size;
        betweenLines = lineEnd != nullptr || length == LONGEST;
        return lineEnd != nullptr ? static_cast<const char*>(lineEnd) : at + size;
    }
};

// Past the stream, which is set back before anything is read from it.
// Decision: a block that is not full is the last one, as it is of any file on a disk. A history
// that comes in smaller pieces, through a FIFO, is not waited for.
static int countLines(FILE* file)
{
    LineCounter counter;
    char block[4096];
    ssize_t size = sizeof block;
    while (size == sizeof block) {
        size = read(fileno(file), block, sizeof block);
        if (size <= 0 || !counter.take(block, block + size))
            break;
    }
    return counter.lines;
}

// Copies the lines from number `first` on (the first line is 1). False when a write failed.
static bool copyLinesFrom(int first, FILE* from, FILE* to)
{
    wchar_t line[LINE_ROOM];
    for (int number = 1; feof(from) == 0 && readFile(from, LINE_FORMAT, line) == 1; ++number) {
        if (number >= first && !putWide(to, std::wstring(line) + L"\n"))
            return false;
    }
    return fflush(to) == 0;
}

void truncateShutdownLog(const std::wstring& logDir)
{
    const std::wstring path = historyPath(logDir);
    const ForcedTrace forced;
    FILE* history = nullptr;
    open_file(history, path.c_str(), L"r");
    if (history == nullptr) {
        SvcDebugOutW(L"QVMRL0138E: Unable to open file.\"%s\"", path.c_str());
        return;
    }
    const int lines = countLines(history);
    if (lines < LONGEST_HISTORY) {
        fclose(history);
        return;
    }
    const std::wstring newPath = path + L".new";
    FILE* kept = nullptr;
    open_file(kept, newPath.c_str(), L"w");
    if (kept == nullptr) {
        SvcDebugOutW(L"QVMRL0105E: Unable to open file for writing.\"%s\"", newPath.c_str());
        fclose(history);
        return;
    }
    rewind(history);
    // Deliberate: from the hundredth line before the last one on, which keeps 101 lines.
    const bool copied = copyLinesFrom(lines - 100, history, kept);
    fclose(history);
    fclose(kept);
    if (!copied) {
        SvcDebugOutW(L"QVMRL0137E: Error while truncating file.\"%s\"", path.c_str());
        deleteFile(newPath.c_str());
        return;
    }
    deleteFile(path.c_str());
    moveFile(newPath.c_str(), path.c_str());
}
