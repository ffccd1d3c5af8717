#!/bin/sh
# Kills processes that save a header, a parameter file, a raster with its description and a picture, over and over, at
# any moment: each file is then old or new, and the next save sweeps what was left.
# Usage: scripts/check_kill.sh BUILD_FOLDER [TIMES]
set -eu
QUO_KILLS=${2:-1000} exec "$1/tests/faults/faults_test" --gtest_filter='Kill.*'
