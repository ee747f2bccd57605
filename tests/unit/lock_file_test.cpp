#include "platform/linux/lock_file.h"

#include "diag/SvcDebug_linux.h"
#include "tests/unit/separate_process.h"
#include "tests/unit/support.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <fcntl.h>
#include <filesystem>
#include <fstream>
#include <functional>
#include <memory>
#include <regex>
#include <sys/file.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/time.h>
#include <unistd.h>

static const wchar_t* const NAME = L"fake-platform";

// A process that ps shows under `name`, until it is killed or its seconds are over.
struct Platform {
    explicit Platform(const std::string& name = "fake-platform", int seconds = 600,
                      bool ownSession = false)
    {
        int executed[2] = {-1, -1};
        if (pipe2(executed, O_CLOEXEC) != 0)
            abort();
        const std::string time = std::to_string(seconds);
        pid = fork();
        if (pid == 0) {
            prctl(PR_SET_PDEATHSIG, SIGKILL);
            if (ownSession)
                setsid();
            execl("/bin/sleep", name.c_str(), time.c_str(), nullptr);
            _exit(127);
        }
        close(executed[1]);
        // The end of the pipe: the child has become the program.
        char nothing = 0;
        while (read(executed[0], &nothing, 1) < 0) {
        }
        close(executed[0]);
    }
    ~Platform()
    {
        end();
    }
    Platform(const Platform&) = delete;
    Platform& operator=(const Platform&) = delete;

    void end()
    {
        if (pid <= 0)
            return;
        kill(pid, SIGKILL);
        statusOf(pid);
        pid = 0;
    }

    std::string number() const
    {
        return std::to_string(pid);
    }

    pid_t pid = 0;
};

// A number that no process has any more.
static std::string deadNumber()
{
    const pid_t child = startProcess([] {});
    statusOf(child);
    return std::to_string(child);
}

static void locate(const std::wstring& workspace, std::vector<std::wstring> options = {},
                   const std::wstring& exeName = NAME)
{
    options.insert(options.begin(), L"velmora");
    ArgumentVector argv;
    for (std::wstring& option : options)
        argv.push_back(&option[0]);
    locateLockFile(static_cast<int>(argv.size()), argv.data(), workspace, exeName);
}

static std::vector<std::wstring> restartOf(const std::string& number)
{
    return {L"-restart", L"-rcp_old_pid", std::wstring(number.begin(), number.end())};
}

static const int MAIN = 70;
static const int DAEMON = 71;

// The role of a launcher that finds `content` in the lock file.
static int roleWith(const std::string& content, const std::wstring& exeName = NAME)
{
    TempDir dir;
    dir.write(".rcp.lock", content);
    return statusOf([&] {
        locate(dir.wdir, {}, exeName);
        _exit(isMainProcess() ? MAIN : DAEMON);
    });
}

static bool finds(const Platform& platform, const std::wstring& exeName)
{
    return roleWith(platform.number(), exeName) == DAEMON;
}

// The log, the times in it being TIME.
static std::string timeless(const std::string& log)
{
    return std::regex_replace(log, std::regex("@ [0-9]{8}_[0-9]{6}_[0-9]{3}\n"), "@ TIME\n");
}

static int descriptorOf(const std::string& path)
{
    for (int fd = 3; fd < 100; ++fd) {
        std::error_code none;
        if (std::filesystem::read_symlink("/proc/self/fd/" + std::to_string(fd), none) == path)
            return fd;
    }
    return -1;
}

// What is written to the lock file from now on meets a full disk.
static void fillDiskOf(const TempDir& dir)
{
    const int full = open("/dev/full", O_RDWR | O_CLOEXEC);
    ASSERT_GE(full, 0);
    ASSERT_GE(dup2(full, descriptorOf(dir.path(".rcp.lock"))), 0);
    close(full);
}

static bool waitsForALock(pid_t process)
{
    std::ifstream locks("/proc/locks");
    const std::regex waiting(".*->.* FLOCK .* " + std::to_string(process) + " .*");
    for (std::string line; std::getline(locks, line);) {
        if (std::regex_match(line, waiting))
            return true;
    }
    return false;
}

static bool waitUntilItWaitsForALock(pid_t process)
{
    for (int i = 0; i < 30000; ++i) {
        if (waitsForALock(process))
            return true;
        usleep(1000);
    }
    return false;
}

static double secondsSince(std::chrono::steady_clock::time_point start)
{
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
}

static const char* const LOOK =
    "QVMRL0090E: Existing platform lock file found - checking validity.\n";
static const char* const NO_DATA = "QVMRL0091E: No data in the platform lock file.\n";
static const char* const CAPTURED = "QVMRL0303I: lock file captured @ TIME\n";
static const char* const WE_ARE_MAIN = "QVMRL0304I: We are main process\n";
static const char* const WE_ARE_DAEMON = "QVMRL0305I: We are daemon process\n";

// The lines of `action` alone, without those that are held from before. The log's directory is gone
// afterwards, also in a child that ends by _exit.
static std::string linesOf(bool tracing, const std::function<void()>& action)
{
    const TempDir dir;
    setDebug(false);
    enableLogging(dir.wdir);
    const size_t held = dir.read("velmora.log").size();
    setDebug(tracing);
    action();
    setDebug(false);
    return dir.read("velmora.log").substr(held);
}

