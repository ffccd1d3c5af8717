// SPDX-License-Identifier: Apache-2.0
#include "generalSAR/orbit/orbit_model.h"

#include <algorithm>
#include <cmath>
#include <new>
#include <span>
#include <utility>

#include "quo_base/interp_orb.h"

namespace quo {
namespace {

constexpr double kEndTolerance_s = 1e-4;

}  // namespace

void along_track_rotation(const double v[3], double R[9], double* speed) noexcept {
    // Sines and cosines of yaw and pitch straight from the components: the angles lie within a quarter turn of 0.
    const double sign = v[0] < 0.0 ? -1.0 : 1.0;
    const double level = std::hypot(v[0], v[1]), length = std::hypot(v[0], v[1], v[2]);
    const double cos_yaw = level > 0.0 ? sign * v[0] / level : 1.0;
    const double sin_yaw = level > 0.0 ? -sign * v[1] / level : 0.0;
    const double cos_pitch = length > 0.0 ? level / length : 1.0;
    const double sin_pitch = length > 0.0 ? -sign * v[2] / length : 0.0;
    const double rows[9] = {cos_yaw * cos_pitch,  sin_yaw, sin_pitch * cos_yaw,   //
                            -sin_yaw * cos_pitch, cos_yaw, -sin_yaw * sin_pitch,  //
                            -sin_pitch,           0.0,     cos_pitch};
    std::copy_n(rows, 9, R);
    *speed = sign * length;
}

namespace {

/** The straight flight from one place to another. */
StraightFlight straight_flight(const double from[3], const double to[3], double time_s) noexcept {
    double velocity[3], R[9], speed = 0.0;
    for (int axis = 0; axis < 3; ++axis) velocity[axis] = (to[axis] - from[axis]) / time_s;
    along_track_rotation(velocity, R, &speed);
    return {{R[0], R[3], R[6]}, speed, speed != 0.0 ? 1.0 / speed : 0.0};
}

}  // namespace

std::unique_ptr<OrbitModel> OrbitModel::create(std::int32_t vectors) noexcept {
    const std::int32_t count = vectors - kRunVectors + 1;
    std::unique_ptr<OrbitRun[]> runs{new (std::nothrow) OrbitRun[static_cast<std::size_t>(count)]};
    std::unique_ptr<OrbitPlace[]> places{new (std::nothrow) OrbitPlace[static_cast<std::size_t>(count)]};
    if (!runs || !places) return nullptr;
    return std::unique_ptr<OrbitModel>{new (std::nothrow) OrbitModel{std::move(runs), std::move(places), count}};
}

void OrbitModel::copy(const OrbitModel& other) noexcept {
    static_cast<OrbitModelValues&>(*this) = static_cast<const OrbitModelValues&>(other);
    std::copy_n(other.runs_.get(), runs_count_, runs_.get());
    std::copy_n(other.places_.get(), places_count_, places_.get());
}

int OrbitModel::build(const StateVectors& states, double t0) noexcept {
    ready_ = false;
    resampling_m_ = 0.0;
    times_ = {t0, states.spacing_s, static_cast<double>(runs_count_ - 1)};
    if (const int status = fit_runs(states)) return status;
    bound_motion();
    cursor_.in_use = use_run(times_, 0.0);
    if (const int status = fit_whole(states)) return status;
    plant_places();
    fresh_ = cursor_.in_use;
    cursor_.switches = 0;
    ready_ = true;
    return QUO_OK;
}

int OrbitModel::fit_runs(const StateVectors& states) noexcept {
    for (std::int32_t k = 0; k < runs_count_; ++k) {
        OrbitRun& run = runs_[static_cast<std::size_t>(k)];
        if (const int status = orb_interp(0.0, spacing(), states.position(k), states.velocity(k), kRunVectors,
                                          run.x, run.y, run.z))
            return status;
        run.chord = straight_flight(states.position(k), states.position(k + kRunVectors - 1), times_.run_length());
    }
    return QUO_OK;
}

void OrbitModel::bound_motion() noexcept {
    const double middle_s = 0.5 * times_.run_length(), half_s = middle_s + kEndTolerance_s;
    const auto raise = [](double& most, double value) {
        if (!(value <= most)) most = std::isnan(value) ? HUGE_VAL : value;
    };
    OrbitState before{};
    bounds_ = {};
    for (std::int32_t k = 0; k < runs_count_; ++k) {
        const OrbitRun& here = run(k);
        const OrbitState at = orbit_state(here.curve(), middle_s), early = orbit_state(here.curve(), spacing());
        // By Taylor's formula about the middle, which ends with the fourth derivative.
        const Vec3 fourth = 24.0 * Vec3{here.x[0], here.y[0], here.z[0]};
        const Vec3 third = 6.0 * Vec3{here.x[1], here.y[1], here.z[1]} + middle_s * fourth;
        const double most = norm(at.acceleration) + half_s * (norm(third) + 0.5 * half_s * norm(fourth));
        raise(bounds_.acceleration_m_s2, most);
        raise(bounds_.speed_m_s, norm(at.velocity) + half_s * most);
        if (k > 0) raise(bounds_.shift_m, norm(early.position - before.position));
        if (k > 0) raise(bounds_.kick_m_s, norm(early.velocity - before.velocity));
        before = at;
    }
}

int OrbitModel::fit_whole(const StateVectors& states) noexcept {
    const double step = length() * 0.25;
    double positions[3 * kRunVectors], velocities[3 * kRunVectors];
    for (int i = 0; i < kRunVectors; ++i) {
        const double t = first_time() + i * step;
        const OrbitSegment curve = select(t).curve();
        store(orbit_position(curve, t - reference()), positions + 3 * i);
        store(orbit_velocity(curve, t - reference()), velocities + 3 * i);
    }
    mean_ = straight_flight(states.position(0), states.position(vectors() - 1), length());
    arc_rad_ = std::abs(run(0).chord.speed_m_s) * length() / norm(run(0).start());
    return orb_interp(0.0, step, positions, velocities, kRunVectors, coarse_x_, coarse_y_, coarse_z_);
}

/** Takes a run's start every ten seconds or so of a low orbit, and a good number of them on a short arc. */
void OrbitModel::plant_places() noexcept {
    constexpr double kFewest = 64.0, kPerRad = 100.0;
    const double most = std::min<double>(runs_count_, kFewest + kPerRad * arc_rad_);
    const std::int32_t stride = runs_count_ / static_cast<std::int32_t>(most);
    places_count_ = 0;
    for (std::int32_t k = 0; k < runs_count_; k += stride) places_[places_count_++] = {run(k).start(), k};
    plant_tree({places_.get(), static_cast<std::size_t>(places_count_)});
}

bool OrbitModel::linear_guess(const Vec3& point, double rate_m_s, double turn, PointTimes* guess) const noexcept {
    const double coarse = mean_.time_of(point - run(0).start(), rate_m_s, turn) / spacing();
    if (!std::isfinite(coarse)) return false;
    const std::int32_t k = centred(coarse);
    const OrbitRun& here = run(k);
    const Vec3 d = point - here.start();
    const double time = here.chord.time_of(d, rate_m_s, turn);
    if (!std::isfinite(time)) return false;
    *guess = {k * spacing() + time, 2.0 / kLightSpeed * here.chord.distance(d, time)};
    return true;
}

double OrbitModel::coarse_guess(const Target& target) const noexcept {
    ImageTime seen{0.5 * length(), 0.0, false, false};
    // Three times the orbit's span: a guess may miss it by a little, and Newton's steps on their way by a lot.
    const TimeSpan span{-length(), 2.0 * length()};
    image_time({coarse_x_, coarse_y_, coarse_z_}, target.point, seen.t_s, span, target.lambda_m, target.fd_hz,
               &seen);
    return seen.t_s;
}

bool OrbitModel::close_guess(const Target& target, double* since_first_s) const noexcept {
    constexpr double kClose = 1e-2;  // spacings
    const double rate = target.range_rate_m_s();
    double t = mean_.time_of(target.point - run(0).start(), rate, kFirstRoot);
    if (!std::isfinite(t)) return false;
    for (int step = 0; step < kInverseSteps; ++step) {
        const DopplerResidual at =
            doppler_residual(orbit_state(OrbitSegment{coarse_x_, coarse_y_, coarse_z_}, t), target.point, rate);
        const double change = at.value / at.slope;
        t -= change;
        // The next step's share of a flight as far as the target is away is about the square of this one's.
        const double far_s = std::sqrt(at.range2_m2) * std::abs(mean_.per_speed);
        if (change * change <= kClose * spacing() * far_s) break;
    }
    *since_first_s = t;
    return std::isfinite(t);
}

int OrbitModel::solve_near(RunCursor& cursor, double* guess_since_first_s, const Target& target, double* t,
                           double* range_s) const noexcept {
    const double length = times_.run_length();
    double guess = first_time() + *guess_since_first_s;
    for (double before = -1.0;; before = cursor.in_use.number) {
        const OrbitRun& here = select(cursor, guess);
        const RunInUse& in_use = cursor.in_use;
        if (in_use.number == before) return QUO_OK;
        const ImageTime seen =
            search_time(here.curve(), target.point, std::clamp(guess - in_use.start_s, 0.0, length), {0.0, length},
                        target.range_rate_m_s());
        const bool solved = seen.seen && seen.settled && seen.t_s >= 0.0 && seen.t_s <= length;
        if (!solved && before >= 0.0) return QUO_OK;
        guess = in_use.start_s + seen.t_s;
        if (!solved) {
            *guess_since_first_s = guess - first_time();
            return QUO_NOT_SEEN;
        }
        *t = guess;
        *range_s = seen.tau_s;
        // A guess at the edge of a run's middle leads out of it, where another run serves: once more there.
        if (before >= 0.0 || (guess >= in_use.earliest_s && guess <= in_use.latest_s)) return QUO_OK;
    }
}

int OrbitModel::solve_from(RunCursor& cursor, double guess_since_first_s, double reach_s, const Target& target,
                           double* t, double* range_s) const noexcept {
    constexpr int kMostTurns = 6;
    double guess = guess_since_first_s;
    for (int turn = 0; turn < kMostTurns; ++turn) {
        if (solve_near(cursor, &guess, target, t, range_s) == QUO_OK) return QUO_OK;
        if (!(std::abs(guess - guess_since_first_s) <= reach_s)) break;
        guess = std::clamp(guess, 0.0, length());
    }
    return QUO_NOT_SEEN;
}

void OrbitModel::settle(RunCursor& cursor, const PointTimes& found, const Target& target, double* t,
                        double* range_s) const noexcept {
    if (solve_from(cursor, found.since_first_s, 0.0, target, t, range_s) == QUO_OK) return;
    *t = first_time() + found.since_first_s;
    *range_s = found.range_s;
}

int OrbitModel::solve_anywhere(double guess_since_first_s, const Target& target,
                               PointTimes* found) const noexcept {
    // Further away there may be another pass of the point, or the far side of the Earth.
    constexpr double kFurthest_rad = 0.1;
    constexpr int kMostTurns = 20;
    const double dt = spacing(), length = times_.run_length();
    const std::int32_t last = runs_count_ - 1;
    double since_first = guess_since_first_s;
    for (int turn = 0; turn < kMostTurns; ++turn) {
        const std::int32_t k = centred(since_first / dt);
        const ImageTime seen =
            search_time(run(k).curve(), target.point, std::clamp(since_first - k * dt, 0.0, length),
                        {-length, 2.0 * length}, target.range_rate_m_s());
        const double u = seen.t_s;
        const double early = k == 0 ? -kEndTolerance_s : 0.0;
        const double late = k == last ? length + kEndTolerance_s : length;
        if (seen.seen && seen.settled && u >= early && u <= late) {
            *found = {k * dt + u, seen.tau_s};
            return QUO_OK;
        }
        if ((u < early && k == 0) || (u > late && k == last)) return QUO_NOT_SEEN;
        since_first = k * dt + u;
        if (!(std::abs(since_first - guess_since_first_s) <= flight_s(kFurthest_rad))) return QUO_NOT_SEEN;
    }
    return QUO_NOT_SEEN;
}

/** The Doppler equation at one time: positive before the platform passes the place where it holds, negative after,
 * or the other way round where the platform turns. */
struct OrbitModel::Crossing {
    double since_first_s, residual, slope, range_s;

