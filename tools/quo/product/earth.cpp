#include "earth.h"

#include <cmath>
#include <numbers>

namespace tool {
namespace {

constexpr double kDegree = std::numbers::pi / 180.0;
constexpr double kE2 = 1.0 - (kSemiMinor / kSemiMajor) * (kSemiMinor / kSemiMajor);  // first eccentricity squared

double dot(const Vector& a, const Vector& b) { return a.v[0] * b.v[0] + a.v[1] * b.v[1] + a.v[2] * b.v[2]; }

Vector cross(const Vector& a, const Vector& b) {
    return {
        {a.v[1] * b.v[2] - a.v[2] * b.v[1], a.v[2] * b.v[0] - a.v[0] * b.v[2], a.v[0] * b.v[1] - a.v[1] * b.v[0]}};
}

}  // namespace

Vector operator-(const Vector& a, const Vector& b) {
    return {{a.v[0] - b.v[0], a.v[1] - b.v[1], a.v[2] - b.v[2]}};
}

double norm(const Vector& a) { return std::sqrt(dot(a, a)); }

double angle_deg(const Vector& a, const Vector& b) { return std::atan2(norm(cross(a, b)), dot(a, b)) / kDegree; }

Vector normal(const Geodetic& point) {
    const double latitude = point.latitude_deg * kDegree;
    const double longitude = point.longitude_deg * kDegree;
    return {
        {std::cos(latitude) * std::cos(longitude), std::cos(latitude) * std::sin(longitude), std::sin(latitude)}};
}

Vector position(const Geodetic& point) {
    const Vector up = normal(point);
    const double n = kSemiMajor / std::sqrt(1.0 - kE2 * up.v[2] * up.v[2]);  // prime vertical radius
    return {{(n + point.height_m) * up.v[0], (n + point.height_m) * up.v[1],
             (n * (1.0 - kE2) + point.height_m) * up.v[2]}};
}

// Latitude: B. R. Bowring, "Transformation from spatial to geographical coordinates", Survey Review 23(181), 1976.
// The height depends on the latitude's error only in second order.
double height_of(const Vector& point) {
    const double p = std::hypot(point.v[0], point.v[1]);
    const double z = point.v[2];
    const double reduced = std::atan2(z * kSemiMajor, p * kSemiMinor);
    const double s = std::sin(reduced);
    const double c = std::cos(reduced);
    const double latitude =
        std::atan2(z + kE2 / (1.0 - kE2) * kSemiMinor * s * s * s, p - kE2 * kSemiMajor * c * c * c);
    const double sine = std::sin(latitude);
    return p * std::cos(latitude) + z * sine - kSemiMajor * std::sqrt(1.0 - kE2 * sine * sine);
}

}  // namespace tool
