#!/usr/bin/env bash
# Makes the packages, twice, and looks at them: the same bytes, lintian, the architecture, the command lines of the pages;
# then installs, starts, upgrades, removes and purges each in a throw-away root of its architecture. The last line is
# "N passed, N failed", perhaps with ", N skipped".
#
# A throw-away root needs root and a package server; without them its tests are skipped with that reason.
# Functions are called through try, and texts in single quotes belong to another shell or program.
# shellcheck disable=SC2317,SC2016
set -u
cd "$(dirname "$0")/../.." || exit 1
ROOT=$PWD

passed=0
failed=0
skipped=0

say() {
    echo "$*"
}

# try NAME COMMAND...: one test. What the command says is shown when it fails.
try() {
    local name=$1 said
    shift
    if said=$("$@" 2>&1); then
        say "ok      $name"
        passed=$((passed + 1))
    else
        say "FAILED  $name"
        printf '%s\n' "$said" | tail -n 30 | sed 's/^/    /'
        failed=$((failed + 1))
        return 1
    fi
}

skip() { # NAME REASON
    say "skipped: $1: $2"
    skipped=$((skipped + 1))
}

# ---- In the throw-away root ------------------------------------------------------------------------

# inside ROOT ARCHITECTURE: mounts are private. Prints the same lines as the outer script, and counts at its end.
inside() {
    root=$1
    architecture=$2
    mount -t proc proc "$root/proc" && mount -t tmpfs none "$root/tmp" || exit 1

    in_root() {
        env -i PATH=/usr/sbin:/usr/bin:/sbin:/bin HOME=/root LC_ALL=C.UTF-8 DEBIAN_FRONTEND=noninteractive \
            chroot "$root" "$@" </dev/null
    }
    by_anna() {
        env -i PATH=/usr/sbin:/usr/bin:/sbin:/bin chroot "$root" setpriv --reuid=1000 --regid=1000 --clear-groups \
            env -i PATH=/usr/bin:/bin HOME=/home/anna USER=anna LC_ALL=C.UTF-8 "$@" </dev/null
    }
    # Every file of anna's: name, kind, mode, owner, time, content.
    area_of_anna() {
        (cd "$root/home/anna" && find . -printf '%P %y %m %U:%G %T@ %l\n' | sort &&
            find . -type f -print0 | sort -z | xargs -0r sha256sum)
    }
    has() {
        [[ -e $root$1 || -L $root$1 ]]
    }
    has_not() {
        ! has "$1"
    }
    no_program_but_ours() { # a start leaves no process behind
        ! pgrep -x velmora
    }
    start_without_platform() {
        by_anna velmora
        local status=$?
        [[ $status -eq 255 ]] || { echo "status $status"; return 1; }
        grep '^QVMRL0190E: Unable to open source file .*/base/config.ini to be copied : No such file' \
            "$root/home/anna/VANTOR/RCP/velmora/anna/logs/velmora.log"
        rm -rf "$root/home/anna/VANTOR"
    }
    add_platform() {
        local base=$root/usr/lib/velmora/rcp/eclipse/plugins/base
        mkdir -p "$base/linux/x86" || return
        echo 'osgi.bundles=' >"$base/config.ini"
        echo 'application=demo' >"$base/rcpinstall.properties"
        echo '<config/>' >"$base/platform.xml"
        : >"$base/launcher.jar"
        # It stays as long as it is asked to, so that it is found running.
        cat >"$base/linux/x86/eclipse" <<'PLATFORM'
#!/bin/sh
printf '%s\n' "$@" >>/tmp/words
while [ -e /tmp/stay ]; do sleep 0.05; done
PLATFORM
        chmod +x "$base/linux/x86/eclipse"
    }
    start() { # WORD...: whole, and the platform was given what the package's properties say
        rm -f "$root/tmp/words"
        by_anna velmora -velmoraWait "$@" || return
        grep -qx -- -Drcp.home=/usr/lib/velmora "$root/tmp/words" &&
            grep -qx -- "-Dcom.vantor.rcp.install.id=$install_id" "$root/tmp/words"
    }
    second_start_is_a_daemon() { # ps is there, and finds the platform
        : >"$root/tmp/stay"
        by_anna velmora && by_anna velmora
        local status=$?
        for _ in $(seq 200); do
            grep -qsx -- -useDaemon "$root/tmp/words" && break
            sleep 0.05
        done
        rm "$root/tmp/stay"
        [[ $status -eq 0 ]] && grep -qx -- -useDaemon "$root/tmp/words"
    }
    link() {
        rm -f "$root/tmp/words"
        by_anna /usr/lib/velmora/open-link velmora:x || return
        for _ in $(seq 200); do
            grep -qsx velmora:x "$root/tmp/words" && return
            sleep 0.05
        done
        return 1
    }
    link_is_refused() {
        by_anna /usr/lib/velmora/open-link velmora:x -resetconfig
        [[ $? -eq 255 ]]
    }
    # The same package with a higher version, and one more line in the settings of the installation it knows of.
    newer_package() {
        local folder=$root/newer
        rm -rf "$folder"
        dpkg-deb -R "$root"/build/package/velmora_*_"$architecture".deb "$folder" || return
        sed -i 's/^Version: .*/&.1/' "$folder/DEBIAN/control"
        dpkg-deb --root-owner-group -b "$folder" "$root/newer.deb" && rm -rf "$folder"
    }
    version_is_newer() {
        [[ $(in_root dpkg-query -W -f='${Version}' velmora) == *.1 ]]
    }
    edit_settings() {
        sed -i 's/^rcp.install.id=.*/rcp.install.id=office-7/' "$root/etc/velmora/velmora.properties"
        install_id=office-7
    }
    settings_are_kept() {
        grep -qx rcp.install.id=office-7 "$root/etc/velmora/velmora.properties"
    }
    area_is_untouched() {
        grep -q '^VANTOR/RCP/velmora/anna/logs/shutdown.log ' "$root/before" &&
            area_of_anna | diff "$root/before" -
    }

    install_id=velmora
    local a=$architecture
    try "$a: what the pages say installs it" in_root bash -eu /installed.sh
    try "$a: dpkg finds nothing to complain about" in_root bash -c '[ -z "$(dpkg --audit)" ] && dpkg -V velmora'
    try "$a: the link leads to the launcher" in_root \
        bash -c '[ "$(readlink -f /usr/bin/velmora)" = /usr/lib/velmora/rcp/velmora ]'
    try "$a: the manual, the examples, the entries and the unit are there" in_root bash -c '
        for file in /usr/share/man/man1/velmora.1.gz /usr/share/man/man5/velmora.properties.5.gz \
            /usr/share/man/man7/velmora-messages.7.gz /usr/share/man/man7/velmora-kiosk.7.gz \
            /usr/share/doc/velmora/examples/README.md /usr/share/doc/velmora/support.md /usr/share/doc/velmora/copyright \
            /usr/share/applications/velmora.desktop /usr/share/applications/velmora-link.desktop \
            /usr/share/icons/hicolor/scalable/apps/velmora.svg /usr/share/metainfo/com.vantor.velmora.metainfo.xml \
            /lib/systemd/system/velmora-kiosk@.service; do
            [ -s "$file" ] || { echo "$file"; exit 1; }
        done'
    try "$a: no page leads to one that was not installed" in_root bash -c '
        cd /usr/share/doc/velmora && pages=$(grep -oh "](.[^)#:]*)" ./*.md | sed "s/^](//; s/)$//" | sort -u) && [ -n "$pages" ] &&
        for page in $pages; do [ -s "$page" ] || { echo "$page"; exit 1; }; done'
    try "$a: ps is there, which it depends on" in_root sh -c 'command -v ps && dpkg-query -W -f="\${Depends}" velmora | grep procps'
    try "$a: a start without a platform says what is missing" start_without_platform
    add_platform
    try "$a: it starts" start
    try "$a: a second start finds the platform" second_start_is_a_daemon
    try "$a: a link reaches the platform" link
    try "$a: a link with a word of its own is refused" link_is_refused
    try "$a: nothing is left running" no_program_but_ours
    edit_settings
    try "$a: it starts with edited settings" start
    area_of_anna >"$root/before"
    try "$a: a newer package" newer_package
    try "$a: it is upgraded" in_root dpkg -i /newer.deb
    try "$a: the upgrade is in place" version_is_newer
    try "$a: the upgrade keeps the settings" settings_are_kept
    try "$a: the upgrade keeps the platform" has /usr/lib/velmora/rcp/eclipse/plugins/base/linux/x86/eclipse
    try "$a: the upgrade leaves a user's area alone" area_is_untouched
    try "$a: it starts after the upgrade" start
    area_of_anna >"$root/before"
    try "$a: it is removed" in_root dpkg -r velmora
    try "$a: the launcher and its link are gone" has_not /usr/bin/velmora
    try "$a: the settings stay when it is removed" settings_are_kept
    try "$a: it is installed again" in_root bash -eu /installed.sh
    try "$a: it starts again, with the old settings" start
    area_of_anna >"$root/before"
    try "$a: it is purged" in_root dpkg -P velmora
    try "$a: the settings are gone" has_not /etc/velmora
    try "$a: nothing of the package is left" in_root bash -c '! dpkg-query -s velmora && [ ! -e /usr/share/doc/velmora ]'
    try "$a: the platform stays, which the package did not bring" has /usr/lib/velmora/rcp/eclipse/plugins/base/linux/x86/eclipse
    try "$a: purging leaves a user's area alone" area_is_untouched
    echo "$passed $failed $skipped" >"$root/counts"
}

if [ "${1:-}" = --inside ]; then
    inside "$2" "$3"
    exit
fi

# ---- Outside ---------------------------------------------------------------------------------------

# shellcheck source=tools/packages.sh
. tools/packages.sh
need_packages build i686 packaging

mkdir -p build
scratch=$(mktemp -d "$ROOT/build/package-check.XXXXXX") || exit 1
trap 'rm -rf "$scratch"' EXIT
debs=$ROOT/build/package

# The commands of the pages, with /opt and what lies below it private. They make build/package and /opt/platform.
run_source_commands() {
    python3 tests/packaging/blocks.py source >"$scratch/source.sh"
    [[ -s $scratch/source.sh ]] || return 1
    cat >>"$scratch/source.sh" <<'END_OF_COMMANDS'
home=/opt/platform
[ -x "$home/rcp/velmora" ] && [ -d "$home/rcp/deploy" ] && [ -d "$home/rcp/eclipse/plugins" ]
cmp packaging/home/velmora.properties "$home/rcp/velmora.properties"
# Only what belongs to an rcp home is there, nothing of the test's own libraries for example.
[ "$(ls "$home" | tr '\n' ' ')" = "open-link rcp share " ]
[ "$(ls "$home/rcp" | tr '\n' ' ')" = "deploy eclipse velmora velmora.properties " ]
[ "$(ls "$home/share" | tr '\n' ' ')" = "doc man " ]
cmp LICENSE "$home/share/doc/velmora/LICENSE"
# It finds itself from there.
status=0
HOME=$scratch USER=anna LC_ALL=C.UTF-8 "$home/rcp/velmora" || status=$?
[ "$status" -eq 255 ]
grep "^QVMRL0190E: .* $home/rcp/eclipse/plugins/base/config.ini " "$scratch"/VANTOR/RCP/velmora/anna/logs/velmora.log
# A later installation keeps the settings.
echo edited=yes >>"$home/rcp/velmora.properties"
cmake --install build/native --prefix "$home"
tail -n 1 "$home/rcp/velmora.properties" | grep -x edited=yes
END_OF_COMMANDS
    local as_root=()
    [ "$(id -u)" -eq 0 ] || as_root=(--user --map-root-user)
    # A launcher deletes an old log in /tmp, so that is private too, unless the project itself lies there.
    scratch=$scratch unshare "${as_root[@]}" --mount bash -eu -c \
        'mount -t tmpfs none /opt; case $PWD in /tmp/*) ;; *) mount -t tmpfs none /tmp ;; esac
        exec bash -eu -o pipefail "$scratch/source.sh"'
}

# The sources as they are now, at another place; and the time that stands for that of both builds.
copy_sources() {
    mkdir "$elsewhere" || return
    if git rev-parse --git-dir >/dev/null 2>&1; then
        git ls-files -z --cached --others --exclude-standard | while IFS= read -r -d '' file; do
            [ ! -f "$file" ] || printf '%s\0' "$file"
        done | tar --null -cf - -T - | tar -xf - -C "$elsewhere"
    else
        tar --exclude=./build -cf - . | tar -xf - -C "$elsewhere"
    fi
    [ -f "$elsewhere/packaging/CMakeLists.txt" ]
}

# A second time: another place, another name of the build, another umask, another language and time zone.
build_elsewhere() {
    (umask 077 && cd "$elsewhere" && TZ=Asia/Tokyo LANG=C ./package --into "$scratch/second")
}

same_bytes() {
    local file compared=0
    for file in "$debs"/*.deb "$debs"/*.tar.gz; do
        cmp "$file" "$scratch/second/${file##*/}" || return 1
        compared=$((compared + 1))
    done
    [ "$compared" -eq 4 ]
}

