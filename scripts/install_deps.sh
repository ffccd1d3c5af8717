#!/bin/sh
# Installs the Debian packages that building and testing need. Quick and silent when nothing is missing.
# Usage: scripts/install_deps.sh
set -eu

packages="git pkg-config ca-certificates g++ cmake ninja-build libxml2-dev libtrio-dev libcli11-dev
nlohmann-json3-dev libpng-dev libfftw3-dev libgtest-dev libgmock-dev libbenchmark-dev liblapack-dev libeigen3-dev
clang-format clang-tidy"

missing=""
for package in $packages; do
    status=$(dpkg-query -W -f '${Status}' "$package" 2>/dev/null || true)
    [ "$status" = "install ok installed" ] || missing="$missing $package"
done
[ -n "$missing" ] || exit 0

if [ "$(id -u)" = 0 ]; then
    as_root=""
elif command -v sudo >/dev/null 2>&1; then
    as_root="sudo"
else
    echo "install_deps.sh: missing packages:$missing; run as root or install sudo" >&2
    exit 1
fi
echo "Installing:$missing"
log=$(mktemp)
trap 'rm -f "$log"' EXIT
export DEBIAN_FRONTEND=noninteractive
# shellcheck disable=SC2086 # the list is meant to be split
if ! { $as_root apt-get update && $as_root apt-get install -y --no-install-recommends $missing; } >"$log" 2>&1; then
    cat "$log" >&2
    exit 1
fi
