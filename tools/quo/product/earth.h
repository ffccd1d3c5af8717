#ifndef QUO_TOOL_EARTH_H
#define QUO_TOOL_EARTH_H

namespace tool {

constexpr double kSemiMajor = 6378137.0;       ///< WGS84 equatorial semi-axis, m
constexpr double kSemiMinor = 6356752.314245;  ///< WGS84 polar semi-axis, m
constexpr double kLightSpeed = 299792458.0;    ///< m/s

/** A position or direction, Earth-fixed. */
struct Vector {
    double v[3];
};

/** Geodetic coordinates on the WGS84 ellipsoid. */
struct Geodetic {
    double latitude_deg, longitude_deg, height_m;
};

Vector operator-(const Vector& a, const Vector& b);
double norm(const Vector& a);
/** Angle between two directions, degrees, accurate for small angles too. */
double angle_deg(const Vector& a, const Vector& b);

Vector position(const Geodetic& point);
/** Height above the ellipsoid of a point no further than some hundred km from its surface, to better than 1e-6 m.
 */
double height_of(const Vector& point);
/** The outward unit normal of the ellipsoid at geodetic coordinates. */
Vector normal(const Geodetic& point);

}  // namespace tool

#endif
