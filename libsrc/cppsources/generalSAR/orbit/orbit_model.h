// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_ORBIT_MODEL_H
#define QUO_ORBIT_MODEL_H

#include <cstddef>
#include <cstdint>
#include <memory>

#include "generalSAR/orbit/orbit_interpolation.h"
#include "generalSAR/orbit/place_tree.h"
#include "generalSAR/orbit_arrays/array_kernels.h"
#include "sarutillib/geometry/geometry_kernels.h"

namespace quo {

/** When a point is seen: time since the first state vector of the orbit, and two-way range time, s. */
struct PointTimes {
    double since_first_s, range_s;
};

/** What is looked for: a point, and the Doppler that it is to be seen with. */
struct Target {
    Vec3 point;
    double lambda_m, fd_hz;
    [[nodiscard]] double range_rate_m_s() const noexcept { return 0.5 * lambda_m * fd_hz; }
};

/** A run in use, and how often another one was taken. Searches go on from one run to the next with it. */
struct RunCursor {
    RunInUse in_use;
    std::int64_t switches;
};

/** What the motion on no run exceeds: its speed and acceleration, and by how much place and velocity change where
 * one run takes over from the one before, in the middle of that one. */
struct MotionBounds {
    double speed_m_s, acceleration_m_s2, shift_m, kick_m_s;
};

/** What an orbit model holds beside its runs. */
struct OrbitModelValues {
    RunTimes times_{};
    RunCursor cursor_{};
    RunInUse fresh_{};
    StraightFlight mean_{};                                 // from the first vector to the last
    double coarse_x_[5]{}, coarse_y_[5]{}, coarse_z_[5]{};  // the whole orbit, in the time since the first vector
    MotionBounds bounds_{};
    double resampling_m_ = 0.0;  // what the interpolation that made the vectors may have left
    double arc_rad_ = 0.0;
    std::int32_t places_count_ = 0;  // the first ones of places_, a tree of run starts
    bool ready_ = false;
};

/** The curves through every run of five state vectors, and a coarse one through the whole orbit.
 *
 * Range rates are lambda fd / 2, in m/s, positive while the platform approaches. */
class OrbitModel : private OrbitModelValues {
public:
    static constexpr std::int32_t kRunVectors = quo::kRunVectors;

    /** Tables for at least five vectors; null when memory cannot be had. */
    static std::unique_ptr<OrbitModel> create(std::int32_t vectors) noexcept;
    /** Whether so many vectors can stand at these times. */
    static bool valid_times(double t0, double dt, std::int32_t vectors) noexcept {
        const double end = t0 + (vectors - 1) * dt;
        return std::isfinite(t0) && std::isfinite(end) && end > t0;
    }
    /** Fits as many vectors as the tables are for, at valid times. 0 or the status of orb_interp(); there is no
     * model after a failure. */
    int build(const StateVectors& states, double t0) noexcept;
    /** Takes over another model for the same number of vectors. */
    void copy(const OrbitModel& other) noexcept;

    void drop() noexcept { ready_ = false; }
    /** Notes by how much the vectors themselves may be off since they were interpolated, m. build() forgets it. */
    void note_resampling(double error_m) noexcept { resampling_m_ = error_m; }
    [[nodiscard]] double resampling_error_m() const noexcept { return resampling_m_; }

    [[nodiscard]] bool ready() const noexcept { return ready_; }
    [[nodiscard]] std::int32_t vectors() const noexcept { return runs_count_ + kRunVectors - 1; }
    [[nodiscard]] std::int32_t runs() const noexcept { return runs_count_; }
    [[nodiscard]] const OrbitRun& run(std::int32_t k) const noexcept { return runs_[static_cast<std::size_t>(k)]; }
    [[nodiscard]] double first_time() const noexcept { return times_.first_s; }
    [[nodiscard]] double spacing() const noexcept { return times_.spacing_s; }
    [[nodiscard]] double length() const noexcept { return (vectors() - 1) * spacing(); }
    [[nodiscard]] double run_length() const noexcept { return times_.run_length(); }
    [[nodiscard]] std::int64_t switches() const noexcept { return cursor_.switches; }

    /** Makes the run in use suit time t, which is finite, and returns it. */
    const OrbitRun& select(RunCursor& cursor, double t) const noexcept {
        const RunInUse next = next_run(times_, cursor.in_use, t);
        if (next.number != cursor.in_use.number) ++cursor.switches;
        cursor.in_use = next;
        return run_of(next);
    }
    const OrbitRun& select(double t) noexcept { return select(cursor_, t); }
    /** The model's own run in use, and time of its first vector. */
    [[nodiscard]] RunCursor& cursor() noexcept { return cursor_; }
    [[nodiscard]] double reference() const noexcept { return cursor_.in_use.start_s; }
    /** The run in use when the model was made: with it a call's results do not hang on the calls before. */
    [[nodiscard]] RunCursor fresh() const noexcept { return {fresh_, 0}; }
    /** What the array kernels know of the model. */
    [[nodiscard]] OrbitView view(double lambda_m, double side) const noexcept {
        return {runs_.get(), times_, fresh_, mean_, lambda_m, side};
    }