TEST(locateLockFile, FirstStartMakesTheFileAndIsMain)
{
    TempDir dir;
    EXPECT_EQ(timeless(linesOf(false, [&] { locate(dir.wdir); })),
              std::string(CAPTURED) + LOOK + NO_DATA + WE_ARE_MAIN);
    EXPECT_TRUE(isMainProcess());
    EXPECT_EQ(dir.read(".rcp.lock"), "");
}

TEST(locateLockFile, LivePlatformMakesADaemon)
{
    TempDir dir;
    const Platform platform;
    dir.write(".rcp.lock", platform.number() + "          ");
    EXPECT_EQ(timeless(linesOf(false, [&] { locate(dir.wdir); })),
              std::string(CAPTURED) + LOOK + WE_ARE_DAEMON);
    EXPECT_FALSE(isMainProcess());
    EXPECT_EQ(getPlatformPid(), platform.pid);
}

TEST(locateLockFile, DecisionForcesTracingAndRestoresIt)
{
    TempDir dir;
    const std::string log = linesOf(false, [&] {
        locate(dir.wdir);
        SvcDebugOutA("traced");
    });
    EXPECT_EQ(log.find("traced"), std::string::npos);
    EXPECT_NE(log.find(WE_ARE_MAIN), std::string::npos);
    TempDir bad;
    bad.write(".rcp.lock", "x");
    EXPECT_FATAL(locate(bad.wdir), LOOK);
}

TEST(locateLockFile, FixesThePaths)
{
    TempDir dir;
    std::wstring path = L"before";
    getLockFilePath(path);
    EXPECT_EQ(path, L"");
    dir.makeDir("a/b");
    locate(dir.wdir + L"\\a\\b");
    getLockFilePath(path);
    EXPECT_EQ(path, dir.wdir + L"/a/b/.rcp.lock");
    getPipeFilePath(path);
    EXPECT_EQ(path, dir.wdir + L"/a/b/.pipe");
    getMainPidFilePath(path);
    EXPECT_EQ(path, dir.wdir + L"/a/b/.rcp.main");
    EXPECT_TRUE(dir.has("a/b/.rcp.lock"));
    EXPECT_FALSE(dir.has("a/b/.rcp.main"));
}

TEST(createAndOpenLockFile, IsForItsOwnerAlone)
{
    TempDir dir;
    umask(0);
    locate(dir.wdir);
    struct stat entry = {};
    ASSERT_EQ(stat(dir.path(".rcp.lock").c_str(), &entry), 0);
    EXPECT_EQ(entry.st_mode & 07777u, 0600u);
}

TEST(createAndOpenLockFile, LeavesWhatTheFileHolds)
{
    TempDir dir;
    const std::string content = deadNumber() + "          ";
    dir.write(".rcp.lock", content);
    locate(dir.wdir);
    EXPECT_EQ(dir.read(".rcp.lock"), content);
}

TEST(createAndOpenLockFile, PlatformInheritsTheLockFileAndNoOther)
{
    TempDir dir;
    dir.write(".pipe", "name\n");
    locate(dir.wdir);
    const int fd = descriptorOf(dir.path(".rcp.lock"));
    ASSERT_GE(fd, 3);
    EXPECT_EQ(fcntl(fd, F_GETFD) & FD_CLOEXEC, 0);
    std::wstring name;
    getPipeName(name);
    populateMainPidFile(1);
    EXPECT_EQ(descriptorOf(dir.path(".pipe")), -1);
    EXPECT_EQ(descriptorOf(dir.path(".rcp.main")), -1);
}

TEST(createAndOpenLockFile, EndsWhereThereIsNoWorkspace)
{
    TempDir dir;
    EXPECT_FATAL(locate(dir.wdir + L"/no"),
                 "QVMRL0199E: CreateLockFile failed. errno=2\n"
                 "QVMRL0054E: Error locating platform lock file : No such file or directory\n");
    EXPECT_TRUE(endsWith([&] { locate(dir.wdir + L"/no"); },
                         "QVMRL0054E: Error locating platform lock file", ENOENT));
}

TEST(createAndOpenLockFile, EndsWhereADirectoryStands)
{
    TempDir dir;
    dir.makeDir(".rcp.lock");
    EXPECT_FATAL(locate(dir.wdir),
                 "QVMRL0199E: CreateLockFile failed. errno=21\n"
                 "QVMRL0054E: Error locating platform lock file : Is a directory\n");
}

TEST(isMainProcessRunning, EmptyAndBlankFilesHoldNoPlatform)
{
    EXPECT_EQ(roleWith(""), MAIN);
    EXPECT_EQ(roleWith("              "), MAIN);
    EXPECT_EQ(roleWith(" \n\t \n"), MAIN);
}

TEST(isMainProcessRunning, DeadProcessIsNoPlatform)
{
    EXPECT_EQ(roleWith(deadNumber() + "          "), MAIN);
}

TEST(isMainProcessRunning, NumberThatNoProcessCanHaveIsADeadOne)
{
    EXPECT_EQ(roleWith("2147483647"), MAIN);
    EXPECT_EQ(roleWith("2147483648"), MAIN);
    EXPECT_EQ(roleWith("4294967297"), MAIN);
    EXPECT_EQ(roleWith("99999999999999999999"), MAIN);
    EXPECT_EQ(roleWith("-99999999999999999999"), MAIN);
}

