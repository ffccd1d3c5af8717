#include "quo_base/geometry.h"

#include <algorithm>
#include <limits>

extern "C" void geodetic_to_xyz(const GeodeticPoint* place, double a, double b, double xyz[3]) noexcept {
    const quo::Vec3 up = quo::ellipsoid_normal(*place);
    const double e2 = 1.0 - (b / a) * (b / a);               // first eccentricity squared
    const double n = a / std::sqrt(1.0 - e2 * up.z * up.z);  // prime vertical radius
    quo::store(
        {(n + place->height_m) * up.x, (n + place->height_m) * up.y, (n * (1.0 - e2) + place->height_m) * up.z},
        xyz);
}

extern "C" void xyz_to_geodetic(const double xyz[3], double a, double b, GeodeticPoint* place) noexcept {
    // A fixed point in the parametric latitude, exact at once on the surface itself and gaining two digits or more
    // a round elsewhere. Latitude is kept as a unit vector; no angle is formed before the end.
    constexpr int kRounds = 10;
    const auto [x, y, z] = quo::load(xyz);
    const double axis_distance = std::sqrt(x * x + y * y);
    const double flat = a * a - b * b;
    double c = b * axis_distance, s = a * z;  // parametric latitude's cosine and sine, up to a factor
    double out = axis_distance, up = z;       // the normal's
    for (int round = 0; round < kRounds; ++round) {
        const double length = std::max(std::sqrt(c * c + s * s), std::numeric_limits<double>::min());
        c /= length;
        s /= length;
        out = std::max(axis_distance - flat / a * c * c * c, 0.0);
        up = z + flat / b * s * s * s;
        const double next_c = a * out, next_s = b * up;
        const bool settled = std::abs(next_s * c - next_c * s) <= 1e-16 * (std::abs(next_s) + next_c);
        c = next_c;
        s = next_s;
        if (settled) break;
    }
    const double length = std::max(std::sqrt(out * out + up * up), std::numeric_limits<double>::min());
    out /= length;
    up /= length;
    *place = {std::atan2(up, out) * quo::kDegPerRad, std::atan2(y, x) * quo::kDegPerRad,
              axis_distance * out + z * up - std::sqrt(a * a * out * out + b * b * up * up)};
}
