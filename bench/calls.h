/*
 * What the programs have in common that make the calls of a start: each call once, as a start has
 * to make it, and the end of the program when the system refuses one.
 */
#ifndef BENCH_CALLS_H
#define BENCH_CALLS_H

#include <fcntl.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

enum { PIECE = 4096 };

static char text[PIECE + 1];

static inline const char* below(const char* folder, const char* name)
{
    static char path[2 * PIECE];
    snprintf(path, sizeof path, "%s/%s", folder, name);
    return path;
}

static inline int opened(const char* path, int flags)
{
    int fd = open(path, flags | O_CLOEXEC, 0666);
    if (fd < 0)
        exit(1);
    return fd;
}

/* Has the file's text, which is shorter than a piece. */
static inline int open_and_read(const char* path)
{
    int fd = opened(path, O_RDONLY);
    ssize_t length = read(fd, text, PIECE);
    if (length < 0 || length == PIECE)
        exit(1);
    text[length] = 0;
    return fd;
}

/* Reads it to its end, which the last piece does not tell. */
static inline void read_file(const char* path)
{
    int fd = open_and_read(path);
    char more;
    if (read(fd, &more, 1) != 0)
        exit(1);
    close(fd);
}

/* Reads the history of starts, whose last piece does tell: it is not full. */
static inline void read_history(const char* path)
{
    close(open_and_read(path));
}

static inline void put(int fd, const char* words)
{
    if (write(fd, words, strlen(words)) != (ssize_t)strlen(words))
        exit(1);
}

static inline void write_text(const char* path, int flags, const char* words)
{
    int fd = opened(path, O_WRONLY | O_CREAT | flags);
    put(fd, words);
    close(fd);
}

/* Whether a file is there, which the start does not care about. */
static inline void ask(const char* path)
{
    int fd = open(path, O_RDONLY | O_CLOEXEC);
    if (fd >= 0)
        close(fd);
}

static inline void ask_folder(const char* path)
{
    struct stat entry;
    if (lstat(path, &entry) != 0)
        return;
}

static inline void ask_program(const char* path)
{
    struct stat entry;
    if (stat(path, &entry) != 0 || !(entry.st_mode & S_IXUSR))
        exit(1);
}

/* Locks the file, which the platform inherits, and reads it: what it holds is in `text`. */
static inline int locked(const char* path, int flags)
{
    int lock = open(path, O_RDWR | flags, 0600);
    if (lock < 0 || flock(lock, LOCK_EX) != 0 || access(path, F_OK) != 0)
        exit(1);
    ssize_t length = pread(lock, text, PIECE, 0);
    if (length < 0)
        exit(1);
    text[length] = 0;
    return lock;
}

static inline pid_t start(char** words)
{
    pid_t child = vfork();
    if (child == 0) {
        execv(words[0], words);
        _exit(127);
    }
    if (child < 0)
        exit(1);
    return child;
}

/* The number of the platform, for who asks which one it is and for who asks whether it lives. */
static inline void record(const char* area, int lock, pid_t child)
{
    char number[40];
    snprintf(number, sizeof number, "%ld    ", (long)child);
    write_text(below(area, ".rcp.main"), O_TRUNC, number);
    ssize_t length = snprintf(number, sizeof number, "%ld          ", (long)child);
    if (pwrite(lock, number, (size_t)length, 0) != length)
        exit(1);
}

#endif
