#!/bin/sh
# C and C++ look as .clang-format says.
set -u
sources=$(find . \( -path ./build -o -path ./.git \) -prune -o \
    \( -name '*.cpp' -o -name '*.h' -o -name '*.c' \) -type f -print | sort)
if [ -z "$sources" ] || [ ! -f .clang-format ]; then
    echo ".clang-format:1: there is nothing to compare with, or nothing to look at"
    exit 1
fi
# shellcheck disable=SC2086 # a list of names
clang-format --dry-run -Werror --style=file $sources 2>&1
