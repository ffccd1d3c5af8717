#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Runs the demo's chain under valgrind, reduced to one target with a narrow beam and a short pulse. Fails on invalid
# accesses, on blocks that nobody holds any more, and on file descriptors that a program left open. Transforms run on
# FFTW, and then on the own engine with the instructions that valgrind knows of every processor: MKL keeps blocks in ways
# that it cannot follow.
# Usage: scripts/check_valgrind.sh BUILD_FOLDER
set -eu
cd "$(dirname "$0")/.."
command -v valgrind >/dev/null || { echo "check_valgrind.sh: install valgrind" >&2; exit 2; }
build=$(cd "$1" && pwd)
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT

check() {
    program=$1
    shift
    echo "valgrind: $(basename "$program") $1"
    # Descriptors 0 to 2 are the caller's; what else a caller has open is closed here, so that none is inherited.
    if ! valgrind -q --leak-check=full --show-leak-kinds=definite,indirect --errors-for-leak-kinds=definite,indirect \
        --track-fds=yes --error-exitcode=99 --log-file="$folder/valgrind.log" "$program" "$@" \
        3>&- 4>&- 5>&- 6>&- 7>&- 8>&- 9>&- >"$folder/output" 2>&1; then
        cat "$folder/output" "$folder/valgrind.log" >&2
        exit 1
    fi
    if awk '/Open file descriptor/ {open = $0} /<inherited from parent>/ {open = ""} /^==[0-9]+== *$/ && open != "" {
            print open; found = 1; open = ""} END {exit !found}' "$folder/valgrind.log" >&2; then
        echo "check_valgrind.sh: $(basename "$program") leaves a file open" >&2
        exit 1
    fi
}

printf 'name,latitude_deg,longitude_deg,height_m,strength\nalone,41.20376137,11.68781587,0,300\n' >"$folder/one.csv"
run_chain() {
    check "$build/examples/chain/echo_simulator" tests/data/scenes/s1a_iw1_slc_20220104_asc.xml "$folder/one.csv" \
        "$folder/raw" --beam 513 --pulse 2.1e-6 --type short --big-endian --prefix 5 --noise 3 --doppler 230
    check "$build/examples/chain/processor" "$folder/raw" "$folder/image" --configuration examples/processor/focus.xml \
        --waitbar
    check "$build/examples/chain/point_targets" "$folder/image" "$folder/one.csv"
    check "$build/tools/quo/quo" quicklook "$folder/image" "$folder/image.png"
    check "$build/tools/quo/quo" footprint "$folder/image.hdr"
    check "$build/tools/quo/quo" info "$folder/image.hdr"
}
(export QUO_FFT_ENGINE=fftw && run_chain)
(export QUO_FFT_ENGINE=quo QUO_CPU=sse2 && run_chain)
if grep ERROR "$folder"/*.report.txt >&2; then
    echo "check_valgrind.sh: a report has errors" >&2
    exit 1
fi
