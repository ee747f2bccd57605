#!/usr/bin/env bash
# All sweeps, in 64 and in 32 bits: calls that fail, kills, allocations that fail, crowds, storms.
# The last line is "N passed, N failed"; the results stay under build/sweeps/ for the page.
set -u
cd "$(dirname "$0")/../.." || exit 1
# shellcheck source=tools/packages.sh
. tools/packages.sh
need_packages build i686 tests
exec tests/sweeps/run --build native,i686
