#include "diag/SvcDebug_linux.h"

#include "diag/log_stream.h"
#include "diag/narrow.h"
#include "diag/self_format.h"
#include "diag/time_stamps.h"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <cwchar>
#include <unistd.h>

// A formatted line and its terminating zero; a longer one is cut.
static const size_t LINE_SIZE = 4096;

// The longest format, text or name that a trace function takes.
static const size_t LONGEST_TRACE = 999;

static bool debug = false;
static std::string logque;
static FILE* logFILE = nullptr;
static bool bLineBlock = false;

char tempOutBuffer[1024];

static void writeLine(const char* line)
{
    if (logFILE == nullptr) {
        addcstr_to_logque(line);
        return;
    }
    if (!bLineBlock)
        fflush(logFILE);
    fputs(line, logFILE);
    if (!bLineBlock)
        fflush(logFILE);
}

LineBlock::LineBlock()
{
    bLineBlock = true;
}

LineBlock::~LineBlock()
{
    bLineBlock = false;
    if (logFILE != nullptr)
        fflush(logFILE);
}

// Decision: a line that is too long is cut to 4095 bytes and gets its line end after them.
static void formatLine(char (&line)[LINE_SIZE + 1], const char* format, va_list arguments)
{
    line[0] = '\0';
    vsnprintf(line, LINE_SIZE, format, arguments);
    line[LINE_SIZE - 1] = '\0';
}

static void endLine(char (&line)[LINE_SIZE + 1])
{
    const size_t length = strlen(line);
    line[length] = '\n';
    line[length + 1] = '\0';
}

void addcstr_to_logque(const char* lines)
{
    logque += lines;
}

void setDebug(bool on)
{
    debug = on;
}

void setDebug(bool on, bool& previous)
{
    previous = debug;
    debug = on;
}

bool isTracing()
{
    return debug;
}

void output_doit(const char* format, va_list arguments)
{
    char line[LINE_SIZE + 1];
    formatLine(line, format, arguments);
    endLine(line);
    writeLine(line);
}

void Output(const char* format, ...)
{
    if (!debug)
        return;
    va_list arguments;
    va_start(arguments, format);
    output_doit(format, arguments);
    va_end(arguments);
}

void SvcDebugOutA(const char* text)
{
    if (!debug || strlen(text) > LONGEST_TRACE)
        return;
    Output("%s", text);
}

void SvcDebugOutA(const char* format, int n)
{
    if (!debug || strlen(format) > LONGEST_TRACE)
        return;
    Output(format, n);
}

// Decision: the limit is the format's. An argument may be longer, so a launch parameter of more
// than 999 characters is logged too, up to the limit of a line.
void SvcDebugOutA(const char* format, const char* s)
{
    if (!debug || strlen(format) > LONGEST_TRACE)
        return;
    Output(format, s);
}

void SvcDebugOutW(const wchar_t* format, const wchar_t* arg)
{
    if (!debug || wcslen(format) > LONGEST_TRACE)
        return;
    Output(narrow(format).c_str(), narrow(arg).c_str());
}

// Deliberate: the text, values included, is its own format: of two per-cent signs in an argument
// the log shows one. The line end that belongs to the text gives an empty line after it.
void SvcDebugOutW(const wchar_t* name, int count, wchar_t** values)
{
    if (!debug || wcslen(name) > LONGEST_TRACE)
        return;
    std::wstring text = name;
    text += L"=\"";
    for (int i = 0; i < count; ++i) {
        text += values[i];
        text += L", ";
    }
    text += L"\"\n";
    Output("%s", narrow(formatOfItself(text).c_str()).c_str());
}

void SvcDebugLastError(const wchar_t* format, const wchar_t* arg)
{
    SvcDebugOutW(format, arg);
}

void SvcDebugLastError(const wchar_t* format)
{
    SvcDebugOutW(format, L"");
}

