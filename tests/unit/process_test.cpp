#include "platform/linux/process.h"

#include "tests/unit/separate_process.h"
#include "tests/unit/support.h"

#include <cerrno>
#include <climits>
#include <csignal>
#include <cstdlib>
#include <ctime>
#include <cwchar>
#include <fcntl.h>
#include <filesystem>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

namespace fs = std::filesystem;

static std::string a(size_t count)
{
    return std::string(count, 'a');
}

// ---- Standard descriptors ----------------------------------------------------------------------

static std::string openedAt(int fd)
{
    std::error_code gone;
    return fs::read_symlink("/proc/self/fd/" + std::to_string(fd), gone);
}

static int nextDescriptor()
{
    const int fd = open("/dev/zero", O_RDONLY | O_CLOEXEC);
    close(fd);
    return fd;
}

// The exit status tells how it went: the expectations have no output to write to.
static int statusWithout(const std::vector<int>& closed, const std::function<bool()>& check)
{
    return statusOf([&] {
        const int free = nextDescriptor();
        for (const int fd : closed)
            close(fd);
        openStandardDescriptors();
        for (const int fd : closed) {
            if (openedAt(fd) != "/dev/null" || fcntl(fd, F_GETFD) != 0 ||
                (fcntl(fd, F_GETFL) & O_ACCMODE) != O_RDWR)
                _exit(2);
        }
        if (nextDescriptor() != free)
            _exit(3);
        _exit(check() ? 0 : 4);
    });
}

TEST(openStandardDescriptors, DecisionClosedOnesBecomeEmptyOnesThatThePlatformInherits)
{
    const auto nothing = [] { return true; };
    EXPECT_EQ(statusWithout({0, 1, 2}, nothing), 0);
    EXPECT_EQ(statusWithout({0}, nothing), 0);
    EXPECT_EQ(statusWithout({1}, nothing), 0);
    EXPECT_EQ(statusWithout({2}, nothing), 0);
    EXPECT_EQ(statusWithout({0, 2}, nothing), 0);
}

TEST(openStandardDescriptors, LeavesTheOpenOnesAlone)
{
    const std::string input = openedAt(0);
    const std::string error = openedAt(2);
    EXPECT_EQ(statusWithout({}, [&] { return openedAt(0) == input && openedAt(2) == error; }), 0);
    EXPECT_EQ(statusWithout({1}, [&] { return openedAt(0) == input && openedAt(2) == error; }), 0);
}

// ---- Who and where we are ----------------------------------------------------------------------

TEST(userIsAdmin, AsksForTheRealUser)
{
    EXPECT_TRUE(holdsAsOrdinaryUser([] { EXPECT_FALSE(userIsAdmin(nullptr)); }));
    if (getuid() != 0)
        GTEST_SKIP() << "only root can be another real user";
    EXPECT_TRUE(userIsAdmin(nullptr));
    EXPECT_TRUE(userIsAdmin(L"nobody"));
    EXPECT_TRUE(holdsInChild([] {
        ASSERT_EQ(setresuid(0, 65534, 0), 0);
        EXPECT_TRUE(userIsAdmin(nullptr));
    }));
    EXPECT_TRUE(holdsInChild([] {
        ASSERT_EQ(setresuid(65534, 0, 0), 0);
        EXPECT_FALSE(userIsAdmin(nullptr));
    }));
}

TEST(readsymln, GivesTheTargetAsItStands)
{
    TempDir dir;
    ASSERT_EQ(::symlink("../no where/\xff", dir.path("link").c_str()), 0);
    std::string out = "before";
    readsymln(out, dir.path("link").c_str());
    EXPECT_EQ(out, "../no where/\xff");
}

TEST(readsymln, TakesATargetOf4095Bytes)
{
    TempDir dir;
    ASSERT_EQ(::symlink(a(4095).c_str(), dir.path("link").c_str()), 0);
    std::string out;
    readsymln(out, dir.path("link").c_str());
    EXPECT_EQ(out, a(4095));
}

// Makes a directory whose path has `length` bytes, and makes it the working directory.
static void goDown(const TempDir& dir, size_t length)
{
    ASSERT_EQ(chdir(dir.dir.c_str()), 0);
    size_t left = length - dir.dir.size();
    while (left > 0) {
        // A "/" and a name of 1 to 199 bytes; what is left is never a lonely "/".
        const size_t name = left > 201 ? 199 : left > 200 ? 100 : left - 1;
        ASSERT_EQ(mkdir(a(name).c_str(), 0700), 0);
        ASSERT_EQ(chdir(a(name).c_str()), 0);
        left -= name + 1;
    }
}

