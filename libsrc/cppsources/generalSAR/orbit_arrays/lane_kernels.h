#ifndef QUO_LANE_KERNELS_H
#define QUO_LANE_KERNELS_H

#include "generalSAR/orbit_arrays/array_kernels.h"

/* The kernels of array_kernels.h, for packs T. Included once for every width, by a source with flags of its own.
 */

namespace quo {

template <class T>
struct LaneKernels {
    using V = PackVec3<T>;
    using Mask = MaskOf<T>;
    using Run = OrbitRunOf<T>;
    static constexpr int kWidth = kLanes<T>;

    QUO_LANES_INLINE static T load(const double* from) noexcept { return *reinterpret_cast<const T*>(from); }
    QUO_LANES_INLINE static void save(T value, double* to) noexcept { *reinterpret_cast<T*>(to) = value; }
    QUO_LANES_INLINE static void save(Mask value, std::int64_t* to) noexcept {
        *reinterpret_cast<Mask*>(to) = value;
    }

    // --- Runs ---------------------------------------------------------------------------------------------------

    QUO_LANES_INLINE static Run spread(const OrbitRun& from) noexcept {
        Run to;
        for (int j = 0; j < kRunVectors; ++j) {
            to.x[j] = fill<T>(from.x[j]);
            to.y[j] = fill<T>(from.y[j]);
            to.z[j] = fill<T>(from.z[j]);
        }
        to.chord = spread(from.chord);
        return to;
    }
    QUO_LANES_INLINE static StraightFlightOf<V> spread(const StraightFlight& from) noexcept {
        return {{fill<T>(from.axis.x), fill<T>(from.axis.y), fill<T>(from.axis.z)},
                fill<T>(from.speed_m_s),
                fill<T>(from.per_speed)};
    }
    QUO_LANES_INLINE static void put(const OrbitRun& from, int lane, Run& to) noexcept {
        for (int j = 0; j < kRunVectors; ++j) {
            to.x[j][lane] = from.x[j];
            to.y[j][lane] = from.y[j];
            to.z[j][lane] = from.z[j];
        }
        to.chord.axis.x[lane] = from.chord.axis.x;
        to.chord.axis.y[lane] = from.chord.axis.y;
        to.chord.axis.z[lane] = from.chord.axis.z;
        to.chord.speed_m_s[lane] = from.chord.speed_m_s;
        to.chord.per_speed[lane] = from.chord.per_speed;
    }
    /** Each lane's run; mostly they share one. */
    QUO_LANES_INLINE static Run gather(const OrbitRun* runs, T number) noexcept {
        Run to = spread(runs[static_cast<std::int32_t>(number[0])]);
        if (any(number != number[0]))
            for (int lane = 1; lane < kWidth; ++lane) put(runs[static_cast<std::int32_t>(number[lane])], lane, to);
        return to;
    }
    QUO_LANES_INLINE static RunInUseOf<T> spread(const RunInUse& run) noexcept {
        return {fill<T>(run.number), fill<T>(run.start_s), fill<T>(run.earliest_s), fill<T>(run.latest_s)};
    }

    // --- Forward ------------------------------------------------------------------------------------------------

    /** Ground points on the ellipsoid, where Newton's method finds them. */
    QUO_LANES_INLINE static Mask ground_points(const V& S, const V& velocity, const RadarLookOf<T>& look,
                                               const PackEllipsoid<T>& e, Mask asked, V* P) noexcept {
        LookCircleOf<V> circle{};
        CirclePointOf<T> at{};
        const Mask usable = both(asked, usable_look(S, velocity, look, e));
        if (!any(usable)) return usable;
        const Mask round = both(usable, fill_look_circle(S, velocity, look, e, &circle));
        if (!any(round)) return round;
        const Mask crossed = find_crossing(circle, S, e, round, &at);
        return both(crossed, touch_down(circle, S, e, at, P));
    }

