#!/bin/sh
# Shell scripts, those without an ending included, are clean for shellcheck.
set -u
if git rev-parse --git-dir >/dev/null 2>&1; then
    all=$(git ls-files --cached --others --exclude-standard)
else
    all=$(find . -type f ! -path './build/*' | sed 's,^\./,,')
fi
scripts=
for file in $all; do
    [ -f "$file" ] || continue
    case $file in
        *.sh | *.bash) scripts="$scripts $file" ;;
        *.*) case $file in .ci/*) ;; *) continue ;; esac ;;
    esac
    case $(head -c 64 "$file" | tr -d '\0' | head -n 1) in
        '#!'*[/\ ]sh | '#!'*[/\ ]bash | '#!'*[/\ ]dash) scripts="$scripts $file" ;;
    esac
done
if [ -z "$scripts" ]; then
    echo "tools:1: no script was found"
    exit 1
fi
# shellcheck disable=SC2086,SC2046 # a list of names
shellcheck -x -f gcc $(printf '%s\n' $scripts | sort -u)
