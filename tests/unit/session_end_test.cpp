#include "platform/linux/session_end.h"

#include "tests/unit/separate_process.h"
#include "tests/unit/support.h"

#include <cerrno>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
#include <filesystem>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace fs = std::filesystem;

// A directory of a session: its library, and a stand-in for killall that records its words.
struct Session {
    Session()
    {
        dir.write("bin/killall", "#!/bin/sh\nprintf '<%s>' \"$@\" >>\"${0%/*}/../killed\"\n");
        fs::permissions(dir.path("bin/killall"), fs::perms(0755));
    }

    // Compiles `source` as the library of the directory. The shell's status.
    int build(const std::string& source) const
    {
        dir.write("lockdown.c", source);
        const std::string width = sizeof(void*) == 4 ? "-m32" : "-m64";
        const std::string at = "cd '" + dir.dir + "' && ";
        return system((at + "cc -shared -fPIC -Wl,-z,lazy " + width +
                       " -o lockdown.so lockdown.c >/dev/null 2>&1")
                          .c_str());
    }

    // Makes the directory the working directory, and its commands the first to be found.
    void enter() const
    {
        ASSERT_EQ(chdir(dir.dir.c_str()), 0);
        setenv("PATH", (dir.path("bin") + ":/usr/bin:/bin").c_str(), 1);
    }

    // What killall was asked to end: each of its words in angle brackets.
    std::string killed() const
    {
        return dir.read("killed");
    }

    TempDir dir;
};

// The status of a process in which `action` answers: 10 for true, 11 for false.
static int answerOf(const Session& session, bool (*action)())
{
    return statusOf([&] {
        session.enter();
        _exit(action() ? 10 : 11);
    });
}

static const int YES = 10;
static const int NO = 11;

#define NEEDS_COMPILER()                                                                           \
    if (system("command -v cc >/dev/null 2>&1") != 0)                                              \
    GTEST_SKIP() << "there is no compiler for the session's library"

static const char* const LOGOFF = "#include <stdbool.h>\n"
                                  "bool logoff(void) { return true; }\n";
static const char* const NO_LOGOFF = "#include <stdbool.h>\n"
                                     "bool logoff(void) { return false; }\n";

TEST(logoff, ReturnsWhatTheLibrarySays)
{
    NEEDS_COMPILER();
    Session session;
    ASSERT_EQ(session.build(LOGOFF), 0);
    EXPECT_EQ(answerOf(session, logoff), YES);
    ASSERT_EQ(session.build(NO_LOGOFF), 0);
    EXPECT_EQ(answerOf(session, logoff), NO);
    EXPECT_EQ(session.killed(), "");
}

TEST(logoff, UnloadsTheLibraryAfterTheCall)
{
    NEEDS_COMPILER();
    Session session;
    ASSERT_EQ(session.build("#include <stdbool.h>\n#include <stdio.h>\n"
                            "static void note(const char* text)\n"
                            "{ FILE* f = fopen(\"notes\", \"a\"); fputs(text, f); fclose(f); }\n"
                            "bool logoff(void) { note(\"called \"); return true; }\n"
                            "__attribute__((destructor)) static void end(void)\n"
                            "{ note(\"unloaded\"); }\n"),
              0);
    EXPECT_EQ(answerOf(session, logoff), YES);
    EXPECT_EQ(session.dir.read("notes"), "called unloaded");
}

TEST(logoff, BindsTheLibraryLazily)
{
    NEEDS_COMPILER();
    Session session;
    ASSERT_EQ(session.build("#include <stdbool.h>\n"
                            "void nobody_has_this(void);\n"
                            "void never_called(void) { nobody_has_this(); }\n"
                            "bool logoff(void) { return true; }\n"),
              0);
    unsetenv("LD_BIND_NOW");
    EXPECT_EQ(answerOf(session, logoff), YES);
}

TEST(logoff, KillsTheGnomeSessionWithoutTheLibrary)
{
    Session session;
    EXPECT_EQ(answerOf(session, logoff), 1);
    EXPECT_EQ(session.killed(), "<gnome-session>");
}

TEST(logoff, KillsTheGnomeSessionWhenTheLibraryHasNoLogoff)
{
    NEEDS_COMPILER();
    Session session;
    ASSERT_EQ(session.build("int shutdown_session(void) { return 1; }\n"), 0);
    EXPECT_EQ(answerOf(session, logoff), 1);
    EXPECT_EQ(session.killed(), "<gnome-session>");
}