void err_doit(bool withErrno, std::string& out, const char* format, va_list arguments)
{
    const int reason = errno;
    char line[LINE_SIZE + 1];
    formatLine(line, format, arguments);
    if (withErrno) {
        const size_t length = strlen(line);
        snprintf(line + length, LINE_SIZE - length, " : %s", strerror(reason));
    }
    endLine(line);
    writeLine(line);
    // An error line does not wait for the end of a block: it may be the last of the process.
    if (logFILE != nullptr)
        fflush(logFILE);
    out = line;
}

void fatalError(bool withErrno, std::string& out, const char* format, ...)
{
    va_list arguments;
    va_start(arguments, format);
    err_doit(withErrno, out, format, arguments);
    va_end(arguments);
}

static void endProcess(bool exitProcess)
{
    if (!exitProcess)
        return;
    if (logFILE == nullptr)
        dumpLogToTempLocation();
    exit(-1);
}

void fatalErrorA(const char* format, const wchar_t* arg, bool exitProcess, bool withErrno)
{
    // An argument that the locale cannot convert would end the line where it stands.
    const int reason = errno;
    if (wcstombs(nullptr, arg, 0) == static_cast<size_t>(-1))
        arg = L"";
    errno = reason;
    std::string line;
    fatalError(withErrno, line, format, arg);
    endProcess(exitProcess);
}

void fatalErrorA(const char* format, const char* arg, bool exitProcess, bool withErrno)
{
    std::string line;
    fatalError(withErrno, line, format, arg);
    endProcess(exitProcess);
}

// Deliberate: a text without an argument is a format all the same.
void fatalErrorA(const char* text, bool exitProcess, bool withErrno)
{
    const int reason = errno;
    const std::string formatted = formatOfItself(std::string(text));
    errno = reason;
    fatalErrorA("%s", formatted.c_str(), exitProcess, withErrno);
}

void fatalErrorW(const wchar_t* text, bool exitProcess, bool withErrno)
{
    const int reason = errno;
    const std::string bytes = narrow(text);
    errno = reason;
    fatalErrorA(bytes.c_str(), exitProcess, withErrno);
}

void GetLastErrorMsg(std::string& out)
{
    const int reason = errno;
    out = " Failed with error " + std::to_string(reason) + ": " + strerror(reason);
}

void GetLastErrorMsg(std::wstring& out)
{
    std::string bytes;
    GetLastErrorMsg(bytes);
    out.clear();
    const size_t length = mbstowcs(nullptr, bytes.c_str(), 0);
    if (length == static_cast<size_t>(-1))
        return;
    out.resize(length);
    mbstowcs(&out[0], bytes.c_str(), length);
}

// The name of the log file in `dir`. A traced run never takes a name that exists.
static std::wstring logFileName(const std::wstring& dir)
{
    if (!debug)
        return dir + L"/velmora.log";
    for (;;) {
        std::wstring time;
        getTimeString(time);
        std::wstring name = dir + L"/velmora_" + time + L".log";
        if (!fileExists(narrowPath(name).c_str()))
            return name;
        sleep(1);
    }
}

bool enableLogging(const std::wstring& dir)
{
    const std::wstring name = withSlashes(logFileName(dir));
    const std::string path = narrow(name.c_str());
    logFILE = openLogStream(path.c_str(), dir == L"/tmp" ? LOG_FOR_EVERYBODY : OWN_LOG);
    if (logFILE == nullptr) {
        fatalErrorA("QVMRL0019E: Could not open %ls for writing!", name.c_str(), GO_ON, WITH_ERRNO);
        return false;
    }
    fprintf(logFILE, "%s\n", logque.c_str());
    fflush(logFILE);
    logque.clear();
    return true;
}

bool dumpLogToTempLocation()
{
    return enableLogging(L"/tmp");
}

void deleteTempLog()
{
    if (fileExists("/tmp/velmora.log"))
        unlink("/tmp/velmora.log");
}

void getLogLocation(std::wstring& out, const std::wstring& base)
{
    out = withSlashes(base + L"/logs");
}
