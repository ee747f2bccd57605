#!/usr/bin/env bash
# Whole starts of build/native/velmora under valgrind: no invalid access, no use of undefined bytes,
# no definite leak. The last line is "N passed, N failed".
#
# The platform is a stand-in, so that the launcher alone is looked at. (32 bits are left to the
# sanitizers: valgrind needs the other width's debugging symbols, of another architecture.)
set -u
cd "$(dirname "$0")/../.." || exit 1

if [ "${1:-}" != --inside ]; then
    # shellcheck source=tools/packages.sh
    . tools/packages.sh
    need_packages valgrind tests
    # /tmp holds names that the launcher writes and deletes: it gets one of its own.
    as_root=()
    [ "$(id -u)" -eq 0 ] || as_root=(--user --map-root-user)
    exec unshare "${as_root[@]}" --mount --pid --fork --mount-proc --kill-child \
        tests/full/valgrind.sh --inside
fi

# Everything is brought to /mnt before /tmp is hidden: the clone may lie there.
mount -t tmpfs none /mnt &&
    mkdir -p /mnt/app /mnt/home /mnt/logs &&
    cp -R example/platform/. /mnt/app/ &&
    cp tests/full/valgrind.supp /mnt/ &&
    cp build/native/velmora /mnt/app/rcp/velmora || exit 1
cd /mnt || exit 1
mount -t tmpfs none /tmp || exit 1

readonly BASE=/mnt/app/rcp/eclipse/plugins/base
mkdir -p "$BASE/linux/x86" "$BASE/../velmora.demo.jvm/jre/bin"
: >"$BASE/launcher.jar"
: >"$BASE/startup.jar"
# It notes its words, and stays while it is asked to.
cat >"$BASE/linux/x86/eclipse" <<'END'
#!/bin/sh
printf '%s\n' "$@" >/mnt/words
while [ -e /mnt/stay ]; do sleep 0.05; done
END
cp "$BASE/linux/x86/eclipse" "$BASE/../velmora.demo.jvm/jre/bin/java"
chmod +x "$BASE/linux/x86/eclipse" "$BASE/../velmora.demo.jvm/jre/bin/java"

passed=0
failed=0

# judge NAME WHETHER-WELL: counts, and shows what valgrind said when it was not.
judge() {
    if [ "$2" = yes ]; then
        echo "ok      $1"
        passed=$((passed + 1))
    else
        echo "FAILED  $1"
        sed 's/^/    /' /mnt/logs/"$1".*
        failed=$((failed + 1))
    fi
}

# start NAME STATUS WORD...: one start; what follows the fork is looked at too, up to the exec.
start() {
    local name=$1 expected=$2 status well=yes
    shift 2
    rm -f /mnt/words
    env -i HOME=/mnt/home USER=anna PATH="$PATH" LC_ALL=C.UTF-8 \
        valgrind --quiet --suppressions=/mnt/valgrind.supp --leak-check=full --errors-for-leak-kinds=definite,indirect \
        --show-leak-kinds=definite,indirect --error-exitcode=99 --log-file="/mnt/logs/$name.%p" \
        /mnt/app/rcp/velmora "$@" </dev/null
    status=$?
    [ "$status" -eq "$expected" ] || well=no
    # With --quiet a log holds reports and nothing else.
    [ -z "$(cat "/mnt/logs/$name".*)" ] || well=no
    # Where the launcher does not wait, the platform may need a moment.
    if [ "$expected" -eq 0 ]; then
        for _ in $(seq 200); do
            [ -s /mnt/words ] && break
            sleep 0.05
        done
        [ -s /mnt/words ] || well=no
    fi
    [ "$well" = yes ] || echo "status $status instead of $expected, or reports, or no platform" \
        >>"/mnt/logs/$name.verdict"
    judge "$name" "$well"
}

start first 0 -velmoraWait -foo
start second 0 -velmoraWait
start extension 0 -velmoraWait -config greeting
start restart 0 -velmoraWait -restart
start reset 0 -velmoraWait -resetconfig
start tracing 0 -velmoraWait -debug

: >/mnt/stay
start main_process 0
start beside_a_running_platform 0
rm /mnt/stay

sed -i 's/=user$/=service/' /mnt/app/rcp/velmora.properties
start service 0 -velmoraWait

sed -i '/^rcp\.base\.location/d' /mnt/app/rcp/velmora.properties
start fatal_end 255

echo "$passed passed, $failed failed"
[ "$failed" -eq 0 ]
