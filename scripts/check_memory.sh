#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Reads, changes and converts files of 100 MB in processes whose address space ends at 8 times that, and tells what each
# took: a header with a long section, a table, a raster, and a parameter file with as much in it as beside it. A job
# fails the check when it fails, or ends by a signal.
# Usage: scripts/check_memory.sh BUILD_FOLDER [LIMIT_IN_MB]
set -eu
cd "$(dirname "$0")/.."
quo=$(cd "$1" && pwd)/tools/quo/quo
limit=${2:-800}
scene=$PWD/tests/data/scenes/s1a_iw1_slc_20220104_asc.xml
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
cd "$folder"

awk '/<\/Channel>/ {
        print "    <Noise>\n      <level>"
        for (i = 1; i <= 2600000; ++i) printf "        <val N=\"%d\">%.9g</val>\n", i, i * 7919 % 100003 / 7
        print "      </level>\n    </Noise>"
    } { print }' "$scene" >header.xml
awk 'BEGIN {
        print "latitude_deg,longitude_deg,height_m"
        for (i = 0; i < 3200000; ++i)
            printf "41.%09d,11.%09d,%d.5\n", i * 37 % 900000000, i * 53 % 900000000, i % 500
    }' >table.csv
head -c 100000000 /dev/zero | tr '\000' '\052' >raster
# The raster's own section comes last in a description that is a parameter file.
awk 'BEGIN {
        for (i = 0; i < 2000; ++i) {
            printf "[section %d]\n", i
            for (k = 0; k < 2000; ++k) printf "key_%d_%d = %d.5 %d\n", i, k, k, i
        }
        print "[RasterInfo]\nHeaderOffset = 0\nRowPrefix = 0\nNrOfPixelsPerLine = 5000\nNrOfLinesPerImage = 10000"
        print "CellType = INT16\nByteOrder = LSBFirst"
    }' >described.hdr
ln -s raster described

failed=0
# NAME ARGUMENT...: one run of the tool
run() {
    name=$1
    shift
    # The system's own time program tells the largest resident set.
    if (ulimit -v $((limit * 1000)) && exec /usr/bin/time -f '%M' "$quo" "$@") >output 2>told; then
        echo "$name: $(($(tail -n 1 told) / 1000)) MB"
    else
        failed=1
        echo "$name: FAILED" >&2
        cat told >&2
    fi
}
run "a header, one field" get header.xml SamplingConstants/prf_hz
run "a header, one field changed" set header.xml SamplingConstants/prf_hz 17.5
run "a header, all its values" get header.xml Noise/level
run "a table" geolocate "$scene" --to radar --input table.csv --output found.csv --threads 2
run "a parameter file" info described.hdr
run "a raster" convert described converted --type FLOAT32 --threads 2
run "a picture of a raster" quicklook described picture.png --threads 2
exit $failed
