#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Runs clang-tidy on one source, or on one that includes several; a finding fails. It is looked at again only when one of
# them, a header or the configuration has changed since it was last found clean.
# Usage: scripts/check_tidy.sh BUILD_FOLDER FILE
set -eu
cd "$(dirname "$0")/.."
build=$1
file=$2

state=$( (git ls-files -co --exclude-standard -- '*.h' .clang-tidy | sort; echo "$file"
    sed -n 's/^#include "\(.*\.cpp\)"$/\1/p' "$file") | tr '\n' '\0' |
    xargs -0 sha256sum | sha256sum | cut -d ' ' -f 1)
stamp=$build/tidy-stamps/$state
[ ! -e "$stamp" ] || exit 0
clang-tidy -p "$build" --quiet "$file"
mkdir -p "$build/tidy-stamps"
: >"$stamp"
