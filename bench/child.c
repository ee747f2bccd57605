/*
 * The platform of the measured starts: reads the clock with its first call, tells when that was and
 * which words it was given, and ends, or stays while /dev/shm/stay is there.
 */
#include "stamp.h"

/* The stack as the kernel makes it: the number of words, then the words. */
__asm__(".globl _start\n"
        "_start:\n"
        "    xor %ebp, %ebp\n"
        "    mov %rsp, %rdi\n"
        "    and $-16, %rsp\n"
        "    call begin\n");

void begin(long* stack);

void begin(long* stack)
{
    long fd = put_stamp();
    char** words = (char**)(stack + 1);
    /* They lie one behind the other. */
    char* end = words[stack[0] - 1];
    while (*end++)
        ;
    long size = end - words[0];
    if (fd < 0 || system_call(SYS_WRITE, fd, (long)words[0], size) != size)
        system_call(SYS_EXIT, 1, 0, 0);
    while (system_call(SYS_OPEN, (long)"/dev/shm/stay", 0, 0) >= 0)
        system_call(SYS_PAUSE, 0, 0, 0);
    system_call(SYS_EXIT, 0, 0, 0);
}
