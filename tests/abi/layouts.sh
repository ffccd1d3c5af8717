#!/bin/sh
# Compares names, signatures and layouts with those of the reference beside this script: what is added is fine.
# Usage: layouts.sh BUILD_FOLDER WORK_FOLDER
set -eu
cd "$(dirname "$0")/../.."
scripts/renew_abi.sh "$1" "$2/built.abi.gz"
for name in "tests/abi/quo_base" "$2/built"; do
    gunzip -c "$name.abi.gz" >"$2/$(basename "$name").abi"
done
if ! abidiff --no-added-syms "$2/quo_base.abi" "$2/built.abi"; then
    echo "The binary interface changed. Where programs that are linked already would break, SOVERSION in"
    echo "libsrc/CMakeLists.txt rises; a release writes the reference anew: scripts/renew_abi.sh $1"
    exit 1
fi
