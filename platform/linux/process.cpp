#include "platform/linux/process.h"

#include "diag/SvcDebug_linux.h"
#include "platform/linux/paths.h"
#include "platform/linux/wide_strings.h"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <cwchar>
#include <dirent.h>
#include <fcntl.h>
#include <sys/time.h>
#include <unistd.h>

const int MAX_RETRIES = 10;

static const char* const OWN_EXECUTABLE = "/proc/self/exe";

// Decision: a launcher that was started without standard descriptors gets empty ones, and so does
// the platform; otherwise the lock file would be the first file that stays open, and the platform's
// output.
void openStandardDescriptors()
{
    int fd = open("/dev/null", O_RDWR);
    while (fd >= 0 && fd <= STDERR_FILENO)
        fd = open("/dev/null", O_RDWR);
    if (fd >= 0)
        close(fd);
}

bool userIsAdmin(const wchar_t* /*ignored*/)
{
    return getuid() == 0;
}

void readsymln(std::string& out, const char* link)
{
    char target[4096];
    const ssize_t length = readlink(link, target, sizeof target);
    if (length < 0 || length >= static_cast<ssize_t>(sizeof target)) {
        const int reason = errno;
        snprintf(tempOutBuffer, sizeof tempOutBuffer,
                 "QVMRL0184E: Getting command path failed! errno = %d", reason);
        errno = reason;
        fatalErrorA(tempOutBuffer, EXIT_PROCESS, WITH_ERRNO);
        return;
    }
    out.assign(target, static_cast<size_t>(length));
}

// Asked once: the system makes a directory in /proc for the answer, which takes longer than opening
// five files.
static const char* ownExecutable()
{
    static std::string path;
    if (path.empty())
        readsymln(path, OWN_EXECUTABLE);
    return path.c_str();
}

void getLauncherPath(std::wstring& out, const wchar_t* /*ignored*/)
{
    chartowstr(ownExecutable(), out);
}

void findCommand(wchar_t*& dir, const wchar_t* /*ignored*/)
{
    dir = chartowcs(ownExecutable());
    wchar_t* slash = wcsrchr(dir, L'/');
    if (slash != nullptr)
        *slash = L'\0';
}

int getTick()
{
    struct timeval now = {};
    gettimeofday(&now, nullptr);
    return static_cast<int>(now.tv_sec);
}

void sysSleep(int seconds)
{
    sleep(static_cast<unsigned>(seconds));
}

const wchar_t* getOS()
{
    return L"linux";
}

void convert_from_relative_location(const wchar_t* in, std::wstring& out)
{
    out = in;
}

void setCurrentWorkingDir(const std::wstring& dir)
{
    std::wstring path = dir + L"/rcp";
    convertToOsSeparator(path);
    std::string narrowPath;
    wcstochar(narrowPath, path.c_str());
    if (chdir(narrowPath.c_str()) == 0)
        return;
    const std::string where = narrowPath + ": " + strerror(errno);
    fatalErrorA("QVMRL0124E: Could not set working directory to %s", where.c_str(), EXIT_PROCESS,
                WITHOUT_ERRNO);
}

// True when the executable path of the process, its first zero-terminated word, ends in "/eclipse".
static bool isPlatformProcess(const char* number)
{
    const std::string path = std::string("/proc/") + number + "/cmdline";
    FILE* file = fopen(path.c_str(), "re");
    if (file == nullptr)
        return false;
    char words[1024];
    const size_t length = fread(words, 1, sizeof words - 1, file);
    fclose(file);
    words[length] = '\0';
    const size_t pathLength = strlen(words);
    return pathLength >= 9 && strcmp(words + pathLength - 8, "/eclipse") == 0;
}

static int findPlatformOnce()
{
    DIR* processes = opendir("/proc");
    if (processes == nullptr)
        return 0;
    int found = 0;
    while (const struct dirent* entry = readdir(processes)) {
        const int number = static_cast<int>(strtol(entry->d_name, nullptr, 10));
        if (number > 0 && isPlatformProcess(entry->d_name)) {
            found = number;
            break;
        }
    }
    closedir(processes);
    return found;
}

int findRCP()
{
    for (int pass = 0; pass < MAX_RETRIES; ++pass) {
        const int found = findPlatformOnce();
        if (found != 0)
            return found;
        sysSleep(1);
    }
    return 0;
}
