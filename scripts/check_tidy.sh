#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Runs clang-tidy on one source, or on one that includes several; a finding fails. It is looked at again only when one of
# them, a header or the configuration has changed since it was last found clean.
# Usage: scripts/check_tidy.sh BUILD_FOLDER FILE
set -eu
cd "$(dirname "$0")/.."
build=$1
file=$2

parts=$(sed -n 's/^#include "\(.*\.cpp\)"$/\1/p' "$file")
state=$( (git ls-files -co --exclude-standard -- '*.h' .clang-tidy scripts/check_tidy.sh | sort; echo "$file"; echo "$parts") |
    grep . | tr '\n' '\0' | xargs -0 sha256sum | sha256sum | cut -d ' ' -f 1)
stamp=$build/tidy-stamps/$state
[ ! -e "$stamp" ] || exit 0

work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
joined=$work/joined.cpp
: >"$joined"
set --
if [ -n "$parts" ]; then
    # The analyzer follows no paths through what a source includes, so the parts are put into one text in its place. What
    # an earlier part includes is left out: only what one of them includes twice is to be found.
    IFS='
'
    # shellcheck disable=SC2086 # the list is meant to be split
    awk 'FNR == 1 { print "// part " FILENAME }
        /^#include / && !own[$2, FILENAME]++ && seen[$2]++ { print ""; next }
        { print }' $parts >"$joined"
    echo "{\"version\": 0, \"roots\": [{\"name\": \"$(realpath "$file")\", \"type\": \"file\",
        \"external-contents\": \"$joined\"}]}" >"$work/overlay.yaml"
    set -- "--vfsoverlay=$work/overlay.yaml"
    for part in $parts; do
        set -- "$@" "--extra-arg=-iquote${part%/*}"
    done
fi
status=0
clang-tidy -p "$build" --quiet "$@" "$file" >"$work/found" || status=$?
# Places in the text are shown as those in its parts.
awk -F : -v OFS=: -v joined="$joined" '
    FILENAME == joined { if (sub(/^\/\/ part /, "")) { start[++count] = FNR; name[count] = $0 } next }
    $1 == joined { part = count; while (start[part] >= $2) --part; $1 = name[part]; $2 -= start[part] }
    { print }' "$joined" "$work/found"
[ "$status" = 0 ] || exit "$status"
mkdir -p "$build/tidy-stamps"
: >"$stamp"
