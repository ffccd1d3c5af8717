#!/bin/sh
# Installs what is missing, builds, and runs all tests: in the release, under the sanitizers (what threads do at the
# same time under one of its own), and the checks of format and style. A second call builds and analyses only what has
# changed.
set -eu
cd "$(dirname "$0")"
scripts/install_deps.sh

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
