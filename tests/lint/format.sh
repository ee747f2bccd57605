#!/bin/sh
# C and C++ look as .clang-format says.
set -u
sources=$(find . \( -path ./build -o -path ./.git \) -prune -o \
    \( -name '*.cpp' -o -name '*.h' -o -name '*.c' \) -type f -print | sort)
if [ -z "$sources" ] || [ ! -f .clang-format ]; then
    echo ".clang-format:1: there is nothing to compare with, or nothing to look at"
    exit 1
fi
# One line for each place is enough; clang-format -i FILE puts all of them right.
# shellcheck disable=SC2086 # a list of names
places=$(clang-format --dry-run -Werror --style=file $sources 2>&1 |
    sed -n 's,^\./,,; s/^\([^: ]*:[0-9]*\):[0-9]*: error: .*/\1: not as .clang-format has it/p' | uniq)
if [ -n "$places" ]; then
    printf '%s\n' "$places"
    exit 1
fi
# Nothing was said about a place: the status tells whether it worked at all.
# shellcheck disable=SC2086
clang-format --dry-run -Werror --style=file $sources
