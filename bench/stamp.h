/*
 * What starts tell the stopwatch: when they arrived. Without a C library, so that nothing of it
 * runs before the clock is read; for 64 bits only, whatever started it.
 */
#ifndef BENCH_STAMP_H
#define BENCH_STAMP_H

#define STAMP "/dev/shm/stamp"

struct stamp {
    long nanoseconds; /* of the monotonic clock */
};

enum { SYS_WRITE = 1, SYS_OPEN = 2, SYS_PAUSE = 34, SYS_EXIT = 231 };
enum { SYS_CLOCK_GETTIME = 228, TO_WRITE = 01, MONOTONIC = 1 };

static inline long system_call(long number, long one, long two, long three)
{
    long result;
    __asm__ volatile("syscall"
                     : "=a"(result)
                     : "a"(number), "D"(one), "S"(two), "d"(three)
                     : "rcx", "r11", "memory");
    return result;
}

/* Gives the descriptor of the stamp's file, or an error below 0. */
static inline long put_stamp(void)
{
    struct {
        long seconds, nanoseconds;
    } now;
    system_call(SYS_CLOCK_GETTIME, MONOTONIC, (long)&now, 0);
    struct stamp stamp = {now.seconds * 1000000000 + now.nanoseconds};
    long fd = system_call(SYS_OPEN, (long)STAMP, TO_WRITE, 0);
    if (fd >= 0 && system_call(SYS_WRITE, fd, (long)&stamp, sizeof stamp) != sizeof stamp)
        return -1;
    return fd;
}

#endif
