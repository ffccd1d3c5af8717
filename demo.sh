#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Installs what is missing, builds the tool, the examples and the Python package, and runs the main job on the bundled
# real scenes.
set -eu
cd "$(dirname "$0")"
scripts/install_deps.sh --demo
scripts/build.sh demo
exec scripts/demo_job.sh build/release
