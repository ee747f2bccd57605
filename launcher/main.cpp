// The entry of the process and its last act: the platform as a child.
#include "diag/SvcDebug_linux.h"
#include "launcher/command/launch_command.h"
#include "launcher/command/options.h"
#include "launcher/startup.h"
#include "launcher/user_area/installation.h"
#include "platform/linux/argument_vector.h"
#include "platform/linux/child_process.h"
#include "platform/linux/lock_file.h"
#include "platform/linux/process.h"
#include "platform/linux/session_end.h"
#include "platform/linux/wide_strings.h"

#include <cerrno>
#include <clocale>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <cwchar>
#include <exception>
#include <new>

// The C++ library would say on standard error what it ends the process for, where this one never
// writes, and would bring along all that it takes to spell a type's name. What it ends for is a
// defect here; of that the system's own account of an abort tells more.
void __gnu_cxx::__verbose_terminate_handler()
{
    abort();
}

// Out of memory ends the process as loudly for `new` as for malloc. If even the line cannot be
// written, only the status is left to tell of it.
static void endWithoutMemory()
{
    static bool entered = false;
    if (entered)
        _Exit(255);
    entered = true;
    const int error = errno;
    wchar_t reason[256] = L"";
    swprintf(reason, 256, L" Failed with error %d: %s", error, strerror(error));
    fatalErrorA("QVMRL0004E: newString malloc failed. %ls", reason, EXIT_PROCESS, WITHOUT_ERRNO);
}

static void logArguments(int argc, wchar_t** argv)
{
    const ForcedTrace forced;
    SvcDebugOutW(L"QVMRL0030I: velmora main arguments", argc, argv);
}

static int argumentCount(char** args)
{
    int count = 0;
    while (args[count] != nullptr)
        ++count;
    return count;
}

// Records the child and releases the lock: in this order, so that whoever waits for the lock finds
// the platform in the lock file.
static void recordChild(const ChildStart& start)
{
    if (start.outcome == CHILD_STARTED)
        populateLockFile(start.pid);
    unlockLockFile();
}

static void launchOnce(int argc, wchar_t** argv, char** args)
{
    const ChildStart start = startChild(args);
    if (start.outcome == IN_FAILED_CHILD)
        return;
    recordChild(start);
    const bool wait = findOption(L"-velmoraWait", argc, argv) >= 0 ||
                      haveLaunchOption("-console", args, argumentCount(args));
    if (wait && start.outcome == CHILD_STARTED)
        waitForChild(start.pid);
}

// What the platform left for the launcher when it ended.
enum ExitRequest { NO_REQUEST, SHUTDOWN_REQUEST, LOGOFF_REQUEST, OTHER_REQUEST };

// Deliberate: the word is compared with its line end, if it has one; "shutdown\n" is no request.
static ExitRequest readExitRequest()
{
    const char* home = getenv("HOME");
    const std::string path = std::string(home == nullptr ? "" : home) + "/.exitData";
    FILE* file = fopen(path.c_str(), "re");
    if (file == nullptr)
        return NO_REQUEST;
    char word[1024] = "";
    if (fgets(word, sizeof word, file) == nullptr)
        word[0] = '\0';
    // Decision: closed, so that a supervision of months loses no descriptors.
    fclose(file);
    if (strcmp(word, "shutdown") == 0)
        return SHUTDOWN_REQUEST;
    if (strcmp(word, "logoff") == 0)
        return LOGOFF_REQUEST;
    return OTHER_REQUEST;
}

// True when the supervision is over: the session ends, or the platform asked for something else.
static bool answerRequest(ExitRequest request)
{
    switch (request) {
    case SHUTDOWN_REQUEST:
        return shutdown();
    case LOGOFF_REQUEST:
        return logoff();
    case OTHER_REQUEST:
        return isLockdownConfig();
    default:
        return false;
    }
}

// Starts the platform again each time it ends, until it asks for the end of the session. A child
// that could not be executed takes part in the loop: it has no child of its own, and its own
// execResult tells it to end.
static void superviseLockdown(char** args)
{
    ChildStart current = {CHILD_NOT_FORKED, 0, 0};
    do {
        const int ignored = system("rm -Rf ~/.exitData");
        static_cast<void>(ignored);
        if (current.pid == 0)
            current = startChild(args);
        if (current.outcome == CHILD_NOT_FORKED) {
            // Decision: nothing is recorded, and the next try is a second away.
            unlockLockFile();
            sysSleep(1);
            continue;
        }
        if (current.outcome == CHILD_STARTED) {
            recordChild(current);
            if (!waitForChild(current.pid))
                continue;
        }
        if (answerRequest(readExitRequest()))
            return;
        current.pid = 0;
        if (current.execResult < 0)
            fatalErrorA("QVMRL0194E: Executing launcher failed!", EXIT_PROCESS, WITH_ERRNO);
    } while (isLockdownConfig());
}

static void launchEclipse(int argc, wchar_t** argv)
{
    char** args = newExecArguments(launchArgs, "QVMRL0132I: ===== Begin Launch Parameters =====",
                                   "QVMRL0133I: ===== End Launch Parameters =====");
    if (isLockdownConfig() && !userIsAdmin(nullptr) && !bDaemon)
        superviseLockdown(args);
    else
        launchOnce(argc, argv, args);
    freeExecArguments(args);
}

int main(int argc, char** argv)
{
    watchChildren();
    std::set_new_handler(endWithoutMemory);
    if (setlocale(LC_CTYPE, "") == nullptr)
        fatalErrorA("QVMRL0182E: Set locale error!", EXIT_PROCESS, WITH_ERRNO);
    ArgumentVector words = wideArguments(argc, argv);
    wchar_t** wargv = words.data();
    setDebug(isDebug(argc, wargv));
    logArguments(argc, wargv);
    bRestart = haveLaunchOption("-restart", argv, argc);
    doVersionCheck(argc, wargv);
    startup(argc, wargv, launchArgs);
    launchEclipse(argc, wargv);
    for (wchar_t* word : words)
        freeString(word);
    return 0;
}
