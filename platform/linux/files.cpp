#include "platform/linux/files.h"

#include "diag/SvcDebug_linux.h"
#include "diag/narrow.h"
#include "platform/linux/text_source.h"
#include "platform/linux/wide_output.h"
#include "platform/linux/wide_strings.h"

#include <cctype>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <cwchar>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

bool exists(const wchar_t* path)
{
    if (path == nullptr)
        return false;
    std::string narrowPath;
    wcstochar(narrowPath, path);
    return existsA(narrowPath.c_str());
}

bool existsA(const char* path)
{
    return path != nullptr && fileExists(path);
}

bool isDirectory(const wchar_t* path)
{
    if (path == nullptr)
        return false;
    std::string narrowPath;
    wcstochar(narrowPath, path);
    struct stat entry = {};
    return lstat(narrowPath.c_str(), &entry) == 0 && S_ISDIR(entry.st_mode);
}

bool isExecutable(const wchar_t* path)
{
    if (path == nullptr)
        return false;
    std::string narrowPath;
    wcstochar(narrowPath, path);
    struct stat entry = {};
    return stat(narrowPath.c_str(), &entry) == 0 && (entry.st_mode & S_IXUSR) != 0;
}

bool deleteFile(const wchar_t* path)
{
    std::string narrowPath;
    wcstochar(narrowPath, path);
    return unlink(narrowPath.c_str()) == 0;
}

bool moveFile(const wchar_t* from, const wchar_t* to)
{
    std::string narrowFrom;
    std::string narrowTo;
    wcstochar(narrowFrom, from);
    wcstochar(narrowTo, to);
    return rename(narrowFrom.c_str(), narrowTo.c_str()) == 0;
}

bool symlink(const wchar_t* target, const wchar_t* link)
{
    std::string narrowTarget;
    std::string narrowLink;
    wcstochar(narrowTarget, target);
    wcstochar(narrowLink, link);
    return ::symlink(narrowTarget.c_str(), narrowLink.c_str()) == 0;
}

// Copies text until `in` ends. Returns the message that a failure ends the process with.
static const char* copyText(FILE* in, FILE* out)
{
    TextSource source(in);
    std::wstring piece;
    while (source.readPiece(piece)) {
        if (!putWide(out, piece))
            return "QVMRL0192E: Encountered error copying file contents";
    }
    // Decision: a directory, or bytes that the locale cannot decode, end here.
    if (!source.isAtItsEnd())
        return "QVMRL0193E: Did not encounter EOF while copying file contents";
    // What was written so far is in the stream's buffer; a full disk shows only now.
    if (fflush(out) != 0)
        return "QVMRL0192E: Encountered error copying file contents";
    return nullptr;
}

static const bool ON_DISK = true;
static const bool IN_MEMORY = false;

static bool copyToPlace(const wchar_t* from, std::wstring& place, const wchar_t* to, bool onDisk)
{
    FILE* in = nullptr;
    open_file(in, from, L"r");
    if (in == nullptr) {
        fatalErrorA("QVMRL0190E: Unable to open source file %ls to be copied", from, EXIT_PROCESS,
                    WITH_ERRNO);
        return false;
    }
    FILE* out = openNewFile(place, to, L"w+");
    if (out == nullptr) {
        const int reason = errno;
        fclose(in);
        errno = reason;
        fatalErrorA("QVMRL0191E: Unable to open destination file %ls to be copied to", to,
                    EXIT_PROCESS, WITH_ERRNO);
        return false;
    }
    const char* trouble = copyText(in, out);
    if (trouble == nullptr && onDisk && place != to && !flushToDisk(out))
        trouble = "QVMRL0192E: Encountered error copying file contents";
    const int reason = errno;
    fclose(in);
    fclose(out);
    if (trouble == nullptr)
        return true;
    if (place != to)
        deleteFile(place.c_str());
    errno = reason;
    fatalErrorA(trouble, EXIT_PROCESS, WITH_ERRNO);
    return false;
}

bool copyFile(const wchar_t* from, const wchar_t* to)
{
    std::wstring place = to;
    return copyFileAside(from, place, to);
}

bool copyFileAside(const wchar_t* from, std::wstring& place, const wchar_t* to)
{
    return copyToPlace(from, place, to, IN_MEMORY);
}

// Decision: a file that is believed for ever once it stands is written aside and renamed, so that
// a launcher killed half-way leaves nothing that a later start believes. When something stands at
// the target (a dangling link, a file that cannot be read) it is written straight.
std::wstring placeForNewFile(const std::wstring& target)
{
    std::string narrowTarget;
    wcstochar(narrowTarget, target.c_str());
    struct stat entry = {};
    if (lstat(narrowTarget.c_str(), &entry) == 0 || errno != ENOENT)
        return target;
    // What an earlier start left there, or somebody put there as a link, is not written through.
    unlink((narrowTarget + ".part").c_str());
    return target + L".part";
}