TEST(isMainProcessRunning, AnotherProgramIsNoPlatform)
{
    const Platform other("other-program");
    EXPECT_EQ(roleWith(other.number()), MAIN);
    EXPECT_TRUE(finds(other, L"other-program"));
}

TEST(isMainProcessRunning, NumberAtTheStartCounts)
{
    const Platform platform;
    EXPECT_EQ(roleWith(platform.number()), DAEMON);
    EXPECT_EQ(roleWith("  \n" + platform.number() + "\n"), DAEMON);
    EXPECT_EQ(roleWith(platform.number() + "abc"), DAEMON);
    EXPECT_EQ(roleWith("+" + platform.number()), DAEMON);
}

TEST(isMainProcessRunning, EndsWithoutANumberAtTheStart)
{
    TempDir dir;
    for (const char* content : {"x", "x123", "  .5", "#1"}) {
        dir.write(".rcp.lock", content);
        EXPECT_FATAL(locate(dir.wdir), "\nQVMRL0092E: Error reading platform lock file. : ");
    }
}

TEST(isMainProcessRunning, DecisionWhatCannotBeReadIsNoEmptyFile)
{
    TempDir dir;
    const Platform platform;
    dir.write(".rcp.lock", platform.number());
    const auto action = [&] {
        ASSERT_TRUE(makeFail(SYS_pread64, EIO));
        locate(dir.wdir);
    };
    EXPECT_TRUE(endsWith(action, "QVMRL0092E: Error reading platform lock file.", EIO));
}

TEST(isMainProcessRunning, DecisionAFifoIsNothingToReadANumberFromAndNobodyWaits)
{
    TempDir dir;
    ASSERT_EQ(mkfifo(dir.path(".rcp.lock").c_str(), 0600), 0);
    EXPECT_TRUE(endsWith([&] { locate(dir.wdir); }, "QVMRL0092E: Error reading platform lock file.",
                         ESPIPE));
}

TEST(isMainProcessRunning, ZeroBytesAreNoNumber)
{
    TempDir dir;
    dir.write(".rcp.lock", std::string(12, '\0'));
    EXPECT_FATAL(locate(dir.wdir), "\nQVMRL0092E: Error reading platform lock file. : ");
    dir.write(".rcp.lock", std::string("  \0 1", 5));
    EXPECT_FATAL(locate(dir.wdir), "\nQVMRL0092E: Error reading platform lock file. : ");
}

TEST(isMainProcessRunning, SignsWithoutDigitsAreNoNumber)
{
    TempDir dir;
    for (const char* content : {"-", "+", "- 5", "+-5"}) {
        dir.write(".rcp.lock", content);
        EXPECT_FATAL(locate(dir.wdir), "\nQVMRL0092E: Error reading platform lock file. : ");
    }
}

TEST(isMainProcessRunning, NumberBehindAnyNumberOfBlanksCounts)
{
    const Platform platform;
    // Around the size of what is read at once.
    for (const size_t blanks : {4090, 4094, 4095, 4096, 8190, 20000}) {
        EXPECT_EQ(roleWith(std::string(blanks, ' ') + platform.number()), DAEMON) << blanks;
        EXPECT_EQ(roleWith(std::string(blanks, '\n')), MAIN) << blanks;
    }
}

TEST(isMainProcessRunning, NumberOfAnyLengthCounts)
{
    const Platform platform;
    const std::string number = platform.number();
    for (const size_t zeros : {4090, 4095, 4096, 4097, 20000}) {
        EXPECT_EQ(roleWith(std::string(zeros, '0') + number), DAEMON) << zeros;
        EXPECT_EQ(roleWith(std::string(zeros, '0') + number + "          "), DAEMON) << zeros;
        EXPECT_EQ(roleWith(std::string(zeros, '9') + number), MAIN) << zeros;
    }
    EXPECT_EQ(roleWith(std::string(4095, ' ') + "+" + number), DAEMON);
}

TEST(isMainProcessRunning, FindsThePlatformWithoutAnotherDescriptor)
{
    TempDir dir;
    const Platform platform;
    dir.write(".rcp.lock", platform.number());
    EXPECT_TRUE(holdsInChild([&] {
        locate(dir.wdir);
        const struct rlimit few = {64, 64};
        ASSERT_EQ(setrlimit(RLIMIT_NOFILE, &few), 0);
        while (open("/dev/null", O_RDONLY | O_CLOEXEC) >= 0) {
        }
        EXPECT_EQ(errno, EMFILE);
        EXPECT_TRUE(isMainProcessRunning(NAME));
    }));
}

TEST(isMainProcessRunning, DecisionWhereThereIsNoShellItIsAskedForOnceMore)
{
    TempDir dir;
    const Platform platform;
    dir.write(".rcp.lock", platform.number());
    EXPECT_TRUE(holdsInChild([&] {
        locate(dir.wdir);
        ASSERT_TRUE(makeFail(SYS_clone3, EAGAIN));
        const auto start = std::chrono::steady_clock::now();
        EXPECT_FALSE(isMainProcessRunning(NAME));
        EXPECT_GE(secondsSince(start), 0.99);
    }));
}

