#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Compares signatures and layouts with those of the reference beside this script: functions and types may be added.
# Usage: layouts.sh WORK_FOLDER
set -eu
cd "$(dirname "$0")/../.."
scripts/renew_abi.sh "$1/built.abi.gz"
for name in "tests/abi/quo_base" "$1/built"; do
    gunzip -c "$name.abi.gz" >"$1/$(basename "$name").abi"
done
if ! abidiff --no-added-syms "$1/quo_base.abi" "$1/built.abi"; then
    echo "The binary interface changed. Where programs that are linked already would break, SOVERSION in"
    echo "libsrc/CMakeLists.txt rises; a release writes the reference anew: scripts/renew_abi.sh"
    exit 1
fi
