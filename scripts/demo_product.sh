#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Part of the main job: a complete product, written and read back, and what the tool tells of it.
# Usage: scripts/demo_product.sh BUILD_FOLDER
set -eu
sources=$(dirname "$0")/..
quo=$1/tools/quo/quo
scene=$sources/tests/data/scenes/s1a_iw1_slc_20220104_asc.xml
folder=demo-output/product
raster=$folder/map_lines.slc
header=$raster.hdr
rm -rf "$folder"
mkdir -p "$folder"

echo
echo "A complete product on a part of the first scene, written, read back and compared:"
"$1/examples/example_complete_product" "$scene" "$raster"
echo
"$quo" info "$header"
echo
echo "Checked:"
"$quo" validate "$header"

echo
echo "Its corners on the ground:"
roi() { "$quo" get "$header" "ROI/$1"; }
awk -v first="$(roi SlowStartTime)" -v duration="$(roi SlowTimeLength)" \
    -v near="$(roi FastStartTime)" -v depth="$(roi FastTimeLength)" 'BEGIN {
        print "corner,azimuth_time_s,range_time_s"
        printf "first near,%.17g,%.17g\n", first, near
        printf "first far,%.17g,%.17g\n", first, near + depth
        printf "last near,%.17g,%.17g\n", first + duration, near
        printf "last far,%.17g,%.17g\n", first + duration, near + depth
    }' | "$quo" geolocate "$header" --to ground | cut -d , -f 1,7-9

"$quo" quicklook "$raster" "$folder/quicklook.png" --north-up --frame
"$quo" footprint "$header" >"$folder/footprint.geojson"
"$quo" vrt "$raster"
echo
echo "In $folder: quicklook.png, footprint.geojson and map_lines.slc.vrt for GDAL"