TEST(isMainProcessRunning, ProcessOfAnotherUserCounts)
{
    if (geteuid() != 0)
        GTEST_SKIP() << "only root can start a process of another user";
    const Platform platform;
    TempDir dir;
    dir.write(".rcp.lock", platform.number());
    giveToOrdinaryUser(dir.dir);
    EXPECT_TRUE(holdsAsOrdinaryUser([&] {
        EXPECT_NE(kill(platform.pid, 0), 0);
        locate(dir.wdir);
        EXPECT_FALSE(isMainProcess());
    }));
}

TEST(isMainProcessRunning, NothingIsLookedAtWithoutTheFile)
{
    TempDir dir;
    locate(dir.wdir);
    unlink(dir.path(".rcp.lock").c_str());
    EXPECT_EQ(linesOf(false, [] { EXPECT_FALSE(isMainProcessRunning(NAME)); }), "");
}

TEST(isMainProcessRunning, DecisionEachLookSeesTheFileAsItIsNow)
{
    TempDir dir;
    Platform first;
    const Platform second;
    dir.write(".rcp.lock", first.number() + "          ");
    locate(dir.wdir);
    EXPECT_EQ(getPlatformPid(), first.pid);
    dir.write(".rcp.lock", second.number() + "          ");
    EXPECT_TRUE(isMainProcessRunning(NAME));
    EXPECT_EQ(getPlatformPid(), second.pid);
    dir.write(".rcp.lock", "              ");
    EXPECT_FALSE(isMainProcessRunning(NAME));
    EXPECT_EQ(getPlatformPid(), second.pid);
    // Without the blanks that the launcher writes, too.
    dir.write(".rcp.lock", first.number());
    EXPECT_TRUE(isMainProcessRunning(NAME));
    dir.write(".rcp.lock", second.number());
    EXPECT_TRUE(isMainProcessRunning(NAME));
    EXPECT_EQ(getPlatformPid(), second.pid);
    first.end();
}

TEST(isMainProcessRunning, PartOfTheNameFindsThePlatform)
{
    const Platform platform("/opt/x/fake-platform");
    EXPECT_TRUE(finds(platform, L"fake-platform"));
    EXPECT_TRUE(finds(platform, L"x/fake"));
    EXPECT_FALSE(finds(platform, L"Fake-platform"));
    // The name is a pattern for grep.
    EXPECT_TRUE(finds(platform, L"f.ke.*form"));
    EXPECT_FALSE(finds(platform, L""));
}

// Room for a name between "ps h <pid> | grep " and " 2>&1 1>/dev/null": 99 - 5 - 8 - 17 characters
// less those of the number.
static size_t roomFor(const Platform& platform)
{
    return 69 - platform.number().size();
}

// A platform whose name has so many characters less than there is room for, all of them "a".
static std::unique_ptr<Platform> platformWithName(size_t less)
{
    for (size_t room = 64;;) {
        auto platform = std::make_unique<Platform>(std::string(room - less, 'a'));
        if (roomFor(*platform) == room)
            return platform;
        room = roomFor(*platform);
    }
}

TEST(isMainProcessRunning, DecisionNameThatFitsIsNotCut)
{
    unsetenv("COLUMNS");
    const std::unique_ptr<Platform> platform = platformWithName(1);
    EXPECT_TRUE(finds(*platform, std::wstring(roomFor(*platform) - 1, L'a')));
    EXPECT_FALSE(finds(*platform, std::wstring(roomFor(*platform), L'a')));
}

TEST(isMainProcessRunning, DecisionLongerNameIsCutAndItsPartFindsThePlatform)
{
    unsetenv("COLUMNS");
    const std::unique_ptr<Platform> platform = platformWithName(0);
    EXPECT_TRUE(finds(*platform, std::wstring(roomFor(*platform) + 1, L'a')));
    EXPECT_TRUE(finds(*platform, std::wstring(4000, L'a')));
    EXPECT_FALSE(finds(*platform, L"b" + std::wstring(4000, L'a')));
}

TEST(isMainProcessRunning, DecisionOtherCharactersAreNeverACommand)
{
    TempDir dir;
    const std::string name =
        "it's;touch " + dir.path("made") + "&$(touch " + dir.path("made") + ")";
    const Platform platform("it's;touch `false` \"x\" & $(y) | z > w");
    EXPECT_TRUE(finds(platform, L"it's"));
    EXPECT_TRUE(finds(platform, L"it's;touch `false` \"x\" & "));
    EXPECT_TRUE(finds(platform, L"(y) | z > w"));
    EXPECT_FALSE(finds(platform, L"it's;touch`"));
    EXPECT_FALSE(finds(platform, std::wstring(name.begin(), name.end())));
    EXPECT_FALSE(finds(platform, L"no;true #"));
    EXPECT_FALSE(dir.has("made"));
}

TEST(isMainProcessRunning, DecisionQuotedNameIsCutBetweenItsCharacters)
{
    const Platform platform(std::string(40, '\''));
    EXPECT_TRUE(finds(platform, std::wstring(40, L'\'')));
    EXPECT_TRUE(finds(platform, std::wstring(39, L'\'')));
    EXPECT_TRUE(finds(platform, std::wstring(11, L'\'')));
}

TEST(lockLockFile, LeftoverMarkerIsADirtyShutdownAndGoes)
{
    TempDir dir;
    dir.write(".sid", "");
    EXPECT_FALSE(isDirtyShutdown());
    locate(dir.wdir);
    EXPECT_TRUE(isDirtyShutdown());
    EXPECT_FALSE(dir.has(".sid"));
}

