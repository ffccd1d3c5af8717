// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_GEOMETRY_H
#define QUO_BASE_GEOMETRY_H

#include "quo_base/api.h"
#include "quo_base/gr_pt.h"

#ifdef __cplusplus
#include <cmath>
#include <numbers>
#endif

/** @file
 * The Earth of all geolocation: its constants, geodetic coordinates, the ground point at a height; for C++
 * programs vectors too. What is asked of one image sample stands together in GrPtGeometry.
 *
 * Positions are Earth-fixed x, y, z in metres, z along the Earth's axis and x in the plane of longitude 0.
 * Latitude is geodetic, from -90 to 90 degrees with north positive; longitude is positive to the east; height is
 * measured along the normal of the ellipsoid, which has semi-axes a (equatorial) and b (polar), both positive.
 * Nothing is kept between calls: any number of threads may call at a time. */

/** Speed of light, m/s: BIPM, "The International System of Units", 9th edition, 2019. */
#define QUO_LIGHT_SPEED_M_S 299792458.0
/** Equatorial semi-axis of the WGS84 ellipsoid, m: NIMA, "Department of Defense World Geodetic System 1984",
 * TR8350.2, 3rd edition, 2000. */
#define QUO_WGS84_EQUATORIAL_M 6378137.0
/** Polar semi-axis of the WGS84 ellipsoid, m, from the same source, to a micrometre. */
#define QUO_WGS84_POLAR_M 6356752.314245

QUO_BASE_C_BEGIN

/** A place in geodetic coordinates. */
typedef struct GeodeticPoint {
    double latitude_deg;  /**< -90 to 90 */
    double longitude_deg; /**< -180 to 180 as the library gives it; any as it takes it */
    double height_m;      /**< above the ellipsoid */
} GeodeticPoint;

/** Writes the position of a place to `xyz`. Values that are not finite give a position that is not. */
QUO_BASE_API void geodetic_to_xyz(const GeodeticPoint* place, double a, double b, double xyz[3]) QUO_NOEXCEPT;

/** Writes the place of a position to `place`; longitude 0 on the axis.
 *
 * Good to the rounding of the position from 50 km beside the Earth's centre to any height; nearer to the centre
 * the numbers are finite and mean nothing. Latitude by a fixed point in the parametric latitude: B. R. Bowring,
 * "Transformation from spatial to geographical coordinates", Survey Review 23(181), 1976. */
QUO_BASE_API void xyz_to_geodetic(const double xyz[3], double a, double b, GeodeticPoint* place) QUO_NOEXCEPT;

/** Ground point seen at one range time and Doppler, at a height above the ellipsoid.
 *
 * The same as gr_pt() for a height of 0, to the bit, and otherwise on the surface of that geodetic height: range,
 * Doppler and height are met within 1e-7 m or the rounding of the platform's coordinates. That surface is no
 * ellipsoid, but on the Earth it differs by at most 1.4 mm per kilometre of height from the one whose axes are as
 * much longer; so the axes are lengthened by what the point's height then lacks, up to ten times.
 *
 * @param[out] P       ground point; unchanged unless 0 is returned
 * @param[in]  S, V, tau, fd, lambda, omega, side  as for gr_pt()
 * @param[in]  height  m, above -b
 * @param[in]  a, b    equatorial and polar semi-axes, m, > 0
 * @return 0, or the status of gr_pt0(), passed on with an ERROR_CALL_TREE entry: 1 also for a height that is not
 *         finite or not above -b, 10 also where the point's height does not settle. */
QUO_BASE_API int gr_pt_at_height(double P[3], const double S[3], const double V[3], double tau, double fd,
                                 double lambda, double omega, double side, double height, double a,
                                 double b) QUO_NOEXCEPT;

QUO_BASE_C_END

#ifdef __cplusplus
namespace quo {

/** Speed of light, m/s. */
inline constexpr double kLightSpeed = QUO_LIGHT_SPEED_M_S;
/** Degrees of a radian. */
inline constexpr double kDegPerRad = 180.0 / std::numbers::pi;

/** A position or direction. */
struct Vec3 {
    /** Earth-fixed; m, for positions. */
    double x, y, z;
};
/** Sum. */
constexpr Vec3 operator+(const Vec3& a, const Vec3& b) noexcept { return {a.x + b.x, a.y + b.y, a.z + b.z}; }
/** Difference. */
constexpr Vec3 operator-(const Vec3& a, const Vec3& b) noexcept { return {a.x - b.x, a.y - b.y, a.z - b.z}; }
/** Multiple. */
constexpr Vec3 operator*(double k, const Vec3& a) noexcept { return {k * a.x, k * a.y, k * a.z}; }
/** Scalar product. */
constexpr double dot(const Vec3& a, const Vec3& b) noexcept { return a.x * b.x + a.y * b.y + a.z * b.z; }
/** Vector product. */
constexpr Vec3 cross(const Vec3& a, const Vec3& b) noexcept {
    return {a.y * b.z - a.z * b.y, a.z * b.x - a.x * b.z, a.x * b.y - a.y * b.x};
}
/** Length. */
inline double norm(const Vec3& a) noexcept { return std::sqrt(dot(a, a)); }
/** Angle between two directions, 0 to 180 degrees, accurate near 0 and 180 too. */
inline double angle_deg(const Vec3& a, const Vec3& b) noexcept {
    return std::atan2(norm(cross(a, b)), dot(a, b)) * kDegPerRad;
}
/** The vector in an array as the library's calls take it. */
constexpr Vec3 load(const double v[3]) noexcept { return {v[0], v[1], v[2]}; }
/** Writes the vector to such an array. */
constexpr void store(const Vec3& a, double v[3]) noexcept {
    v[0] = a.x;
    v[1] = a.y;
    v[2] = a.z;
}

/** An ellipsoid about the Earth's centre and axis. */
struct Ellipsoid {
    /** Semi-axes, m. */
    double equatorial_m, polar_m;
};
/** The ellipsoid of all geolocation on an orbit. */
inline constexpr Ellipsoid kWgs84{QUO_WGS84_EQUATORIAL_M, QUO_WGS84_POLAR_M};

/** The outward unit normal of the ellipsoid, whichever it is, at geodetic coordinates. */
inline Vec3 ellipsoid_normal(const GeodeticPoint& place) noexcept {
    constexpr double kRadPerDeg = std::numbers::pi / 180.0;
    const double latitude = place.latitude_deg * kRadPerDeg, longitude = place.longitude_deg * kRadPerDeg;
    return {std::cos(latitude) * std::cos(longitude), std::cos(latitude) * std::sin(longitude),
            std::sin(latitude)};
}
/** As geodetic_to_xyz(). */
inline Vec3 from_geodetic(const GeodeticPoint& place, const Ellipsoid& e = kWgs84) noexcept {
    double xyz[3];
    geodetic_to_xyz(&place, e.equatorial_m, e.polar_m, xyz);
    return load(xyz);
}
/** As xyz_to_geodetic(). */
inline GeodeticPoint to_geodetic(const Vec3& p, const Ellipsoid& e = kWgs84) noexcept {
    const double xyz[3] = {p.x, p.y, p.z};
    GeodeticPoint place;
    xyz_to_geodetic(xyz, e.equatorial_m, e.polar_m, &place);
    return place;
}

}  // namespace quo
#endif

#endif
