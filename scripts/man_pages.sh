#!/bin/sh
# Makes the manual pages from the tool's own help: quo.1, and a page for each of its verbs.
# Usage: scripts/man_pages.sh QUO OUTPUT_FOLDER
set -eu
quo=$1
out=$2
version=$("$quo" --version)
mkdir -p "$out"
"$quo" --help >"$out/help.txt"

page() { # name, one line of what it is, command
    help2man --no-info --section 1 --name "$2" --version-string "$version" --source "quo_base ${version#quo }" \
        --manual "Radar geometry and products" --output "$out/page" "$3"
    # A verb's page carries the tool's name otherwise.
    sed -e "s/^\.TH QUO /.TH $(echo "$1" | tr a-z A-Z) /" -e "s/^quo \\\\- /$1 \\\\- /" "$out/page" >"$out/$1.1"
}
page quo "radar geometry and products from the headers of synthetic aperture radar data" "$quo"
sed -n '/^Subcommands:/,/^$/ { /^  [a-z]/ p }' "$out/help.txt" | while read -r verb what; do
    page "quo-$verb" "$what" "$quo $verb"
done
rm "$out/help.txt" "$out/page"
