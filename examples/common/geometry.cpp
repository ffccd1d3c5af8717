#include "geometry.h"

#include <cmath>
#include <numbers>

#include "quo_base/gr_pt.h"
#include "session.h"

namespace example {

double dot(const Point& a, const Point& b) { return a[0] * b[0] + a[1] * b[1] + a[2] * b[2]; }
double length(const Point& a) { return std::sqrt(dot(a, a)); }

Point geodetic_point(double latitude_deg, double longitude_deg, double height_m) {
    constexpr double kRadPerDeg = std::numbers::pi / 180.0;
    constexpr double kFlatness = kSemiMinor * kSemiMinor / (kSemiMajor * kSemiMajor);  // 1 - e^2
    const double sine = std::sin(latitude_deg * kRadPerDeg), cosine = std::cos(latitude_deg * kRadPerDeg);
    const double normal_m = kSemiMajor / std::sqrt(cosine * cosine + kFlatness * sine * sine);
    const double parallel_m = (normal_m + height_m) * cosine;
    return {parallel_m * std::cos(longitude_deg * kRadPerDeg), parallel_m * std::sin(longitude_deg * kRadPerDeg),
            (kFlatness * normal_m + height_m) * sine};
}

Point ground_point(GeneralSAROrbit& orbit, double azimuth_s, double range_s, double height_m) {
    Point point{};
    if (height_m == 0.0) {
        require(orbit.sat2earth(azimuth_s, range_s, point.data()), "a ground point");
        return point;
    }
    // The orbit's own functions know the ellipsoid alone; the solver below them takes one that is inflated by the
    // height, which misses the geodetic height by less than 1 cm per km.
    Point position, velocity;
    require(orbit.SVGetPos(azimuth_s, position.data()), "the orbit's position");
    require(orbit.SVGetVel(azimuth_s, velocity.data()), "the orbit's velocity");
    require(gr_pt(point.data(), position.data(), velocity.data(), range_s, 0.0, orbit.getLambda(), 0.0,
                  orbit.getLookSign(), kSemiMajor + height_m, kSemiMinor + height_m),
            "a ground point");
    return point;
}

double distance(GeneralSAROrbit& orbit, double azimuth_s, const Point& point) {
    Point position;
    require(orbit.SVGetPos(azimuth_s, position.data()), "the orbit's position");
    return length(point - position);
}

}  // namespace example
