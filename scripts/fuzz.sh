#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Builds the fuzz targets and runs them one after the other from their seeds, for so many minutes in all; 0.5 is a quick
# look. Fails for a target that crashes, leaks or hangs, and for one whose coverage does not grow beyond that of its
# seeds in half a minute: it would be looking at nothing. An input that was found to fail is kept in build/found.
# Usage: scripts/fuzz.sh MINUTES [BUILT_TARGET...], which without targets builds and takes all
set -eu
[ $# -ge 1 ] || { echo "Usage: scripts/fuzz.sh MINUTES [BUILT_TARGET...]" >&2; exit 2; }
cd "$(dirname "$0")/.."
minutes=$1
shift
if [ $# -eq 0 ]; then
    scripts/build.sh asan fuzz_targets
    set -- build/asan/fuzz/*_fuzz
fi
seconds=$(awk -v minutes="$minutes" -v targets=$# 'BEGIN { print int(60 * minutes / targets + 1) }')
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
mkdir -p build/found

# The branches that were reached by the time of a line of the log: INITED, after the seeds, or DONE.
covered() {
    sed -n "s/^#[0-9]*[[:space:]]*$1[[:space:]].*cov: \([0-9]*\).*/\1/p" "$2" | tail -n 1
}

failed=0
for target in "$@"; do
    name=$(basename "$target" _fuzz)
    log=$work/$name.log
    mkdir "$work/$name"
    verdict=fine
    "$target" -max_total_time="$seconds" -timeout=10 -rss_limit_mb=1024 -artifact_prefix="build/found/$name-" \
        "$work/$name" "fuzz/corpus/$name" >"$log" 2>&1 || verdict="FAILED, ended with status $?"
    seeds=$(covered INITED "$log")
    reached=$(covered DONE "$log")
    if [ "$verdict" = fine ] && [ "$seconds" -ge 30 ] && [ "${reached:-0}" -le "${seeds:-0}" ]; then
        verdict="FAILED, its coverage did not grow"
    fi
    inputs=$(sed -n 's/^#\([0-9]*\)[[:space:]]*DONE.*/\1/p' "$log")
    echo "$name: $verdict; ${inputs:-no} inputs; branches: ${seeds:-none} from the seeds, ${reached:-none} in the end"
    if [ "$verdict" != fine ]; then
        failed=1
        tail -n 60 "$log" >&2
    fi
done
exit $failed
