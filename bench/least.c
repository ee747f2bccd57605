/*
 * The least that a start takes: a dynamic C program in the user's locale that asks the system for
 * what a start has to ask it for, understands none of it, and starts the platform. Whether a file
 * is there is asked by opening it; one that is there is opened again to be read.
 *
 *     least APP WORKSPACE PROGRAM           a warm start
 *     least APP WORKSPACE PROGRAM first     makes the user area
 *     least APP WORKSPACE PROGRAM beside    the platform runs, which the shell's ps is asked
 */
#define _GNU_SOURCE
#include "calls.h"

#include <locale.h>
#include <signal.h>
#include <time.h>

#define BASE "rcp/eclipse/plugins/base/"
#define JVM "rcp/eclipse/plugins/velmora.demo.jvm/"

static wchar_t wide[PIECE + 1];

/* Has all of it in wide characters. */
static void read_text(const char* path)
{
    read_file(path);
    if (mbstowcs(wide, text, PIECE) == (size_t)-1)
        exit(1);
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

static void write_to_disk(const char* path)
{
    int fd = opened(path, O_WRONLY | O_CREAT | O_TRUNC);
    put(fd, text);
    if (fsync(fd) != 0 || close(fd) != 0)
        exit(1);
}

/* One of the installation's files becomes the user's: whole, and on the disk, before it is there. */
static void copy(const char* app, const char* area, const char* folder, const char* name, int again)
{
    char from[PIECE], whole[PIECE], part[PIECE + 5], new[PIECE + 4];
    snprintf(from, sizeof from, "%s/" BASE "config/user/%s", app, name);
    ask(from);
    snprintf(from, sizeof from, "%s/" BASE "%s", app, name);
    snprintf(whole, sizeof whole, "%s/.config/%s%s", area, folder, name);
    snprintf(part, sizeof part, "%s.part", whole);
    snprintf(new, sizeof new, "%s.new", whole);
    ask_folder(whole);
    read_text(from);
    if (!again)
        write_to_disk(part);
    else { /* line by line, now that all of it is there */
        write_text(part, O_TRUNC, text);
        read_text(part);
        write_to_disk(new);
        unlink(part);
    }
    if (rename(again ? new : part, whole) != 0)
        exit(1);
}

static void make_copies(const char* app, const char* area)
{
    copy(app, area, "", "config.ini", 0);
    copy(app, area, "", "rcpinstall.properties", 1);
    copy(app, area, "org.eclipse.update/", "platform.xml", 0);
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
    ask_folder(below(app, "rcp"));
    ask_folder(app);
    read_text(below(app, "rcp/velmora.properties"));
    ask(below(app, "rcp/prov.debug/debug.txt"));
    ask_folder(area);
    if (kind == FIRST)
        make_folders(area);
    int lock = locked(below(area, ".rcp.lock"), kind == FIRST ? O_CREAT : 0);
    int pid = atoi(text);
    if ((pid > 0) == (kind == FIRST) || (pid > 0 && (kill(pid, 0) == 0) != (kind == BESIDE)))
        exit(1);
    if (kind == BESIDE)
        ask_shell(pid);
    ask(below(area, ".sid"));
    return lock;
}

static void tell_start(const char* area)
{
    time_t now = time(NULL);
    strftime(text, PIECE, "Started %c\n", localtime(&now));
    write_text(below(area, "logs/shutdown.log"), O_APPEND, text);
    read_history(below(area, "logs/shutdown.log"));
}

static int prepare(const char* app, const char* area, const char* program, enum kind kind)
{
    ask_folder(below(area, "logs"));
    int log = opened(below(area, "logs/velmora.log"), O_WRONLY | O_CREAT | O_TRUNC);
    put(log, "The words of the start would stand here.\n");
    ask("/tmp/velmora.log");
    ask_folder(below(area, ".config"));
    if (kind != FIRST)
        read_text(below(area, ".config/rcpinstall.properties"));
    ask_folder(below(area, "applications/eclipse/features"));
    ask_folder(below(area, "applications/eclipse/plugins"));
    ask(below(app, "shared/eclipse/.eclipseextension"));
    if (kind != BESIDE)
        write_text(below(area, ".config/args.properties"), O_TRUNC, "arg0=velmora\n");
    ask(below(area, ".config/config.ini"));
    if (kind == FIRST) {
        ask(below(area, ".config/rcpinstall.properties"));
        make_copies(app, area);
        read_text(below(area, ".config/rcpinstall.properties"));
    }
    read_text(below(area, ".config/args.properties"));
    put(log, "The path of the VM would stand here.\n");
    ask(below(app, JVM "jvm.properties"));
    put(log, "The path of its properties would stand here.\n");
    read_text(below(app, JVM "jvm.properties"));
    ask_folder(below(area, ".config/org.eclipse.update"));
    ask(below(area, ".config/org.eclipse.update/platform.xml"));
    if (kind != BESIDE)
        tell_start(area);
    ask_program(program);
    put(log, "The words of the platform would stand here.\n");
    return log;
}

int main(int argc, char** argv)
{
    if (argc < 4 || !setlocale(LC_CTYPE, ""))
        return 1;
    enum kind kind = argc == 4 ? WARM : strcmp(argv[4], "first") == 0 ? FIRST : BESIDE;
    const char *app = argv[1], *area = argv[2];
    int lock = begin(app, area, kind), log = prepare(app, area, argv[3], kind);
    pid_t child = start((char*[]){argv[3], NULL});
    if (kind != BESIDE)
        record(area, lock, child);
    if (flock(lock, LOCK_UN) != 0)
        return 1;
    put(log, "The lock is released.\n");
    return 0;
}
