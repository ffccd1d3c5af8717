#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Runs the tests over a library that counts what ran, and fails where less than 97 % of its lines or 87 % of its
# branches did. Branches that only an exception takes are left out, for the compiler puts one behind every call; so are
# the tests that counting disturbs, and of those that let system calls fail the tool's and the longest: each of their
# thousands of processes adds its counts to the files.
# Usage: scripts/check_coverage.sh [JOBS]
set -eu
cd "$(dirname "$0")/.."
jobs=${1:-$(nproc)}
build=$PWD/build/coverage
mkdir -p "$build"
cmake -S . -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=Coverage -DQUO_BUILD_TESTS=ON \
    -DCMAKE_C_FLAGS=--coverage -DCMAKE_CXX_FLAGS=--coverage \
    -DCMAKE_EXE_LINKER_FLAGS=-Wl,-u,__gcov_dump >"$build/log"
ninja -j "$jobs" -C "$build" >>"$build/log"
find "$build" -name '*.gcda' -delete
# Where a parameter file ends the process for want of memory, the counting that comes then finds none either, and the
# test sees a crash; what ran until then counts.
ended='^faults.* = (CalibrationFactor|(All)?Profiles?|ReadProfile|FallBack)$'
ctest --test-dir "$build" -j "$jobs" -R "$ended" >>"$build/log" || true
ctest --test-dir "$build" --output-on-failure -j "$jobs" -LE lint \
    -E "$ended|"'^(faults.*/([a-z]|Read(Orbit|Product)|UseHandle)|faults.Kill|api.packages|profile.ProfileMemory)|OutputsWrittenInPlaceAreTold|Holds/config'
find "$build/libsrc" -name '*.gcda' -exec gcov --json-format --stdout --branch-probabilities {} + | python3 -c '
import json, os, sys
lines, branches = {}, {}
for document in sys.stdin:
    for file in json.loads(document)["files"]:
        path = os.path.realpath(file["file"])
        for line in file["lines"] if "/libsrc/" in path else ():
            place = path, line["line_number"]
            lines[place] = lines.get(place, 0) + line["count"]
            for way, branch in enumerate(line["branches"]):
                if not branch["throw"]:
                    one = *place, way
                    branches[one] = branches.get(one, 0) + branch["count"]
shares = [100 * sum(map(bool, counts.values())) / len(counts) for counts in (lines, branches)]
print("lines %.2f %%, branches %.2f %%" % tuple(shares))
sys.exit(shares[0] < 97 or shares[1] < 87)'
