#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Writes the signatures of the plain functions and the layouts of the types in the public headers into
# tests/abi/quo_base.abi.gz, or another file. A small library with a pointer to each of them, compiled here, tells them
# all: the real one would have to be built anew with debugging information. What methods take is in their exported names.
# Usage: scripts/renew_abi.sh [FILE]
set -eu
cd "$(dirname "$0")/.."
dump=${1:-tests/abi/quo_base.abi.gz}
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT

{
    echo '#include "quo_base/quo_base.h"'
    for header in trio triop triostr trionan; do echo "#include <$header.h>"; done
    echo "namespace quo {"
    # Functions; classes and enumerations that are declared whole, and enumerations inside classes.
    awk '
        FILENAME ~ /exported/ && /^[A-Za-z][A-Za-z0-9_]*$/ { found = "decltype(&::" $0 ")" }
        { sub(/QUO_BASE_API /, "") }
        /^(class|struct|enum) [A-Za-z][^;]*$/ { found = within = $2 }
        /^    enum [A-Z]/ { found = within "::" $2 }
        found != "" && !seen[found]++ {
            name = found
            gsub(/[^A-Za-z0-9_]/, "_", name)  # named after what it tells, as more is added the others stay
            print "extern " found "* const tells_" name "; " found "* const tells_" name " = nullptr;"
        }
        { found = "" }' tests/abi/exported_symbols.txt include/quo_base/*.h
    echo "}"
} >"$folder/interface.cpp"
c++ -std=c++20 -g -w -fPIC -shared -fno-eliminate-unused-debug-types -femit-class-debug-always -fno-access-control \
    -Iinclude "$folder/interface.cpp" -o "$folder/interface.so"
abidw --drop-private-types --no-show-locs --no-comp-dir-path --no-corpus-path \
    --headers-dir include "$folder/interface.so" | gzip -9n >"$dump"