TEST(lockLockFile, WithoutAMarkerTheShutdownWasClean)
{
    TempDir dir;
    locate(dir.wdir);
    EXPECT_TRUE(isMainProcess());
    EXPECT_FALSE(isDirtyShutdown());
}

TEST(lockLockFile, DaemonLeavesTheMarker)
{
    TempDir dir;
    const Platform platform;
    dir.write(".rcp.lock", platform.number());
    dir.write(".sid", "x");
    locate(dir.wdir);
    EXPECT_FALSE(isDirtyShutdown());
    EXPECT_EQ(dir.read(".sid"), "x");
}

TEST(lockLockFile, EndsWhenTheLockCannotBeHad)
{
    TempDir dir;
    EXPECT_TRUE(endsWith(
        [&] {
            ASSERT_TRUE(makeFail(SYS_flock, ENOLCK));
            locate(dir.wdir);
        },
        "QVMRL0053E: Error locking platform lock file. ", ENOLCK));
}

TEST(lockLockFile, SecondLauncherWaitsAndReadsWhatTheFirstHasRecorded)
{
    TempDir dir;
    const Platform platform;
    locate(dir.wdir);
    ASSERT_TRUE(isMainProcess());
    const pid_t second = startProcess([&] {
        setMainProcess(false);
        locate(dir.wdir);
        _exit(isMainProcess() ? MAIN : DAEMON);
    });
    EXPECT_TRUE(waitUntilItWaitsForALock(second));
    populateLockFile(platform.pid);
    unlockLockFile();
    EXPECT_EQ(statusOf(second), DAEMON);
}

static int interruptions[2] = {-1, -1};

static void noteInterruption(int)
{
    const char mark = '!';
    if (write(interruptions[1], &mark, 1) != 1)
        _exit(72);
}

TEST(lockLockFile, TriesAgainWhenInterrupted)
{
    TempDir dir;
    dir.write(".rcp.lock", "");
    int locked[2] = {-1, -1};
    ASSERT_EQ(pipe(locked), 0);
    ASSERT_EQ(pipe(interruptions), 0);
    const pid_t launcher = getpid();
    // Holds the lock until the launcher was interrupted.
    const pid_t holder = startProcess([&] {
        char mark = '!';
        const int fd = open(dir.path(".rcp.lock").c_str(), O_RDWR);
        ASSERT_EQ(flock(fd, LOCK_EX), 0);
        ASSERT_EQ(write(locked[1], &mark, 1), 1);
        ASSERT_TRUE(waitUntilItWaitsForALock(launcher));
        ASSERT_EQ(kill(launcher, SIGUSR1), 0);
        ASSERT_EQ(read(interruptions[0], &mark, 1), 1);
    });
    char mark = 0;
    ASSERT_EQ(read(locked[0], &mark, 1), 1);
    struct sigaction action = {};
    action.sa_handler = noteInterruption;
    ASSERT_EQ(sigaction(SIGUSR1, &action, nullptr), 0);
    locate(dir.wdir);
    EXPECT_TRUE(isMainProcess());
    EXPECT_EQ(statusOf(holder), 0);
    for (const int fd : {locked[0], locked[1], interruptions[0], interruptions[1]})
        close(fd);
}

TEST(unlockLockFile, ReleasesTheLockAndSaysSo)
{
    TempDir dir;
    locate(dir.wdir);
    const int fd = open(dir.path(".rcp.lock").c_str(), O_RDWR | O_CLOEXEC);
    ASSERT_GE(fd, 0);
    EXPECT_NE(flock(fd, LOCK_EX | LOCK_NB), 0);
    EXPECT_EQ(timeless(linesOf(false, [] { unlockLockFile(); })),
              "QVMRL0306I: lock file released @ TIME\n");
    EXPECT_EQ(flock(fd, LOCK_EX | LOCK_NB), 0);
    close(fd);
}

TEST(unlockLockFile, EndsWhenItCannot)
{
    TempDir dir;
    const auto action = [&] {
        locate(dir.wdir);
        ASSERT_TRUE(makeFail(SYS_flock, ENOLCK));
        unlockLockFile();
    };
    EXPECT_TRUE(endsWith(action, "QVMRL0070E: Error unlocking platform lock file. ", ENOLCK));
    EXPECT_FATAL(action(), "\nQVMRL0306I: lock file released @ ");
}

TEST(populateLockFile, RecordsThePlatform)
{
    TempDir dir;
    locate(dir.wdir);
    EXPECT_EQ(linesOf(true, [] { populateLockFile(1234); }), "");
    EXPECT_EQ(dir.read(".rcp.lock"), "1234          ");
    EXPECT_EQ(dir.read(".rcp.main"), "1234    ");
}

TEST(populateLockFile, TenBlanksCoverALongerNumber)
{
    TempDir dir;
    dir.write(".rcp.lock", "2147483647          ");
    locate(dir.wdir);
    populateLockFile(42);
    // 2 + 10 characters are written over the 20 that were there.
    EXPECT_EQ(dir.read(".rcp.lock"), "42                  ");
}

