# shellcheck shell=bash
# Makes the example installation: a small but real platform, laid out as velmora expects it.
# Read with `.` by ./demo, and by the tests that start a real platform.
#
#   example_build PIECES VELMORA              compiles what the platform consists of
#   example_install PIECES VELMORA RCP_HOME   lays the installation out
#   example_configure RCP_HOME KEY VALUE     changes a line of its velmora.properties
#   example_user_prefix RCP_HOME USER_HOME   a command that makes the rest of the line unprivileged
#
# Each ends with a status other than 0, after one line on the error output, when it cannot do it.

EXAMPLE_SOURCES=$(cd "$(dirname "${BASH_SOURCE[0]}")" && pwd)
EXAMPLE_JARS=/usr/share/java
EXAMPLE_LAUNCHER_ARCHIVE=$EXAMPLE_JARS/equinox-launcher.jar
# The framework and the bundles that config.ini names, besides the demo's own.
EXAMPLE_BUNDLES=(eclipse-osgi equinox-common eclipse-core-jobs equinox-registry equinox-app)

example_fail() {
    printf 'error: %s\n' "$*" >&2
    return 1
}

# The directory of a JDK: where the compiler on the search path really lies.
example_jdk() {
    local compiler
    compiler=$(command -v javac) || {
        example_fail "there is no Java compiler (javac) on the search path"
        return 1
    }
    compiler=$(readlink -f "$compiler")
    printf '%s\n' "${compiler%/bin/javac}"
}

# Where a bundle or archive lies. The packages have a link without a version to each.
example_bundle_path() {
    local bundle=$EXAMPLE_JARS/$1.jar
    [[ -r $bundle ]] || {
        example_fail "$bundle is missing; is its package installed?"
        return 1
    }
    printf '%s\n' "$bundle"
}

# The compiler's word for a library that an executable is to load, which must have the same width.
# The compiler's own width needs none.
example_width_option() {
    case $(od -An -tu1 -j4 -N1 "$1" | tr -d ' ') in
        1) echo -m32 ;;
        2) ;;
        *) example_fail "$1 is no executable" ;;
    esac
}

example_build() {
    local pieces=$1 velmora=$2 jdk width class_path='' bundle
    jdk=$(example_jdk) || return
    width=$(example_width_option "$velmora") || return
    for bundle in "${EXAMPLE_BUNDLES[@]}"; do
        class_path+=:$(example_bundle_path "$bundle") || return
    done

    rm -rf "$pieces"
    mkdir -p "$pieces/classes" || return
    local strict=(-std=c11 -O2 -Wall -Wextra -Wshadow -Werror)
    cc "${strict[@]}" -o "$pieces/eclipse" "$EXAMPLE_SOURCES/eclipse.c" || return
    cc "${strict[@]}" ${width:+"$width"} -shared -fPIC -o "$pieces/lockdown.so" \
        "$EXAMPLE_SOURCES/lockdown.c" || return

    # Without their performance data the tools leave nothing in /tmp.
    local application=$EXAMPLE_SOURCES/application
    "$jdk/bin/javac" -J-XX:-UsePerfData -Xlint:all -Werror --release 11 \
        -cp "${class_path#:}" -d "$pieces/classes" \
        "$application"/src/velmora/demo/*.java || return
    "$jdk/bin/jar" -J-XX:-UsePerfData --create --file "$pieces/velmora-demo.jar" \
        --manifest "$application/META-INF/MANIFEST.MF" \
        -C "$application" plugin.xml -C "$pieces/classes" .
}

example_install() {
    local pieces=$1 velmora=$2 rcp_home=$3 jdk bundle archive
    local plugins=$rcp_home/rcp/eclipse/plugins
    local base=$plugins/base
    jdk=$(example_jdk) || return

    mkdir -p "$rcp_home" && cp -R "$EXAMPLE_SOURCES/platform/." "$rcp_home/" || return
    # A copy: velmora finds its installation from where its executable lies.
    cp "$velmora" "$rcp_home/rcp/velmora" || return
    # velmora loads it from the current directory, so a kiosk is started from here.
    cp "$pieces/lockdown.so" "$rcp_home/rcp/" || return

    for bundle in "${EXAMPLE_BUNDLES[@]}"; do
        cp "$(example_bundle_path "$bundle")" "$plugins/" || return
    done
    cp "$pieces/velmora-demo.jar" "$plugins/" || return
    ln -s "$jdk" "$plugins/velmora.demo.jvm/jre" || return

    mkdir -p "$base/linux/x86" && cp "$pieces/eclipse" "$base/linux/x86/" || return
    for archive in launcher startup; do
        cp "$EXAMPLE_LAUNCHER_ARCHIVE" "$base/$archive.jar" || return
    done
}

# Replaces the line of the key, or adds one at the end.
example_configure() {
    local file=$1/rcp/velmora.properties key=$2 value=$3 line found=no
    local lines=()
    while IFS= read -r line; do
        if [[ $line == "$key="* ]]; then
            line=$key=$value
            found=yes
        fi
        lines+=("$line")
    done <"$file"
    [[ $found == yes ]] || lines+=("$key=$value")
    printf '%s\n' "${lines[@]}" >"$file"
}

# Prints, one word per line, what to put before a command that an unprivileged user is to run. For
# root that is a change of user, after which USER_HOME belongs to that user; else nothing.
example_user_prefix() {
    local rcp_home=$1 user_home=$2
    [[ $(id -u) -eq 0 ]] || return 0
    local owner=65534
    local words=(setpriv "--reuid=$owner" "--regid=$owner" --clear-groups)
    chown -R "$owner:$owner" "$user_home" || return
    if ! "${words[@]}" test -x "$rcp_home/rcp/velmora" -a -w "$user_home"; then
        # The project lies below a directory that is root's alone, /root perhaps. Another user has
        # to be let through; nothing but the permissions of files is set aside for that.
        words+=("--inh-caps=-all,+dac_override" "--ambient-caps=-all,+dac_override")
    fi
    printf '%s\n' "${words[@]}"
}
