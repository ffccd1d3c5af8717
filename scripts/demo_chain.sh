#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Part of the main job: the chain from echoes to a geolocated image. Simulates, focuses, measures and shows.
# Usage: scripts/demo_chain.sh BUILD_FOLDER
set -eu
sources=$(dirname "$0")/..
quo=$1/tools/quo/quo
chain=$1/examples/chain
scene=$sources/tests/data/scenes/s1a_iw1_slc_20220104_asc.xml
targets=$sources/examples/echo_simulator/targets.csv
folder=demo-output/chain
rm -rf "$folder"
mkdir -p "$folder"
echo
echo "Nine reflectors, seen from the orbit of the first scene:"
"$chain/echo_simulator" "$scene" "$targets" "$folder/raw" --type short --big-endian --prefix 16 --noise 20 --doppler 230
"$chain/processor" "$folder/raw" "$folder/image" --configuration "$sources/examples/processor/focus.xml" --verbose
echo
echo "Where they are in the focused image, and what they look like (theory: sidelobes -13.3 dB, integrated -10.2 dB):"
"$chain/point_targets" "$folder/image" "$targets" --picture "$folder/target.png" --target Elio
echo
"$quo" info "$folder/image.hdr"
"$quo" quicklook "$folder/raw" "$folder/raw.png" --width 500 --frame --title "Echoes"
"$quo" quicklook "$folder/image" "$folder/image.png" --width 500 --frame --title "Focused"
"$quo" spectrum "$folder/image" "$folder/spectrum.png" --header "$folder/image.hdr" >/dev/null
"$quo" footprint "$folder/image.hdr" >"$folder/footprint.geojson"
if grep -l ERROR "$folder"/*.report.txt; then
    echo "demo_chain.sh: a report has errors" >&2
    exit 1
fi
echo
echo "In $folder: raw.png before and image.png after focusing, target.png, one of the reflectors, spectrum.png and"
echo "footprint.geojson"
