#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# The main job: geolocates the bundled real scenes and compares the result with what their producers state.
# Usage: scripts/demo_job.sh BUILD_FOLDER; it and its parts write below demo-output in the current folder
set -eu
sources=$(dirname "$0")/..
quo=$1/tools/quo/quo
scenes=$sources/tests/data/scenes

echo
echo "Geolocation of three real scenes against their producers' own points:"
"$quo" tiepoints "$scenes"/*.xml
echo
echo "One sample of the second scene, brought to the ground:"
printf 'azimuth_time_s,range_time_s\n1133090050.25,0.0058123\n' |
    "$quo" geolocate "$scenes/s1a_iw_grd_20201127_desc_sea.xml" --to ground

"$sources"/scripts/demo_product.sh "$1"
"$sources"/scripts/demo_import.sh "$1"
"$sources"/scripts/demo_chain.sh "$1"
"$sources"/scripts/demo_python.sh "$1"
echo
echo "To run quo, the examples and the Python package in any folder, tell the shell:"
echo "sources=$(cd "$sources" && pwd) build=$(cd "$1" && pwd)"
grep '^export PATH=' "$sources/docs/README.md"
