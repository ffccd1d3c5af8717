// SPDX-License-Identifier: Apache-2.0
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
    using Motion = MotionOf<T>;
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
    QUO_LANES_INLINE static Motion gathered_motion(const OrbitRun* runs, T number) noexcept {
        return motion_of(gather(runs, number).curve());
    }
    QUO_LANES_INLINE static RunInUseOf<T> spread(const RunInUse& run) noexcept {
        return {fill<T>(run.number), fill<T>(run.start_s), fill<T>(run.earliest_s), fill<T>(run.latest_s)};
    }

    // --- Forward ------------------------------------------------------------------------------------------------
    //
    // In stages, each over all packs of a block before the next begins: the steps of one pack wait for each other,
    // those of several keep the processor busy.

    /** A pack of samples on its way to the ground. */
    struct Sample {
        V S, velocity, acceleration;  // the last where the FM rate is wanted
        T tau_s, fd_hz;
        T longer_m;  // by which the axes of the Earth are lengthened
        LookCircleOf<V> circle;
        CrossingOf<T> crossing;
        V P;
        Mask open, solved;
    };
    static constexpr int kPacks = kBlockPoints / kWidth;
    static_assert(kBlockPoints % kWidth == 0);

    /** Times of the samples, which are finite. */
    QUO_LANES_INLINE static T times_of(const OrbitView& orbit, const ForwardBlock& block, int i) noexcept {
        const T t = load(block.t_s + i);
        return select(magnitude(t) <= kMost, t, fill<T>(orbit.times.first_s));
    }
    QUO_LANES_INLINE static void place(const ForwardBlock& block, int i, const Motion& motion, T u,
                                       Sample& sample) noexcept {
        sample.open = magnitude(load(block.t_s + i)) <= kMost;
        sample.solved = Mask{};
        sample.P = V{};
        sample.S = orbit_position(motion, u);
        sample.velocity = orbit_velocity(motion, u);
        sample.tau_s = load(block.range_s + i);
        sample.fd_hz = load(block.doppler_hz + i);
        if (block.want_rate) sample.acceleration = orbit_acceleration(motion, u);
    }

    /** The run that serves the earliest and the latest time of a block, where it serves for all between as well:
     * from the place where the fresh run leaves off, the choice rises with time. */
    QUO_LANES_INLINE static bool share_run(const OrbitView& orbit, const ForwardBlock& block, int packs,
                                           RunInUseOf<T>* shared) noexcept {
        T earliest = times_of(orbit, block, 0), latest = earliest;
        for (int i = 1; i < packs; ++i) {
            const T t = times_of(orbit, block, i * kWidth);
            earliest = select(t < earliest, t, earliest);
            latest = select(t > latest, t, latest);
        }
        double first = earliest[0], last = latest[0];
        for (int lane = 1; lane < kWidth; ++lane) {
            first = earliest[lane] < first ? earliest[lane] : first;
            last = latest[lane] > last ? latest[lane] : last;
        }
        const RunInUse& fresh = orbit.fresh;
        const bool before = last < fresh.start_s - kKeepFrom * orbit.times.spacing_s;
        const bool kept = first >= fresh.earliest_s && last <= fresh.latest_s;
        *shared = next_run(orbit.times, spread(fresh), fill<T>(first));
        return (before || kept) &&
               next_run(orbit.times, spread(fresh), fill<T>(last)).number[0] == shared->number[0];
    }
    QUO_LANES_INLINE static void place_all(const OrbitView& orbit, const ForwardBlock& block, int packs,
                                           Sample* samples) noexcept {
        RunInUseOf<T> in_use;
        if (share_run(orbit, block, packs, &in_use)) {
            const Motion motion = gathered_motion(orbit.runs, in_use.number);
            for (int i = 0; i < packs; ++i)
                place(block, i * kWidth, motion, times_of(orbit, block, i * kWidth) - in_use.start_s, samples[i]);
            return;
        }
        for (int i = 0; i < packs; ++i) {
            const T t = times_of(orbit, block, i * kWidth);
            in_use = next_run(orbit.times, spread(orbit.fresh), t);
            place(block, i * kWidth, gathered_motion(orbit.runs, in_use.number), t - in_use.start_s, samples[i]);
        }
    }

    /** The ellipsoid that a sample is to meet. */
    template <bool with_heights>
    QUO_LANES_INLINE static PackEllipsoid<T> earth_of(const Sample& sample) noexcept {
        if constexpr (with_heights)
            return PackEllipsoid<T>{kWgs84.equatorial_m + sample.longer_m, kWgs84.polar_m + sample.longer_m};
        else
            return PackEllipsoid<T>{fill<T>(kWgs84.equatorial_m), fill<T>(kWgs84.polar_m)};
    }
    /** The circle that range and Doppler leave, and where the search on it begins. */
    template <bool with_heights>
    QUO_LANES_INLINE static void aim(const OrbitView& orbit, Sample& sample) noexcept {
        const RadarLookOf<T> look{sample.tau_s, sample.fd_hz, orbit.lambda_m, orbit.side};
        const PackEllipsoid<T> e = earth_of<with_heights>(sample);
        const Mask usable = usable_look(sample.S, sample.velocity, look, e);
        const Mask round = fill_look_circle(sample.S, sample.velocity, look, e, &sample.circle);
        sample.crossing = begin_crossing(sample.circle, sample.S, e, both(sample.open, both(usable, round)));
    }
    /** The steps of all packs together, until each is done. */
    QUO_LANES_INLINE static void turn(Sample* samples, int packs) noexcept {
        bool open = true;
        for (int step = 0; step < kForwardSteps && open; ++step) {
            open = false;
            for (int i = 0; i < packs; ++i) {
                if (!any(samples[i].crossing.open)) continue;
                step_crossing(samples[i].circle, samples[i].crossing);
                open = true;
            }
        }
    }
    /** The points found. Open stays what does not lie at its height yet: the axes are lengthened by what it lacks.
     */
    template <bool with_heights>
    QUO_LANES_INLINE static void land(const ForwardBlock& block, int i, Sample& sample) noexcept {
        V P;
        const Mask seen =
            both(sample.crossing.found,
                 touch_down(sample.circle, sample.S, earth_of<with_heights>(sample), sample.crossing.at, &P));
        Mask close = seen;
        if constexpr (with_heights) {
            const T height = geodetic_normal(P, kWgs84.equatorial_m, kWgs84.polar_m).height_m;
            const T lacking = load(block.height_m + i) - height;
            close = both(seen, magnitude(lacking) <= kHeightReach);
            sample.longer_m = sample.longer_m + lacking;
        }
        sample.P = select_vector(close, P, sample.P);
        sample.solved = either(sample.solved, close);
        sample.open = but_not(seen, close);
    }

    /** Place and angles of the points. Off the ellipsoid its gradient is not the normal of the place. */
    QUO_LANES_INLINE static void place_of(const V& P, T height_m, const V& S, ForwardBlock& block,
                                          int i) noexcept {
        const auto normal = geodetic_normal(P, kWgs84.equatorial_m, kWgs84.polar_m);
        if (block.want_place) {
            save(angle_of(normal.up, normal.out) * kDegPerRad, block.result[kLatitude] + i);
            save(angle_of(P.y, P.x) * kDegPerRad, block.result[kLongitude] + i);
            save(normal.height_m, block.result[kHeight] + i);
        }
        if (!block.want_angles) return;
        V up = ellipsoid_gradient(P, kWgs84);
        if (block.with_heights) {
            const T axis_distance = root(P.x * P.x + P.y * P.y);
            const Mask aside = axis_distance > 0.0;
            const T scale = normal.out / select(aside, axis_distance, fill<T>(1.0));
            up = select_vector(height_m == 0.0, up, {scale * P.x, scale * P.y, normal.up});
        }
        save(angle_deg(up, S - P), block.result[kIncidence] + i);
        save(look_angle_deg(S, P), block.result[kLook] + i);
    }
    QUO_LANES_INLINE static void tell(const OrbitView& orbit, ForwardBlock& block, int i,
                                      const Sample& sample) noexcept {
        save(sample.P.x, block.result[kX] + i);
        save(sample.P.y, block.result[kY] + i);
        save(sample.P.z, block.result[kZ] + i);
        save(sample.solved, block.solved + i);
        const T height_m = block.with_heights ? load(block.height_m + i) : T{};
        if (block.want_place || block.want_angles) place_of(sample.P, height_m, sample.S, block, i);
        if (block.want_rate)
            save(fm_rate_hz_s(StateOf<V>{sample.S, sample.velocity, sample.acceleration}, sample.P, orbit.lambda_m,
                              0.0),
                 block.result[kFmRate] + i);
        if (block.want_speed) save(norm(sample.velocity), block.result[kSpeed] + i);
    }

    template <bool with_heights>
    static bool forward_block(const OrbitView& orbit, int count, ForwardBlock& block) noexcept {
        Sample samples[kPacks];
        const int packs = (count + kWidth - 1) / kWidth;
        place_all(orbit, block, packs, samples);
        if constexpr (with_heights)
            for (int i = 0; i < packs; ++i) samples[i].longer_m = load(block.height_m + i * kWidth);
        bool open = true;
        for (int round = 0; round < kHeightRounds && open; ++round) {
            for (int i = 0; i < packs; ++i) aim<with_heights>(orbit, samples[i]);
            turn(samples, packs);
            open = false;
            for (int i = 0; i < packs; ++i) {
                land<with_heights>(block, i * kWidth, samples[i]);
                open = open || any(samples[i].open);
            }
        }
        auto solved = everywhere<Mask>();
        for (int i = 0; i < packs; ++i) {
            tell(orbit, block, i * kWidth, samples[i]);
            solved = both(solved, samples[i].solved);
        }
        return all(solved);
    }

    static bool forward(const OrbitView& orbit, int count, ForwardBlock& block) noexcept {
        return block.with_heights ? forward_block<true>(orbit, count, block)
                                  : forward_block<false>(orbit, count, block);
    }

    // --- Inverse ------------------------------------------------------------------------------------------------

    /** First guesses, as times since the orbit's first vector; not finite where the speed forbids the rate. */
    QUO_LANES_INLINE static T first_guess(const OrbitView& orbit, const V& P, T rate) noexcept {
        const double spacing = orbit.times.spacing_s;
        const Run fresh = spread(orbit.runs[static_cast<std::int32_t>(orbit.fresh.number)]);
        const T at_hand = fresh.chord.time_of(P - fresh.start(), rate, kFirstRoot);
        const Mask near = is_at_hand(orbit.times, at_hand);
        const T here = (orbit.fresh.start_s - orbit.times.first_s) + at_hand;
        if (all(near)) return here;

        const V first = spread(orbit.runs[0]).start();
        const T coarse = spread(orbit.mean).time_of(P - first, rate, kFirstRoot) / spacing;
        const Mask known = magnitude(coarse) <= kMost;
        const T number = centred_run(orbit.times, select(known, coarse, T{}));
        const Run run = gather(orbit.runs, number);
        const T time = run.chord.time_of(P - run.start(), rate, kFirstRoot);
        return select(near, here, select(known, number * spacing + time, coarse));
    }

    /** A pack of ground points on its way to the times at which they are seen. */
    struct Search {
        V P;
        T rate_m_s;
        RunInUseOf<T> in_use;
        const Motion* motion;
        TimeSearchOf<T> newton;
        T guess_s;  // absolute
        T t_s, range_s;
        Mask open, found;
    };

    QUO_LANES_INLINE static void begin(const OrbitView& orbit, const InverseBlock& block, int i,
                                       Search& search) noexcept {
        const V asked{load(block.x_m + i), load(block.y_m + i), load(block.z_m + i)};
        const T asked_rate = 0.5 * orbit.lambda_m * load(block.doppler_hz + i);
        const Mask known = magnitude(asked.x + asked.y + asked.z + asked_rate) <= kMost;
        search.P = select_vector(known, asked, V{});
        search.rate_m_s = select(known, asked_rate, T{});
        const T since_first = first_guess(orbit, search.P, search.rate_m_s);
        search.open = both(known, magnitude(since_first) <= kMost);
        search.found = Mask{};
        search.guess_s = orbit.times.first_s + select(search.open, since_first, T{});
        search.in_use = next_run(orbit.times, spread(orbit.fresh), search.guess_s);
        search.t_s = search.range_s = T{};
    }

    /** Newton's method for all packs together, each from its guess. Neighbours mostly share a run. */
    QUO_LANES_INLINE static void find_times(const OrbitView& orbit, Search* searches, int packs) noexcept {
        Motion motions[kPacks];
        const T length = fill<T>(orbit.times.run_length());
        for (int i = 0; i < packs; ++i) {
            Search& search = searches[i];
            const T start = clamped(search.guess_s - search.in_use.start_s, T{}, length);
            search.newton = TimeSearchOf<T>::begin(start, search.open);
            search.motion = &motions[i];
            if (i > 0 && !any(search.in_use.number != searches[i - 1].in_use.number[0]) &&
                !any(searches[i - 1].in_use.number != search.in_use.number))
                search.motion = searches[i - 1].motion;
            else
                motions[i] = gathered_motion(orbit.runs, search.in_use.number);
        }
        bool open = true;
        for (int step = 0; step < kInverseSteps && open; ++step) {
            open = false;
            for (int i = 0; i < packs; ++i) {
                Search& search = searches[i];
                if (!any(search.newton.open)) continue;
                search.newton.step(*search.motion, search.P, {T{}, length}, search.rate_m_s);
                open = true;
            }
        }
    }

    /** Takes what was found. Open stays what lies outside the middle of its run, where another one serves. */
    QUO_LANES_INLINE static void end(const OrbitView& orbit, Search& search) noexcept {
        const ImageTimeOf<T> seen = search.newton.end();
        const T length = fill<T>(orbit.times.run_length());
        const Mask inside = both(seen.t_s >= T{}, seen.t_s <= length);
        const Mask solved = both(both(seen.seen, seen.settled), inside);
        const RunInUseOf<T> here = search.in_use;
        search.guess_s = select(solved, here.start_s + seen.t_s, here.earliest_s);
        search.t_s = select(solved, search.guess_s, search.t_s);
        search.range_s = select(solved, seen.tau_s, search.range_s);
        search.found = either(search.found, solved);
        search.open = but_not(solved, both(search.guess_s >= here.earliest_s, search.guess_s <= here.latest_s));
        if (!any(search.open)) return;
        search.in_use = next_run(orbit.times, here, search.guess_s);
        search.open = both(search.open, search.in_use.number != here.number);
    }

    static bool inverse(const OrbitView& orbit, int count, InverseBlock& block) noexcept {
        Search searches[kPacks];
        const int packs = (count + kWidth - 1) / kWidth;
        for (int i = 0; i < packs; ++i) begin(orbit, block, i * kWidth, searches[i]);
        // A guess at the edge of a run's middle leads out of it, where another run serves: once more there.
        for (int round = 0; round < 2; ++round) {
            find_times(orbit, searches, packs);
            Mask open{};
            for (int i = 0; i < packs; ++i) {
                end(orbit, searches[i]);
                open = either(open, searches[i].open);
            }
            if (!any(open)) break;
        }
        auto solved = everywhere<Mask>();
        for (int i = 0; i < packs; ++i) {
            save(searches[i].t_s, block.t_s + i * kWidth);
            save(searches[i].range_s, block.range_s + i * kWidth);
            save(searches[i].found, block.solved + i * kWidth);
            solved = both(solved, searches[i].found);
        }
        return all(solved);
    }

    static constexpr ArrayKernels kTable{kWidth, forward, inverse};
};

}  // namespace quo

#endif
