#!/bin/sh
# Runs clang-tidy over every source of the tidy preset; a finding fails. A file is looked at again only when it, a
# header or the configuration has changed.
# Usage: scripts/check_tidy.sh [--one FILE]   (--one is the script's own call, one per file, side by side)
set -eu
cd "$(dirname "$0")/.."
build=build/tidy
stamps=$build/tidy-stamps

check_one() {
    stamp=$stamps/$( (echo "$headers" "$1"; cat "$1") | sha256sum | cut -d ' ' -f 1)
    [ ! -e "$stamp" ] || return 0
    if clang-tidy -p "$build" --quiet "$1" 2>/dev/null; then
        : >"$stamp"
    else
        echo "clang-tidy: findings in $1" >&2
        return 1
    fi
}
if [ "${1:-}" = --one ]; then
    check_one "$2"
    exit
fi

echo "Running clang-tidy"
cmake --preset tidy >/dev/null
mkdir -p "$stamps"
headers=$(git ls-files -co --exclude-standard -- '*.h' .clang-tidy | sort | tr '\n' '\0' | xargs -0 cat | sha256sum)
export headers
git ls-files -co --exclude-standard -- 'libsrc/*.cpp' 'tools/*.cpp' 'tests/*.cpp' 'examples/*.cpp' 'bench/*.cpp' |
    while read -r file; do
        ! grep -q "/$file\"" "$build/compile_commands.json" || printf '%s\0' "$file"
    done | xargs -0 -r -n 1 -P "$(nproc)" scripts/check_tidy.sh --one
