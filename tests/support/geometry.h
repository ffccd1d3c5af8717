// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_SUPPORT_GEOMETRY_H
#define QUO_TESTS_SUPPORT_GEOMETRY_H

#include <cmath>
#include <cstddef>
#include <numbers>

namespace test {

/** Vectors, the Earth and circular orbits, written without any help of the library that they are to judge.
 * Metres, seconds, degrees; Earth-fixed unless a name says inertial. */

inline constexpr double kLightSpeed = 299792458.0;          // m/s
inline constexpr double kSemiMajor = 6378137.0;             // WGS84, m
inline constexpr double kSemiMinor = 6356752.314245;        // WGS84, m
inline constexpr double kEarthRate = 7.292115189334571e-5;  // rad/s
inline constexpr double kGravity = 3.986004418e14;          // Earth's gravitational parameter, m^3/s^2
inline constexpr double kRadPerDeg = std::numbers::pi / 180.0;

struct Vec3 {
    double v[3];
    double& operator[](std::size_t i) { return v[i]; }
    double operator[](std::size_t i) const { return v[i]; }
};

inline Vec3 operator+(const Vec3& a, const Vec3& b) { return {a[0] + b[0], a[1] + b[1], a[2] + b[2]}; }
inline Vec3 operator-(const Vec3& a, const Vec3& b) { return {a[0] - b[0], a[1] - b[1], a[2] - b[2]}; }
inline Vec3 operator-(const Vec3& a) { return {-a[0], -a[1], -a[2]}; }
inline Vec3 operator*(double k, const Vec3& a) { return {k * a[0], k * a[1], k * a[2]}; }
inline double dot(const Vec3& a, const Vec3& b) { return a[0] * b[0] + a[1] * b[1] + a[2] * b[2]; }
inline double norm(const Vec3& a) { return std::sqrt(dot(a, a)); }
inline Vec3 unit(const Vec3& a) { return 1.0 / norm(a) * a; }
inline Vec3 cross(const Vec3& a, const Vec3& b) {
    return {a[1] * b[2] - a[2] * b[1], a[2] * b[0] - a[0] * b[2], a[0] * b[1] - a[1] * b[0]};
}
/** Angle between two directions, accurate for small and for right angles alike. */
inline double angle_deg(const Vec3& a, const Vec3& b) {
    return std::atan2(norm(cross(a, b)), dot(a, b)) / kRadPerDeg;
}
/** Turned about the z axis, counter-clockwise seen from the north. */
inline Vec3 turned(const Vec3& a, double angle_rad) {
    const double c = std::cos(angle_rad), s = std::sin(angle_rad);
    return {c * a[0] - s * a[1], s * a[0] + c * a[1], a[2]};
}

/** Directions at a place of the ellipsoid (geodetic latitude) or of a sphere (geocentric latitude). */
struct LocalFrame {
    Vec3 east, north, up;
};
inline LocalFrame local_frame(double latitude_deg, double longitude_deg) {
    const double lat = latitude_deg * kRadPerDeg, lon = longitude_deg * kRadPerDeg;
    return {{-std::sin(lon), std::cos(lon), 0.0},
            {-std::sin(lat) * std::cos(lon), -std::sin(lat) * std::sin(lon), std::cos(lat)},
            {std::cos(lat) * std::cos(lon), std::cos(lat) * std::sin(lon), std::sin(lat)}};
}

/** Place of geodetic coordinates over an ellipsoid, through the point of its surface with that normal. */
inline Vec3 geodetic_point(double latitude_deg, double longitude_deg, double height_m = 0.0, double a = kSemiMajor,
                           double b = kSemiMinor) {
    const Vec3 up = local_frame(latitude_deg, longitude_deg).up;
    const double k = 1.0 / std::sqrt(a * a * (up[0] * up[0] + up[1] * up[1]) + b * b * up[2] * up[2]);
    return Vec3{k * a * a * up[0], k * a * a * up[1], k * b * b * up[2]} + height_m * up;
}

/** Outward normal of the ellipsoid through p, not of unit length. */
inline Vec3 ellipsoid_gradient(const Vec3& p, double a = kSemiMajor, double b = kSemiMinor) {
    return {p[0] / (a * a), p[1] / (a * a), p[2] / (b * b)};
}

/** Signed distance from the ellipsoid, by the multiplier of the nearest-point problem: the foot of p is
 * (x a^2 / (a^2 + k), y a^2 / (a^2 + k), z b^2 / (b^2 + k)). For points not deep inside. */
inline double height_above_ellipsoid(const Vec3& p, double a = kSemiMajor, double b = kSemiMinor) {
    const double x2 = p[0] * p[0] + p[1] * p[1], z2 = p[2] * p[2];
    double k = 0.0;
    for (int step = 0; step < 100; ++step) {
        const double ka = a * a + k, kb = b * b + k;
        const double excess = x2 * a * a / (ka * ka) + z2 * b * b / (kb * kb) - 1.0;
        const double change = excess / (2.0 * (x2 * a * a / (ka * ka * ka) + z2 * b * b / (kb * kb * kb)));
        k += change;
        if (std::abs(change) < 1e-16 * a * a) break;
    }
    const Vec3 foot{p[0] * a * a / (a * a + k), p[1] * a * a / (a * a + k), p[2] * b * b / (b * b + k)};
    return k * norm(ellipsoid_gradient(foot, a, b));
}

/** State of a platform. Acceleration is the derivative of the velocity in the same frame. */
struct Platform {
    Vec3 position, velocity, acceleration;
};

/** Earth-fixed components and rates of an inertial state, the axes turned by omega t. */
inline Platform to_earth_fixed(const Platform& inertial, double t, double omega = kEarthRate) {
    const Vec3 spin{0.0, 0.0, omega};
    const Vec3 drag = cross(spin, inertial.position);
    const Vec3 velocity = inertial.velocity - drag;
    const Vec3 acceleration = inertial.acceleration - 2.0 * cross(spin, velocity) - cross(spin, drag);
    return {turned(inertial.position, -omega * t), turned(velocity, -omega * t), turned(acceleration, -omega * t)};
}

/** A circular orbit in the field of a point mass, at time 0 above a place (geocentric latitude) and with a heading
 * (from north, clockwise) of the inertial velocity. */
class CircularOrbit {
public:
    CircularOrbit(double latitude_deg, double longitude_deg, double heading_deg, double height_m = 693e3)
        : radius_m_{kSemiMajor + height_m} {
        const LocalFrame at = local_frame(latitude_deg, longitude_deg);
        const double heading = heading_deg * kRadPerDeg;
        outward_ = at.up;
        along_ = std::sin(heading) * at.east + std::cos(heading) * at.north;
    }
    [[nodiscard]] double angular_rate() const { return std::sqrt(kGravity / radius_m_) / radius_m_; }
    [[nodiscard]] Platform inertial(double t) const {
        const double rate = angular_rate(), c = std::cos(rate * t), s = std::sin(rate * t);
        const Vec3 out = c * outward_ + s * along_, on = c * along_ - s * outward_;
        return {radius_m_ * out, radius_m_ * rate * on, -radius_m_ * rate * rate * out};
    }
    [[nodiscard]] Platform earth_fixed(double t) const { return to_earth_fixed(inertial(t), t); }

private:
    double radius_m_;
    Vec3 outward_{}, along_{};
};

/** Earth-fixed state over a place of a circular orbit. */
inline Platform circular_orbit(double latitude_deg, double longitude_deg, double heading_deg,
                               double height_m = 693e3) {
    return CircularOrbit{latitude_deg, longitude_deg, heading_deg, height_m}.earth_fixed(0.0);
}

}  // namespace test

#endif
