#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Part of the main job: the focused image of the chain as a map, by the Python package.
# Usage: scripts/demo_python.sh BUILD_FOLDER
set -eu
sources=$(dirname "$0")/..
folder=demo-output/python
targets=$sources/examples/echo_simulator/targets.csv
rm -rf "$folder"
mkdir -p "$folder"
export PYTHONPATH="$1/python"
echo
echo "The reflectors on the map, by Python: on an elevation model with an island under each of them"
/usr/bin/python3 "$sources"/examples/python/elevation_model.py "$targets" "$folder/dem.tif"
/usr/bin/python3 "$sources"/examples/python/make_map.py demo-output/chain/image.hdr "$folder/dem.tif" "$targets" "$folder/map.png"
echo
echo "In $folder: map.png and dem.tif"