TEST(populateLockFile, DaemonRecordsNothing)
{
    TempDir dir;
    const Platform platform;
    dir.write(".rcp.lock", platform.number());
    locate(dir.wdir);
    populateLockFile(1);
    EXPECT_EQ(dir.read(".rcp.lock"), platform.number());
    EXPECT_FALSE(dir.has(".rcp.main"));
}

TEST(populateLockFile, WhatItWroteIsReadBack)
{
    TempDir dir;
    const Platform platform;
    locate(dir.wdir);
    populateLockFile(platform.pid);
    EXPECT_TRUE(isMainProcessRunning(NAME));
    EXPECT_EQ(getPlatformPid(), platform.pid);
}

TEST(populateLockFile, LogsAFullDisk)
{
    TempDir dir;
    locate(dir.wdir);
    fillDiskOf(dir);
    EXPECT_EQ(linesOf(false, [] { populateLockFile(1234); }),
              "QVMRL0051E: Unable to write to platform lock file\n");
    EXPECT_EQ(dir.read(".rcp.main"), "1234    ");
}

TEST(populateLockFile, WritesNothingLaterThatMetAFullDisk)
{
    TempDir dir;
    locate(dir.wdir);
    const int lockFile = descriptorOf(dir.path(".rcp.lock"));
    const int kept = dup(lockFile);
    fillDiskOf(dir);
    populateLockFile(1234);
    ASSERT_GE(dup2(kept, lockFile), 0);
    close(kept);
    fflush(nullptr);
    EXPECT_EQ(dir.read(".rcp.lock"), "");
}

TEST(populateMainPidFile, WritesTheNumberAnew)
{
    TempDir dir;
    locate(dir.wdir);
    dir.write(".rcp.main", "1234567890    ");
    populateMainPidFile(7);
    EXPECT_EQ(dir.read(".rcp.main"), "7    ");
    populateMainPidFile(4294967295UL);
    EXPECT_EQ(dir.read(".rcp.main"), "4294967295    ");
}

TEST(populateMainPidFile, DeliberatelySaysXXWhenItCannotBeOpened)
{
    TempDir dir;
    locate(dir.wdir);
    dir.makeDir(".rcp.main");
    EXPECT_EQ(linesOf(false, [] { populateLockFile(1234); }),
              "QVMRL00XXI: Unable to open rcp.main file\n");
    EXPECT_EQ(dir.read(".rcp.lock"), "1234          ");
}

TEST(populateMainPidFile, DeliberatelySaysXXWhenItCannotBeWritten)
{
    TempDir dir;
    locate(dir.wdir);
    ASSERT_EQ(symlink("/dev/full", dir.path(".rcp.main").c_str()), 0);
    EXPECT_EQ(linesOf(false, [] { populateLockFile(1234); }),
              "QVMRL00XXI: Unable to write pid to rcp.main file\n");
    EXPECT_EQ(dir.read(".rcp.lock"), "1234          ");
}

TEST(invalidateLockFile, WritesFourteenBlanks)
{
    TempDir dir;
    locate(dir.wdir);
    populateLockFile(42);
    EXPECT_EQ(dir.read(".rcp.lock"), "42          ");
    EXPECT_EQ(linesOf(true, [] { invalidateLockFile(); }), "");
    EXPECT_EQ(dir.read(".rcp.lock"), "              ");
    EXPECT_FALSE(isMainProcessRunning(NAME));
}

TEST(invalidateLockFile, LogsAFullDisk)
{
    TempDir dir;
    locate(dir.wdir);
    fillDiskOf(dir);
    EXPECT_EQ(linesOf(false, [] { invalidateLockFile(); }),
              "QVMRL0052E: Unable to invalidate platform lock file\n");
}

TEST(restartWait, WithoutARestartNobodyWaits)
{
    TempDir dir;
    const Platform platform;
    dir.write(".rcp.lock", platform.number());
    const std::wstring number = restartOf(platform.number())[2];
    EXPECT_EQ(timeless(linesOf(false,
                               [&] {
                                   locate(dir.wdir, {L"-rcp_old_pid", number});
                               })),
              std::string(CAPTURED) + LOOK + WE_ARE_DAEMON);
}

TEST(restartWait, OneSecondAtLeast)
{
    TempDir dir;
    const auto start = std::chrono::steady_clock::now();
    EXPECT_EQ(timeless(linesOf(false, [&] { locate(dir.wdir, restartOf("1")); })),
              std::string(LOOK) + NO_DATA + CAPTURED + LOOK + NO_DATA + WE_ARE_MAIN);
    EXPECT_GE(secondsSince(start), 0.99);
}

TEST(restartWait, AnotherPlatformEndsIt)
{
    TempDir dir;
    const Platform platform;
    dir.write(".rcp.lock", platform.number());
    EXPECT_EQ(timeless(linesOf(false, [&] { locate(dir.wdir, restartOf(deadNumber())); })),
              std::string(LOOK) + CAPTURED + LOOK + WE_ARE_DAEMON);
}

TEST(restartWait, DecisionWithoutAReadableOldNumberALivePlatformEndsIt)
{
    const Platform platform;
    const std::vector<std::vector<std::wstring>> options = {{L"-restart"},
                                                            {L"-restart", L"-rcp_old_pid"},
                                                            {L"-rcp_old_pid", L"-restart"},
                                                            restartOf("x")};
    for (const std::vector<std::wstring>& words : options) {
        TempDir dir;
        dir.write(".rcp.lock", platform.number());
        EXPECT_TRUE(holdsInChild([&] {
            EXPECT_EQ(timeless(linesOf(false, [&] { locate(dir.wdir, words); })),
                      std::string(LOOK) + CAPTURED + LOOK + WE_ARE_DAEMON);
        }));
    }
}

