#include "tests/unit/separate_process.h"

#include <cerrno>
#include <csignal>
#include <cstddef>
#include <cstdio>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <fstream>
#include <grp.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sched.h>
#include <sstream>
#include <sys/mount.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

namespace fs = std::filesystem;

static const uid_t ORDINARY_USER = 65534;

pid_t startProcess(const std::function<void()>& action)
{
    fflush(nullptr);
    const pid_t child = fork();
    if (child != 0)
        return child;
    action();
    fflush(nullptr);
    _exit(testing::Test::HasFailure() ? 1 : 0);
}

int statusOf(pid_t child)
{
    int status = 0;
    while (waitpid(child, &status, 0) < 0) {
        if (errno != EINTR)
            return -1;
    }
    return WIFEXITED(status) ? WEXITSTATUS(status) : 1000 + WTERMSIG(status);
}

int statusOf(const std::function<void()>& action)
{
    return statusOf(startProcess(action));
}

testing::AssertionResult holdsInChild(const std::function<void()>& action)
{
    const int status = statusOf(action);
    if (status == 0)
        return testing::AssertionSuccess();
    return testing::AssertionFailure() << "the process ended with status " << status;
}

testing::AssertionResult holdsAsOrdinaryUser(const std::function<void()>& action)
{
    return holdsInChild([&] {
        if (geteuid() == 0) {
            ASSERT_EQ(setgroups(0, nullptr), 0);
            ASSERT_EQ(setresgid(ORDINARY_USER, ORDINARY_USER, ORDINARY_USER), 0);
            ASSERT_EQ(setresuid(ORDINARY_USER, ORDINARY_USER, ORDINARY_USER), 0);
        }
        action();
    });
}

void giveToOrdinaryUser(const std::string& dir)
{
    if (geteuid() != 0)
        return;
    ASSERT_EQ(lchown(dir.c_str(), ORDINARY_USER, ORDINARY_USER), 0);
    for (const auto& entry : fs::recursive_directory_iterator(dir))
        ASSERT_EQ(lchown(entry.path().c_str(), ORDINARY_USER, ORDINARY_USER), 0);
}

static bool writeText(const char* path, const std::string& text)
{
    const int fd = open(path, O_WRONLY | O_CLOEXEC);
    if (fd < 0)
        return false;
    const bool ok = write(fd, text.data(), text.size()) == static_cast<ssize_t>(text.size());
    close(fd);
    return ok;
}

// Enters the namespaces: as root as they come, as anybody else inside a user namespace.
static bool enterNamespaces(int namespaces)
{
    const uid_t user = geteuid();
    const gid_t group = getegid();
    if (user == 0 && unshare(namespaces) == 0)
        return true;
    if (unshare(namespaces | CLONE_NEWUSER) != 0)
        return false;
    writeText("/proc/self/setgroups", "deny");
    const std::string userText = std::to_string(user);
    const std::string groupText = std::to_string(group);
    return writeText("/proc/self/uid_map", userText + " " + userText + " 1") &&
           writeText("/proc/self/gid_map", groupText + " " + groupText + " 1");
}

static bool mountPrivately(const char* kind, const char* target, const char* options)
{
    return mount("none", "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0 &&
           mount(kind, target, kind, MS_NOSUID | MS_NODEV, options) == 0;
}

static bool enterPrivateTmp()
{
    return enterNamespaces(CLONE_NEWNS) && mountPrivately("tmpfs", "/tmp", "mode=1777");
}

testing::AssertionResult holdsInPrivateTmp(const std::function<void()>& action)
{
    return holdsInChild([&] {
        ASSERT_TRUE(enterPrivateTmp()) << strerror(errno);
        action();
    });
}

testing::AssertionResult holdsInPrivateProc(const std::function<void()>& action)
{
    return holdsInChild([&] {
        ASSERT_TRUE(enterNamespaces(CLONE_NEWNS | CLONE_NEWPID)) << strerror(errno);
        // The children of this process live in the new namespace; the first one is its init.
        EXPECT_TRUE(holdsInChild([&] {
            prctl(PR_SET_PDEATHSIG, SIGKILL);
            ASSERT_TRUE(mountPrivately("proc", "/proc", nullptr)) << strerror(errno);
            ASSERT_TRUE(mountPrivately("tmpfs", "/tmp", "mode=1777")) << strerror(errno);
            action();
        }));
    });
}

std::string noPrivateTmp()
{
    const int status = statusOf([] {
        if (!enterPrivateTmp())
            _exit(2);
    });
    return status != 2 ? std::string() : "no private mount namespace can be made here";
}

std::string noPrivateProc()
{
    const int status = statusOf([] {
        if (!enterNamespaces(CLONE_NEWNS | CLONE_NEWPID))
            _exit(2);
        const int inner = statusOf([] {
            if (!mountPrivately("proc", "/proc", nullptr))
                _exit(2);
        });
        _exit(inner);
    });
    return status != 2 ? std::string() : "no private process numbers can be had here";
}

bool makeFail(long systemCall, int reason)
{
    struct sock_filter filter[] = {
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(struct seccomp_data, nr)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, static_cast<unsigned>(systemCall), 0, 1),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | static_cast<unsigned>(reason)),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
    };
    struct sock_fprog program = {};
    program.len = sizeof filter / sizeof *filter;
    program.filter = filter;
    return prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) == 0 &&
           prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) == 0;
}

// The letter of the process's state, 'X' when it is gone.
static char stateOf(pid_t child)
{
    const std::string stat = bytesOf("/proc/" + std::to_string(child) + "/stat");
    const std::string::size_type name = stat.rfind(") ");
    return name == std::string::npos ? 'X' : stat[name + 2];
}

// How often the process has gone to sleep of its own accord.
static long sleepsOf(pid_t child)
{
    const std::string status = bytesOf("/proc/" + std::to_string(child) + "/status");
    const std::string name = "\nvoluntary_ctxt_switches:";
    const std::string::size_type at = status.find(name);
    return at == std::string::npos ? 0 : std::stol(status.substr(at + name.size()));
}

// Waits until the process sleeps and has gone to sleep more than `sleeps` times.
static bool waitForSleep(pid_t child, long sleeps)
{
    for (;;) {
        const char state = stateOf(child);
        if (state == 'Z' || state == 'X')
            return false;
        if (state == 'S' && sleepsOf(child) > sleeps)
            return true;
        usleep(1000);
    }
}

bool waitUntilAsleep(pid_t child)
{
    return waitForSleep(child, -1);
}

bool waitUntilAsleepAgain(pid_t child)
{
    return waitForSleep(child, sleepsOf(child));
}

void boundMemory(size_t more)
{
    if (underAddressSanitizer())
        return;
    size_t pages = 0;
    std::ifstream("/proc/self/statm") >> pages;
    const rlim_t room = pages * static_cast<rlim_t>(sysconf(_SC_PAGESIZE)) + more;
    const struct rlimit limit = {room, room};
    ASSERT_EQ(setrlimit(RLIMIT_AS, &limit), 0);
}

bool underAddressSanitizer()
{
#ifdef __SANITIZE_ADDRESS__
    return true;
#else
    return false;
#endif
}

std::string bytesOf(const std::string& path)
{
    std::ifstream in(path, std::ios::binary);
    std::stringstream bytes;
    bytes << in.rdbuf();
    return bytes.str();
}
