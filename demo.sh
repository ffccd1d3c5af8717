#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Installs what is missing, builds the release and runs the main job on the bundled real scenes.
set -eu
cd "$(dirname "$0")"
scripts/install_deps.sh --demo
scripts/build.sh demo quo_base quo_base_tiff quo example_complete_product make_measurement echo_simulator processor \
    point_targets quo_python
exec scripts/demo_job.sh build/release
