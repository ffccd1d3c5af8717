#!/bin/sh
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

# Sizes and signatures too, beside the last tagged version, where that kept them from a release built with -g:
# abidw --drop-private-types --no-show-locs --headers-dir include LIBRARY | gzip >tests/abi/quo_base.abi.gz
if command -v abidiff >/dev/null && tag=$(git describe --tags --abbrev=0 2>/dev/null) &&
    git cat-file -e "$tag:tests/abi/quo_base.abi.gz" 2>/dev/null; then
    git show "$tag:tests/abi/quo_base.abi.gz" | gunzip >"$work/tagged.abi"
    abidiff --headers-dir2 include "$work/tagged.abi" "$build/libsrc/libquo_base.so"
fi
