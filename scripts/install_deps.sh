#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
#
# Installs the Debian packages that building and testing need. Quick and silent when nothing is missing.
# Usage: scripts/install_deps.sh [--demo | --with-mkl]
# --demo leaves out what only tests need.
# --with-mkl adds the FFT engine MKL, which is not free software: Debian keeps it in its component non-free. It does
# not become the system's BLAS.
set -eu

packages="pkg-config ca-certificates g++ cmake ninja-build libxml2-dev libtrio-dev libcli11-dev nlohmann-json3-dev libpng-dev
libcairo2-dev libtiff-dev libfftw3-dev pybind11-dev python3-dev python3-numpy python3-matplotlib python3-rasterio python3-pyproj
python3-xarray python3-dask gdal-bin"
tests="git libgtest-dev libgmock-dev libbenchmark-dev liblapack-dev libeigen3-dev clang-format clang-tidy clang libclang-rt-dev
valgrind time abigail-tools dpkg-dev file lintian help2man doxygen python3-pytest python3-pip
python3-distributed python3-pyflakes pycodestyle zsh"
case "${1:-}" in
"") packages="$packages $tests" ;;
--demo) ;;
--with-mkl) packages="$packages $tests libmkl-rt" ;;
*)
    echo "install_deps.sh: unknown option $1" >&2
    exit 2
    ;;
esac

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

# MKL needs the component non-free, in a sources file of its own, and asks whether to become the default BLAS.
prepare_mkl() {
    [ -n "$(apt-cache madison libmkl-rt)" ] || $as_root tee /etc/apt/sources.list.d/debian-non-free.sources <<SOURCES
Types: deb
URIs: http://deb.debian.org/debian
Suites: $(sed -n "s/^VERSION_CODENAME=//p" /etc/os-release)
Components: non-free
Signed-By: /usr/share/keyrings/debian-archive-keyring.gpg
SOURCES
    echo "libmkl-rt libmkl-rt/use-as-default-blas-lapack boolean false" | $as_root debconf-set-selections
}

echo "Installing:$missing"
log=$(mktemp)
trap 'rm -f "$log"' EXIT
export DEBIAN_FRONTEND=noninteractive
case "$missing" in *libmkl-rt*) prepare_mkl >"$log" ;; esac
# shellcheck disable=SC2086 # the list is meant to be split
if ! { $as_root apt-get update && $as_root apt-get install -y --no-install-recommends $missing; } >"$log" 2>&1; then
    cat "$log" >&2
    exit 1
fi
