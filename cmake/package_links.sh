#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Lets the links of documents hold where they are installed: what another package has is there, and what only the sources
# have is named without a link.
# Usage: package_links.sh STAGE FOLDER, where FOLDER is that of the documents, below STAGE
set -eu
own=$1/$2
documents=$(dirname "$own")
find "$own" -name '*.md' | while read -r file; do
    folder=$(dirname "$file")
    grep -oE '[^[]\]\([^)# ]+' "$file" | sed 's/^.](//' | sort -u | while read -r link; do
        case $link in *:*) continue ;; esac
        [ ! -e "$folder/$link" ] || continue
        place=$(realpath -m --relative-to="$own" "$folder/$link")  # in the sources, too
        case $place in
        include/*) target=$1/$place ;;
        LICENSE) target=$documents/libquo-base1/copyright ;;
        NOTICE) target=$documents/libquo-base1/NOTICE ;;
        docs | docs/* | examples | examples/* | README.md) target=$documents/libquo-base-dev/$place ;;
        *)
            sed -i "s|\[\([^]]*\)\]($link[^)]*)|\1|g" "$file"
            continue
            ;;
        esac
        sed -i "s|]($link\([)#]\)|]($(realpath -m --relative-to="$folder" "$target")\1|g" "$file"
    done
done
