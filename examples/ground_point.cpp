#include <cstdio>

#include "quo_base/generalSARorbit.h"

int main(int argc, char** argv) {
    GeneralSAROrbit orbit(0.05546576);                        // the radar's wavelength, m
    if (argc != 2 || orbit.readhdr(argv[1]) != 0) return 1;   // the product's XML header
    double latitude, longitude, incidence, look;              // degrees
    const double azimuth = 1133090050.25, range = 0.0058123;  // s since 1985; two-way range time, s
    if (orbit.SVGetLatLon(azimuth, range, &latitude, &longitude) != 0) return 1;
    if (orbit.SVGetAngles(azimuth, range, &incidence, &look) != 0) return 1;
    std::printf("%.7f N, %.7f E, seen at %.4f degrees\n", latitude, longitude, incidence);
}
