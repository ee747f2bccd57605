/*
 * A library in front of the C library's fsync: it flushes, or with FLUSH=no in the environment it
 * does not. Both sides of the comparison load it, so that flushing is all that differs.
 */
#define _GNU_SOURCE
#include <stdlib.h>
#include <string.h>
#include <sys/syscall.h>
#include <unistd.h>

int fsync(int fd)
{
    const char* wish = getenv("FLUSH");
    return wish && !strcmp(wish, "no") ? 0 : (int)syscall(SYS_fsync, fd);
}