TEST(readsymln, EndsTheProcessForATargetOf4096Bytes)
{
    {
        TempDir dir;
        EXPECT_TRUE(holdsInChild([&] {
            goDown(dir, 4095);
            std::string out;
            readsymln(out, "/proc/self/cwd");
            EXPECT_EQ(out.size(), 4095u);
        }));
    }
    TempDir dir;
    EXPECT_TRUE(endsWith(
        [&] {
            goDown(dir, 4096);
            std::string out;
            readsymln(out, "/proc/self/cwd");
        },
        "QVMRL0184E: Getting command path failed! errno = 36", ENAMETOOLONG));
}

TEST(readsymln, EndsTheProcessWhenTheLinkCannotBeRead)
{
    TempDir dir;
    dir.write("file", "");
    std::string out;
    EXPECT_TRUE(endsWith([&] { readsymln(out, dir.path("missing").c_str()); },
                         "QVMRL0184E: Getting command path failed! errno = 2", ENOENT));
    EXPECT_TRUE(endsWith([&] { readsymln(out, dir.path("file").c_str()); },
                         "QVMRL0184E: Getting command path failed! errno = 22", EINVAL));
}

static std::wstring ownPath()
{
    char* path = realpath(program_invocation_name, nullptr);
    const std::string bytes = path == nullptr ? "" : path;
    free(path);
    return std::wstring(bytes.begin(), bytes.end());
}

TEST(getLauncherPath, IsTheAbsolutePathOfTheExecutable)
{
    std::wstring out = L"before";
    getLauncherPath(out, nullptr);
    EXPECT_EQ(out, ownPath());
    EXPECT_EQ(out.substr(out.size() - 19), L"/velmora_unit_tests");
}

TEST(findCommand, IsTheDirectoryOfTheExecutableWithoutASlashAtItsEnd)
{
    wchar_t* dir = nullptr;
    findCommand(dir, nullptr);
    EXPECT_EQ(std::wstring(dir) + L"/velmora_unit_tests", ownPath());
    free(dir);
}

// ---- Small answers -----------------------------------------------------------------------------

TEST(getTick, IsTheTimeInWholeSeconds)
{
    const time_t before = time(nullptr);
    const int tick = getTick();
    EXPECT_LE(before, tick + 1);
    EXPECT_GE(time(nullptr) + 1, tick);
}

static double secondsOf(const std::function<void()>& action)
{
    struct timespec before = {};
    struct timespec after = {};
    clock_gettime(CLOCK_MONOTONIC, &before);
    action();
    clock_gettime(CLOCK_MONOTONIC, &after);
    return static_cast<double>(after.tv_sec - before.tv_sec) +
           static_cast<double>(after.tv_nsec - before.tv_nsec) / 1e9;
}

TEST(sysSleep, SleepsForSoManySeconds)
{
    EXPECT_LT(secondsOf([] { sysSleep(0); }), 0.9);
    const double slept = secondsOf([] { sysSleep(1); });
    EXPECT_GE(slept, 0.99);
    EXPECT_LT(slept, 1.9);
}

TEST(getOS, IsLinux)
{
    EXPECT_STREQ(getOS(), L"linux");
}

TEST(convert_from_relative_location, ChangesNothing)
{
    std::wstring out = L"before";
    convert_from_relative_location(L"../a\\b//c/.", out);
    EXPECT_EQ(out, L"../a\\b//c/.");
    convert_from_relative_location(L"", out);
    EXPECT_EQ(out, L"");
}

TEST(setCurrentWorkingDir, GoesToTheRcpDirectory)
{
    TempDir dir;
    dir.makeDir("app/rcp");
    EXPECT_TRUE(holdsInChild([&] {
        setCurrentWorkingDir(dir.wide("app"));
        EXPECT_EQ(fs::current_path(), fs::path(dir.path("app/rcp")));
    }));
    EXPECT_TRUE(holdsInChild([&] {
        setCurrentWorkingDir(dir.wdir + L"\\app");
        EXPECT_EQ(fs::current_path(), fs::path(dir.path("app/rcp")));
    }));
}

TEST(setCurrentWorkingDir, EndsTheProcessWhenItCannot)
{
    TempDir dir;
    EXPECT_TRUE(endsWith([&] { setCurrentWorkingDir(dir.wdir + L"\\app"); },
                         "QVMRL0124E: Could not set working directory to " + dir.path("app/rcp") +
                             ": No such file or directory"));
    dir.write("rcp", "");
    EXPECT_TRUE(endsWith([&] { setCurrentWorkingDir(dir.wdir); },
                         "QVMRL0124E: Could not set working directory to " + dir.path("rcp") +
                             ": Not a directory"));
}

// ---- The search for the platform ---------------------------------------------------------------

static void appear(const std::string& name)
{
    execl("/bin/sleep", name.c_str(), "600", nullptr);
    _exit(127);
}

