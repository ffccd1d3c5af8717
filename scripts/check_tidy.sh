#!/bin/sh
# Runs clang-tidy on one source; a finding fails. A source is looked at again only when it, a header or the
# configuration has changed since it was last found clean.
# Usage: scripts/check_tidy.sh BUILD_FOLDER FILE
set -eu
cd "$(dirname "$0")/.."
build=$1
file=$2

state=$( (git ls-files -co --exclude-standard -- '*.h' .clang-tidy | sort; echo "$file") | tr '\n' '\0' |
    xargs -0 sha256sum | sha256sum | cut -d ' ' -f 1)
stamp=$build/tidy-stamps/$state
[ ! -e "$stamp" ] || exit 0
clang-tidy -p "$build" --quiet "$file"
mkdir -p "$build/tidy-stamps"
: >"$stamp"
