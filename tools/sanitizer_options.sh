# shellcheck shell=sh
# How the sanitizers behave in every test. Read with `.`; POSIX sh.
#
# A report ends the process with status 99, which velmora itself never uses, so that a report is not
# taken for a status that a test expects. A failing allocation gives a null pointer, as the C
# library's own does. Leaks are looked for at every normal end.
#
# leak_checks_possible tells whether LeakSanitizer can work here: it stops the process through
# ptrace, which some containers forbid. Where it cannot, leaks alone are not looked for, and whoever
# reads this file has to say so.

SANITIZER_COMMON=exitcode=99:allocator_may_return_null=1:detect_stack_use_after_return=1
UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1:exitcode=99
LSAN_OPTIONS=exitcode=99:print_suppressions=0

# leak_checks_possible DIRECTORY: DIRECTORY takes a small program for the trial.
leak_checks_possible() {
    printf '#include <stdlib.h>\nint main(void) { free(malloc(1)); return 0; }\n' \
        >"$1/leak_trial.c" &&
        gcc -fsanitize=address -o "$1/leak_trial" "$1/leak_trial.c" 2>/dev/null &&
        ASAN_OPTIONS="$SANITIZER_COMMON:detect_leaks=1" "$1/leak_trial" >/dev/null 2>&1
}

# use_sanitizer_options LEAKS: LEAKS is 1, or 0 where leak_checks_possible said no.
use_sanitizer_options() {
    ASAN_OPTIONS=$SANITIZER_COMMON:detect_leaks=$1
    export ASAN_OPTIONS UBSAN_OPTIONS LSAN_OPTIONS
}
