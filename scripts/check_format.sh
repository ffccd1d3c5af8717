#!/bin/sh
# Fails when a source file is not formatted as .clang-format says.
set -eu
cd "$(dirname "$0")/.."
echo "Checking the format"
git ls-files -co --exclude-standard -- '*.h' '*.hpp' '*.c' '*.cpp' '*.inc' | tr '\n' '\0' |
    xargs -0 -r clang-format --dry-run --Werror
