/*
 * The limit: what it takes to start a program, and nothing else. Linked statically.
 *
 *     limit PROGRAM             fork and exec
 *     limit PROGRAM COMMAND     the shell runs COMMAND first, and must find it true
 */
#include <stdlib.h>
#include <sys/types.h>
#include <unistd.h>

int main(int argc, char** argv)
{
    if (argc < 2 || (argc > 2 && system(argv[2]) != 0))
        return 1;
    pid_t child = fork();
    if (child == 0) {
        execv(argv[1], (char*[]){argv[1], NULL});
        _exit(127);
    }
    return child < 0;
}