    [[nodiscard]] bool opposite(const Crossing& other) const noexcept {
        return (residual < 0.0) != (other.residual < 0.0);
    }
    /** Whether the residual shrinks in size as time goes on. */
    [[nodiscard]] bool nearing() const noexcept { return (residual < 0.0) == (slope > 0.0); }
};

OrbitModel::Crossing OrbitModel::crossing_at(double since_first_s, std::int32_t run_number,
                                             const Target& target) const noexcept {
    const OrbitState platform = orbit_state(run(run_number).curve(), since_first_s - run_number * spacing());
    const DopplerResidual at = doppler_residual(platform, target.point, target.range_rate_m_s());
    return {since_first_s, at.value, at.slope, 2.0 / kLightSpeed * std::sqrt(at.range2_m2)};
}

/** Newton's step where it stays between the two times, else halving. */
PointTimes OrbitModel::crossing_between(Crossing before, Crossing after, std::int32_t run_number,
                                        const Target& target) const noexcept {
    constexpr int kMostSteps = 100;
    Crossing here = before;
    for (int step = 0; step < kMostSteps && after.since_first_s - before.since_first_s > kInverseStep; ++step) {
        const double newton = here.since_first_s - here.residual / here.slope;
        const bool inside = newton > before.since_first_s && newton < after.since_first_s;
        const double next = inside ? newton : 0.5 * (before.since_first_s + after.since_first_s);
        const double change = std::abs(next - here.since_first_s);
        here = crossing_at(next, run_number, target);
        (here.opposite(before) ? after : before) = here;
        if (inside && change < kInverseStep) break;
    }
    return {here.since_first_s, here.range_s};
}

/** Where the residual comes nearest to 0 before it grows again; any place beyond 0 on the way there. */
OrbitModel::Crossing OrbitModel::turn_between(Crossing before, Crossing after, std::int32_t run_number,
                                              const Target& target) const noexcept {
    Crossing here = before;
    while (after.since_first_s - before.since_first_s > kInverseStep) {
        const double middle = 0.5 * (before.since_first_s + after.since_first_s);
        if (!(middle > before.since_first_s && middle < after.since_first_s)) break;
        here = crossing_at(middle, run_number, target);
        if (here.opposite(before)) break;
        (here.nearing() ? before : after) = here;
    }
    return here;
}

/** The nearest of the times found so far. */
struct OrbitModel::Nearest {
    PointTimes* found;
    int status = QUO_NOT_SEEN;