// Restarts while the old platform lives; the log, and how long it took.
static std::string restartLog(const Platform& old, double& seconds, std::string& lockFile)
{
    TempDir dir;
    dir.write(".rcp.lock", old.number() + "          ");
    const auto start = std::chrono::steady_clock::now();
    const std::string log = linesOf(false, [&] { locate(dir.wdir, restartOf(old.number())); });
    seconds = secondsSince(start);
    lockFile = dir.read(".rcp.lock");
    return timeless(log);
}

static std::string times(int count, const std::string& line)
{
    std::string lines;
    for (int i = 0; i < count; ++i)
        lines += line;
    return lines;
}

TEST(restartWait, OldPlatformHasTwentySeconds)
{
    const Platform endless;
    const Platform ends("fake-platform", 17);
    // One launcher waits for each of them, at the same time.
    const pid_t patient = startProcess([&] {
        double seconds = 0;
        std::string lockFile;
        const std::string log = restartLog(ends, seconds, lockFile);
        EXPECT_TRUE(isMainProcess());
        EXPECT_GE(seconds, 16.5);
        EXPECT_EQ(log.find("QVMRL0013E"), std::string::npos) << log;
        EXPECT_EQ(lockFile, ends.number() + "          ");
    });
    double seconds = 0;
    std::string lockFile;
    const std::string log = restartLog(endless, seconds, lockFile);
    // The looks after 1 to 19 seconds find it; after the twentieth the file is invalidated.
    EXPECT_EQ(log, times(19, LOOK) +
                       "QVMRL0013E: Existing platform has not shutdown within allotted time. "
                       "Invalidating the lockfile for new launch.\n" +
                       LOOK + NO_DATA + CAPTURED + LOOK + NO_DATA + WE_ARE_MAIN);
    EXPECT_TRUE(isMainProcess());
    EXPECT_GE(seconds, 19.9);
    EXPECT_LT(seconds, 60);
    EXPECT_EQ(lockFile, std::string(std::max<size_t>(14, endless.number().size() + 10), ' '));
    EXPECT_EQ(statusOf(patient), 0);
}

TEST(getPipeName, FirstLineThatIsNotBlank)
{
    TempDir dir;
    dir.write(".pipe", "\n  \n\t the name  \nsecond\n");
    locate(dir.wdir);
    std::wstring name;
    EXPECT_TRUE(getPipeName(name));
    EXPECT_EQ(name, L"the name  ");
}

TEST(getPipeName, IsReadOnce)
{
    TempDir dir;
    dir.write(".pipe", "first");
    locate(dir.wdir);
    std::wstring name;
    EXPECT_TRUE(getPipeName(name));
    dir.write(".pipe", "second");
    EXPECT_TRUE(getPipeName(name));
    EXPECT_EQ(name, L"first");
    unlink(dir.path(".pipe").c_str());
    name = L"before";
    EXPECT_TRUE(getPipeName(name));
    EXPECT_EQ(name, L"first");
}

TEST(getPipeName, ThereIsNoneWithoutTheFile)
{
    TempDir dir;
    locate(dir.wdir);
    std::wstring name;
    EXPECT_FALSE(getPipeName(name));
    dir.write(".pipe", "late");
    EXPECT_TRUE(getPipeName(name));
    EXPECT_EQ(name, L"late");
}

TEST(getPipeName, ThereIsNoneWhenTheFileCannotBeOpened)
{
    TempDir dir;
    // It is there, but opening it waits for somebody who writes, until a signal comes.
    ASSERT_EQ(mkfifo(dir.path(".pipe").c_str(), 0600), 0);
    locate(dir.wdir);
    struct sigaction action = {};
    action.sa_handler = [](int) {};
    ASSERT_EQ(sigaction(SIGALRM, &action, nullptr), 0);
    const struct itimerval often = {{0, 50000}, {0, 50000}};
    ASSERT_EQ(setitimer(ITIMER_REAL, &often, nullptr), 0);
    std::wstring name = L"before";
    EXPECT_FALSE(getPipeName(name));
    EXPECT_EQ(name, L"before");
}

TEST(getPipeName, EmptyFileGivesAnEmptyName)
{
    TempDir dir;
    dir.write(".pipe", "\n\n");
    locate(dir.wdir);
    std::wstring name = L"before";
    EXPECT_TRUE(getPipeName(name));
    EXPECT_EQ(name, L"");
}

TEST(getPipeName, At2024BytesTheNameIsCut)
{
    for (const size_t length : {2024u, 2025u}) {
        TempDir dir;
        dir.write(".pipe", "  " + std::string(length, 'x') + "\n");
        EXPECT_TRUE(holdsInChild([&] {
            locate(dir.wdir);
            std::wstring name;
            EXPECT_TRUE(getPipeName(name));
            EXPECT_EQ(name, std::wstring(2024, L'x'));
        }));
    }
}

TEST(roles, AreUndecidedAtFirst)
{
    EXPECT_FALSE(isMainProcess());
    EXPECT_FALSE(isDirtyShutdown());
    EXPECT_EQ(getPlatformPid(), 0);
    setMainProcess(true);
    EXPECT_TRUE(isMainProcess());
    setMainProcess(false);
    EXPECT_FALSE(isMainProcess());
}

