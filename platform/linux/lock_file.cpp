#include "platform/linux/lock_file.h"

#include "diag/SvcDebug_linux.h"
#include "diag/time_stamps.h"
#include "platform/linux/argument_vector.h"
#include "platform/linux/files.h"
#include "platform/linux/lock_content.h"
#include "platform/linux/paths.h"
#include "platform/linux/platform_process.h"
#include "platform/linux/process.h"
#include "platform/linux/wide_strings.h"

#include <cerrno>
#include <cstdio>
#include <cwchar>
#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

static FILE* lockFILE = nullptr;
static long pid = 0;
static std::wstring lockFilePath;
static std::wstring pipeFilePath;
static std::wstring mainPidFilePath;
static std::wstring pipename;
static bool runningLock = false;
static bool bWaitMode = false;
static bool bDirtyShutdown = false;

static std::wstring controlFile(const std::wstring& workspace, const wchar_t* name)
{
    std::wstring path = workspace + L"/" + name;
    convertToOsSeparator(path);
    return path;
}

// The old platform's number; 0, which no platform has, when the words do not give it.
static long oldPlatformPid(int argc, wchar_t** argv)
{
    const int option = findOption(L"-rcp_old_pid", argc, argv);
    if (option < 0 || option + 1 >= argc)
        return 0;
    return wcstol(argv[option + 1], nullptr, 10);
}

// Decision: without a readable old number a live platform ends the wait at once, and this start
// becomes a daemon process.
static void waitForOldPlatform(long oldPid, const std::wstring& exeName)
{
    sysSleep(1);
    int seconds = 1;
    while (isMainProcessRunning(exeName)) {
        if (pid != oldPid)
            return;
        sysSleep(1);
        ++seconds;
        if (seconds > 19) {
            SvcDebugOutA("QVMRL0013E: Existing platform has not shutdown within allotted time. "
                         "Invalidating the lockfile for new launch.");
            invalidateLockFile();
        }
    }
}

// Decision: tracing stays forced on while the lock is taken, so a fatal end in here leaves its
// lines in the time-stamped log.
void locateLockFile(int argc, wchar_t** argv, const std::wstring& workspace,
                    const std::wstring& exeName)
{
    lockFilePath = controlFile(workspace, L".rcp.lock");
    pipeFilePath = controlFile(workspace, L".pipe");
    mainPidFilePath = controlFile(workspace, L".rcp.main");
    const ForcedTrace forced;
    createAndOpenLockFile();
    if (findOption(L"-restart", argc, argv) >= 0)
        waitForOldPlatform(oldPlatformPid(argc, argv), exeName);
    lockLockFile(controlFile(workspace, L".sid"), exeName);
}

static void createLockFile(const char* path)
{
    const int fd = open(path, O_RDWR | O_CREAT | O_CLOEXEC, 0600);
    if (fd >= 0) {
        close(fd);
        return;
    }
    const int reason = errno;
    const ForcedTrace forced;
    SvcDebugOutA("QVMRL0199E: CreateLockFile failed. errno=%d", reason);
}

// No file stays open before this one, so its descriptor tells whether the launcher was started with
// all of the standard ones.
static FILE* openLockFile(const char* path)
{
    FILE* file = fopen(path, "r+");
    if (file == nullptr || fileno(file) > STDERR_FILENO)
        return file;
    fclose(file);
    openStandardDescriptors();
    return fopen(path, "r+");
}

void createAndOpenLockFile()
{
    std::string path;
    wcstochar(path, lockFilePath.c_str());
    // The platform inherits this stream's descriptor: when the launcher is killed before it has
    // recorded the platform, the lock stays with the platform and no second one can start.
    lockFILE = openLockFile(path.c_str());
    // Decision: made only where it cannot be opened as it stands; each start but the first finds
    // one.
    if (lockFILE == nullptr) {
        createLockFile(path.c_str());
        lockFILE = openLockFile(path.c_str());
    }
    if (lockFILE == nullptr) {
        fatalErrorA("QVMRL0054E: Error locating platform lock file", EXIT_PROCESS, WITH_ERRNO);
        return;
    }
    fwide(lockFILE, -1);
}

