#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Compares the names that the library exports with the list that stands beside this script.
# Usage: exported_symbols.sh BUILD_FOLDER WORK_FOLDER
set -eu
build=$1
work=$2
cd "$(dirname "$0")/../.."
scripts/renew_exported_symbols.sh "$build" "$work/exported_symbols.txt"
if ! diff -U 0 tests/abi/exported_symbols.txt "$work/exported_symbols.txt"; then
    echo "The exported names changed. If that is meant: scripts/renew_exported_symbols.sh $build"
    exit 1
fi
