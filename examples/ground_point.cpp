// SPDX-License-Identifier: Apache-2.0
#include <cstdio>

#include "quo_base/generalSAR.h"

int main(int argc, char** argv) {
    GeneralSAR product;  // a product's header: the orbit gets wavelength and look side from their sections
    if (argc != 2 || product.GSread(argv[1]) != 0 || !product.GSexists(gsOrbit)) return 1;
    const double azimuth = 1133090050.25, range = 0.0058123;  // s since 1985; two-way range time, s
    double latitude, longitude;                               // degrees
    if (product.orbit.SVGetLatLon(azimuth, range, &latitude, &longitude) != 0) return 1;
    std::printf("%.7f N, %.7f E\n", latitude, longitude);
}
