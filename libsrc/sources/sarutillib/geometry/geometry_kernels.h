#ifndef QUO_GEOMETRY_KERNELS_H
#define QUO_GEOMETRY_KERNELS_H

#include <cmath>
#include <limits>

#include "quo_base/geometry.h"

/* The geometry under the point solvers and the orbit model, without frames, reports or allocation. Metres,
 * seconds, hertz and degrees; conventions as in quo_base/geometry.h and quo_base/gr_pt.h. Outputs are written only
 * where 0 is returned. */

namespace quo {

// --- Orbit segments ---------------------------------------------------------------------------------------------

/** Three position polynomials of five coefficients, highest degree first. */
struct OrbitSegment {
    const double *x, *y, *z;
};
struct OrbitState {
    Vec3 position, velocity, acceleration;
};

constexpr double position_5(const double c[5], double u) noexcept {
    return (((c[0] * u + c[1]) * u + c[2]) * u + c[3]) * u + c[4];
}
constexpr double velocity_5(const double c[5], double u) noexcept {
    return ((4.0 * c[0] * u + 3.0 * c[1]) * u + 2.0 * c[2]) * u + c[3];
}
constexpr double acceleration_5(const double c[5], double u) noexcept {
    return (12.0 * c[0] * u + 6.0 * c[1]) * u + 2.0 * c[2];
}
constexpr Vec3 orbit_position(const OrbitSegment& c, double u) noexcept {
    return {position_5(c.x, u), position_5(c.y, u), position_5(c.z, u)};
}
constexpr Vec3 orbit_velocity(const OrbitSegment& c, double u) noexcept {
    return {velocity_5(c.x, u), velocity_5(c.y, u), velocity_5(c.z, u)};
}
constexpr Vec3 orbit_acceleration(const OrbitSegment& c, double u) noexcept {
    return {acceleration_5(c.x, u), acceleration_5(c.y, u), acceleration_5(c.z, u)};
}
/** State at u seconds from the segment's reference time. */
constexpr OrbitState orbit_state(const OrbitSegment& c, double u) noexcept {
    return {orbit_position(c, u), orbit_velocity(c, u), orbit_acceleration(c, u)};
}

// --- The ellipsoid ----------------------------------------------------------------------------------------------

/** Gradient of (x^2 + y^2) / a^2 + z^2 / b^2, times a^2: along the outward normal where p lies on the surface. */
constexpr Vec3 ellipsoid_gradient(const Vec3& p, const Ellipsoid& e) noexcept {
    const double stretch = (e.equatorial_m / e.polar_m) * (e.equatorial_m / e.polar_m);
    return {p.x, p.y, stretch * p.z};
}

// --- Forward: from range time and Doppler to the ground ---------------------------------------------------------

/** What a sample says about its target. */
struct RadarLook {
    double tau_s, fd_hz, lambda_m;
    double side;  // negative: left
};

/** Steps of the forward solvers at most, and the squared step at which they are done, m^2. */
inline constexpr int kForwardSteps = 20;
inline constexpr double kForwardStep2 = 1e-10;

/** The points at one range and Doppler, seen from one platform, together with the ellipsoid they are to meet.
 *
 * With a velocity relative to the Earth, range and Doppler fix a circle about the line of flight: the platform
 * plus along + cos(t) down + sin(t) across, where `down` is the radius nearest the Earth's centre and `across` the
 * one towards the look side (neither `along` nor `down` leaves the plane of position and velocity, so that across
 * is square to the position). Along it a^2 ((x^2 + y^2) / a^2 + z^2 / b^2 - 1) becomes base + cos(t) swing +
 * stretch z^2, one equation in one unknown. A point is given by cosine and sine of t. */
struct LookCircle {
    Vec3 along, down, across;
    double radius2_m2;
    double base_m2, swing_m2, stretch, centre_z_m;

