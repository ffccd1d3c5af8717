// SPDX-License-Identifier: Apache-2.0
#include "sarutillib/geometry/geometry_kernels.h"

#include <numbers>

namespace quo {
namespace {

/** Level and slope at an angle, and the second derivative, for the searches. */
struct Curve {
    double value, slope, bend;
};
Curve curve_at(const LookCircle& circle, double angle) noexcept {
    const double c = std::cos(angle), s = std::sin(angle);
    const auto [value, slope] = circle.level(c, s);
    const double z = circle.centre_z_m + c * circle.down.z + s * circle.across.z;
    const double dz = c * circle.across.z - s * circle.down.z;
    const double ddz = circle.centre_z_m - z;
    return {value, slope, 2.0 * circle.stretch * (dz * dz + z * ddz) - c * circle.swing_m2};
}

/** Angle at which the circle dips deepest. The ellipsoid's flattening moves it only a little from where a term in
 * cos(t) and sin(t) alone would put it. */
double lowest_angle(const LookCircle& circle) noexcept {
    const double flat = 2.0 * circle.stretch * circle.centre_z_m;
    double angle = std::atan2(-flat * circle.across.z, -circle.swing_m2 - flat * circle.down.z);
    for (int step = 0; step < kForwardSteps; ++step) {
        const Curve at = curve_at(circle, angle);
        if (!(at.bend > 0.0)) break;
        const double change = at.slope / at.bend;
        angle -= change;
        if (!(std::abs(change) > 1e-12)) break;
    }
    return angle;
}

}  // namespace

bool search_crossing(const LookCircle& circle, CirclePoint* at) noexcept {
    double inside = lowest_angle(circle), outside = inside + std::numbers::pi;
    if (!(curve_at(circle, inside).value <= 0.0 && curve_at(circle, outside).value > 0.0)) return false;
    // Newton's step where it stays in the bracket, else halving: 200 of either are more than any bracket needs.
    double angle = 0.5 * (inside + outside);
    for (int step = 0; step < 200; ++step) {
        const Curve here = curve_at(circle, angle);
        (here.value <= 0.0 ? inside : outside) = angle;
        const double newton = angle - here.value / here.slope;
        const double next = newton > inside && newton < outside ? newton : 0.5 * (inside + outside);
        const bool settled = std::abs(next - angle) <= 1e-15;
        angle = next;
        if (settled) break;
    }
    *at = {std::cos(angle), std::sin(angle)};
    return at->s > 0.0;
}

int refine_ground_point(const Vec3& S, const Vec3& V, const RadarLook& look, double omega, const Ellipsoid& e,
                        Vec3* P) noexcept {
    const double range = 0.5 * kLightSpeed * look.tau_s;
    const double a2 = e.equatorial_m * e.equatorial_m;
    double before2 = std::numeric_limits<float>::max();  // so that the ratio cannot stop the first step
    for (int step = 1; step <= kForwardSteps; ++step) {
        const Vec3 D = *P - S;
        const Vec3 W{V.x + omega * P->y, V.y - omega * P->x, V.z};
        const double R = norm(D), closing = dot(W, D) / R;
        const Vec3 gradient = ellipsoid_gradient(*P, e);

        // Rows: squared range, Doppler times -lambda / 2, the ellipsoid times a^2. W itself changes with the
        // point.
        const double f1 = R * R - range * range;
        const double f2 = closing - 0.5 * look.lambda_m * look.fd_hz;
        const double f3 = dot(*P, gradient) - a2;
        const Vec3 r1 = 2.0 * D;
        const Vec3 r2 = 1.0 / R * (Vec3{W.x - omega * D.y, W.y + omega * D.x, W.z} - (closing / R) * D);
        const Vec3 r3 = 2.0 * gradient;

        // Cramer's rule: the columns of the inverse are the cross products of the rows over the determinant.
        const Vec3 r23 = cross(r2, r3);
        const Vec3 change = -1.0 / dot(r1, r23) * (f1 * r23 + f2 * cross(r3, r1) + f3 * cross(r1, r2));
        const double change2 = dot(change, change);
        if (!std::isfinite(change2)) return step - 1;
        *P = *P + change;
        if (change2 <= kForwardStep2 || before2 / change2 <= 2.0) return step;
        before2 = change2;
    }
    return kForwardSteps;
}

int ground_point_at_height(const Vec3& S, const Vec3& V, const RadarLook& look, double omega, double height_m,
                           const Ellipsoid& e, Vec3* P) noexcept {
    if (!(e.equatorial_m > 0.0 && e.polar_m > 0.0)) return QUO_REFUSED;  // the lengthened axes could be
    double longer_m = height_m;
    for (int round = 0; round < kHeightRounds; ++round) {
        Vec3 point;
        const Ellipsoid raised{e.equatorial_m + longer_m, e.polar_m + longer_m};
        if (const int status = turning_ground_point(S, V, look, omega, raised, &point)) return status;
        const double lacking_m = height_m - geodetic_normal(point, e.equatorial_m, e.polar_m).height_m;
        if (std::abs(lacking_m) <= kHeightReach) {
            *P = point;
            return QUO_OK;
        }
        longer_m += lacking_m;
    }
    return QUO_NUMERIC;
}

}  // namespace quo
