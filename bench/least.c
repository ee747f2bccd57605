/*
 * The least that a start takes: a dynamic C program in the user's locale that touches the files
 * which a start has to, each of them once, understands none of them, and starts the platform.
 *
 *     least APP WORKSPACE PROGRAM           a warm start
 *     least APP WORKSPACE PROGRAM first     makes the user area
 *     least APP WORKSPACE PROGRAM beside    the platform runs, which the shell's ps is asked
 */
#define _GNU_SOURCE
#include <fcntl.h>
#include <locale.h>
#include <signal.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#define BASE "rcp/eclipse/plugins/base/"

enum { PIECE = 4096 };

static char text[PIECE + 1];
static wchar_t wide[PIECE + 1];

static const char* below(const char* folder, const char* name)
{
    static char path[PIECE];
    snprintf(path, sizeof path, "%s/%s", folder, name);
    return path;
}

static int opened(const char* path, int flags)
{
    int fd = open(path, flags | O_CLOEXEC, 0666);
    if (fd < 0)
        exit(1);
    return fd;
}

/* Reads it to its end, which the last piece does not tell, and has it in wide characters. */
static void read_text(const char* path)
{
    int fd = opened(path, O_RDONLY);
    ssize_t length = read(fd, text, PIECE);
    if (length < 0 || length == PIECE)
        exit(1);
    text[length] = 0;
    if (read(fd, wide, 1) != 0 || mbstowcs(wide, text, PIECE) == (size_t)-1)
        exit(1);
    close(fd);
}

static void put(int fd, const char* words)
{
    if (write(fd, words, strlen(words)) != (ssize_t)strlen(words))
        exit(1);
}

static void write_text(const char* path, int flags, const char* words)
{
    int fd = opened(path, O_WRONLY | O_CREAT | flags);
    put(fd, words);
    close(fd);
}

/* Whether it is there, which the start does not care about. */
static void look(const char* path)
{
    if (access(path, F_OK) != 0)
        return;
}

static void make(const char* path)
{
    if (mkdir(path, 0775) != 0)
        exit(1);
}

static void make_folders(const char* area)
{
    const char* folders[] = {"logs",
                             ".config",
                             ".config/org.eclipse.update",
                             "applications",
                             "applications/eclipse",
                             "applications/eclipse/features",
                             "applications/eclipse/plugins"};
    char path[PIECE];
    snprintf(path, sizeof path, "%s", area);
    const char* home = getenv("HOME");
    for (char* end = path + strlen(home ? home : "") + 1; (end = strchr(end, '/')); end++) {
        *end = 0;
        make(path);
        *end = '/';
    }
    make(path);
    for (size_t i = 0; i < sizeof folders / sizeof *folders; i++)
        make(below(area, folders[i]));
}

/* Whole, and on the disk, before it is there. */
static void copy(const char* from, const char* area, const char* name)
{
    char whole[PIECE], part[PIECE + 5];
    snprintf(whole, sizeof whole, "%s/.config/%s", area, name);
    snprintf(part, sizeof part, "%s.part", whole);
    read_text(from);
    int fd = opened(part, O_WRONLY | O_CREAT | O_TRUNC);
    put(fd, text);
    if (fsync(fd) != 0 || close(fd) != 0 || rename(part, whole) != 0)
        exit(1);
}

static void make_copies(const char* app, const char* area)
{
    copy(below(app, BASE "config.ini"), area, "config.ini");
    copy(below(app, BASE "rcpinstall.properties"), area, "rcpinstall.properties");
    copy(below(app, BASE "platform.xml"), area, "org.eclipse.update/platform.xml");
}

static pid_t start(const char* program)
{
    pid_t child = vfork();
    if (child == 0) {
        execl(program, program, NULL);
        _exit(127);
    }
    return child;
}

enum kind { WARM, FIRST, BESIDE };

static void ask_shell(int pid)
{
    char command[100];
    snprintf(command, sizeof command, "ps h %d | grep eclipse 2>&1 1>/dev/null", pid);
    if (system(command) != 0)
        exit(1);
}

/* Up to the lock, which names a platform, or none before a first start. */
static int begin(const char* app, const char* area, enum kind kind)
{
    if (readlink("/proc/self/exe", text, PIECE) < 0)
        exit(1);
    read_text(below(app, "rcp/velmora.properties"));
    look(below(app, "rcp/prov.debug/debug.txt"));
    look(area);
    if (kind == FIRST)
        make_folders(area);
    int lock = opened(below(area, ".rcp.lock"), O_RDWR | O_CREAT);
    if (flock(lock, LOCK_EX) != 0 || (read(lock, text, PIECE) > 0) == (kind == FIRST))
        exit(1);
    int pid = kind == FIRST ? 0 : atoi(text);
    if (pid > 0 && (kill(pid, 0) == 0) != (kind == BESIDE))
        exit(1);
    if (kind == BESIDE)
        ask_shell(pid);
    look(below(area, ".sid"));
    return lock;
}

static void tell_start(const char* area)
{
    time_t now = time(NULL);
    strftime(text, PIECE, "Started %c\n", localtime(&now));
    write_text(below(area, "logs/shutdown.log"), O_APPEND, text);
    read_text(below(area, "logs/shutdown.log"));
}

static int prepare(const char* app, const char* area, enum kind kind)
{
    look(below(area, "logs"));
    int log = opened(below(area, "logs/velmora.log"), O_WRONLY | O_CREAT | O_TRUNC);
    look("/tmp/velmora.log");
    look(below(area, ".config"));
    look(below(area, "applications/eclipse/features"));
    look(below(area, "applications/eclipse/plugins"));
    look(below(app, "shared/eclipse/.eclipseextension"));
    if (kind != BESIDE)
        write_text(below(area, ".config/args.properties"), O_TRUNC, "arg0=velmora\n");
    look(below(area, ".config/config.ini"));
    if (kind == FIRST)
        make_copies(app, area);
    read_text(below(area, ".config/rcpinstall.properties"));
    read_text(below(area, ".config/args.properties"));
    read_text(below(app, "rcp/eclipse/plugins/velmora.demo.jvm/jvm.properties"));
    look(below(area, ".config/org.eclipse.update/platform.xml"));
    if (kind != BESIDE)
        tell_start(area);
    put(log, "The words of the platform would stand here.\n");
    return log;
}

static void record(const char* area, int lock, pid_t child)
{
    ssize_t length = snprintf(text, sizeof text, "%ld          ", (long)child);
    write_text(below(area, ".rcp.main"), O_TRUNC, text);
    if (pwrite(lock, text, (size_t)length, 0) != length)
        exit(1);
}

int main(int argc, char** argv)
{
    if (argc < 4 || !setlocale(LC_CTYPE, ""))
        return 1;
    enum kind kind = argc == 4 ? WARM : strcmp(argv[4], "first") == 0 ? FIRST : BESIDE;
    const char *app = argv[1], *area = argv[2];
    int lock = begin(app, area, kind), log = prepare(app, area, kind);
    pid_t child = start(argv[3]);
    if (child < 0)
        return 1;
    if (kind != BESIDE)
        record(area, lock, child);
    if (flock(lock, LOCK_UN) != 0)
        return 1;
    put(log, "The lock is released.\n");
    return 0;
}