    /** The equation's left side and its derivative by t. */
    struct Level {
        double value, slope;
    };
    [[nodiscard]] constexpr Level level(double c, double s) const noexcept {
        const double z = centre_z_m + c * down.z + s * across.z;
        return {base_m2 + c * swing_m2 + stretch * z * z,
                2.0 * stretch * z * (c * across.z - s * down.z) - s * swing_m2};
    }
};

/** A place on a look circle. */
struct CirclePoint {
    double c, s;
    /** Turned by the angle whose half has the tangent `half`: the pair keeps its length to rounding. */
    [[nodiscard]] constexpr CirclePoint turned(double half) const noexcept {
        const double k = 2.0 / (1.0 + half * half);
        return {c - k * half * (half * c + s), s + k * half * (c - half * s)};
    }
};

/** Fills `circle` for velocity V relative to the Earth. 1: an input that is not finite or must be positive and is
 * not, or no velocity; 10: Doppler beyond what the velocity allows, or flight straight up or down. */
inline int make_look_circle(const Vec3& S, const Vec3& V, const RadarLook& look, const Ellipsoid& e,
                            LookCircle* circle) noexcept {
    const double V2 = dot(V, V);
    const double all =
        S.x + S.y + S.z + V2 + look.tau_s + look.fd_hz + look.lambda_m + look.side + e.equatorial_m + e.polar_m;
    if (!(std::abs(all) <= std::numeric_limits<double>::max() && V2 > 0.0 && look.tau_s > 0.0 &&
          look.lambda_m > 0.0 && e.equatorial_m > 0.0 && e.polar_m > 0.0))
        return QUO_REFUSED;

    const double range = 0.5 * kLightSpeed * look.tau_s;
    const double range2 = range * range;
    // Fraction of the velocity that the centre of the circle lies ahead; its length is range times the sine of the
    // squint.
    const double ahead = 0.5 * look.lambda_m * look.fd_hz * range / V2;
    const double radius2 = range2 - ahead * ahead * V2;
    const double climb = dot(S, V);
    const Vec3 upright = S - (climb / V2) * V;
    const double upright2 = dot(upright, upright);
    constexpr double kSteepest2 =
        1e-18;  // squared cosine of the flight path's slope that still tells left from right
    if (!(radius2 > 0.0 && upright2 > kSteepest2 * dot(S, S))) return QUO_NUMERIC;

    const double scale = std::sqrt(radius2 / upright2);
    const double sideways = (look.side < 0.0 ? -scale : scale) / std::sqrt(V2);
    const double a2 = e.equatorial_m * e.equatorial_m;
    circle->along = ahead * V;
    circle->down = -scale * upright;
    circle->across = sideways * cross(V, S);
    circle->radius2_m2 = radius2;
    circle->base_m2 = dot(S, S) + range2 + 2.0 * ahead * climb - a2;
    circle->swing_m2 = -2.0 * scale * upright2;
    circle->stretch = a2 / (e.polar_m * e.polar_m) - 1.0;
    circle->centre_z_m = S.z + circle->along.z;
    return QUO_OK;
}

/** Finds where the circle leaves the ellipsoid on its look side, however near to the nadir or the horizon. False
 * where it never dips into the ellipsoid or leaves it on the other side only. */
bool search_crossing(const LookCircle& circle, CirclePoint* at) noexcept;

/** Newton's method from the crossing with the sphere through the point beneath the platform. False where it fails
 * to settle on a crossing outwards, on the look side: near the nadir. */
inline bool find_crossing(const LookCircle& circle, double first_cosine, CirclePoint* at) noexcept {
    // Within a centimetre Newton's next step reaches rounding; ground_point() takes it at the point itself.
    constexpr double kClose2 = 1e-4;  // m^2
    if (!(std::abs(first_cosine) < 1.0)) return false;
    CirclePoint p{first_cosine, std::sqrt(1.0 - first_cosine * first_cosine)};
    for (int step = 0; step < kForwardSteps; ++step) {
        const LookCircle::Level level = circle.level(p.c, p.s);
        const double turn = -level.value / level.slope;
        p = p.turned(0.5 * turn);
        if (turn * turn * circle.radius2_m2 <= kClose2) {
            *at = p;
            return p.s > 0.0 && level.slope > 0.0;
        }
    }
    return false;
}

/** Ground point for a velocity relative to the Earth. Returns the statuses of make_look_circle(), and 10 where the
 * range is shorter than the height or the target lies beyond the horizon.
 *
 * Meets the range and Doppler equations by construction, the ellipsoid's to rounding: where the range and Doppler
 * equations hold there is one unknown left (LookCircle). */
inline int ground_point(const Vec3& S, const Vec3& V, const RadarLook& look, const Ellipsoid& e,
                        Vec3* P) noexcept {
    LookCircle circle;
    if (const int status = make_look_circle(S, V, look, e, &circle)) return status;

    const double a2 = e.equatorial_m * e.equatorial_m;
    // |S|^2 less the squared radius of the ellipsoid in that direction, by way of |S|^2 / (a times the gradient).
    const double S2 = dot(S, S);
    const double nadir2 = a2 * S2 / dot(S, ellipsoid_gradient(S, e));
    const double first_cosine = (circle.base_m2 + a2 - nadir2) / -circle.swing_m2;
    CirclePoint at;
    if (!find_crossing(circle, first_cosine, &at) && !search_crossing(circle, &at)) return QUO_NUMERIC;

    // The last step works on the point's own coordinates: the circle's equation holds squares of the platform's,
    // whose rounding would show from high orbits.
    const Vec3 tangent = at.c * circle.across - at.s * circle.down;
    Vec3 p = S + (circle.along + at.c * circle.down + at.s * circle.across);
    const Vec3 gradient = ellipsoid_gradient(p, e);
    const double turn = 0.5 * (a2 - dot(p, gradient)) / dot(gradient, tangent);
    if (turn * turn * circle.radius2_m2 <= kForwardStep2) p = p + turn * tangent;

    if (!(dot(S, ellipsoid_gradient(p, e)) > a2)) return QUO_NUMERIC;  // beneath its own horizon
    *P = p;
    return QUO_OK;
}

/** The velocity relative to the Earth of a platform with inertial velocity V. It decides the Doppler of a ground
 * point alone, the point's own velocity need not be known: both differ by the rotation of the line between them,
 * which is square to it. */
constexpr Vec3 relative_velocity(const Vec3& S, const Vec3& V, double omega) noexcept {
    return {V.x + omega * S.y, V.y - omega * S.x, V.z};
}

/** Newton's method on the range, Doppler and ellipsoid equations for a velocity V to be corrected by omega: at
 * most kForwardSteps steps from P, done when a squared step is at most kForwardStep2 or no longer less than half
 * the one before. Returns the number of steps taken. A step that is not finite is not taken. */
int refine_ground_point(const Vec3& S, const Vec3& V, const RadarLook& look, double omega, const Ellipsoid& e,
                        Vec3* P) noexcept;

/** Ground point for a velocity to be corrected by omega, where that is not 0. Statuses of ground_point(). */
inline int turning_ground_point(const Vec3& S, const Vec3& V, const RadarLook& look, double omega,
                                const Ellipsoid& e, Vec3* P) noexcept {
    Vec3 point;
    if (const int status = ground_point(S, relative_velocity(S, V, omega), look, e, &point)) return status;
    if (omega != 0.0) refine_ground_point(S, V, look, omega, e, &point);
    *P = point;
    return QUO_OK;
}

/** The same at a height above the ellipsoid; see gr_pt_at_height(). */
int ground_point_at_height(const Vec3& S, const Vec3& V, const RadarLook& look, double omega, double height_m,
                           const Ellipsoid& e, Vec3* P) noexcept;

// --- Inverse: from the ground to azimuth time and range time ----------------------------------------------------

struct TimeSpan {
    double first_s, last_s;
};

/** Steps of the inverse solver at most, and the step at which it is done, s. */
inline constexpr int kInverseSteps = 8;
inline constexpr double kInverseStep = 1e-8;

/** How far a state is from seeing P with a range rate of lambda fd / 2, in m^2/s, and the derivative of that by
 * time. With D = P - S, R = |D| the residual is -V.D + (lambda fd / 2) R; the rotation of the Earth, added to
 * satellite and target, cancels in it. Its derivative is V.V - A.D - (lambda fd / 2) V.D / R. */
struct DopplerResidual {
    double value, slope, range2_m2;
};
inline DopplerResidual doppler_residual(const OrbitState& s, const Vec3& P, double range_rate_m_s) noexcept {
    const Vec3 line = P - s.position;
    const double range2 = dot(line, line);
    double value = -dot(s.velocity, line);
    double slope = dot(s.velocity, s.velocity) - dot(s.acceleration, line);
    if (range_rate_m_s != 0.0) {  // the root stays out of the loop where the Doppler is zero
        const double range = std::sqrt(range2);
        slope += range_rate_m_s * value / range;
        value += range_rate_m_s * range;
    }
    return {value, slope, range2};
}

/** When a point is seen: time on a segment and two-way range time before the last step, and whether that step was
 * shorter than kInverseStep. */
struct ImageTime {
    double t_s, tau_s;
    bool settled;
};

/** Time at which P is seen with Doppler fd, by Newton's method from `start_s`, and the range time before the last
 * step. 12 when an iterate but the last leaves the span or anything is not a number. Running out of steps is told
 * in the result alone.
 *
 * Targets seen close to either end need room beyond it: from the middle of a segment of 10 s spacing the first
 * iterate lands up to 0.1 s beside a solution at the end, at 60 s spacing up to 3 s. */
inline int image_time(const OrbitSegment& orbit, const Vec3& P, double start_s, const TimeSpan& span,
                      double lambda_m, double fd_hz, ImageTime* seen) noexcept {
    const double range_rate = 0.5 * lambda_m * fd_hz;
    double t = start_s, range2 = 0.0, slope = 0.0;
    bool settled = false;
    for (int step = 0; step < kInverseSteps && !settled; ++step) {
        if (!(t >= span.first_s && t <= span.last_s)) return QUO_NOT_SEEN;
        const DopplerResidual at = doppler_residual(orbit_state(orbit, t), P, range_rate);
        const double change = at.value / at.slope;
        t -= change;
        range2 = at.range2_m2;
        slope = at.slope;
        settled = std::abs(change) < kInverseStep;
    }
    // A Doppler so large that the slope overflows makes a step of 0, which settles nothing.
    if (!std::isfinite(t) || !std::isfinite(slope)) return QUO_NOT_SEEN;
    *seen = {t, 2.0 / kLightSpeed * std::sqrt(range2), settled};
    return QUO_OK;
}

// --- Geometry at a sample ---------------------------------------------------------------------------------------

/** Incidence angle of a P on the ellipsoid: between its outward normal and the line to the satellite. */
inline double incidence_deg(const Vec3& S, const Vec3& P, const Ellipsoid& e) noexcept {
    return angle_deg(ellipsoid_gradient(P, e), S - P);
}

/** Look angle: at S, between the direction to the Earth's centre and the line of sight. */
inline double look_angle_deg(const Vec3& S, const Vec3& P) noexcept { return angle_deg(-1.0 * S, P - S); }

/** d(Doppler)/dt of the fixed target P. With a rotation rate other than 0 state and target are taken as inertial,
 * the target turning with the Earth. */
inline double fm_rate_hz_s(const OrbitState& s, const Vec3& P, double lambda_m, double omega) noexcept {
    // With D the line of sight Doppler is -(2 / lambda) D.D' / |D|.
    const Vec3 D = P - s.position;
    const Vec3 D1 = Vec3{-omega * P.y, omega * P.x, 0.0} - s.velocity;
    const Vec3 D2 = Vec3{-omega * omega * P.x, -omega * omega * P.y, 0.0} - s.acceleration;
    const double range = norm(D), rate = dot(D, D1) / range;
    return -2.0 / lambda_m * (dot(D1, D1) + dot(D, D2) - rate * rate) / range;
}

/** Everything that is asked of the sample whose target is P, at a height. Above or below the ellipsoid its
 * gradient is no longer the normal of the place: at 9 km they are 5e-4 degrees apart. */
inline GrPtGeometry sample_geometry(const OrbitState& s, const Vec3& P, double height_m, double lambda_m,
                                    double omega, const Ellipsoid& e) noexcept {
    const GeodeticPoint place = to_geodetic(P, e);
    return {{P.x, P.y, P.z},
            place.latitude_deg,
            place.longitude_deg,
            height_m == 0.0 ? incidence_deg(s.position, P, e) : angle_deg(ellipsoid_normal(place), s.position - P),
            look_angle_deg(s.position, P),
            fm_rate_hz_s(s, P, lambda_m, omega),
            norm(s.velocity)};
}

}  // namespace quo

#endif