TEST(logoff, KillsTheGnomeSessionWhenTheLibraryCannotBeLoaded)
{
    Session session;
    session.dir.write("lockdown.so", "no library");
    EXPECT_EQ(answerOf(session, logoff), 1);
    EXPECT_EQ(session.killed(), "<gnome-session>");
}

TEST(logoff, LoadsTheLibraryOfTheWorkingDirectoryAlone)
{
    NEEDS_COMPILER();
    Session session;
    ASSERT_EQ(session.build(LOGOFF), 0);
    Session empty;
    setenv("LD_LIBRARY_PATH", session.dir.dir.c_str(), 1);
    EXPECT_EQ(answerOf(empty, logoff), 1);
    EXPECT_EQ(empty.killed(), "<gnome-session>");
}

TEST(logoff, EndsWithStatus1WhateverBecameOfKillall)
{
    Session session;
    session.dir.write("bin/killall", "#!/bin/sh\nexit 3\n");
    EXPECT_EQ(answerOf(session, logoff), 1);
    EXPECT_EQ(statusOf([&] {
                  session.enter();
                  setenv("PATH", session.dir.path("nowhere").c_str(), 1);
                  // The shell says that it has no such command.
                  close(STDERR_FILENO);
                  logoff();
              }),
              1);
}

// ---- The request for a shutdown ----------------------------------------------------------------

TEST(CMD_FILE, IsInTmp)
{
    EXPECT_STREQ(CMD_FILE, "/tmp/tzn_shutdown");
}

static std::string shutdownRecord()
{
    std::string record(512, '\0');
    record.replace(0, 8, "shutdown");
    record[256] = '1';
    return record;
}

static unsigned requestMode()
{
    struct stat entry = {};
    return stat(CMD_FILE, &entry) == 0 ? entry.st_mode & 07777 : 0;
}

// Says yes when the request of 512 bytes stands there already.
static const char* const LOGOFF_AFTER_REQUEST =
    "#include <stdbool.h>\n#include <sys/stat.h>\n"
    "bool logoff(void) { struct stat s; return stat(\"/tmp/tzn_shutdown\", &s) == 0 "
    "&& s.st_size == 512 && (s.st_mode & 0777) == 0666; }\n";

TEST(shutdown, WritesTheRequestForAllBeforeItAsksTheLibrary)
{
    NEEDS_COMPILER();
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        Session session;
        ASSERT_EQ(session.build(LOGOFF_AFTER_REQUEST), 0);
        umask(077);
        EXPECT_EQ(answerOf(session, shutdown), YES);
        EXPECT_EQ(bytesOf(CMD_FILE), shutdownRecord());
        EXPECT_EQ(requestMode(), 0666u);
    }));
}

TEST(shutdown, ReplacesAnOldRequestAndItsMode)
{
    NEEDS_COMPILER();
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        Session session;
        ASSERT_EQ(session.build(LOGOFF_AFTER_REQUEST), 0);
        FILE* old = fopen(CMD_FILE, "we");
        ASSERT_NE(old, nullptr);
        fputs(std::string(1000, 'x').c_str(), old);
        fclose(old);
        ASSERT_EQ(chmod(CMD_FILE, 0600), 0);
        EXPECT_EQ(answerOf(session, shutdown), YES);
        EXPECT_EQ(bytesOf(CMD_FILE), shutdownRecord());
        EXPECT_EQ(requestMode(), 0666u);
    }));
}

// From now on no file can be opened with leave to make it (EACCES), as in a sticky directory whose
// entries belong to others. False where that cannot be had.
static bool refuseToMakeFiles()
{
    // The flags are the third argument, of which the lower half stands first.
    struct sock_filter filter[] = {
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(struct seccomp_data, nr)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_openat, 0, 3),
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(struct seccomp_data, args[2])),
        BPF_JUMP(BPF_JMP | BPF_JSET | BPF_K, O_CREAT, 0, 1),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | EACCES),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
    };
    struct sock_fprog program = {};
    program.len = sizeof filter / sizeof *filter;
    program.filter = filter;
    return prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) == 0 &&
           prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) == 0;
}

