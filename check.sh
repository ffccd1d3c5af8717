#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Installs what is missing, builds, and runs all tests: in the release; under the sanitizers, compiled by clang (what
# threads do at the same time under one of its own); the fuzz targets for a few seconds each; and the checks of format
# and style. A second call builds and analyses only what has changed.
set -eu
cd "$(dirname "$0")"
scripts/install_deps.sh

# Where there is room in memory, temporary files need not wait for the disk: what is saved is asked onto it thousands of
# times.
if [ -z "${TMPDIR:-}" ] && [ -w /dev/shm ] && [ "$(df --output=avail -m /dev/shm | tail -n 1)" -gt 4096 ]; then
    export TMPDIR=/dev/shm
fi

run() {
    echo "Testing: $*"
    ctest --output-on-failure --no-tests=error --parallel "$(nproc)" "$@"
}
scripts/build.sh release
build/release/tests/signallib/engines_present
run --test-dir build/release --label-exclude lint
scripts/build.sh asan
run --test-dir build/asan --label-exclude lint
scripts/build.sh tsan threads_test
run --test-dir build/tsan --tests-regex '^threads'
run --test-dir build/release --label-regex lint
