#include "tests/fuzz/harness.h"

#include "diag/SvcDebug_linux.h"
#include "platform/linux/wide_strings.h"

#include <cerrno>
#include <clocale>
#include <csetjmp>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <set>
#include <string>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

static std::set<FILE*> openStreams;
static bool keepStreams = false;
static FILE* lastKept = nullptr;

// While the launcher's code runs; the fuzzer's own calls go through.
static bool inside = false;
static jmp_buf wayBack;
static int endStatus = 0;

bool endsByJump = false;
int platformLooks = 0;

extern "C" {
[[noreturn]] void __real_exit(int status);
int __real_system(const char* command);
FILE* __real_fopen(const char* path, const char* mode);
FILE* __real_fopen64(const char* path, const char* mode);
int __real_fclose(FILE* stream);

[[noreturn]] void __wrap_exit(int status)
{
    if (!inside)
        __real_exit(status);
    inside = false;
    endStatus = status & 0xff;
    if (endsByJump)
        longjmp(wayBack, 1);
    throw Ended();
}

// No shell: whether the lock file names a platform is the target's choice.
int __wrap_system(const char* command)
{
    if (!inside)
        return __real_system(command);
    if (strncmp(command, "ps h ", 5) == 0 && strlen(command) > 99)
        finding("a process test that is longer than its room");
    return platformLooks-- > 0 ? 0 : 256;
}

int __wrap_kill(pid_t, int signal)
{
    if (signal != 0)
        finding("a signal for somebody");
    errno = ESRCH;
    return platformLooks > 0 ? 0 : -1;
}

unsigned __wrap_sleep(unsigned)
{
    return 0;
}

int __wrap_clone(int (*)(void*), void*, int, void*, ...)
{
    errno = EAGAIN;
    return -1;
}

pid_t __wrap_fork()
{
    errno = EAGAIN;
    return -1;
}

static FILE* remember(FILE* stream)
{
    if (keepStreams)
        lastKept = stream;
    else if (stream != nullptr)
        openStreams.insert(stream);
    return stream;
}

FILE* __wrap_fopen(const char* path, const char* mode)
{
    return remember(__real_fopen(path, mode));
}

FILE* __wrap_fopen64(const char* path, const char* mode)
{
    return remember(__real_fopen64(path, mode));
}

int __wrap_fclose(FILE* stream)
{
    openStreams.erase(stream);
    return __real_fclose(stream);
}
}

// The log of a target goes nowhere, and stays open from one input to the next.
static void openNowhere()
{
    static FILE* log = nullptr;
    const std::string link = place() + "/nowhere/velmora.log";
    if (log == nullptr) {
        std::filesystem::create_directories(place() + "/nowhere");
        if (symlink("/dev/null", link.c_str()) != 0)
            finding("no place for the log");
    }
    FILE* before = log;
    keepStreams = true;
    lastKept = nullptr;
    setDebug(false);
    enableLogging(std::wstring(link.begin(), link.end() - 12));
    log = lastKept;
    keepStreams = false;
    if (before != nullptr)
        __real_fclose(before);
}

static void closeStreams()
{
    const std::set<FILE*> left = openStreams;
    openStreams.clear();
    for (FILE* stream : left)
        __real_fclose(stream);
}

// Standard output is a file in memory, in which nothing may ever stand.
static void watchStandardOutput()
{
    const int file = memfd_create("standard output", MFD_CLOEXEC);
    if (file < 0 || dup2(file, STDOUT_FILENO) < 0)
        finding("no place for the standard output");
}

static bool hasPrinted()
{
    fflush(stdout);
    struct stat output = {};
    return fstat(STDOUT_FILENO, &output) != 0 || output.st_size != 0;
}

// True when the action came to its end.
static bool returnsFrom(const std::function<void()>& action)
{
    inside = true;
    try {
        if (endsByJump && setjmp(wayBack) != 0)
            return false;
        action();
    } catch (const Ended&) {
        return false;
    }
    inside = false;
    return true;
}

bool runs(const std::function<void()>& action)
{
    openNowhere();
    const bool returned = returnsFrom(action);
    if (!returned && endStatus != 0 && endStatus != 1 && endStatus != 255)
        finding("a status that the launcher does not have");
    if (hasPrinted())
        finding("something on standard output");
    setDebug(false);
    // A start has opened a log of its own; the next lines must not go to a closed stream.
    openNowhere();
    closeStreams();
    return returned;
}

const std::string& place()
{
    static const std::string dir = [] {
        std::string name = "/dev/shm/velmora-fuzz-XXXXXX";
        if (mkdtemp(&name[0]) == nullptr)
            finding("no place for files");
        static std::string toRemove;
        toRemove = name;
        atexit([] {
            std::error_code ignored;
            std::filesystem::remove_all(toRemove, ignored);
        });
        return name;
    }();
    return dir;
}

std::wstring widePlace()
{
    return wide(place());
}

void put(const std::string& name, const std::string& bytes)
{
    const std::filesystem::path path = place() + "/" + name;
    std::filesystem::create_directories(path.parent_path());
    FILE* file = __real_fopen(path.c_str(), "w");
    if (file == nullptr)
        return;
    fwrite(bytes.data(), 1, bytes.size(), file);
    __real_fclose(file);
}

unsigned Bytes::number(unsigned below)
{
    if (left == 0)
        return 0;
    --left;
    return *data++ % below;
}

static std::string takeUntil(Bytes& bytes, int end)
{
    const void* found = memchr(bytes.data, end, bytes.left);
    const size_t length =
        found == nullptr ? bytes.left
                         : static_cast<size_t>(static_cast<const uint8_t*>(found) - bytes.data);
    std::string out(reinterpret_cast<const char*>(bytes.data), length);
    const size_t taken = found == nullptr ? length : length + 1;
    bytes.data += taken;
    bytes.left -= taken;
    return out;
}

std::string Bytes::line()
{
    return takeUntil(*this, '\n');
}

std::string Bytes::part()
{
    return takeUntil(*this, 0x1e);
}

std::string Bytes::rest()
{
    std::string out(reinterpret_cast<const char*>(data), left);
    data += left;
    left = 0;
    return out;
}

std::wstring wide(const std::string& bytes)
{
    std::wstring out;
    chartowstr(bytes.c_str(), out);
    return out;
}

void finding(const char* what)
{
    fprintf(stderr, "finding: %s\n", what);
    abort();
}

extern "C" int LLVMFuzzerInitialize(int* /*argc*/, char*** /*argv*/)
{
    const char* locale = getenv("FUZZ_LOCALE");
    if (setlocale(LC_CTYPE, locale == nullptr ? "C.UTF-8" : locale) == nullptr)
        finding("the locale is not installed");
    watchStandardOutput();
    return 0;
}
