#ifndef QUO_EXAMPLES_GEOMETRY_H
#define QUO_EXAMPLES_GEOMETRY_H

#include <array>

#include "quo_base/generalSARorbit.h"

namespace example {

inline constexpr double kLightSpeed = 299792458.0;    // m/s
inline constexpr double kSemiMajor = 6378137.0;       // WGS84, m
inline constexpr double kSemiMinor = 6356752.314245;  // WGS84, m

using Point = std::array<double, 3>;  // Earth-fixed x, y, z, m

inline Point operator-(const Point& a, const Point& b) { return {a[0] - b[0], a[1] - b[1], a[2] - b[2]}; }
double dot(const Point& a, const Point& b);
double length(const Point& a);

/** The point of a geodetic latitude and longitude, degrees, and a height above the ellipsoid, m. */
Point geodetic_point(double latitude_deg, double longitude_deg, double height_m);

/** The point at a height above the ellipsoid that is seen at zero Doppler; throws Failure where there is none. */
Point ground_point(GeneralSAROrbit& orbit, double azimuth_s, double range_s, double height_m);

/** The platform's distance from a point, m; throws Failure without an orbit. */
double distance(GeneralSAROrbit& orbit, double azimuth_s, const Point& point);

}  // namespace example

#endif
