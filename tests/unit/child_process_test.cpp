#include "platform/linux/child_process.h"

#include "diag/SvcDebug_linux.h"

#include "tests/unit/separate_process.h"
#include "tests/unit/support.h"

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <set>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

namespace fs = std::filesystem;

// The status of a child that came back because it could not become the program.
static const int CAME_BACK = 42;

static ChildStart started(std::vector<std::string> narrow)
{
    std::vector<char*> args;
    for (std::string& word : narrow)
        args.push_back(&word[0]);
    args.push_back(nullptr);
    const ChildStart start = startChild(args.data());
    if (start.outcome == IN_FAILED_CHILD)
        _exit(start.execResult < 0 && start.pid == 0 ? CAME_BACK : CAME_BACK + 1);
    return start;
}

// A program that waits until it is ended.
static ChildStart startedWaiting()
{
    return started({"/bin/sleep", "600"});
}

static int ended(const ChildStart& start)
{
    kill(start.pid, SIGKILL);
    return statusOf(start.pid);
}

static std::string executableOf(int pid)
{
    std::error_code gone;
    return fs::read_symlink("/proc/" + std::to_string(pid) + "/exe", gone);
}

TEST(startChild, ExecutesTheFirstWordWithAllOfThem)
{
    TempDir dir;
    const ChildStart start = started({"/bin/sh", "-c", "printf '<%s>' \"$@\" >\"$0\"",
                                      dir.path("out"), "a b", "", "%s", "\xff"});
    EXPECT_EQ(start.outcome, CHILD_STARTED);
    EXPECT_GT(start.pid, 0);
    EXPECT_EQ(start.execResult, 0);
    EXPECT_EQ(statusOf(start.pid), 0);
    EXPECT_EQ(dir.read("out"), "<a b><><%s><\xff>");
}

TEST(startChild, HandsTheEnvironmentOn)
{
    TempDir dir;
    setenv("VELMORA_TEST", "x y", 1);
    const ChildStart start =
        started({"/bin/sh", "-c", "printf %s \"$VELMORA_TEST\" >\"$0\"", dir.path("out")});
    EXPECT_EQ(statusOf(start.pid), 0);
    EXPECT_EQ(dir.read("out"), "x y");
}

TEST(startChild, WritesNothingWhenItSucceeds)
{
    EXPECT_EQ(logOf(true, [] { EXPECT_EQ(statusOf(started({"/bin/true"}).pid), 0); }), "");
}

TEST(startChild, DecisionReturnsOnceTheChildIsTheNewProgram)
{
    const std::string program = fs::canonical("/bin/sleep");
    for (int i = 0; i < 25; ++i) {
        const ChildStart start = startedWaiting();
        ASSERT_EQ(start.outcome, CHILD_STARTED);
        const std::string seen = executableOf(start.pid);
        EXPECT_EQ(ended(start), 1000 + SIGKILL);
        ASSERT_EQ(seen, program);
    }
}

static std::set<std::string> openedBy(const std::string& process)
{
    std::set<std::string> opened;
    for (const auto& entry : fs::directory_iterator("/proc/" + process + "/fd")) {
        std::error_code gone;
        const std::string target = fs::read_symlink(entry.path(), gone);
        if (target.find("/fd") == std::string::npos)
            opened.insert(target);
    }
    return opened;
}

TEST(startChild, HandsNoDescriptorOfItsOwnOn)
{
    const std::set<std::string> before = openedBy("self");
    const ChildStart start = startedWaiting();
    // Before that it has its libraries open.
    EXPECT_TRUE(waitUntilAsleep(start.pid));
    const std::set<std::string> childs = openedBy(std::to_string(start.pid));
    const std::set<std::string> after = openedBy("self");
    ended(start);
    EXPECT_EQ(before, after);
    for (const std::string& target : childs)
        EXPECT_EQ(before.count(target), 1u) << target;
}

static std::string logOfFailure(const std::vector<std::string>& args)
{
    return logOf(false, [&] {
        const ChildStart start = started(args);
        EXPECT_EQ(start.outcome, CHILD_STARTED);
        EXPECT_GT(start.pid, 0);
        EXPECT_EQ(start.execResult, 0);
        EXPECT_EQ(statusOf(start.pid), CAME_BACK);
    });
}

TEST(startChild, DecisionAChildThatCannotBeExecutedSaysSoAndComesBack)
{
    TempDir dir;
    EXPECT_EQ(logOfFailure({dir.path("no"), "a"}),
              "Unable to execute " + dir.path("no") + " : No such file or directory\n");
    EXPECT_EQ(logOfFailure({dir.dir}), "Unable to execute " + dir.dir + " : Permission denied\n");
    dir.write("text", "not a program");
    fs::permissions(dir.path("text"), fs::perms(0755));
    EXPECT_EQ(logOfFailure({dir.path("text")}),
              "Unable to execute " + dir.path("text") + " : Exec format error\n");
    EXPECT_EQ(logOfFailure({"100% %s"}), "Unable to execute 100% %s : No such file or directory\n");
}

TEST(startChild, LooksForAPathAndNotForACommand)
{
    EXPECT_EQ(logOfFailure({"sleep", "600"}),
              "Unable to execute sleep : No such file or directory\n");
}

