// SPDX-License-Identifier: Apache-2.0
#include "quo_base/geometry.h"

#include "sarutillib/geometry/geometry_formulas.h"

extern "C" void geodetic_to_xyz(const GeodeticPoint* place, double a, double b, double xyz[3]) noexcept {
    const quo::Vec3 up = quo::ellipsoid_normal(*place);
    const double e2 = 1.0 - (b / a) * (b / a);               // first eccentricity squared
    const double n = a / std::sqrt(1.0 - e2 * up.z * up.z);  // prime vertical radius
    quo::store(
        {(n + place->height_m) * up.x, (n + place->height_m) * up.y, (n * (1.0 - e2) + place->height_m) * up.z},
        xyz);
}

extern "C" void xyz_to_geodetic(const double xyz[3], double a, double b, GeodeticPoint* place) noexcept {
    const quo::Vec3 p = quo::load(xyz);
    const auto [out, up, height_m] = quo::geodetic_normal(p, a, b);
    *place = {std::atan2(up, out) * quo::kDegPerRad, std::atan2(p.y, p.x) * quo::kDegPerRad, height_m};
}