FILE* openNewFile(std::wstring& place, const wchar_t* target, const wchar_t* mode)
{
    FILE* file = nullptr;
    open_file(file, place.c_str(), mode);
    if (file == nullptr && place != target) {
        // Something is in the way of the place aside; the reason that counts is the target's.
        place = target;
        open_file(file, target, mode);
    }
    return file;
}

bool publishNewFile(const std::wstring& place, const std::wstring& target)
{
    if (place == target || moveFile(place.c_str(), target.c_str()))
        return true;
    const int reason = errno;
    deleteFile(place.c_str());
    errno = reason;
    return false;
}

bool copyNewFile(const wchar_t* from, const wchar_t* to)
{
    std::wstring place = placeForNewFile(to);
    return copyToPlace(from, place, to, ON_DISK) && publishNewFile(place, to);
}

// A buffer for a stream that is closed again by the function that opens it; at most two of these
// are open at a time. Without one of its own a stream asks for the file's block size first.
static void giveBuffer(FILE* fp)
{
    static char buffers[4][4096];
    static auto* next = buffers;
    setvbuf(fp, *next, _IOFBF, sizeof *next);
    next = next == buffers + 3 ? buffers : next + 1;
}

static void openStream(FILE*& fp, const wchar_t* path, const wchar_t* mode, int orientation)
{
    std::string narrowPath;
    std::string narrowMode;
    wcstochar(narrowPath, path);
    wcstochar(narrowMode, mode);
    narrowMode += 'e';
    fp = fopen(narrowPath.c_str(), narrowMode.c_str());
    if (fp == nullptr)
        return;
    giveBuffer(fp);
    fwide(fp, orientation);
}

void open_file(FILE*& fp, const wchar_t* path, const wchar_t* mode)
{
    openStream(fp, path, mode, -1);
}

void open_wfile(FILE*& fp, const wchar_t* path, const wchar_t* mode)
{
    openStream(fp, path, mode, 1);
}

void open_prop_file(FILE*& fp, const char* path, const char* mode)
{
    fp = fopen(path, (std::string(mode) + 'e').c_str());
}

// The bytes of `format`. Reading a file asks for the same one over and over.
static const char* narrowFormat(const wchar_t* format)
{
    static std::wstring last;
    static std::string bytes;
    if (last != format) {
        last = format;
        wcstochar(bytes, format);
    }
    return bytes.c_str();
}

static int skipWhiteSpace(FILE* fp, int c)
{
    while (c != EOF && isspace(c) != 0)
        c = getc_unlocked(fp);
    return c;
}

// What fscanf does with TRIMMED_LINE, in a fifth of its time: long files are read by it.
static const wchar_t* const TRIMMED_LINE = L" %2024[^\n]\n";

static int scanTrimmedLine(FILE* fp, char* line)
{
    int c = skipWhiteSpace(fp, getc_unlocked(fp));
    if (c == EOF)
        return EOF;
    int length = 0;
    while (length < LINE_ROOM - 1 && c != EOF && c != '\n') {
        line[length++] = static_cast<char>(c);
        c = getc_unlocked(fp);
    }
    line[length] = '\0';
    c = skipWhiteSpace(fp, c);
    if (c != EOF)
        ungetc(c, fp);
    return 1;
}

int readFile(FILE* fp, const wchar_t* format, wchar_t* out)
{
    // Never cleared as a whole: that would cost more than all the rest of a start.
    static char work[819200];
    work[0] = '\0';
    const int result = wcscmp(format, TRIMMED_LINE) == 0 ? scanTrimmedLine(fp, work)
                                                         : fscanf(fp, narrowFormat(format), work);
    // Decision: a read that matched nothing hands over an empty line, and so do bytes that the
    // locale cannot convert.
    if (decode(out, work, LINE_ROOM) >= LINE_ROOM)
        out[0] = L'\0';
    return result;
}

bool readCopiedLine(FILE* fp, wchar_t* out)
{
    while (feof(fp) == 0) {
        const int result = readFile(fp, L"%2024[^\n]\n", out);
        if (result != 0)
            return result != EOF;
        // Decision: only a line end at the very head of the file matches nothing. It is swallowed
        // with what follows, as behind any other line; the copy neither ends nor hangs there.
        readFile(fp, L"\n", out);
    }
    return false;
}

bool flushToDisk(FILE* fp)
{
    return fflush(fp) == 0 && fsync(fileno(fp)) == 0;
}
