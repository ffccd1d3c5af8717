// SPDX-License-Identifier: Apache-2.0
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <thread>
#include <vector>

#include "quo_base/generalSAR.h"

int main(int argc, char** argv) {
    GeneralSAR product;
    if (argc != 2 || product.GSread(argv[1]) != 0 || !product.GSexists(gsOrbit)) return 1;
    constexpr std::size_t kLines = 500, kColumns = 2000, kCount = kLines * kColumns;
    std::vector<double> azimuth(kCount), range(kCount), latitude(kCount), longitude(kCount);
    for (std::size_t i = 0; i < kCount; ++i) {
        const std::size_t line = i / kColumns, column = i % kColumns;
        azimuth[i] = 1133090040.25 + 0.04 * static_cast<double>(line);  // s since 1985
        range[i] = 0.0053523 + 4.7e-7 * static_cast<double>(column);    // two-way range time, s
    }
    std::vector<std::int32_t> status(kCount);
    const auto geolocate = [&](std::size_t first, std::size_t count) {
        OrbitGround ground;  // null where something is not wanted
        ground.latitude_deg = &latitude[first];
        ground.longitude_deg = &longitude[first];
        ground.status = &status[first];
        product.orbit.sat2earth(OrbitSamples{count, &azimuth[first], &range[first]}, ground);
    };
    std::thread other{geolocate, 0, kCount / 2};  // pieces of any length, by any number of threads
    geolocate(kCount / 2, kCount / 2);
    other.join();
    for (const std::size_t i : {std::size_t{0}, kCount - 1})
        std::printf("%.7f N, %.7f E, status %d\n", latitude[i], longitude[i], status[i]);
}