TEST(shutdown, UsesARequestThatMayBeWrittenButNotMade)
{
    NEEDS_COMPILER();
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        Session session;
        ASSERT_EQ(session.build(LOGOFF_AFTER_REQUEST), 0);
        FILE* old = fopen(CMD_FILE, "we");
        ASSERT_NE(old, nullptr);
        fputs(std::string(1000, 'x').c_str(), old);
        fclose(old);
        EXPECT_EQ(statusOf([&] {
                      session.enter();
                      if (!refuseToMakeFiles() ||
                          open("made", O_WRONLY | O_CREAT | O_CLOEXEC, 0666) >= 0)
                          _exit(2);
                      _exit(shutdown() ? YES : NO);
                  }),
                  YES);
        EXPECT_EQ(bytesOf(CMD_FILE), shutdownRecord());
        EXPECT_EQ(requestMode(), 0666u);
    }));
}

TEST(shutdown, ClearsTheUmaskForGood)
{
    NEEDS_COMPILER();
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        Session session;
        ASSERT_EQ(session.build(NO_LOGOFF), 0);
        session.enter();
        umask(077);
        EXPECT_FALSE(shutdown());
        EXPECT_EQ(umask(0), 0u);
    }));
}

TEST(shutdown, ClearsTheUmaskBeforeTheRequestIsOpened)
{
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        Session session;
        ASSERT_EQ(mkdir(CMD_FILE, 0755), 0);
        session.enter();
        umask(027);
        EXPECT_FALSE(shutdown());
        EXPECT_EQ(umask(0), 0u);
    }));
}

TEST(shutdown, ReturnsWhatTheLibrarySays)
{
    NEEDS_COMPILER();
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        Session session;
        ASSERT_EQ(session.build(NO_LOGOFF), 0);
        EXPECT_EQ(answerOf(session, shutdown), NO);
        EXPECT_EQ(bytesOf(CMD_FILE), shutdownRecord());
    }));
}

TEST(shutdown, IsFalseWithoutALogoffWhenTheRequestCannotBeWritten)
{
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        Session session;
        ASSERT_EQ(mkdir(CMD_FILE, 0755), 0);
        EXPECT_EQ(answerOf(session, shutdown), NO);
        EXPECT_EQ(session.killed(), "");
    }));
}

TEST(shutdown, DoesNotWaitForSomebodyWhoReadsTheRequest)
{
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        Session session;
        ASSERT_EQ(mkfifo(CMD_FILE, 0666), 0);
        EXPECT_EQ(answerOf(session, shutdown), NO);
        EXPECT_EQ(session.killed(), "");
    }));
}

static int leasedRequest = -1;

static void giveUpTheRequest(int)
{
    fcntl(leasedRequest, F_SETLEASE, F_UNLCK);
}

TEST(shutdown, WaitsUntilALeaseOnTheRequestIsGivenUp)
{
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        Session session;
        signal(SIGIO, giveUpTheRequest);
        leasedRequest = open(CMD_FILE, O_RDWR | O_CREAT | O_CLOEXEC, 0666);
        ASSERT_EQ(fcntl(leasedRequest, F_SETLEASE, F_WRLCK), 0);
        EXPECT_EQ(answerOf(session, shutdown), 1);
        EXPECT_EQ(lseek(leasedRequest, 0, SEEK_END), 512);
    }));
}

TEST(shutdown, HandsTheRequestToWhoeverReadsAFifo)
{
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        Session session;
        ASSERT_EQ(mkfifo(CMD_FILE, 0666), 0);
        const int reader = open(CMD_FILE, O_RDONLY | O_NONBLOCK | O_CLOEXEC);
        ASSERT_GE(reader, 0);
        EXPECT_EQ(answerOf(session, shutdown), 1);
        std::string record(600, 'x');
        EXPECT_EQ(read(reader, &record[0], record.size()), 512);
        EXPECT_EQ(record.substr(0, 512), shutdownRecord());
        close(reader);
    }));
}

TEST(shutdown, KillsTheGnomeSessionWithoutTheLibraryAfterTheRequest)
{
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        Session session;
        EXPECT_EQ(answerOf(session, shutdown), 1);
        EXPECT_EQ(session.killed(), "<gnome-session>");
        EXPECT_EQ(bytesOf(CMD_FILE), shutdownRecord());
    }));
}
