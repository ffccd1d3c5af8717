#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Configures and builds one preset, quietly: output is shown only when something fails.
# Usage: scripts/build.sh PRESET [TARGET...]
set -eu
cd "$(dirname "$0")/.."
preset=$1
shift
log=$(mktemp)
trap 'rm -f "$log"' EXIT
echo "Building the $preset preset"
[ $# -eq 0 ] || set -- --target "$@"
if ! { cmake --preset "$preset" && cmake --build --preset "$preset" "$@"; } >"$log" 2>&1; then
    cat "$log" >&2
    exit 1
fi
