// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_ORBIT_RUN_H
#define QUO_ORBIT_RUN_H

#include <cstdint>

#include "sarutillib/geometry/geometry_formulas.h"

/* The runs of an orbit model and which of them serves when, for one point and for packs of points (lanes.h). */

namespace quo {

/** A straight flight: unit vector and speed, both turned so that the speed has the sign of the velocity's x
 * component (positive for 0). The turn changes no time of travel; it decides which of two solutions comes first.
 */
template <class V>
struct StraightFlightOf {
    using T = NumberOf<V>;
    V axis;
    T speed_m_s;
    T per_speed;  // 1 / speed, 0 for a platform that stands still

    /** Time from the flight's start to one of the two places from which a target at d from the start, m, has the
     * range rate `rate_m_s` or its negative: the place further along the axis for turn 1, further back for -1. Not
     * finite where the speed does not allow the rate. */
    [[nodiscard]] QUO_LANES_INLINE T time_of(const V& d, T rate_m_s, double turn) const noexcept {
        const T along = dot(axis, d);
        if (!any(rate_m_s != 0.0)) return along * per_speed;
        // The cone of directions with that rate: the place lies as far along as the target is aside, times this.
        const T k = rate_m_s * rate_m_s * per_speed * per_speed;
        const T aside2 = dot(d, d) - along * along;
        return (along + turn * root(k * aside2 / (1.0 - k))) * per_speed;
    }
    /** Distance of that target after `time` seconds of flight, m. */
    [[nodiscard]] QUO_LANES_INLINE T distance(const V& d, T time) const noexcept {
        return norm(d - (time * speed_m_s) * axis);
    }
};
using StraightFlight = StraightFlightOf<Vec3>;

inline constexpr std::int32_t kRunVectors = 5;

/** A run of five state vectors: the curve through their positions in the time since the first, coefficients as in
 * interp_orb.h, and the chord from first to last. What one point needs stands together. */
template <class T>
struct OrbitRunOf {
    T x[kRunVectors], y[kRunVectors], z[kRunVectors];
    StraightFlightOf<Vector<T>> chord;

    [[nodiscard]] QUO_LANES_INLINE SegmentOf<T> curve() const noexcept { return {x, y, z}; }
    /** Position of the first vector, m. */
    [[nodiscard]] QUO_LANES_INLINE Vector<T> start() const noexcept { return {x[4], y[4], z[4]}; }
};
using OrbitRun = OrbitRunOf<double>;

/** When runs serve: the time of the first vector, the spacing, and the number of the last run. */
struct RunTimes {
    double first_s, spacing_s, last_run;

    [[nodiscard]] QUO_LANES_INLINE double run_length() const noexcept { return (kRunVectors - 1) * spacing_s; }
};

/** A run in use: its number, the time of its first vector, and the times for which it is kept. */
template <class T>
struct RunInUseOf {
    T number, start_s, earliest_s, latest_s;
};
using RunInUse = RunInUseOf<double>;

// A run is kept from this many spacings after its first vector to this many; beyond, another one is closer.
inline constexpr double kKeepFrom = 0.6, kKeepUntil = 3.4;

template <class T>
QUO_LANES_INLINE RunInUseOf<T> use_run(const RunTimes& times, T number) noexcept {
    const T start = times.first_s + number * times.spacing_s;
    return {number, start, start + kKeepFrom * times.spacing_s, start + kKeepUntil * times.spacing_s};
}

/** The run that suits a time t, which is finite, coming from one that does not. Where t left that one through its
 * early edge, the new one ends a little after t, otherwise it starts a little before, so that a sweep in either
 * direction can go on in it for as long as possible. */
template <class T>
QUO_LANES_INLINE T choose_run(const RunTimes& times, T from_start_s, T t) noexcept {
    const double last = times.last_run, edge = kKeepFrom * times.spacing_s;
    // Some numbers beyond the ends, so that rounding up and down have a whole number's room.
    const T lowest = fill<T>(-8.0), highest = fill<T>(last + 8.0);
    const T u = t - times.first_s;
    T k = rounded_down(clamped((u - edge) / times.spacing_s, lowest, highest));
    const MaskOf<T> early = magnitude(t - from_start_s) < edge;
    if (any(early)) k = select(early, rounded_up(clamped((u + edge) / times.spacing_s, lowest, highest)) - 4.0, k);
    k = select(u >= 0.0, k, T{});
    k = select(u > (last + (kRunVectors - 1)) * times.spacing_s, fill<T>(last), k);
    return clamped(k, T{}, fill<T>(last));
}

/** The run in use for a time, after `now`. */
template <class T>
QUO_LANES_INLINE RunInUseOf<T> next_run(const RunTimes& times, const RunInUseOf<T>& now, T t) noexcept {
    const MaskOf<T> keep = both(now.earliest_s <= t, t <= now.latest_s);
    if constexpr (kLanes<T> == 1)
        if (keep) return now;
    return use_run(times, select(keep, now.number, choose_run(times, now.start_s, t)));
}

/** The run with the vector nearest to a time in its middle, as far as there is one. `spacings` is finite. */
template <class T>
QUO_LANES_INLINE T centred_run(const RunTimes& times, T spacings) noexcept {
    const T inside = clamped(spacings, T{}, fill<T>(times.last_run + kRunVectors));
    return clamped(rounded(inside) - 2.0, T{}, fill<T>(times.last_run));
}

/** The first guess's two solutions lie to either side of the place abeam; which is right depends on the Doppler's
 * sign, the guess takes the one further along the signed flight direction. Newton's method mostly mends a wrong
 * choice within the run. */
inline constexpr double kFirstRoot = 1.0, kOtherRoot = -1.0;

/** Whether a first guess on a run alone will do, as a time since its start: it lies within a spacing of the run's
 * middle. A guess in low orbit is off by about a tenth of its distance from the middle: one that near would keep
 * the run with a guess on the whole orbit as well. */
template <class T>
QUO_LANES_INLINE MaskOf<T> is_at_hand(const RunTimes& times, T since_start_s) noexcept {
    return both(times.spacing_s <= since_start_s, since_start_s <= 3.0 * times.spacing_s);
}

}  // namespace quo

#endif
