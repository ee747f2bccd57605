// The log of the process, and the end of the process.
//
// Trace lines (identifiers ending in I) are written while tracing is on; error lines are always
// written. Until the log file is open, lines are held in memory; the file begins with them. A
// fatal error writes its line and ends the process with status 255; when the log file was never
// opened, the held lines go to a file in /tmp first. Nothing is ever written to standard output
// or standard error.
//
// A line is bytes in the locale's encoding, at most 4095 of them, with a line end after them.
// Running text: in a trace format a wide argument is %s, in a fatal format it is %ls.
//
// The log stands on the ground: it uses the C library alone and needs nothing of ours.
#ifndef DIAG_SVCDEBUG_LINUX_H
#define DIAG_SVCDEBUG_LINUX_H

#include <cstdarg>
#include <string>

// The two flags that end every fatal call, in this order.
const bool EXIT_PROCESS = true;
const bool GO_ON = false;
const bool WITH_ERRNO = true;
const bool WITHOUT_ERRNO = false;

/// Turns tracing on or off. It is off until the first call.
void setDebug(bool on);

/// The same, after storing the setting that was in force in `previous`.
void setDebug(bool on, bool& previous);

/// True while trace lines are written: asked before a text is put together only to be traced.
bool isTracing();

/// Tracing is on while one of these lives: for lines that reach the log whatever the user asked
/// for. The destructor restores the setting.
struct ForcedTrace {
    ForcedTrace()
    {
        setDebug(true, previous);
    }
    ~ForcedTrace()
    {
        setDebug(previous);
    }
    ForcedTrace(const ForcedTrace&) = delete;
    ForcedTrace& operator=(const ForcedTrace&) = delete;

private:
    bool previous = false;
};

/// While one of these lives, the trace lines that are written belong together: they reach the file
/// when it ends, or with the next error line. For the parameters of a launch, which are many short
/// lines. The process must not fork meanwhile.
struct LineBlock {
    LineBlock();
    ~LineBlock();
    LineBlock(const LineBlock&) = delete;
    LineBlock& operator=(const LineBlock&) = delete;
};

// ---- Trace lines: nothing happens while tracing is off -----------------------------------------

/// Writes one line in the manner of printf.
void Output(const char* format, ...) __attribute__((format(printf, 1, 2)));
void output_doit(const char* format, va_list arguments) __attribute__((format(printf, 1, 0)));

/// Writes `text` as it stands. A text of more than 999 characters is dropped silently; so is, in
/// the functions below, such a format or name. Arguments may be longer.
void SvcDebugOutA(const char* text);
void SvcDebugOutA(const char* format, int n);
void SvcDebugOutA(const char* format, const char* s);

/// Writes `format` with one wide argument, for which it holds "%s".
void SvcDebugOutW(const wchar_t* format, const wchar_t* arg);

/// Writes name="a, b, " and an empty line. The whole text is its own format (diag/self_format.h).
void SvcDebugOutW(const wchar_t* name, int count, wchar_t** values);

/// As SvcDebugOutW(format, arg), with an empty argument in the second form.
void SvcDebugLastError(const wchar_t* format, const wchar_t* arg);
void SvcDebugLastError(const wchar_t* format);

// ---- Error lines: always written ---------------------------------------------------------------

/// Writes one line in the manner of printf and copies it, line end included, to `out`. With
/// `withErrno` the line goes on with " : " and the system's reason: the errno at entry.
void err_doit(bool withErrno, std::string& out, const char* format, va_list arguments)
    __attribute__((format(printf, 3, 0)));
void fatalError(bool withErrno, std::string& out, const char* format, ...)
    __attribute__((format(printf, 3, 4)));

/// Writes the line; then, with EXIT_PROCESS, ends the process with status 255, after saving the
/// held lines below /tmp when the log file is not open. With GO_ON it returns.
void fatalErrorA(const char* format, const wchar_t* arg, bool exitProcess, bool withErrno);
void fatalErrorA(const char* format, const char* arg, bool exitProcess, bool withErrno);

/// The same without an argument: `text` is its own format (diag/self_format.h).
void fatalErrorA(const char* text, bool exitProcess, bool withErrno);
void fatalErrorW(const wchar_t* text, bool exitProcess, bool withErrno);

/// A pointer where the exit flag was meant: one argument is missing.
void fatalErrorA(const char* format, const wchar_t* arg, bool flag) = delete;
void fatalErrorA(const char* format, const char* arg, bool flag) = delete;

/// Sets `out` to " Failed with error <errno>: <the system's reason>".
void GetLastErrorMsg(std::string& out);
void GetLastErrorMsg(std::wstring& out);

/// Room for a narrow message that is put together right before fatalErrorA(text, ...).
/// Written by the caller of fatalErrorA, read by nobody else.
extern char tempOutBuffer[1024];

// ---- The log file ------------------------------------------------------------------------------

/// Opens "<dir>/velmora.log", or while tracing "<dir>/velmora_<time>.log" under a name that did
/// not exist, and writes the held lines and an empty line. When it cannot be opened, the line
/// QVMRL0019E with the system's reason is written (held, then) and the result is false.
bool enableLogging(const std::wstring& dir);

/// enableLogging in /tmp: what is left when the log of the user's area cannot be had.
bool dumpLogToTempLocation();

/// Deletes /tmp/velmora.log, if it is there: an earlier start that failed left it.
void deleteTempLog();

/// Sets `out` to the log directory of the workspace `base`: "<base>/logs".
void getLogLocation(std::wstring& out, const std::wstring& base);

/// Adds lines, each with its line end, to those that are held until the log file opens.
void addcstr_to_logque(const char* lines);

#endif