    void take(const PointTimes& times) noexcept {
        if (status == QUO_OK && times.range_s >= found->range_s) return;
        *found = times;
        status = QUO_OK;
    }
};

void OrbitModel::search_piece(double from_s, double to_s, std::int32_t run_number, const Target& target,
                              Nearest& nearest) const noexcept {
    // A residual of so little, as a range rate, is 0: the two solutions meet where it turns.
    constexpr double kTouch_m_s = 1e-9;
    const Crossing before = crossing_at(from_s, run_number, target), after = crossing_at(to_s, run_number, target);
    if (before.opposite(after)) return nearest.take(crossing_between(before, after, run_number, target));
    if (!before.nearing() || after.nearing()) return;
    const Crossing turn = turn_between(before, after, run_number, target);
    if (turn.opposite(before)) {
        nearest.take(crossing_between(before, turn, run_number, target));
        nearest.take(crossing_between(turn, after, run_number, target));
    } else if (std::abs(turn.residual) <= kTouch_m_s * 0.5 * kLightSpeed * turn.range_s) {
        nearest.take({turn.since_first_s, turn.range_s});
    }
}

// Neighbouring runs differ a little, and each serves for times that others serve for as well. Where two solutions
// nearly meet only one of the runs may have them, so that each is searched over all it serves for.
void OrbitModel::search_run(std::int32_t run_number, const Target& target, Nearest& nearest) const noexcept {
    const std::int32_t k = run_number;
    const double dt = spacing();
    const double to = k == runs_count_ - 1 ? length() + kEndTolerance_s : (k + kKeepUntil) * dt;
    double at = k == 0 ? -kEndTolerance_s : (k + kKeepFrom) * dt;
    for (std::int32_t vector = k + 1; vector <= k + 3; ++vector) {
        search_piece(at, vector * dt, k, target, nearest);
        at = vector * dt;
    }
    search_piece(at, to, k, target, nearest);
}

/** False where all runs from one to another keep the sign of the residual, or stay further away than the nearest
 * time found: told from the middle of the run among them by how far the platform gets and turns from there, going
 * over from each run to the next in its middle. */
bool OrbitModel::may_improve(std::int32_t first, std::int32_t last, const Target& target,
                             const Nearest& nearest) const noexcept {
    constexpr double kRounding = 1e-6;  // of a residual as a range rate, m/s; and of a range
    const std::int32_t middle = first + (last - first) / 2;
    const double runs = last - middle, flight_s = (runs + 2.0) * spacing() + kEndTolerance_s;
    const Crossing at = crossing_at((middle + 2) * spacing(), middle, target);
    const double range_m = 0.5 * kLightSpeed * at.range_s;
    const double moved_m = bounds_.speed_m_s * flight_s + runs * bounds_.shift_m;
    const double turned_m_s = bounds_.acceleration_m_s2 * flight_s + runs * bounds_.kick_m_s;
    const double change = (bounds_.speed_m_s + std::abs(target.range_rate_m_s()) + kRounding) * moved_m +
                          (turned_m_s + kRounding) * range_m;
    const bool further = nearest.status == QUO_OK &&
                         range_m - moved_m > (1.0 + kRounding) * 0.5 * kLightSpeed * nearest.found->range_s;
    return !(std::abs(at.residual) > change || further);
}

void OrbitModel::search_runs(std::int32_t first, std::int32_t last, const Target& target,
                             Nearest& nearest) const noexcept {
    if (!may_improve(first, last, target, nearest)) return;
    if (first == last) return search_run(first, target, nearest);
    const std::int32_t middle = first + (last - first) / 2;
    search_runs(first, middle, target, nearest);
    search_runs(middle + 1, last, target, nearest);
}

int OrbitModel::search_all(const Target& target, PointTimes* found) const noexcept {
    Nearest nearest{found};
    search_runs(0, runs_count_ - 1, target, nearest);
    return nearest.status;
}

double OrbitModel::nearest_start(const Vec3& point) const noexcept {
    const std::span<const OrbitPlace> tree{places_.get(), static_cast<std::size_t>(places_count_)};
    return nearest_in_tree(tree, point) * spacing();
}

}  // namespace quo