clean_for_lintian() {
    local said
    said=$(lintian --fail-on none "$1" 2>/dev/null) || return
    printf '%s\n' "$said"
    ! printf '%s\n' "$said" | grep -E '^[EW]:'
}

# lintian is seen to find something: without its manual page a program is a warning.
lintian_can_fail() {
    local folder=$scratch/without
    dpkg-deb -R "$1" "$folder" && rm "$folder"/usr/share/man/man1/velmora.1.gz &&
        sed -i '/man1\/velmora/d' "$folder/DEBIAN/md5sums" &&
        dpkg-deb --root-owner-group -b "$folder" "$scratch/without.deb" || return
    local said
    ! said=$(clean_for_lintian "$scratch/without.deb") && printf '%s\n' "$said" | grep '^W: velmora: no-manual-page'
}

field_is() { # PACKAGE FIELD VALUE
    local value
    value=$(dpkg-deb -f "$1" "$2")
    [ "$value" = "$3" ] || { echo "$2: $value"; return 1; }
}

# The class and the machine of the executable in the package.
executable_is() { # PACKAGE CLASS MACHINE
    dpkg-deb --fsys-tarfile "$1" | tar -xOf - ./usr/lib/velmora/rcp/velmora >"$scratch/velmora" || return
    [ "$(readelf -h "$scratch/velmora" | sed -n 's/^ *Class: *//p')" = "$2" ] &&
        [ "$(readelf -h "$scratch/velmora" | sed -n 's/^ *Machine: *//p')" = "$3" ]
}

