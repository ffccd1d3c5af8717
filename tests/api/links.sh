#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Fails for a link of a document in a folder that leads nowhere.
# Usage: links.sh FOLDER
set -eu
find "$1" -name '*.md' | while read -r file; do
    grep -oE '[^[]\]\([^)# ]+' "$file" | sed 's/^.](//' | while read -r link; do
        case $link in *:*) continue ;; esac
        [ -e "$(dirname "$file")/$link" ] || echo "$file: $link"
    done
done | grep . && exit 1
exit 0
