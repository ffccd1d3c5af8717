#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Makes the manual pages from the tool's own help: quo.1, and a page for each of its verbs.
# Usage: scripts/man_pages.sh QUO OUTPUT_FOLDER
set -eu
quo=$1
out=$2
version=$("$quo" --version)
mkdir -p "$out"
"$quo" --help >"$out/help.txt"

# Behind the options, indented lines are examples and tables, which help2man would run into paragraphs: they pass it with
# a mark, and keep their lines on the page.
mark() {
    awk '/^[A-Z].*[^:]$/ && options { behind = 1 } /^Options:/ { options = 1 } behind && /^  / { $0 = "VERBATIM" $0 } { print }'
}
unmark() {
    awk '{ kept = sub(/^VERBATIM/, "") } kept && !open { print ".nf" } !kept && open { print ".fi" }
        { open = kept; print } END { if (open) print ".fi" }'
}

page() { # name, one line of what it is, its words on the command line
    # shellcheck disable=SC2086 # a verb is a word of its own, and the tool alone has none
    "$quo" $3 --help | mark >"$out/marked"
    printf '#!/bin/sh\ncat "$(dirname "$0")/marked"\n' >"$out/told"
    chmod +x "$out/told"
    help2man --no-info --section 1 --name "$2" --version-string "$version" --source "quo_base ${version#quo }" \
        --manual "Radar geometry and products" --output "$out/page" "$out/told"
    # A verb's page carries the tool's name otherwise.
    sed -e "s/^\.TH QUO /.TH $(echo "$1" | tr a-z A-Z) /" -e "s/^quo \\\\- /$1 \\\\- /" "$out/page" | unmark >"$out/$1.1"
}
page quo "radar geometry and products from the headers of synthetic aperture radar data" ""
sed -n '/^Subcommands:/,/^$/ { /^  [a-z]/ p }' "$out/help.txt" | while read -r verb what; do
    page "quo-$verb" "$what" "$verb"
done
rm "$out/help.txt" "$out/marked" "$out/told" "$out/page"