// A process that shows `name` as the path of its executable. It ends with its world.
static int start(const std::string& name)
{
    int ready[2];
    if (pipe2(ready, O_CLOEXEC) != 0)
        return -1;
    const pid_t child = fork();
    if (child == 0)
        appear(name);
    close(ready[1]);
    char nothing = 0;
    while (read(ready[0], &nothing, 1) < 0 && errno == EINTR) {
    }
    close(ready[0]);
    return child;
}

static int found(const std::string& name)
{
    const int child = start(name);
    const int answer = findRCP();
    kill(child, SIGKILL);
    waitpid(child, nullptr, 0);
    return answer == child ? 1 : answer;
}

TEST(findRCP, FindsAnExecutableCalledEclipse)
{
    NEEDS_PRIVATE_PROC();
    EXPECT_TRUE(holdsInPrivateProc([] {
        EXPECT_EQ(found("/opt/app/rcp/eclipse/eclipse"), 1);
        EXPECT_EQ(found("a/eclipse"), 1);
    }));
}

TEST(findRCP, ReadsTheFirst1023Bytes)
{
    NEEDS_PRIVATE_PROC();
    EXPECT_TRUE(holdsInPrivateProc([] { EXPECT_EQ(found(a(1015) + "/eclipse"), 1); }));
}

TEST(findRCP, TakesTheFirstInTheOrderOfTheDirectory)
{
    NEEDS_PRIVATE_PROC();
    EXPECT_TRUE(holdsInPrivateProc([] {
        const int first = start("/opt/a/eclipse");
        const int second = start("/opt/b/eclipse");
        ASSERT_LT(first, second);
        EXPECT_EQ(findRCP(), first);
    }));
}

TEST(findRCP, LooksAgainAfterASecond)
{
    NEEDS_PRIVATE_PROC();
    EXPECT_TRUE(holdsInPrivateProc([] {
        // A child that becomes the platform once the search, its parent, sleeps.
        const pid_t parent = getpid();
        const pid_t child = fork();
        if (child == 0) {
            waitUntilAsleep(parent);
            appear("/opt/app/eclipse");
        }
        int answer = 0;
        const double seconds = secondsOf([&] { answer = findRCP(); });
        EXPECT_EQ(answer, child);
        EXPECT_GE(seconds, 0.99);
        EXPECT_LT(seconds, 5.0);
    }));
}

// From now on the process may open only so many files more.
static void boundDescriptors(pid_t process, int more)
{
    const int next = dup(STDERR_FILENO);
    close(next);
    struct rlimit limit = {};
    getrlimit(RLIMIT_NOFILE, &limit);
    limit.rlim_cur = more < 0 ? limit.rlim_max : static_cast<rlim_t>(next + more);
    EXPECT_EQ(prlimit(process, RLIMIT_NOFILE, &limit, nullptr), 0);
}

TEST(findRCP, WhatCannotBeOpenedIsPassedOver)
{
    NEEDS_PRIVATE_PROC();
    EXPECT_TRUE(holdsInPrivateProc([] {
        const int platform = start("/opt/app/eclipse");
        ASSERT_GT(platform, 0);
        // The first time not even /proc can be opened, the second time nothing in it.
        const pid_t search = getpid();
        const pid_t helper = fork();
        if (helper == 0) {
            waitUntilAsleep(search);
            boundDescriptors(search, 1);
            waitUntilAsleepAgain(search);
            boundDescriptors(search, -1);
            _exit(0);
        }
        boundDescriptors(search, 0);
        int answer = 0;
        const double seconds = secondsOf([&] { answer = findRCP(); });
        EXPECT_EQ(answer, platform);
        EXPECT_GE(seconds, 1.99);
        EXPECT_LT(seconds, 6.0);
        EXPECT_EQ(waitpid(helper, nullptr, 0), helper);
    }));
}

// All of them at once: each search that finds nothing takes ten seconds.
TEST(findRCP, PassesOverWhatIsNotThePlatformTenTimes)
{
    NEEDS_PRIVATE_PROC();
    EXPECT_EQ(MAX_RETRIES, 10);
    EXPECT_TRUE(holdsInPrivateProc([] {
        for (const std::string& name :
             {std::string("/eclipse"), std::string("eclipse"), std::string("/opt/myeclipse"),
              std::string("/opt/eclipse2"), std::string("/opt/Eclipse"),
              std::string("/opt/eclipse/"), std::string("/opt/eclipse x"), std::string(),
              a(1016) + "/eclipse"})
            ASSERT_GT(start(name), 0);
        const pid_t argument = fork();
        if (argument == 0) {
            execl("/bin/sh", "sh", "-c", "sleep 600; :", "/opt/app/eclipse", nullptr);
            _exit(127);
        }
        int answer = -1;
        const double seconds = secondsOf([&] { answer = findRCP(); });
        EXPECT_EQ(answer, 0);
        EXPECT_GE(seconds, 9.9);
        EXPECT_LT(seconds, 14.0);
    }));
}