TEST(roles, WaitModeIsSetForGood)
{
    EXPECT_FALSE(isWaitMode());
    setWaitMode();
    EXPECT_TRUE(isWaitMode());
}

TEST(roles, FixedAnswers)
{
    EXPECT_FALSE(isPipeDaemonCommand());
    getCmdString();
}

// What the process writes to standard output and standard error during `action`.
static std::string outputOf(const std::function<void()>& action)
{
    TempDir dir;
    const std::string path = dir.path("output");
    statusOf([&] {
        const int fd = open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0600);
        if (fd < 0 || dup2(fd, 1) != 1 || dup2(fd, 2) != 2)
            abort();
        action();
        _exit(0);
    });
    return dir.read("output");
}

TEST(isMainProcessRunning, DecisionNothingIsPrintedForWhatCannotBeFound)
{
    Platform platform;
    EXPECT_EQ(outputOf([] { EXPECT_EQ(roleWith("0"), MAIN); }), "");
    EXPECT_EQ(outputOf([] { EXPECT_EQ(roleWith("-1"), MAIN); }), "");
    EXPECT_EQ(outputOf([&] { EXPECT_EQ(roleWith(platform.number(), L""), MAIN); }), "");
    EXPECT_EQ(roleWith("0"), MAIN);
    EXPECT_EQ(roleWith(platform.number(), L""), MAIN);
}

TEST(isMainProcessRunning, DecisionANameThatBeginsWithADashIsAPatternAndNoOption)
{
    Platform platform;
    EXPECT_EQ(roleWith(platform.number(), L"-V"), MAIN);
    EXPECT_EQ(roleWith(platform.number(), L"-platform"), DAEMON);
}

TEST(isMainProcessRunning, NameOutsideAscii)
{
    Platform platform("\xc3\xa9"
                      "clipse");
    EXPECT_TRUE(finds(platform, L"\u00e9clipse"));
    EXPECT_FALSE(finds(platform, L"\u00e8clipse"));
}

TEST(restartWait, OldNumberIsDecimalWhateverItBeginsWith)
{
    Platform old("fake-platform", 2);
    TempDir dir;
    dir.write(".rcp.lock", old.number());
    locate(dir.wdir, restartOf("0" + old.number()));
    // Read as another number it would not be the old platform's, and this a daemon at once.
    EXPECT_TRUE(isMainProcess());
}

TEST(lockLockFile, MarkerIsFoundInAWorkspaceWithBackslashes)
{
    TempDir dir;
    dir.write("ws/.sid", "");
    locate(dir.wdir + L"\\ws");
    EXPECT_TRUE(isDirtyShutdown());
    EXPECT_FALSE(dir.has("ws/.sid"));
}

TEST(populateLockFile, RecordsTheNumberInItsOwnFileFirst)
{
    TempDir dir;
    locate(dir.wdir);
    dir.makeDir(".rcp.main");
    fillDiskOf(dir);
    EXPECT_EQ(linesOf(false, [] { populateLockFile(1234); }),
              "QVMRL00XXI: Unable to open rcp.main file\n"
              "QVMRL0051E: Unable to write to platform lock file\n");
}

TEST(getPipeName, NameOutsideAscii)
{
    TempDir dir;
    dir.write(".pipe", "\xc3\xa9\xe2\x82\xac\n");
    locate(dir.wdir);
    std::wstring name;
    EXPECT_TRUE(getPipeName(name));
    EXPECT_EQ(name, L"\u00e9\u20ac");
}

TEST(isMainProcessRunning, LeavesNothingThatAChildCouldSetBack)
{
    TempDir dir;
    dir.write(".rcp.lock", "4194303          ");
    locate(dir.wdir);
    const int fd = descriptorOf(dir.path(".rcp.lock"));
    ASSERT_GE(fd, 0);
    const off_t before = lseek(fd, 0, SEEK_CUR);
    // A child that ends as a launcher does flushes the streams that it has inherited.
    EXPECT_EQ(statusOf([] { exit(0); }), 0);
    EXPECT_EQ(lseek(fd, 0, SEEK_CUR), before);
    populateLockFile(1234);
    EXPECT_EQ(dir.read(".rcp.lock"), "1234             ");
}

TEST(isMainProcessRunning, NegativeNumberIsLookedUpLikeAnyOther)
{
    // kill takes it for a process group, ps for a session; both are this platform's own.
    Platform platform("fake-platform", 600, true);
    EXPECT_EQ(roleWith("-" + platform.number()), DAEMON);
    EXPECT_EQ(roleWith("-" + platform.number(), L"another-name"), MAIN);
}

TEST(populateLockFile, WhatCannotBeWrittenIsLogged)
{
    TempDir dir;
    EXPECT_TRUE(holdsInChild([&] {
        locate(dir.wdir);
        populateLockFile(123456);
        ASSERT_TRUE(makeFail(SYS_pwrite64, EIO));
        EXPECT_EQ(linesOf(false, [] { populateLockFile(7); }),
                  "QVMRL0051E: Unable to write to platform lock file\n");
    }));
    EXPECT_EQ(dir.read(".rcp.lock"), "123456          ");
}
