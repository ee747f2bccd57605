/*
 * Starts a program once, and tells how long it took and what it used.
 *
 *     stopwatch RESULT PROGRAM WORD...
 *
 * PROGRAM gets WORD... as its words. What it starts tells its arrival in STAMP; whatever of it is
 * left behind comes to this process and is waited for. Written to the descriptor RESULT, on one
 * line: the nanoseconds from PROGRAM's exec to the stamp (-1 when there was none) and to the
 * program's end, the microseconds of processor time, the peak of its resident memory in KB and
 * the page faults, all with those of its helpers, its status, how many were left behind, and how
 * many of these failed.
 *
 * Linked statically: a process begins with the memory of its maker as its peak.
 */
#define _GNU_SOURCE
#include "stamp.h"

#include <fcntl.h>
#include <stdio.h>
#include <stdlib.h>
#include <sys/mman.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

enum { LONGEST = 60 }; /* seconds */

static long now(void)
{
    struct timespec time;
    clock_gettime(CLOCK_MONOTONIC, &time);
    return time.tv_sec * 1000000000L + time.tv_nsec;
}

static long microseconds(struct timeval time)
{
    return time.tv_sec * 1000000L + time.tv_usec;
}

/* An empty file, so that what a start before this one has told is gone. */
static void clear_stamp(void)
{
    int fd = open(STAMP, O_RDWR | O_CREAT | O_TRUNC | O_CLOEXEC, 0666);
    if (fd < 0)
        exit(2);
    close(fd);
}

static struct stamp read_stamp(void)
{
    struct stamp stamp = {0};
    int fd = open(STAMP, O_RDONLY | O_CLOEXEC);
    if (fd < 0 || read(fd, &stamp, sizeof stamp) != sizeof stamp)
        stamp.nanoseconds = 0;
    close(fd);
    return stamp;
}

int main(int argc, char** argv)
{
    if (argc < 4)
        return 2;
    int result = atoi(argv[1]);
    long* begin =
        mmap(NULL, sizeof *begin, PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    if (begin == MAP_FAILED || fcntl(result, F_SETFD, FD_CLOEXEC) != 0 ||
        prctl(PR_SET_CHILD_SUBREAPER, 1) != 0)
        return 2;
    clear_stamp();
    alarm(LONGEST);

    pid_t started = fork();
    if (started == 0) {
        *begin = now();
        execv(argv[2], argv + 3);
        _exit(127);
    }
    int status, left = 0, failed = 0, other;
    struct rusage usage;
    if (started < 0 || wait4(started, &status, 0, &usage) != started)
        return 2;
    long end = now();
    while (wait4(-1, &other, 0, NULL) > 0) {
        left++;
        failed += other != 0;
    }
    struct stamp stamp = read_stamp();
    dprintf(result, "%ld %ld %ld %ld %ld %d %d %d\n",
            stamp.nanoseconds ? stamp.nanoseconds - *begin : -1, end - *begin,
            microseconds(usage.ru_utime) + microseconds(usage.ru_stime), usage.ru_maxrss,
            usage.ru_minflt, WIFEXITED(status) ? WEXITSTATUS(status) : -WTERMSIG(status), left,
            failed);
    return 0;
}