TEST(startChild, CannotExecuteAnEmptyCommand)
{
    EXPECT_EQ(logOfFailure({}), "Unable to execute  : No such file or directory\n");
    EXPECT_EQ(logOfFailure({""}), "Unable to execute  : No such file or directory\n");
}

// No process can be had any more.
static bool refuseProcesses()
{
    bool refused =
        makeFail(SYS_clone, EAGAIN) && makeFail(SYS_fork, EAGAIN) && makeFail(SYS_vfork, EAGAIN);
#ifdef SYS_clone3
    refused = refused && makeFail(SYS_clone3, ENOSYS);
#endif
    return refused;
}

TEST(startChild, DecisionALauncherThatCannotForkSaysSoAndGoesOn)
{
    TempDir dir;
    EXPECT_TRUE(holdsInChild([&] {
        ASSERT_TRUE(enableLogging(dir.wdir));
        ASSERT_TRUE(refuseProcesses());
        const ChildStart start = started({"/bin/true"});
        EXPECT_EQ(start.outcome, CHILD_NOT_FORKED);
        EXPECT_EQ(start.pid, 0);
        EXPECT_EQ(start.execResult, 0);
    }));
    EXPECT_EQ(dir.read("velmora.log"),
              "\nUnable to start /bin/true : Resource temporarily unavailable\n");
}

TEST(waitForChild, WaitsForTheEndWhateverTheStatus)
{
    for (const char* command : {"exit 0", "exit 7", "kill -9 $$"}) {
        const ChildStart start = started({"/bin/sh", "-c", command});
        EXPECT_TRUE(waitForChild(start.pid)) << command;
        EXPECT_EQ(waitpid(start.pid, nullptr, WNOHANG), -1);
        EXPECT_EQ(errno, ECHILD);
    }
}

TEST(waitForChild, WaitsAsLongAsTheChildLives)
{
    EXPECT_TRUE(holdsInChild([] {
        const ChildStart start = startedWaiting();
        const pid_t parent = getpid();
        // Ends the program once the waiting process sleeps.
        const pid_t other = startProcess([&] {
            EXPECT_TRUE(waitUntilAsleep(parent));
            EXPECT_EQ(executableOf(start.pid), fs::canonical("/bin/sleep").string());
            EXPECT_EQ(kill(start.pid, SIGKILL), 0);
        });
        EXPECT_TRUE(waitForChild(start.pid));
        EXPECT_EQ(statusOf(other), 0);
    }));
}

TEST(waitForChild, WaitsForThisChildAlone)
{
    const ChildStart other = started({"/bin/true"});
    const ChildStart start = started({"/bin/true"});
    EXPECT_TRUE(waitForChild(start.pid));
    EXPECT_EQ(statusOf(other.pid), 0);
}

TEST(waitForChild, IsFalseWhenThereIsNoSuchChild)
{
    EXPECT_FALSE(waitForChild(getpid()));
    const ChildStart start = started({"/bin/true"});
    EXPECT_TRUE(waitForChild(start.pid));
    EXPECT_FALSE(waitForChild(start.pid));
}

TEST(watchChildren, DecisionTheEndOfAChildIsSeenAlsoWhereItsSignalWasIgnored)
{
    EXPECT_TRUE(holdsInChild([] {
        signal(SIGCHLD, SIG_IGN);
        EXPECT_FALSE(waitForChild(started({"/bin/true"}).pid));
        watchChildren();
        EXPECT_TRUE(waitForChild(started({"/bin/true"}).pid));
        EXPECT_EQ(system("exit 3"), 3 << 8);
    }));
}

TEST(watchChildren, DecisionThePlatformInheritsTheDefault)
{
    TempDir dir;
    EXPECT_TRUE(holdsInChild([&] {
        signal(SIGCHLD, SIG_IGN);
        watchChildren();
        const ChildStart start =
            started({"/bin/sh", "-c", "grep SigIgn: /proc/self/status >\"$0\"", dir.path("out")});
        EXPECT_EQ(statusOf(start.pid), 0);
    }));
    const std::string ignored = dir.read("out");
    ASSERT_EQ(ignored.compare(0, 8, "SigIgn:\t"), 0) << ignored;
    EXPECT_EQ(std::stoull(ignored.substr(8), nullptr, 16) >> (SIGCHLD - 1) & 1, 0u) << ignored;
}

TEST(startChild, LeavesEachSignalAsItIs)
{
    TempDir dir;
    EXPECT_TRUE(holdsInChild([&] {
        signal(SIGHUP, SIG_IGN);
        signal(SIGPIPE, SIG_DFL);
        const ChildStart start =
            started({"/bin/sh", "-c", "grep -E 'Sig(Blk|Ign):' /proc/self/status >\"$0\"",
                     dir.path("out")});
        EXPECT_EQ(statusOf(start.pid), 0);
    }));
    EXPECT_EQ(dir.read("out"), "SigBlk:\t0000000000000000\nSigIgn:\t0000000000000001\n");
}

TEST(startChild, AProgramThatIsRefusedLeavesNoChildBehindButTheOneThatSaysSo)
{
    TempDir dir;
    EXPECT_TRUE(holdsInChild([&] {
        ASSERT_TRUE(enableLogging(dir.wdir));
        const ChildStart start = started({dir.path("no")});
        EXPECT_EQ(statusOf(start.pid), CAME_BACK);
        EXPECT_EQ(waitpid(-1, nullptr, 0), -1);
        EXPECT_EQ(errno, ECHILD);
    }));
}
