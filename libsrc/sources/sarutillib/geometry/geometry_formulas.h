// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_GEOMETRY_FORMULAS_H
#define QUO_GEOMETRY_FORMULAS_H

#include "sarutillib/geometry/lanes.h"

/* The formulas under the point solvers, for one point and for packs of points (lanes.h). V is a vector, T its
 * number. Metres, seconds, hertz and degrees; conventions as in quo_base/geometry.h and quo_base/gr_pt.h. Loops go
 * on until every lane is done; a lane that is done keeps what it has. */

namespace quo {

// --- Orbit segments ---------------------------------------------------------------------------------------------

/** Three position polynomials of five coefficients, highest degree first. */
template <class T>
struct SegmentOf {
    const T *x, *y, *z;
};
template <class V>
struct StateOf {
    V position, velocity, acceleration;
};

/** One coordinate of a segment with the coefficients of its derivatives, for more than one time. */
template <class T>
struct AxisMotionOf {
    T place[5], rate[3], bend[2];

    QUO_LANES_INLINE static constexpr AxisMotionOf of(const T* c) noexcept {
        return {{c[0], c[1], c[2], c[3], c[4]}, {4.0 * c[0], 3.0 * c[1], 2.0 * c[2]}, {12.0 * c[0], 6.0 * c[1]}};
    }
    [[nodiscard]] QUO_LANES_INLINE constexpr T position(T u) const noexcept {
        return (((place[0] * u + place[1]) * u + place[2]) * u + place[3]) * u + place[4];
    }
    [[nodiscard]] QUO_LANES_INLINE constexpr T velocity(T u) const noexcept {
        return ((rate[0] * u + rate[1]) * u + rate[2]) * u + place[3];
    }
    [[nodiscard]] QUO_LANES_INLINE constexpr T acceleration(T u) const noexcept {
        return (bend[0] * u + bend[1]) * u + rate[2];
    }
};
template <class T>
struct MotionOf {
    AxisMotionOf<T> x, y, z;
};
template <class T>
QUO_LANES_INLINE constexpr MotionOf<T> motion_of(const SegmentOf<T>& c) noexcept {
    return {AxisMotionOf<T>::of(c.x), AxisMotionOf<T>::of(c.y), AxisMotionOf<T>::of(c.z)};
}
template <class T>
QUO_LANES_INLINE constexpr const MotionOf<T>& motion_of(const MotionOf<T>& c) noexcept {
    return c;
}

// C is a segment or a motion.
template <class T, class C = SegmentOf<T>>
QUO_LANES_INLINE constexpr Vector<T> orbit_position(const C& curve, T u) noexcept {
    const auto& c = motion_of(curve);
    return {c.x.position(u), c.y.position(u), c.z.position(u)};
}
template <class T, class C = SegmentOf<T>>
QUO_LANES_INLINE constexpr Vector<T> orbit_velocity(const C& curve, T u) noexcept {
    const auto& c = motion_of(curve);
    return {c.x.velocity(u), c.y.velocity(u), c.z.velocity(u)};
}
template <class T, class C = SegmentOf<T>>
QUO_LANES_INLINE constexpr Vector<T> orbit_acceleration(const C& curve, T u) noexcept {
    const auto& c = motion_of(curve);
    return {c.x.acceleration(u), c.y.acceleration(u), c.z.acceleration(u)};
}
/** State at u seconds from the segment's reference time. */
template <class T, class C = SegmentOf<T>>
QUO_LANES_INLINE constexpr StateOf<Vector<T>> orbit_state(const C& c, T u) noexcept {
    return {orbit_position(c, u), orbit_velocity(c, u), orbit_acceleration(c, u)};
}

// --- The ellipsoid ----------------------------------------------------------------------------------------------

/** Gradient of (x^2 + y^2) / a^2 + z^2 / b^2, times a^2: along the outward normal where p lies on the surface. */
template <class V, class E>
QUO_LANES_INLINE constexpr V ellipsoid_gradient(const V& p, const E& e) noexcept {
    const auto stretch = (e.equatorial_m / e.polar_m) * (e.equatorial_m / e.polar_m);
    return {p.x, p.y, stretch * p.z};
}

/** The normal of the ellipsoid through a point, as a unit vector in the plane of the axis, and the point's height.
 */
template <class T>
struct GeodeticNormal {
    T out, up, height_m;
};

/** By a fixed point in the parametric latitude, exact at once on the surface itself and gaining two digits or more
 * a round elsewhere. Latitude is kept as a unit vector; no angle is formed. */
template <class V>
QUO_LANES_INLINE GeodeticNormal<NumberOf<V>> geodetic_normal(const V& p, double a, double b) noexcept {
    using T = NumberOf<V>;
    constexpr int kRounds = 10;
    const T least = fill<T>(kLeast);
    const T axis_distance = root(p.x * p.x + p.y * p.y);
    const double flat = a * a - b * b;
    T c = b * axis_distance, s = a * p.z;  // parametric latitude's cosine and sine, up to a factor
    T out = axis_distance, up = p.z;       // the normal's
    auto open = everywhere<MaskOf<T>>();
    for (int round = 0; round < kRounds && any(open); ++round) {
        const T length = at_least(root(c * c + s * s), least);
        const T unit_c = c / length, unit_s = s / length;
        out = select(open, at_least(axis_distance - flat / a * unit_c * unit_c * unit_c, T{}), out);
        up = select(open, p.z + flat / b * unit_s * unit_s * unit_s, up);
        c = a * out;
        s = b * up;
        open = but_not(open, magnitude(s * unit_c - c * unit_s) <= 1e-16 * (magnitude(s) + c));
    }
    const T length = at_least(root(out * out + up * up), least);
    out = out / length;
    up = up / length;
    return {out, up, axis_distance * out + p.z * up - root(a * a * out * out + b * b * up * up)};
}

// --- Forward: from range time and Doppler to the ground ---------------------------------------------------------

/** What a sample says about its target. */
template <class T>
struct RadarLookOf {
    T tau_s, fd_hz;
    double lambda_m;
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
template <class V>
struct LookCircleOf {
    using T = NumberOf<V>;
    V along, down, across;
    T radius2_m2;
    T base_m2, swing_m2, stretch, centre_z_m;

