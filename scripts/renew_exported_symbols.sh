#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Writes the names that the built library exports into tests/abi/exported_symbols.txt, or another file. A name that
# goes breaks programs that are linked already: then SOVERSION in libsrc/CMakeLists.txt rises.
# Usage: scripts/renew_exported_symbols.sh BUILD_FOLDER [FILE]
set -eu
library=$1/libsrc/libquo_base.so
list=${2:-$(dirname "$0")/../tests/abi/exported_symbols.txt}
[ -e "$library" ] || { echo "renew_exported_symbols.sh: there is no $library" >&2; exit 1; }
# Which parts of the standard library are compiled into the library is the compiler's choice.
nm -D --defined-only --format=posix "$library" | cut -d ' ' -f 1 | grep -vE '^_Z[A-Z]*(St|9__gnu_cxx)' |
    LC_ALL=C sort -u >"$list"
