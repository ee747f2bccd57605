// For executables that count what they go through. The counters are written by exit; a child of a
// test ends without it, by _exit, and keeps what it has counted all the same.
//
// The linker gives us the calls of _exit (--wrap).
extern "C" {
void __gcov_dump();
[[noreturn]] void __real__exit(int status);

[[noreturn]] void __wrap__exit(int status)
{
    __gcov_dump();
    __real__exit(status);
}
}
