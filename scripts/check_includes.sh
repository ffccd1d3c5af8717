#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Fails where a file of the library includes something of a component that its own does not stand on: the floors are what
# DEPENDS says. Of private headers the compiler tells too, of public ones only this.
# Usage: scripts/check_includes.sh BUILD_FOLDER
set -eu
cd "$(dirname "$0")/.."
echo "Checking the includes against the floors"
# components.txt, which CMake writes, has a line a component: name|folder|public headers|the components it stands on
grep -rEo '^#include "[^"]+"' libsrc include/quo_base | sed 's/:#include "/|/; s/"$//' |
    awk -F '|' -v list="$1/components.txt" '
        # The component in whose folder a file lies, or that has it as a public header.
        function component_of(file, folder) {
            if (file in of_header) return of_header[file]
            folder = file
            while (sub(/\/[^\/]*$/, "", folder))
                if (folder in of_folder) return of_folder[folder]
            return ""
        }
        BEGIN {
            while ((getline line <list) > 0) {
                split(line, part, "|")
                if (!(part[2] in of_folder)) of_folder[part[2]] = part[1]
                name = of_folder[part[2]]  # components of one folder are one here
                below[name] = below[name] ";" name ";" part[4] ";"
                count = split(part[3], headers, ";")
                for (i = 1; i <= count; ++i) of_header["include/quo_base/" headers[i]] = name
            }
            if (!count && !name) { print list " lists nothing"; bad = 1; exit }
        }
        {
            file = $2 ~ /^quo_base\// ? "include/" $2 : "libsrc/sources/" $2
            to = component_of(file)
            if (to == "") to = component_of("libsrc/cppsources/" $2)
            from = component_of($1)
            if (to == "" || from == "") { if (to == "") print $1 ": of no component: " $2; bad = bad || to == "" }
            else if (index(below[from], ";" to ";") == 0) {
                print $1 ": includes " $2 " of " to ", on which " from " does not stand"
                bad = 1
            }
        }
        END { exit bad }'