    /** The equation's left side and its derivative by t. */
    struct Level {
        T value, slope;
    };
    [[nodiscard]] QUO_LANES_INLINE constexpr Level level(T c, T s) const noexcept {
        const T z = centre_z_m + c * down.z + s * across.z;
        return {base_m2 + c * swing_m2 + stretch * z * z,
                2.0 * stretch * z * (c * across.z - s * down.z) - s * swing_m2};
    }
};

/** A place on a look circle. */
template <class T>
struct CirclePointOf {
    T c, s;
    /** Turned by the angle whose half has the tangent `half`: the pair keeps its length to rounding. */
    [[nodiscard]] QUO_LANES_INLINE constexpr CirclePointOf turned(T half) const noexcept {
        const T k = 2.0 / (1.0 + half * half);
        return {c - k * half * (half * c + s), s + k * half * (c - half * s)};
    }
};

/** Whether velocity, range and the rest are finite, and positive where they must be. */
template <class V, class E>
QUO_LANES_INLINE MaskOf<NumberOf<V>> usable_look(const V& S, const V& velocity,
                                                 const RadarLookOf<NumberOf<V>>& look, const E& e) noexcept {
    using T = NumberOf<V>;
    const T V2 = dot(velocity, velocity);
    const T all =
        S.x + S.y + S.z + V2 + look.tau_s + look.fd_hz + look.lambda_m + look.side + e.equatorial_m + e.polar_m;
    const MaskOf<T> known = both(magnitude(all) <= kMost, V2 > 0.0);
    const MaskOf<T> positive =
        both(both(look.tau_s > 0.0, fill<T>(look.lambda_m) > 0.0), both(e.equatorial_m > T{}, e.polar_m > T{}));
    return both(known, positive);
}

/** Fills `circle` for a velocity relative to the Earth. False for a Doppler beyond what the velocity allows, or
 * flight straight up or down. */
template <class V, class E>
QUO_LANES_INLINE MaskOf<NumberOf<V>> fill_look_circle(const V& S, const V& velocity,
                                                      const RadarLookOf<NumberOf<V>>& look, const E& e,
                                                      LookCircleOf<V>* circle) noexcept {
    using T = NumberOf<V>;
    const T V2 = dot(velocity, velocity);
    const T range = 0.5 * kLightSpeed * look.tau_s;
    const T range2 = range * range;
    // Fraction of the velocity that the centre of the circle lies ahead; its length is range times the sine of the
    // squint.
    const T ahead = 0.5 * look.lambda_m * look.fd_hz * range / V2;
    const T radius2 = range2 - ahead * ahead * V2;
    const T climb = dot(S, velocity);
    const V upright = S - (climb / V2) * velocity;
    const T upright2 = dot(upright, upright);
    constexpr double kSteepest2 =
        1e-18;  // squared cosine of the flight path's slope that still tells left from right
    const MaskOf<T> good = both(radius2 > 0.0, upright2 > kSteepest2 * dot(S, S));
    if constexpr (kLanes<T> == 1)
        if (!good) return good;

    const T scale = root(radius2 / upright2);
    const T sideways = (look.side < 0.0 ? -scale : scale) / root(V2);
    const auto a2 = e.equatorial_m * e.equatorial_m;
    circle->along = ahead * velocity;
    circle->down = -scale * upright;
    circle->across = sideways * cross(velocity, S);
    circle->radius2_m2 = radius2;
    circle->base_m2 = dot(S, S) + range2 + 2.0 * ahead * climb - a2;
    circle->swing_m2 = -2.0 * scale * upright2;
    circle->stretch = a2 / (e.polar_m * e.polar_m) - fill<T>(1.0);
    circle->centre_z_m = S.z + circle->along.z;
    return good;
}

/** Newton's method on a look circle. What is open is not yet done, what is found has settled on a crossing
 * outwards, on the look side; near the nadir it may fail to. */
template <class T>
struct CrossingOf {
    CirclePointOf<T> at;
    MaskOf<T> open, found;
};

/** The crossing with the sphere through the point beneath the platform, where `asked` holds, to begin with. */
template <class V, class E>
QUO_LANES_INLINE CrossingOf<NumberOf<V>> begin_crossing(const LookCircleOf<V>& circle, const V& S, const E& e,
                                                        MaskOf<NumberOf<V>> asked) noexcept {
    using T = NumberOf<V>;
    // |S|^2 less the squared radius of the ellipsoid in that direction, by way of |S|^2 / (a times the gradient).
    const auto a2 = e.equatorial_m * e.equatorial_m;
    const T nadir2 = a2 * dot(S, S) / dot(S, ellipsoid_gradient(S, e));
    const T first = (circle.base_m2 + a2 - nadir2) / -circle.swing_m2;
    const MaskOf<T> crosses = both(asked, magnitude(first) < 1.0);
    const T c = select(crosses, first, T{});
    return {{c, root(1.0 - c * c)}, crosses, MaskOf<T>{}};
}

template <class V>
QUO_LANES_INLINE void step_crossing(const LookCircleOf<V>& circle, CrossingOf<NumberOf<V>>& crossing) noexcept {
    using T = NumberOf<V>;
    // Within a centimetre Newton's next step reaches rounding; touch_down() takes it at the point itself.
    constexpr double kClose2 = 1e-4;  // m^2
    auto& [p, open, found] = crossing;
    const auto level = circle.level(p.c, p.s);
    const T turn = -level.value / level.slope;
    const CirclePointOf<T> next = p.turned(0.5 * turn);
    p = {select(open, next.c, p.c), select(open, next.s, p.s)};
    const MaskOf<T> settled = both(open, turn * turn * circle.radius2_m2 <= kClose2);
    found = either(found, both(settled, both(p.s > 0.0, level.slope > 0.0)));
    open = but_not(open, settled);
}

/** The ground point near a place on the circle. False where it lies beneath the platform's horizon.
 *
 * The last step works on the point's own coordinates: the circle's equation holds squares of the platform's, whose
 * rounding would show from high orbits. */
template <class V, class E>
QUO_LANES_INLINE MaskOf<NumberOf<V>> touch_down(const LookCircleOf<V>& circle, const V& S, const E& e,
                                                const CirclePointOf<NumberOf<V>>& at, V* P) noexcept {
    using T = NumberOf<V>;
    const auto a2 = e.equatorial_m * e.equatorial_m;
    const V tangent = at.c * circle.across - at.s * circle.down;
    const V p = S + (circle.along + at.c * circle.down + at.s * circle.across);
    const V gradient = ellipsoid_gradient(p, e);
    const T turn = 0.5 * (a2 - dot(p, gradient)) / dot(gradient, tangent);
    const MaskOf<T> small = turn * turn * circle.radius2_m2 <= kForwardStep2;
    *P = select_vector(small, p + turn * tangent, p);
    return dot(S, ellipsoid_gradient(*P, e)) > a2;
}

/** Heights of ground points are met within this, m, by so many lengthenings of the axes at most. */
inline constexpr double kHeightReach = 1e-7;
inline constexpr int kHeightRounds = 10;

// --- Inverse: from the ground to azimuth time and range time ----------------------------------------------------

/** Steps of the inverse solver at most, and the step at which it is done, s. */
inline constexpr int kInverseSteps = 8;
inline constexpr double kInverseStep = 1e-8;

/** How far a state is from seeing P with a range rate of lambda fd / 2, in m^2/s, and the derivative of that by
 * time. With D = P - S, R = |D| the residual is -V.D + (lambda fd / 2) R; the rotation of the Earth, added to
 * satellite and target, cancels in it. Its derivative is V.V - A.D - (lambda fd / 2) V.D / R. */
template <class T>
struct DopplerResidualOf {
    T value, slope, range2_m2;
};
template <class V>
QUO_LANES_INLINE DopplerResidualOf<NumberOf<V>> doppler_residual(const StateOf<V>& s, const V& P,
                                                                 NumberOf<V> range_rate_m_s) noexcept {
    using T = NumberOf<V>;
    const V line = P - s.position;
    const T range2 = dot(line, line);
    T value = -dot(s.velocity, line);
    T slope = dot(s.velocity, s.velocity) - dot(s.acceleration, line);
    if (any(range_rate_m_s != 0.0)) {  // the root stays out of the loop where the Doppler is zero
        const T range = root(range2);
        slope += range_rate_m_s * value / range;
        value += range_rate_m_s * range;
    }
    return {value, slope, range2};
}

template <class T>
struct TimeSpanOf {
    T first_s, last_s;
};

/** When a point is seen: time on a segment and two-way range time before the last step, whether that step was
 * shorter than kInverseStep, and whether all of it stayed in the span and finite. */
template <class T>
struct ImageTimeOf {
    T t_s, tau_s;
    MaskOf<T> settled, seen;
};

/** Newton's method in time: what is open is not yet done, what was seen has stayed in the span so far. */
template <class T>
struct TimeSearchOf {
    T t_s, range2_m2, slope;
    MaskOf<T> open, seen, settled;

