#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Runs the benchmark programs of a build and prints their ratios as one table in Markdown. Programs that are not
# built are left out; arguments after the folder name those to run, without "_bench".
# Usage: scripts/bench_table.sh BUILD_FOLDER [NAME...]
set -eu
cd "$(dirname "$0")/.."
build=$1
shift
names=$*
[ -n "$names" ] || names=$(basename -s _bench.cmake bench/*_bench.cmake)

# Most programs end with a line of column heads and a line for each ratio: its name, two times in ns, the ratio and
# its limit; a ratio above its limit stands in bold. Others tell the ratio behind each benchmark and set no limit.
rows() {
    awk -v command="\`bench/$1\`" '
        past && NF > 4 {
            name = $1
            for (i = 2; i <= NF - 4; ++i) name = name " " $i
            mark = $(NF - 1) > $NF ? "**" : ""
            printf "| %s | %s%.2f%s | %.2f | %s |\n", name, mark, $(NF - 1), mark, $NF, command
        }
        $1 == "ratio" && $NF == "target" { past = 1 }
        sub(/^ratio=/, "", $NF) {
            ratio = $NF
            sub(/\/manual_time.*/, "")
            if (sub(/\/[0-9]+$/, ":&")) sub(/:\//, ": ")  # a count behind the name
            printf "| %s | %.2f | | %s |\n", $0, ratio, command
        }'
}

echo '| measured / beside | ratio | limit | command in the build folder |'
echo '|---|---|---|---|'
for name in $names; do
    program=${name}_bench
    [ ! -x "$build/bench/$program" ] || "$build/bench/$program" 2>/dev/null | rows "$program"
done