    /** The same at heights: the axes are lengthened by what the points' heights then lack. */
    QUO_LANES_INLINE static Mask ground_points_at(T height_m, const V& S, const V& velocity,
                                                  const RadarLookOf<T>& look, const PackEllipsoid<T>& e,
                                                  Mask asked, V* P) noexcept {
        T longer = height_m;
        Mask open = asked, found = but_not(asked, asked);
        for (int round = 0; round < kHeightRounds && any(open); ++round) {
            V point{};
            open = ground_points(S, velocity, look, {e.equatorial_m + longer, e.polar_m + longer}, open, &point);
            const T height = geodetic_normal(point, kWgs84.equatorial_m, kWgs84.polar_m).height_m;
            const T lacking = height_m - height;
            const Mask close = both(open, magnitude(lacking) <= kHeightReach);
            *P = select_vector(close, point, *P);
            found = either(found, close);
            open = but_not(open, close);
            longer = longer + lacking;
        }
        return found;
    }

    QUO_LANES_INLINE static void place_of(const V& P, T height_m, const V& S, bool with_heights,
                                          ForwardBlock& block, int i) noexcept {
        const auto normal = geodetic_normal(P, kWgs84.equatorial_m, kWgs84.polar_m);
        if (block.want_place) {
            save(angle_of(normal.up, normal.out) * kDegPerRad, block.result[kLatitude] + i);
            save(angle_of(P.y, P.x) * kDegPerRad, block.result[kLongitude] + i);
            save(normal.height_m, block.result[kHeight] + i);
        }
        if (!block.want_angles) return;
        V up = ellipsoid_gradient(P, kWgs84);
        if (with_heights) {
            const T axis_distance = root(P.x * P.x + P.y * P.y);
            const Mask aside = axis_distance > 0.0;
            const T scale = normal.out / select(aside, axis_distance, fill<T>(1.0));
            up = select_vector(height_m == 0.0, up, {scale * P.x, scale * P.y, normal.up});
        }
        save(angle_deg(up, S - P), block.result[kIncidence] + i);
        save(look_angle_deg(S, P), block.result[kLook] + i);
    }

    /** One pack, from the i-th point of the block. */
    template <bool with_heights>
    QUO_LANES_INLINE static void forward_pack(const OrbitView& orbit, ForwardBlock& block, int i) noexcept {
        const T asked_t = load(block.t_s + i);
        const Mask known = magnitude(asked_t) <= kMost;
        const T t = select(known, asked_t, fill<T>(orbit.times.first_s));
        const RunInUseOf<T> in_use = next_run(orbit.times, spread(orbit.fresh), t);
        const Run run = gather(orbit.runs, in_use.number);
        const T u = t - in_use.start_s;
        const V S = orbit_position(run.curve(), u), velocity = orbit_velocity(run.curve(), u);

        const RadarLookOf<T> look{load(block.range_s + i), load(block.doppler_hz + i), orbit.lambda_m, orbit.side};
        const PackEllipsoid<T> earth{fill<T>(kWgs84.equatorial_m), fill<T>(kWgs84.polar_m)};
        V P{};
        T height_m{};
        Mask solved;
        if constexpr (with_heights) {
            height_m = load(block.height_m + i);
            solved = ground_points_at(height_m, S, velocity, look, earth, known, &P);
        } else {
            solved = ground_points(S, velocity, look, earth, known, &P);
        }
        save(P.x, block.result[kX] + i);
        save(P.y, block.result[kY] + i);
        save(P.z, block.result[kZ] + i);
        save(solved, block.solved + i);
        if (block.want_place || block.want_angles) place_of(P, height_m, S, with_heights, block, i);
        if (block.want_rate)
            save(fm_rate_hz_s(StateOf<V>{S, velocity, orbit_acceleration(run.curve(), u)}, P, orbit.lambda_m, 0.0),
                 block.result[kFmRate] + i);
        if (block.want_speed) save(norm(velocity), block.result[kSpeed] + i);
    }