    /** From a start, where `asked` holds. */
    QUO_LANES_INLINE static TimeSearchOf begin(T start_s, MaskOf<T> asked) noexcept {
        return {start_s, T{}, T{}, asked, asked, MaskOf<T>{}};
    }
    template <class C, class V>
    QUO_LANES_INLINE void step(const C& orbit, const V& P, const TimeSpanOf<T>& span, T range_rate_m_s) noexcept {
        const MaskOf<T> inside = both(t_s >= span.first_s, t_s <= span.last_s);
        seen = but_not(seen, but_not(open, inside));
        open = both(open, inside);
        if constexpr (kLanes<T> == 1)
            if (!open) return;
        const DopplerResidualOf<T> at = doppler_residual(orbit_state(orbit, t_s), P, range_rate_m_s);
        const T change = at.value / at.slope;
        t_s = select(open, t_s - change, t_s);
        range2_m2 = select(open, at.range2_m2, range2_m2);
        slope = select(open, at.slope, slope);
        const MaskOf<T> close = both(open, magnitude(change) < kInverseStep);
        settled = either(settled, close);
        open = but_not(open, close);
    }
    [[nodiscard]] QUO_LANES_INLINE ImageTimeOf<T> end() const noexcept {
        // A Doppler so large that the slope overflows makes a step of 0, which settles nothing.
        const MaskOf<T> known = both(magnitude(t_s) <= kMost, magnitude(slope) <= kMost);
        return {t_s, 2.0 / kLightSpeed * root(range2_m2), settled, both(seen, known)};
    }
};

// --- Geometry at a sample ---------------------------------------------------------------------------------------

/** Incidence angle of a P on the ellipsoid: between its outward normal and the line to the satellite. */
template <class V, class E>
QUO_LANES_INLINE NumberOf<V> incidence_deg(const V& S, const V& P, const E& e) noexcept {
    return angle_deg(ellipsoid_gradient(P, e), S - P);
}

/** Look angle: at S, between the direction to the Earth's centre and the line of sight. */
template <class V>
QUO_LANES_INLINE NumberOf<V> look_angle_deg(const V& S, const V& P) noexcept {
    return angle_deg(-1.0 * S, P - S);
}

/** d(Doppler)/dt of the fixed target P. With a rotation rate other than 0 state and target are taken as inertial,
 * the target turning with the Earth. */
template <class V>
QUO_LANES_INLINE NumberOf<V> fm_rate_hz_s(const StateOf<V>& s, const V& P, double lambda_m,
                                          double omega) noexcept {
    using T = NumberOf<V>;
    // With D the line of sight Doppler is -(2 / lambda) D.D' / |D|.
    const V D = P - s.position;
    const V D1 = V{-omega * P.y, omega * P.x, T{}} - s.velocity;
    const V D2 = V{-omega * omega * P.x, -omega * omega * P.y, T{}} - s.acceleration;
    const T range = norm(D), rate = dot(D, D1) / range;
    return -2.0 / lambda_m * (dot(D1, D1) + dot(D, D2) - rate * rate) / range;
}

}  // namespace quo

#endif
