#include "platform/linux/child_process.h"

#include "diag/SvcDebug_linux.h"

#include <cerrno>
#include <csignal>
#include <fcntl.h>
#include <sched.h>
#include <sys/wait.h>
#include <unistd.h>

// Both ends are closed by a successful exec; -1 where there is no pipe.
struct ExecPipe {
    int ends[2] = {-1, -1};

    ExecPipe()
    {
        if (pipe2(ends, O_CLOEXEC) != 0)
            ends[0] = ends[1] = -1;
    }

    ~ExecPipe()
    {
        closeEnd(0);
        closeEnd(1);
    }

    ExecPipe(const ExecPipe&) = delete;
    ExecPipe& operator=(const ExecPipe&) = delete;

    void closeEnd(int end)
    {
        if (ends[end] >= 0)
            close(ends[end]);
        ends[end] = -1;
    }

    // Returns when nobody can write to the pipe any more: the child has executed or has closed it.
    void waitForExec()
    {
        closeEnd(1);
        char nothing = 0;
        while (ends[0] >= 0 && read(ends[0], &nothing, 1) < 0 && errno == EINTR) {
        }
    }
};

static ChildStart executeInChild(char** args)
{
    const char* path = args[0] == nullptr ? "" : args[0];
    errno = ENOENT;
    const int result = args[0] == nullptr ? -1 : execv(path, args);
    // Decision: an error line, always; then the child goes on as a launcher that has nothing to do.
    fatalErrorA("Unable to execute %s", path, GO_ON, WITH_ERRNO);
    return {IN_FAILED_CHILD, 0, result};
}

// What a child does that shares this process's memory: it executes, or leaves word that it cannot.
struct Execution {
    char** args;
    bool refused;
};

static int execute(void* request)
{
    auto* execution = static_cast<Execution*>(request);
    execv(execution->args[0], execution->args);
    execution->refused = true;
    return 127;
}

// Without a copy of this process, which would cost more than half of all the rest, and without
// posix_spawn, which asks for each signal's action first: no handler of ours could run in the
// child. The call comes back once the child is the new program; it gives no child when that
// cannot be.
static pid_t spawnChild(char** args)
{
    if (args[0] == nullptr)
        return -1;
    // Room also for what a preloaded library puts in front of execv: below this array lie the
    // frames of this very call.
    alignas(16) char stack[32768];
    Execution execution = {args, false};
    const pid_t child =
        clone(execute, stack + sizeof stack, CLONE_VM | CLONE_VFORK | SIGCHLD, &execution);
    if (child > 0 && execution.refused) {
        waitForChild(child);
        return -1;
    }
    return child;
}

// Decision: the parent goes on only after the exec. Until then ps shows the child as a launcher,
// and one that reads its number from the lock file would take it for a stranger.
ChildStart startChild(char** args)
{
    const pid_t spawned = spawnChild(args);
    if (spawned > 0)
        return {CHILD_STARTED, static_cast<int>(spawned), 0};
    // What the child does that cannot become the platform is a launcher's work, so it must be a
    // whole process; and where no process can be had, this shows it.
    ExecPipe execPipe;
    const pid_t child = fork();
    if (child == 0)
        return executeInChild(args);
    if (child < 0) {
        // Decision: there is no number to record; the launcher ends as after a start.
        fatalErrorA("Unable to start %s", args[0] == nullptr ? "" : args[0], GO_ON, WITH_ERRNO);
        return {CHILD_NOT_FORKED, 0, 0};
    }
    execPipe.waitForExec();
    return {CHILD_STARTED, static_cast<int>(child), 0};
}

bool waitForChild(int pid)
{
    int status = 0;
    return waitpid(pid, &status, 0) >= 0;
}

// Decision: with SIGCHLD ignored, as some sessions leave it, neither a shell command's result nor
// the end of a child could be had; the platform inherits the default as well.
void watchChildren()
{
    signal(SIGCHLD, SIG_DFL);
}
