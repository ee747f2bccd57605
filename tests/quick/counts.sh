#!/bin/sh
# What starts take that is the same on every machine: system calls, instructions, shared libraries and
# helper processes of both widths, held to bench/counts.json. The last line is "N passed, N failed".
#
#   tests/quick/counts.sh                      all of them
#   tests/quick/counts.sh --only i686-warm     some, by how their names begin
#   tests/quick/counts.sh --write              puts what is counted now into bench/counts.json
set -eu
cd "$(dirname "$0")/../.."
# shellcheck source=tools/packages.sh
. tools/packages.sh
need_packages build i686 tests valgrind
exec /usr/bin/python3 tests/quick/counts.py "$@"