no_path_of_this_machine() { # PACKAGE
    dpkg-deb --fsys-tarfile "$1" | tar -xf - -C "$scratch" ./usr/lib/velmora/rcp/velmora || return
    ! grep -aF "$ROOT" "$scratch/usr/lib/velmora/rcp/velmora"
}

# The rcp home in one folder, with its licence and without what belongs to a distribution.
tarball_is() { # FILE CLASS
    local folder=$scratch/tarball
    rm -rf "$folder" && mkdir "$folder" && tar -xzf "$1" -C "$folder" || return
    local inside="${1##*/}"
    inside=${inside%.tar.gz}
    (cd "$folder" && printf '%s\n' * "$inside"/*) |
        diff <(printf '%s\n' "$inside" "$inside"/{open-link,rcp,share}) - || return
    folder=$folder/$inside
    [ "$(readelf -h "$folder/rcp/velmora" | sed -n 's/^ *Class: *//p')" = "$2" ] || return
    cmp LICENSE "$folder/share/doc/velmora/LICENSE" &&
        cmp packaging/home/velmora.properties "$folder/rcp/velmora.properties" &&
        [ -s "$folder/share/man/man1/velmora.1.gz" ] && [ -x "$folder/open-link" ] && [ -d "$folder/rcp/eclipse/plugins" ]
}

refuses() {
    ! "$@"
}

installed_commands_for() { # ARCHITECTURE
    python3 tests/packaging/blocks.py installed | sed "s/_amd64\.deb/_$1.deb/g"
}

# The package server that this machine uses for its own release.
server() {
    apt-get indextargets --format '$(REPO_URI) $(RELEASE)' 'Created-By: Packages' |
        sed -n "s/ $1\$//p" | head -n 1
}

make_root() { # ARCHITECTURE FOLDER
    local codename
    codename=$(. /etc/os-release && echo "$VERSION_CODENAME")
    mkdir -p "$ROOT/build/package-cache"
    debootstrap --arch="$1" --variant=minbase --include=procps,psmisc --cache-dir="$ROOT/build/package-cache" \
        "$codename" "$2" "$(server "$codename")" || return
    mkdir -p "$2/build/package" "$2/home/anna" &&
        echo 'anna:x:1000:1000::/home/anna:/bin/sh' >>"$2/etc/passwd" &&
        echo 'anna:x:1000:' >>"$2/etc/group" &&
        chown 1000:1000 "$2/home/anna" &&
        cp "$debs"/velmora_*_"$1".deb "$2/build/package/" &&
        installed_commands_for "$1" >"$2/installed.sh" && [ -s "$2/installed.sh" ]
}

elsewhere=$scratch/another\ place
if SOURCE_DATE_EPOCH=$(git log -1 --format=%ct 2>/dev/null); then
    export SOURCE_DATE_EPOCH
else
    unset SOURCE_DATE_EPOCH
fi
try "a copy of the sources" copy_sources
case $ROOT in
    /opt/*)
        skip "the command lines of the pages" "the project lies in /opt, which they write to"
        try "packages" ./package
        ;;
    *) try "the command lines of the pages make packages and an rcp home" run_source_commands ;;
esac
try "a second build, elsewhere" build_elsewhere
try "both builds are the same bytes" same_bytes
try "an executable of the other width is refused for i386" refuses packaging/debian/dependencies i386 build/native/velmora
try "an executable of the other width is refused for amd64" refuses packaging/debian/dependencies amd64 build/i686/velmora

for architecture in amd64 i386; do
    deb=$(ls "$debs"/velmora_*_"$architecture".deb 2>/dev/null)
    try "$architecture: there is one package" test -f "$deb" || continue
    try "$architecture: the control file says so" field_is "$deb" Architecture "$architecture"
    if [ "$architecture" = amd64 ]; then
        try "$architecture: its executable is of that architecture" executable_is "$deb" ELF64 "Advanced Micro Devices X86-64"
        try "$architecture: the tarball is whole" tarball_is "$(ls "$debs"/velmora-*-x86_64.tar.gz)" ELF64
    else
        try "$architecture: its executable is of that architecture" executable_is "$deb" ELF32 "Intel 80386"
        try "$architecture: the tarball is whole" tarball_is "$(ls "$debs"/velmora-*-i686.tar.gz)" ELF32
    fi
    try "$architecture: it needs the C library and ps" \
        field_is "$deb" Depends "$(packaging/debian/dependencies "$architecture" "$scratch/velmora"), procps"
    try "$architecture: it recommends killall" field_is "$deb" Recommends psmisc
    try "$architecture: no path of this machine is in it" no_path_of_this_machine "$deb"
    try "$architecture: lintian has no error and no warning" clean_for_lintian "$deb"
    [ "$architecture" = i386 ] || try "lintian is seen to warn" lintian_can_fail "$deb"

    if [ "$(id -u)" -ne 0 ]; then
        skip "$architecture: installation" "a throw-away root of the distribution needs root"
        continue
    fi
    root=$scratch/$architecture
    try "$architecture: a throw-away root" make_root "$architecture" "$root" || continue
    # The numbers of the processes in there are private too, and all of them end with the first.
    unshare --mount --pid --fork --mount-proc --kill-child \
        bash "$ROOT/tests/full/package.sh" --inside "$root" "$architecture"
    if read -r p f s <"$root/counts" 2>/dev/null; then
        passed=$((passed + p)) failed=$((failed + f)) skipped=$((skipped + s))
    else
        say "FAILED  $architecture: the tests in the throw-away root came to no end"
        failed=$((failed + 1))
    fi
    rm -rf "$root"
done

summary="$passed passed, $failed failed"
[ "$skipped" -eq 0 ] || summary="$summary, $skipped skipped"
echo "$summary"
[ "$failed" -eq 0 ] && [ "$passed" -gt 0 ]
