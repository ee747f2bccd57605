#!/bin/sh
# What .clang-tidy asks for, over the launcher's own sources, as build/native compiles them.
#
# VELMORA_JOBS says how many run at a time (default 2).
set -u
if [ ! -f build/native/compile_commands.json ] || [ ! -f .clang-tidy ]; then
    echo "build/native:1: it is not configured (compile_commands.json), or .clang-tidy is missing"
    exit 1
fi
sources=$(find launcher platform diag -name '*.cpp' -type f | sort)
if [ -z "$sources" ]; then
    echo "launcher:1: no source was found"
    exit 1
fi
# One that the build does not know would be judged with flags that were guessed.
unknown=0
for source in $sources; do
    if ! grep -qF "/$source\"" build/native/compile_commands.json; then
        echo "$source:1: it is not part of build/native"
        unknown=1
    fi
done
[ "$unknown" -eq 0 ] || exit 1
# The count of warnings in headers of others goes to standard error: nobody asked for it.
printf '%s\n' "$sources" |
    xargs -P "${VELMORA_JOBS:-2}" -n 4 clang-tidy -p build/native --quiet --warnings-as-errors='*' 2>/dev/null
