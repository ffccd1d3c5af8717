# SPDX-License-Identifier: Apache-2.0
#
# An image with the tool, the library, its headers and documents, made from the Debian packages; it has no compiler.
# Nothing of the tests runs this file: it was not built where the project is checked.
#   docker build -t quo . && docker run --rm -v "$PWD:/data" -w /data quo info scene.hdr
FROM debian:12 AS build
RUN apt-get update && apt-get install -y --no-install-recommends \
        ca-certificates pkg-config g++ cmake ninja-build dpkg-dev file gzip help2man \
        libxml2-dev libtrio-dev libfftw3-dev libtiff-dev libcli11-dev nlohmann-json3-dev libpng-dev libcairo2-dev
COPY . /source
RUN cmake -S /source -B /build -G Ninja && cmake --build /build && \
    cpack -G DEB --config /build/CPackConfig.cmake -B /packages

# Not the slim image, which leaves out documents and manual pages.
FROM debian:12
COPY --from=build /packages/*.deb /packages/
# /packages/*.deb brings the packages that ours depend on, too.
RUN apt-get update && apt-get install -y --no-install-recommends /packages/*.deb && \
    rm -rf /packages /var/lib/apt/lists/*
ENTRYPOINT ["quo"]
