/*
 * The least that velmora's kind of program can be: dynamic, its text in the user's locale, and one
 * start of a program, without a copy of itself. It reads nothing and writes nothing.
 */
#define _GNU_SOURCE
#include <locale.h>
#include <unistd.h>

int main(int argc, char** argv)
{
    if (argc != 2 || !setlocale(LC_CTYPE, ""))
        return 1;
    pid_t child = vfork();
    if (child == 0) {
        execv(argv[1], argv + 1);
        _exit(127);
    }
    return child < 0;
}
