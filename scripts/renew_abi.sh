#!/bin/sh
# Writes names, signatures and layouts of the library into tests/abi/quo_base.abi.gz, or another file. The build must have
# debugging information: that of the preset debug.
# Usage: scripts/renew_abi.sh BUILD_FOLDER [FILE]
set -eu
cd "$(dirname "$0")/.."
dump=${2:-tests/abi/quo_base.abi.gz}
abidw --drop-private-types --no-show-locs --no-comp-dir-path --no-corpus-path --headers-dir include \
    "$1/libsrc/libquo_base.so" | gzip -9n >"$dump"