    static void forward(const OrbitView& orbit, int count, ForwardBlock& block) noexcept {
        if (block.with_heights)
            for (int i = 0; i < count; i += kWidth) forward_pack<true>(orbit, block, i);
        else
            for (int i = 0; i < count; i += kWidth) forward_pack<false>(orbit, block, i);
    }

    // --- Inverse ------------------------------------------------------------------------------------------------

    /** First guesses, as times since the orbit's first vector; not finite where the speed does not allow the rate.
     */
    QUO_LANES_INLINE static T first_guess(const OrbitView& orbit, const V& P, T rate) noexcept {
        const double spacing = orbit.times.spacing_s;
        const Run fresh = spread(orbit.runs[static_cast<std::int32_t>(orbit.fresh.number)]);
        const T at_hand = fresh.chord.time_of(P - fresh.start(), rate, kFirstRoot);
        const Mask near = is_at_hand(orbit.times, at_hand);
        const T here = (orbit.fresh.start_s - orbit.times.first_s) + at_hand;
        if (!any(but_not(P.x == P.x, near))) return here;

        const V first = spread(orbit.runs[0]).start();
        const T coarse = spread(orbit.mean).time_of(P - first, rate, kFirstRoot) / spacing;
        const Mask known = magnitude(coarse) <= kMost;
        const T number = centred_run(orbit.times, select(known, coarse, T{}));
        const Run run = gather(orbit.runs, number);
        const T time = run.chord.time_of(P - run.start(), rate, kFirstRoot);
        return select(near, here, select(known, number * spacing + time, coarse));
    }

    /** One pack, from the i-th point of the block. */
    QUO_LANES_INLINE static void inverse_pack(const OrbitView& orbit, InverseBlock& block, int i) noexcept {
        const V asked{load(block.x_m + i), load(block.y_m + i), load(block.z_m + i)};
        const T asked_rate = 0.5 * orbit.lambda_m * load(block.doppler_hz + i);
        const Mask known = magnitude(asked.x + asked.y + asked.z + asked_rate) <= kMost;
        const V P = select_vector(known, asked, V{});
        const T rate = select(known, asked_rate, T{});

        const T since_first = first_guess(orbit, P, rate);
        Mask open = both(known, magnitude(since_first) <= kMost);
        T guess = orbit.times.first_s + select(open, since_first, T{});
        RunInUseOf<T> in_use = next_run(orbit.times, spread(orbit.fresh), guess);
        const T length = fill<T>(orbit.times.run_length());
        T t{}, range{};
        Mask found = but_not(open, open);
        // A guess at the edge of a run's middle leads out of it, where another run serves: once more there.
        for (int round = 0; round < 2 && any(open); ++round) {
            const Run run = gather(orbit.runs, in_use.number);
            const T start = clamped(guess - in_use.start_s, T{}, length);
            const ImageTimeOf<T> seen = find_image_time(run.curve(), P, start, {T{}, length}, rate, open);
            const Mask inside = both(seen.t_s >= 0.0, seen.t_s <= length);
            const Mask solved = both(both(seen.seen, seen.settled), inside);
            guess = in_use.start_s + seen.t_s;
            t = select(solved, guess, t);
            range = select(solved, seen.tau_s, range);
            found = either(found, solved);
            open = but_not(solved, both(guess >= in_use.earliest_s, guess <= in_use.latest_s));
            if (!any(open)) break;
            const T safe = select(open, guess, in_use.earliest_s);
            const RunInUseOf<T> next = next_run(orbit.times, in_use, safe);
            open = both(open, next.number != in_use.number);
            in_use = next;
        }
        save(t, block.t_s + i);
        save(range, block.range_s + i);
        save(found, block.solved + i);
    }

    static void inverse(const OrbitView& orbit, int count, InverseBlock& block) noexcept {
        for (int i = 0; i < count; i += kWidth) inverse_pack(orbit, block, i);
    }

    static constexpr ArrayKernels kTable{kWidth, forward, inverse};
};

}  // namespace quo

#endif
