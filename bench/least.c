/*
 * The least that a warm start takes: a dynamic C program in the user's locale that touches the
 * files which a warm start has to, each of them once, understands none of them, and starts the
 * platform.
 *
 *     least APP WORKSPACE PROGRAM
 */
#define _GNU_SOURCE
#include <fcntl.h>
#include <locale.h>
#include <signal.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/file.h>
#include <time.h>
#include <unistd.h>

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

/* Reads it all, and has it in wide characters. */
static void read_text(const char* path)
{
    int fd = opened(path, O_RDONLY);
    ssize_t length;
    while ((length = read(fd, text, PIECE)) > 0) {
        text[length] = 0;
        if (mbstowcs(wide, text, PIECE) == (size_t)-1)
            exit(1);
    }
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

static pid_t start(const char* program)
{
    pid_t child = vfork();
    if (child == 0) {
        execl(program, program, NULL);
        _exit(127);
    }
    return child;
}

/* What was there before the start: the installation and the lock. */
static int begin(const char* app, const char* area)
{
    if (readlink("/proc/self/exe", text, PIECE) < 0)
        exit(1);
    read_text(below(app, "rcp/velmora.properties"));
    look(below(app, "rcp/prov.debug/debug.txt"));
    look(area);
    int lock = opened(below(area, ".rcp.lock"), O_RDWR);
    if (flock(lock, LOCK_EX) != 0 || read(lock, text, PIECE) < 1 || kill(atoi(text), 0) == 0)
        exit(1);
    look(below(area, ".sid"));
    return lock;
}

static int prepare(const char* app, const char* area)
{
    look(below(area, "logs"));
    int log = opened(below(area, "logs/velmora.log"), O_WRONLY | O_TRUNC);
    look("/tmp/velmora.log");
    look(below(area, ".config"));
    look(below(area, "applications/eclipse/features"));
    look(below(area, "applications/eclipse/plugins"));
    look(below(app, "shared/eclipse/.eclipseextension"));
    write_text(below(area, ".config/args.properties"), O_TRUNC, "arg0=velmora\n");
    look(below(area, ".config/config.ini"));
    read_text(below(area, ".config/rcpinstall.properties"));
    read_text(below(area, ".config/args.properties"));
    read_text(below(app, "rcp/eclipse/plugins/velmora.demo.jvm/jvm.properties"));
    look(below(area, ".config/org.eclipse.update/platform.xml"));
    time_t now = time(NULL);
    strftime(text, PIECE, "Started %c\n", localtime(&now));
    write_text(below(area, "logs/shutdown.log"), O_APPEND, text);
    read_text(below(area, "logs/shutdown.log"));
    put(log, "The words of the platform would stand here.\n");
    return log;
}

int main(int argc, char** argv)
{
    if (argc != 4 || !setlocale(LC_CTYPE, ""))
        return 1;
    const char *app = argv[1], *area = argv[2];
    int lock = begin(app, area), log = prepare(app, area);
    pid_t child = start(argv[3]);
    if (child < 0)
        return 1;
    snprintf(text, sizeof text, "%-11ld", (long)child);
    write_text(below(area, ".rcp.main"), O_TRUNC, text);
    if (pwrite(lock, text, 11, 0) != 11 || flock(lock, LOCK_UN) != 0)
        return 1;
    put(log, "The lock is released.\n");
    return 0;
}
