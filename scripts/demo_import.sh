#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Part of the main job: a Sentinel-1 sub-swath taken over. The annotation is a real one, cut down to three bursts; the
# measurement is made, of its size.
# Usage: scripts/demo_import.sh BUILD_FOLDER
set -eu
sources=$(dirname "$0")/..
quo=$1/tools/quo/quo
folder=demo-output/sentinel1
rm -rf "$folder"
mkdir -p "$folder"
cp -r "$sources"/tests/data/sentinel1/S1A_IW_SLC*.SAFE "$folder"
annotation=$(ls "$folder"/*.SAFE/annotation/*.xml)
"$1/examples/make_measurement" "$annotation"

echo
echo "A Sentinel-1 sub-swath of three bursts, taken over without copying its samples:"
"$quo" import "$folder"/*.SAFE "$folder/scene" --link
echo
"$quo" info "$folder/scene.hdr"

# The annotation's own tie point in the middle of the list.
echo
echo "One of its tie points, as the producer states it, and where the library finds it from either side:"
tie_point() {
    awk -v name="$1" -F '[<>]' '
        $2 == "geolocationGridPoint" { ++points }
        points == 7 && $2 == name && !found++ { printf "%.12g", $3 }' "$annotation"
}
line=$(tie_point line) sample=$(tie_point pixel) latitude=$(tie_point latitude) longitude=$(tie_point longitude)
height=$(tie_point height)
echo "stated: line $line, sample $sample is $latitude N, $longitude E, $height m high"
printf 'line,sample,height_m\n%s,%s,%s\n' "$line" "$sample" "$height" |
    "$quo" geolocate "$folder/scene.hdr" --to ground |
    awk -F , 'NR == 1 { for (i = 1; i <= NF; ++i) at[$i] = i }
        NR == 2 { printf "found:  %.9f N, %.9f E for that line and sample\n", $at["latitude_deg"], $at["longitude_deg"] }'
printf 'latitude_deg,longitude_deg,height_m\n%s,%s,%s\n' "$latitude" "$longitude" "$height" |
    "$quo" geolocate "$folder/scene.hdr" --to radar --pixels |
    awk -F , 'NR == 1 { for (i = 1; i <= NF; ++i) at[$i] = i }
        NR > 1 { printf "found:  line %.5f, sample %.5f for that place\n", $at["line"], $at["sample"] }'

echo
"$quo" quicklook "$folder/scene" "$folder/quicklook.png" --width 500 --north-up --frame --title "Three bursts of IW1"
echo
echo "Its outline:"
"$quo" footprint "$folder/scene.hdr" | tee "$folder/footprint.geojson"
echo
echo "In $folder: quicklook.png, with parallels and meridians at every tenth of a degree, and footprint.geojson"