void lockLockFile(const std::wstring& sidPath, const std::wstring& exeName)
{
    while (flock(fileno(lockFILE), LOCK_EX) != 0) {
        if (errno != EINTR) {
            fatalErrorA("QVMRL0053E: Error locking platform lock file. ", EXIT_PROCESS, WITH_ERRNO);
            return;
        }
    }
    std::wstring now;
    getTimeString(now);
    SvcDebugOutW(L"QVMRL0303I: lock file captured @ %s", now.c_str());
    if (isMainProcessRunning(exeName)) {
        SvcDebugOutA("QVMRL0305I: We are daemon process");
        return;
    }
    SvcDebugOutA("QVMRL0304I: We are main process");
    setMainProcess(true);
    if (exists(sidPath.c_str())) {
        bDirtyShutdown = true;
        deleteFile(sidPath.c_str());
    }
}

void unlockLockFile()
{
    const bool released = flock(fileno(lockFILE), LOCK_UN) == 0;
    const int reason = errno;
    std::wstring now;
    getTimeString(now);
    {
        const ForcedTrace forced;
        SvcDebugOutW(L"QVMRL0306I: lock file released @ %s", now.c_str());
    }
    if (!released) {
        errno = reason;
        fatalErrorA("QVMRL0070E: Error unlocking platform lock file. ", EXIT_PROCESS, WITH_ERRNO);
    }
}

void invalidateLockFile()
{
    if (writeLockContent(fileno(lockFILE), "              "))
        return;
    const ForcedTrace forced;
    SvcDebugOutA("QVMRL0052E: Unable to invalidate platform lock file");
}

void populateLockFile(int childPid)
{
    if (!isMainProcess())
        return;
    populateMainPidFile(static_cast<unsigned long>(childPid));
    const std::string text = std::to_string(childPid) + "          ";
    // Decision: tried twice, since a second platform may be started beside one whose number is not
    // there. What fails once and not again leaves no line.
    const int fd = fileno(lockFILE);
    if (writeLockContent(fd, text) || writeLockContent(fd, text))
        return;
    const ForcedTrace forced;
    SvcDebugOutA("QVMRL0051E: Unable to write to platform lock file");
}

void populateMainPidFile(unsigned long mainPid)
{
    const ForcedTrace forced;
    FILE* file = nullptr;
    open_file(file, mainPidFilePath.c_str(), L"w+");
    if (file == nullptr) {
        // Deliberate: the two identifiers below carry a literal XX.
        SvcDebugOutA("QVMRL00XXI: Unable to open rcp.main file");
        return;
    }
    const bool written = fprintf(file, "%lu    ", mainPid) >= 0;
    if (fflush(file) != 0 || !written)
        SvcDebugOutA("QVMRL00XXI: Unable to write pid to rcp.main file");
    fclose(file);
}

// One that is there but cannot be opened for the moment is read all the same: it is open already.
static bool lockFileIsThere()
{
    std::string path;
    wcstochar(path, lockFilePath.c_str());
    return access(path.c_str(), F_OK) == 0 || (errno != ENOENT && errno != ENOTDIR);
}

bool isMainProcessRunning(const std::wstring& exeName)
{
    if (!lockFileIsThere())
        return false;
    const ForcedTrace forced;
    SvcDebugOutA("QVMRL0090E: Existing platform lock file found - checking validity.");
    const LockContent content = readLockContent(fileno(lockFILE), pid);
    if (content == PLATFORM_NUMBER)
        return isPlatformAlive(pid, exeName);
    if (content == NO_DATA)
        SvcDebugOutA("QVMRL0091E: No data in the platform lock file.");
    else
        fatalErrorA("QVMRL0092E: Error reading platform lock file.", EXIT_PROCESS, WITH_ERRNO);
    return false;
}

long getPlatformPid()
{
    return pid;
}

void getLockFilePath(std::wstring& path)
{
    path = lockFilePath;
}

void getPipeFilePath(std::wstring& path)
{
    path = pipeFilePath;
}

void getMainPidFilePath(std::wstring& path)
{
    path = mainPidFilePath;
}

bool getPipeName(std::wstring& name)
{
    if (pipename.empty() && exists(pipeFilePath.c_str())) {
        FILE* file = nullptr;
        open_file(file, pipeFilePath.c_str(), L"r");
        if (file == nullptr)
            return false;
        wchar_t line[LINE_ROOM];
        readFile(file, L" %2024[^\n]\n", line);
        fclose(file);
        pipename = line;
        name = pipename;
        return true;
    }
    name = pipename;
    return !pipename.empty();
}

void setMainProcess(bool isMain)
{
    runningLock = isMain;
}

bool isMainProcess()
{
    return runningLock;
}

void setWaitMode()
{
    bWaitMode = true;
}

bool isWaitMode()
{
    return bWaitMode;
}

bool isDirtyShutdown()
{
    return bDirtyShutdown;
}

bool isPipeDaemonCommand()
{
    return false;
}

void getCmdString() {}
