# shellcheck shell=sh
# The distribution packages that building, testing and showing velmora take. Read with `.`; POSIX sh.
#
#   . tools/packages.sh
#   need_packages build platform     # comes back only when both groups are installed
#   missing_packages coverage        # prints the names that are absent, nothing when all are there
#
# need_packages installs what is absent when it runs as root. Anybody else is told the one command
# that an administrator has to run, and the script ends with status 1.

# package_group GROUP: the packages of one group, one word each. "a|b" is satisfied by either; the
# first one is what gets installed.
package_group() {
    case $1 in
        build) echo "cmake make g++ libc6-dev" ;;
        i686) echo "g++-multilib" ;;
        tests) echo "googletest python3 python3-pytest strace procps util-linux" ;;
        lint) echo "git python3 binutils clang-tidy clang-format shellcheck" ;;
        platform)
            echo "default-jdk-headless|openjdk-17-jdk-headless|openjdk-21-jdk-headless|openjdk-25-jdk-headless" \
                "libequinox-launcher-java libeclipse-osgi-java libequinox-app-java" \
                "libequinox-common-java libequinox-registry-java libeclipse-core-jobs-java"
            ;;
        sanitizers) echo "g++ g++-multilib" ;;
        coverage) echo "g++ python3" ;;
        valgrind) echo "valgrind" ;;
        fuzz) echo "clang libclang-rt-dev llvm locales" ;;
        pages) echo "python3 python3-pytest cmake mandoc man-db desktop-file-utils appstream systemd" ;;
        bench) echo "cmake g++ g++-multilib libbenchmark-dev valgrind strace procps dash default-jdk-headless|openjdk-17-jdk-headless" ;;
        packaging) echo "dpkg-dev binutils file lintian debootstrap" ;;
        *)
            echo "packages.sh: there is no package group \"$1\"" >&2
            return 1
            ;;
    esac
}

# package_installed NAME: whether dpkg has it unpacked and configured, in any architecture.
package_installed() {
    dpkg-query -W -f='${db:Status-Status}\n' "$1" 2>/dev/null | grep -qx installed
}

# missing_packages GROUP...: one line per absent package, each package once.
missing_packages() {
    for _group in "$@"; do
        _words=$(package_group "$_group") || return 1
        for _word in $_words; do
            _found=no
            for _name in $(echo "$_word" | tr '|' ' '); do
                if package_installed "$_name"; then
                    _found=yes
                    break
                fi
            done
            [ "$_found" = yes ] || echo "${_word%%|*}"
        done
    done | sort -u
}

# install_quietly LOG NAME...: apt-get without a question. Its words go to LOG.
install_quietly() {
    _log=$1
    shift
    DEBIAN_FRONTEND=noninteractive apt-get -q -y -o DPkg::Lock::Timeout=300 \
        install --no-install-recommends "$@" >>"$_log" 2>&1 </dev/null
}

need_packages() {
    if ! command -v dpkg-query >/dev/null 2>&1; then
        echo "error: this needs a Debian-like system: there is no dpkg-query to ask for packages." >&2
        exit 1
    fi
    for _group in "$@"; do
        package_group "$_group" >/dev/null || exit 1
    done
    _missing=$(missing_packages "$@" | tr '\n' ' ')
    _missing=${_missing% }
    [ -n "$_missing" ] || return 0

    if [ "$(id -u)" -ne 0 ]; then
        echo "error: packages are missing. As an administrator run" >&2
        echo "    apt-get update && apt-get install --no-install-recommends $_missing" >&2
        exit 1
    fi

    echo "installing: $_missing"
    _apt_log=$(mktemp) || exit 1
    # The package lists may be absent (a fresh container) or too old to name files that still
    # exist, so a first try that fails is repeated with fresh lists.
    # shellcheck disable=SC2086 # a list of names
    if ! install_quietly "$_apt_log" $_missing; then
        apt-get -q -o DPkg::Lock::Timeout=300 update >>"$_apt_log" 2>&1 </dev/null
        # shellcheck disable=SC2086
        if ! install_quietly "$_apt_log" $_missing; then
            tail -n 20 "$_apt_log" >&2
            rm -f "$_apt_log"
            echo "error: apt-get could not install: $_missing" >&2
            exit 1
        fi
    fi
    rm -f "$_apt_log"

    _missing=$(missing_packages "$@" | tr '\n' ' ')
    if [ -n "$_missing" ]; then
        echo "error: still missing after apt-get succeeded: $_missing" >&2
        exit 1
    fi
}