    /** First guess of a point's times in closed form, `turn` as in StraightFlight::time_of(). False where the
     * speed does not allow the range rate. */
    bool linear_guess(const Vec3& point, double rate_m_s, double turn, PointTimes* guess) const noexcept;
    /** The same on the run in use alone, as a time since the first vector. False unless it is_at_hand(). Points in
     * the order of an image mostly need no more. */
    bool guess_on(const RunInUse& in_use, const Vec3& point, double rate_m_s, double turn,
                  double* since_first_s) const noexcept {
        const OrbitRun& here = run_of(in_use);
        const double u = here.chord.time_of(point - here.start(), rate_m_s, turn);
        *since_first_s = (in_use.start_s - first_time()) + u;
        return is_at_hand(times_, u);
    }
    /** Time of a point on the coarse curve since the first vector, for a first guess. */
    double coarse_guess(const Target& target) const noexcept;
    /** The same to about a hundredth of a spacing, from straight flight on and without a look at a run, as far as
     * the coarse curve follows the orbit. False where the speed does not allow the range rate. */
    bool close_guess(const Target& target, double* since_first_s) const noexcept;
    /** When the point is seen: Newton's method from a first guess, on the run in use made to suit it. `t` is on
     * the absolute scale. Where the solution leaves the middle of that run it is found again on the run that
     * serves there. 0, or 12 when it lies outside the run or the steps ran out; `t` and `range_s` then stay, and
     * the guess becomes the time that the last step led to. */
    int solve_near(RunCursor& cursor, double* guess_since_first_s, const Target& target, double* t,
                   double* range_s) const noexcept;
    /** The same from run to run, few whatever the spacing, as long as a step leads no further than `reach_s` from
     * the guess. */
    int solve_from(RunCursor& cursor, double guess_since_first_s, double reach_s, const Target& target, double* t,
                   double* range_s) const noexcept;
    /** Ends a search that found the point's times on some run: solves again on the run that serves that time, so
     * that the way back to the ground starts from the same curve. Where that one has no solution, as beyond the
     * ends, the times stay those found. */
    void settle(RunCursor& cursor, const PointTimes& found, const Target& target, double* t,
                double* range_s) const noexcept;
    /** The times on the run with the nearest vector in its middle, going from run to run until one holds its own
     * solution. A solution up to 1e-4 s beyond the first or the last vector counts as on the orbit. */
    int solve_anywhere(double guess_since_first_s, const Target& target, PointTimes* found) const noexcept;
    /** Of all times at which the point is seen the one from nearest by, found by the changes of sign that the
     * Doppler equation makes from vector to vector, also where there are two between two vectors. 0 or 12. */
    int search_all(const Target& target, PointTimes* found) const noexcept;
    /** Time since the first vector of a run that starts as near to the point as any, but for some ten seconds of
     * flight in low orbit. */
    double nearest_start(const Vec3& point) const noexcept;
    /** How far the platform flies round the Earth, about, as an angle. */
    [[nodiscard]] double arc_rad() const noexcept { return arc_rad_; }
    /** In how long it flies about so much of the way round. */
    [[nodiscard]] double flight_s(double angle_rad) const noexcept { return angle_rad / arc_rad_ * length(); }

private:
    OrbitModel(std::unique_ptr<OrbitRun[]> runs, std::unique_ptr<OrbitPlace[]> places, std::int32_t count) noexcept
        : runs_{std::move(runs)}, places_{std::move(places)}, runs_count_{count} {}
    [[nodiscard]] const OrbitRun& run_of(const RunInUse& in_use) const noexcept {
        return run(static_cast<std::int32_t>(in_use.number));
    }
    [[nodiscard]] std::int32_t centred(double spacings) const noexcept {
        return static_cast<std::int32_t>(centred_run(times_, spacings));
    }
    struct Crossing;
    [[nodiscard]] Crossing crossing_at(double since_first_s, std::int32_t run_number,
                                       const Target& target) const noexcept;
    [[nodiscard]] PointTimes crossing_between(Crossing before, Crossing after, std::int32_t run_number,
                                              const Target& target) const noexcept;
    [[nodiscard]] Crossing turn_between(Crossing before, Crossing after, std::int32_t run_number,
                                        const Target& target) const noexcept;
    struct Nearest;
    void search_piece(double from_s, double to_s, std::int32_t run_number, const Target& target,
                      Nearest& nearest) const noexcept;
    void search_run(std::int32_t run_number, const Target& target, Nearest& nearest) const noexcept;
    void search_runs(std::int32_t first, std::int32_t last, const Target& target, Nearest& nearest) const noexcept;
    [[nodiscard]] bool may_improve(std::int32_t first, std::int32_t last, const Target& target,
                                   const Nearest& nearest) const noexcept;
    int fit_runs(const StateVectors& states) noexcept;
    void bound_motion() noexcept;
    int fit_whole(const StateVectors& states) noexcept;
    void plant_places() noexcept;

    std::unique_ptr<OrbitRun[]> runs_;
    std::unique_ptr<OrbitPlace[]> places_;  // room for one of each run
    std::int32_t runs_count_;
};

/** The rotation into the along-track frame of a finite velocity, and its signed speed; see
 * GeneralSAROrbit::computeRotationMatrix(). */
void along_track_rotation(const double v[3], double R[9], double* speed) noexcept;

}  // namespace quo

#endif
