#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Fails when a source file is not formatted as .clang-format says, or lacks the licence line.
set -eu
cd "$(dirname "$0")/.."
echo "Checking the format"
git ls-files -co --exclude-standard -- '*.h' '*.hpp' '*.c' '*.cpp' '*.inc' | tr '\n' '\0' |
    xargs -0 -r clang-format --dry-run --Werror
# METADATA.in becomes a file whose format knows no comments.
! git ls-files -co --exclude-standard -- '*.h' '*.hpp' '*.c' '*.cpp' '*.inc' '*.cmake' '*CMakeLists.txt' '*.sh' '*.bash' '*.py' '*.pyi' \
    '*.in' '*.toml' '*.sed' '*.dox' '.clang-*' Dockerfile 'examples/*.xml' | grep -vE '^(tests/data/|fuzz/corpus/|python/METADATA.in$)' |
    tr '\n' '\0' | xargs -0 grep -L '^\(//\|#\|<!--\) SPDX-License-Identifier: Apache-2.0\( -->\)\?$' | grep .
