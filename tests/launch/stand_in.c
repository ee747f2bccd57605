/*
 * The stand-in for the platform's executables and for the JVM.
 *
 * Every start claims the next free number below RECORDS, writes down what it was given, and follows the plan of its
 * number (plan.<number>, else plan): a row of words, each ended by a zero byte.
 *
 *     write PATH TEXT      append PATH TEXT      remove PATH
 *     sleep MILLISECONDS   wait (for SIGTERM)    exit STATUS
 *
 * The record is a row of zero-ended texts too: process number, /proc/self/status, /proc/self/exe, the path given to
 * exec, the working directory, then three counted lists: arguments, environment, open descriptors ("3 /path").
 */
#define _GNU_SOURCE
#include <dirent.h>
#include <fcntl.h>
#include <signal.h>
#include <stdarg.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/auxv.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#define RECORDS "/dev/shm/stand-in"

extern char** environ;

static void give_up(const char* what)
{
    /* The launcher's own standard error stays clean, so trouble is told in a file. */
    int fd = open(RECORDS "/trouble", O_WRONLY | O_CREAT | O_APPEND, 0666);
    if (fd >= 0)
        dprintf(fd, "%s: %m\n", what);
    _exit(120);
}

static void put(FILE* record, const char* format, ...)
{
    va_list values;
    va_start(values, format);
    vfprintf(record, format, values);
    va_end(values);
    putc(0, record);
}

static void put_words(FILE* record, char** words)
{
    int count = 0;
    while (words[count])
        count++;
    put(record, "%d", count);
    for (int i = 0; i < count; i++)
        put(record, "%s", words[i]);
}

static char* link_target(const char* path, char target[4097])
{
    ssize_t length = readlink(path, target, 4096);
    target[length > 0 ? length : 0] = 0;
    return target;
}

/* The open descriptors, as they were before this program opened one of its own. */
static char** descriptors(void)
{
    char** words = calloc(4096, sizeof *words);
    int count = 0;
    DIR* folder = opendir("/proc/self/fd");
    if (!folder)
        give_up("/proc/self/fd");
    for (struct dirent* entry; (entry = readdir(folder)) && count < 4095;) {
        char path[64], target[4097];
        int number = atoi(entry->d_name);
        if (entry->d_name[0] == '.' || number == dirfd(folder))
            continue;
        snprintf(path, sizeof path, "/proc/self/fd/%d", number);
        if (asprintf(&words[count++], "%d %s", number, link_target(path, target)) < 0)
            give_up("memory");
    }
    closedir(folder);
    return words;
}

static const char* own_status(void)
{
    static char text[8192];
    int fd = open("/proc/self/status", O_RDONLY | O_CLOEXEC);
    ssize_t length = read(fd, text, sizeof text - 1);
    if (length < 0)
        give_up("/proc/self/status");
    close(fd);
    return text;
}

static int claim_number(void)
{
    for (int number = 0; number < 1000000; number++) {
        char name[32];
        snprintf(name, sizeof name, "%d", number);
        if (mkdir(name, 0777) == 0)
            return number;
    }
    give_up("claim");
    return -1;
}

static void record_start(int number, char** argv, const char* status, const char* folder,
                         mode_t mask, char** open_ones)
{
    char part[64], name[64], target[4097];
    snprintf(part, sizeof part, "%d/part", number);
    snprintf(name, sizeof name, "%d/record", number);
    FILE* record = fopen(part, "we");
    if (!record)
        give_up(part);
    put(record, "%d", (int)getpid());
    put(record, "%s", status);
    put(record, "%s", link_target("/proc/self/exe", target));
    put(record, "%s", (const char*)getauxval(AT_EXECFN));
    put(record, "%s", folder);
    put(record, "%o", (unsigned)mask);
    put_words(record, argv);
    put_words(record, environ);
    put_words(record, open_ones);
    if (fclose(record) != 0 || rename(part, name) != 0)
        give_up(name);
}

static char *plan, *plan_end;

static char* next_word(void)
{
    if (plan >= plan_end)
        give_up("a plan without the word that it needs");
    char* word = plan;
    plan += strlen(plan) + 1;
    return word;
}

static void read_plan(int number)
{
    char name[32];
    snprintf(name, sizeof name, RECORDS "/plan.%d", number);
    FILE* file = fopen(name, "re");
    if (!file)
        file = fopen(RECORDS "/plan", "re");
    if (!file)
        return;
    size_t room = 1 << 22;
    plan = malloc(room);
    if (!plan)
        give_up("memory");
    plan_end = plan + fread(plan, 1, room - 1, file);
    *plan_end = 0;
    fclose(file);
}

static void write_file(int more)
{
    const char *path = next_word(), *text = next_word();
    int fd = open(path, O_WRONLY | O_CREAT | O_CLOEXEC | more, 0666);
    if (fd < 0 || write(fd, text, strlen(text)) != (ssize_t)strlen(text))
        give_up(path);
    close(fd);
}

static void follow_plan(const sigset_t* the_end)
{
    while (plan && plan < plan_end) {
        const char* verb = next_word();
        if (!strcmp(verb, "write"))
            write_file(O_TRUNC);
        else if (!strcmp(verb, "append"))
            write_file(O_APPEND);
        else if (!strcmp(verb, "remove"))
            unlink(next_word());
        else if (!strcmp(verb, "sleep")) {
            long rest = atol(next_word());
            struct timespec time = {rest / 1000, rest % 1000 * 1000000};
            sigtimedwait(the_end, NULL, &time);
        } else if (!strcmp(verb, "wait"))
            sigwaitinfo(the_end, NULL);
        else if (!strcmp(verb, "exit"))
            _exit(atoi(next_word()));
        else
            give_up(verb);
    }
}

int main(int argc, char** argv)
{
    (void)argc;
    char** open_ones = descriptors();
    if (getenv("STAND_IN_HOLDS"))
        for (;;)
            pause();
    const char* status = own_status();
    char folder[4097];
    if (!getcwd(folder, sizeof folder))
        folder[0] = 0;
    if (chdir(RECORDS) != 0)
        give_up(RECORDS);

    /* From here on a SIGTERM is kept for the plan, so that whoever sees the record may send it. */
    sigset_t the_end;
    sigemptyset(&the_end);
    sigaddset(&the_end, SIGTERM);
    sigprocmask(SIG_BLOCK, &the_end, NULL);

    mode_t mask = umask(0);
    int number = claim_number();
    read_plan(number);
    record_start(number, argv, status, folder, mask, open_ones);
    umask(mask);
    if (folder[0] && chdir(folder) != 0)
        give_up(folder);
    follow_plan(&the_end);
    return 0;
}
