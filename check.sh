#!/bin/sh
# Installs what is missing, builds, and runs every check: formatting and static analysis, the tests under the
# sanitizers, and the tests of the release. The slowest come last, and ctest's own lines close the run.
set -eu
cd "$(dirname "$0")"
scripts/install_deps.sh

scripts/check_format.sh
scripts/build.sh release
scripts/check_tidy.sh
scripts/build.sh asan

jobs=$(nproc)
run_tests() {
    echo "Testing the $1 preset"
    ctest --preset "$1" --parallel "$jobs" --progress
}
run_tests asan
run_tests release
