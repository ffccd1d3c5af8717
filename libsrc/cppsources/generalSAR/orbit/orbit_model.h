#ifndef QUO_ORBIT_MODEL_H
#define QUO_ORBIT_MODEL_H

#include <cstddef>
#include <cstdint>
#include <memory>

#include "generalSAR/orbit/orbit_interpolation.h"
#include "sarutillib/geometry/geometry_kernels.h"

namespace quo {

/** A straight flight: unit vector and speed, both turned so that the speed has the sign of the velocity's x
 * component (positive for 0). The turn changes no time of travel; it decides which of two solutions comes first.
 */
struct StraightFlight {
    Vec3 axis;
    double speed_m_s;
    double per_speed;  // 1 / speed, 0 for a platform that stands still

    /** Of a finite velocity. */
    static StraightFlight of(const double velocity_m_s[3]) noexcept;
    /** Time from the flight's start to one of the two places from which a target at d from the start, m, has the
     * range rate `rate_m_s` or its negative: the place further along the axis for turn 1, further back for -1. Not
     * finite where the speed does not allow the rate. */
    [[nodiscard]] double time_of(const Vec3& d, double rate_m_s, double turn) const noexcept {
        const double along = dot(axis, d);
        if (rate_m_s == 0.0) return along * per_speed;
        // The cone of directions with that rate: the place lies as far along as the target is aside, times this.
        const double k = rate_m_s * rate_m_s * per_speed * per_speed;
        const double aside2 = dot(d, d) - along * along;
        return (along + turn * std::sqrt(k * aside2 / (1.0 - k))) * per_speed;
    }
    /** Distance of that target after `time` seconds of flight, m. */
    [[nodiscard]] double distance(const Vec3& d, double time) const noexcept {
        return norm(d - (time * speed_m_s) * axis);
    }
};

/** A run of five state vectors: the curve through their positions in the time since the first, coefficients as in
 * interp_orb.h, and the chord from first to last. What one point needs stands together. */
struct OrbitRun {
    double x[5], y[5], z[5];
    StraightFlight chord;

    [[nodiscard]] OrbitSegment curve() const noexcept { return {x, y, z}; }
    /** Position of the first vector, m. */
    [[nodiscard]] Vec3 start() const noexcept { return {x[4], y[4], z[4]}; }
};

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

/** What an orbit model holds beside its runs. */
struct OrbitModelValues {
    double t0_ = 0.0, dt_ = 0.0;  // first vector and spacing
    std::int32_t current_ = 0;
    double tc_ = 0.0;                       // time of the current run's first vector
    double earliest_ = 0.0, latest_ = 0.0;  // the times for which the current run is kept
    std::int64_t switches_ = 0;
    StraightFlight mean_{};                                 // from the first vector to the last
    double coarse_x_[5]{}, coarse_y_[5]{}, coarse_z_[5]{};  // the whole orbit, in the time since the first vector
    double resampling_m_ = 0.0;  // what the interpolation that made the vectors may have left
    double arc_rad_ = 0.0;
    bool ready_ = false;
};

/** The curves through every run of five state vectors, and a coarse one through the whole orbit.
 *
 * Range rates are lambda fd / 2, in m/s, positive while the platform approaches. */
class OrbitModel : private OrbitModelValues {
public:
    static constexpr std::int32_t kRunVectors = 5;

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
    [[nodiscard]] double first_time() const noexcept { return t0_; }
    [[nodiscard]] double spacing() const noexcept { return dt_; }
    [[nodiscard]] double length() const noexcept { return (vectors() - 1) * dt_; }
    [[nodiscard]] std::int64_t switches() const noexcept { return switches_; }

    /** Makes the current run suit time t, which is finite, and returns it. */
    const OrbitRun& select(double t) noexcept {
        if (!(earliest_ <= t && t <= latest_)) choose(t);
        return run(current_);
    }
    /** Time of the current run's first vector. */
    [[nodiscard]] double reference() const noexcept { return tc_; }

    /** First guess of a point's times in closed form, `turn` as in StraightFlight::time_of(). False where the
     * speed does not allow the range rate. */
    bool linear_guess(const Vec3& point, double rate_m_s, double turn, PointTimes* guess) const noexcept;
    /** The same on the current run alone, as a time since the first vector. False unless it lies within a spacing
     * of the run's middle. A guess in low orbit is off by about a tenth of its distance from the middle: one that
     * near would keep the run with linear_guess() as well. Points in the order of an image mostly need no more. */
    bool guess_on_current(const Vec3& point, double rate_m_s, double turn, double* since_first_s) const noexcept {
        const OrbitRun& here = run(current_);
        const double u = here.chord.time_of(point - here.start(), rate_m_s, turn);
        *since_first_s = (tc_ - t0_) + u;
        return dt_ <= u && u <= 3.0 * dt_;
    }
    /** Time of a point on the coarse curve since the first vector, for a first guess. */
    double coarse_guess(const Target& target) const noexcept;
    /** When the point is seen: Newton's method from a first guess, on the current run made to suit it. `t` is on
     * the absolute scale. Where the solution leaves the middle of that run it is found again on the run that
     * serves there. 0, or 12 when it lies outside the run or the steps ran out; nothing is then written. */
    int solve_near(double guess_since_first_s, const Target& target, double* t, double* range_s) noexcept;
    /** Ends a search that found the point's times on some run: solves again on the run that serves that time, so
     * that the way back to the ground starts from the same curve. Where that one has no solution, as beyond the
     * ends, the times stay those found. */
    void settle(const PointTimes& found, const Target& target, double* t, double* range_s) noexcept;
    /** As solve_near() over the whole orbit, from run to run, until a run holds its own solution; the current run
     * stays. A solution up to 1e-4 s beyond the first or the last vector counts as on the orbit. */
    int solve_anywhere(double guess_since_first_s, const Target& target, PointTimes* found) const noexcept;
    /** Of all times at which the point is seen the one from nearest by, found by the changes of sign that the
     * Doppler equation makes from vector to vector, also where there are two between two vectors. 0 or 12. */
    int search_all(const Target& target, PointTimes* found) const noexcept;
    /** Time since the first vector of the run that starts nearest to the point. */
    double nearest_start(const Vec3& point) const noexcept;
    /** How far the platform flies round the Earth, about, as an angle. */
    [[nodiscard]] double arc_rad() const noexcept { return arc_rad_; }

private:
    OrbitModel(std::unique_ptr<OrbitRun[]> runs, std::int32_t count) noexcept
        : runs_{std::move(runs)}, runs_count_{count} {}
    void choose(double t) noexcept;
    void take(std::int32_t k) noexcept;
    /** The run with the vector nearest to a time in its middle, as far as there is one. `spacings` is finite. */
    [[nodiscard]] std::int32_t centred_run(double spacings) const noexcept;
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
    int fit_runs(const StateVectors& states) noexcept;
    int fit_whole(const StateVectors& states) noexcept;

    std::unique_ptr<OrbitRun[]> runs_;
    std::int32_t runs_count_;
};

/** The rotation into the along-track frame of a finite velocity, and its signed speed; see
 * GeneralSAROrbit::computeRotationMatrix(). */
void along_track_rotation(const double v[3], double R[9], double* speed) noexcept;

}  // namespace quo

#endif
