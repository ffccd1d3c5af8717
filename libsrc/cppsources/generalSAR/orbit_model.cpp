#include "generalSAR/orbit_model.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <new>
#include <utility>

#include "quo_base/interp_orb.h"

namespace quo {
namespace {

// A run is kept from this many spacings after its first vector to this many; beyond, another one is closer.
constexpr double kKeepFrom = 0.6, kKeepUntil = 3.4;
constexpr double kEndTolerance_s = 1e-4;
constexpr double kLongArc_rad = 1.0;

void difference(const double from[3], const double to[3], double time_s, double velocity_m_s[3]) noexcept {
    for (int axis = 0; axis < 3; ++axis) velocity_m_s[axis] = (to[axis] - from[axis]) / time_s;
}

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

StraightFlight StraightFlight::of(const double velocity_m_s[3]) noexcept {
    double R[9], speed = 0.0;
    along_track_rotation(velocity_m_s, R, &speed);
    return {{R[0], R[3], R[6]}, speed, speed != 0.0 ? 1.0 / speed : 0.0};
}

std::unique_ptr<OrbitModel> OrbitModel::create(std::int32_t vectors) noexcept {
    const std::int32_t count = vectors - kRunVectors + 1;
    std::unique_ptr<OrbitRun[]> runs{new (std::nothrow) OrbitRun[static_cast<std::size_t>(count)]};
    if (!runs) return nullptr;
    return std::unique_ptr<OrbitModel>{new (std::nothrow) OrbitModel{std::move(runs), count}};
}

void OrbitModel::copy(const OrbitModel& other) noexcept {
    static_cast<OrbitModelValues&>(*this) = static_cast<const OrbitModelValues&>(other);
    std::copy_n(other.runs_.get(), runs_count_, runs_.get());
}

int OrbitModel::build(const StateVectors& states, double t0) noexcept {
    ready_ = false;
    t0_ = t0;
    dt_ = states.spacing_s;
    if (const int status = fit_runs(states)) return status;
    take(0);
    if (const int status = fit_whole(states)) return status;
    switches_ = 0;
    ready_ = true;
    return QUO_OK;
}

int OrbitModel::fit_runs(const StateVectors& states) noexcept {
    for (std::int32_t k = 0; k < runs_count_; ++k) {
        OrbitRun& run = runs_[static_cast<std::size_t>(k)];
        if (const int status =
                orb_interp(0.0, dt_, states.position(k), states.velocity(k), kRunVectors, run.x, run.y, run.z))
            return status;
        double velocity[3];
        difference(states.position(k), states.position(k + kRunVectors - 1), (kRunVectors - 1) * dt_, velocity);
        run.chord = StraightFlight::of(velocity);
    }
    return QUO_OK;
}

int OrbitModel::fit_whole(const StateVectors& states) noexcept {
    const double step = length() * 0.25;
    double positions[3 * kRunVectors], velocities[3 * kRunVectors];
    for (int i = 0; i < kRunVectors; ++i) {
        const double t = t0_ + i * step;
        const OrbitSegment curve = select(t).curve();
        store(orbit_position(curve, t - tc_), positions + 3 * i);
        store(orbit_velocity(curve, t - tc_), velocities + 3 * i);
    }
    double velocity[3];
    difference(states.position(0), states.position(vectors() - 1), length(), velocity);
    mean_ = StraightFlight::of(velocity);
    long_arc_ = std::abs(run(0).chord.speed_m_s) * length() > kLongArc_rad * norm(run(0).start());
    return orb_interp(0.0, step, positions, velocities, kRunVectors, coarse_x_, coarse_y_, coarse_z_);
}

void OrbitModel::take(std::int32_t k) noexcept {
    if (k != current_) ++switches_;
    current_ = k;
    tc_ = t0_ + k * dt_;
    earliest_ = tc_ + kKeepFrom * dt_;
    latest_ = tc_ + kKeepUntil * dt_;
}

// Deliberate: where t left the run through its early edge, the new one ends a little after t, otherwise it starts
// a little before, so that a sweep in either direction can go on in it for as long as possible.
void OrbitModel::choose(double t) noexcept {
    const std::int32_t last = runs_count_ - 1;
    const double u = t - t0_;
    double k = 0.0;
    if (u > length())
        k = last;
    else if (u >= 0.0 && std::abs(t - tc_) < kKeepFrom * dt_)
        k = std::ceil((u + kKeepFrom * dt_) / dt_) - 4.0;
    else if (u >= 0.0)
        k = std::floor((u - kKeepFrom * dt_) / dt_);
    take(static_cast<std::int32_t>(std::clamp(k, 0.0, static_cast<double>(last))));
}

std::int32_t OrbitModel::centred_run(double spacings) const noexcept {
    const double inside = std::clamp(spacings, 0.0, static_cast<double>(vectors()));
    return std::clamp(static_cast<std::int32_t>(std::lround(inside)) - 2, 0, runs_count_ - 1);
}

bool OrbitModel::linear_guess(const Vec3& point, double rate_m_s, double turn, PointTimes* guess) const noexcept {
    const double coarse = mean_.time_of(point - run(0).start(), rate_m_s, turn) / dt_;
    if (!std::isfinite(coarse)) return false;
    const std::int32_t k = centred_run(coarse);
    const OrbitRun& here = run(k);
    const Vec3 d = point - here.start();
    const double time = here.chord.time_of(d, rate_m_s, turn);
    if (!std::isfinite(time)) return false;
    *guess = {k * dt_ + time, 2.0 / kLightSpeed * here.chord.distance(d, time)};
    return true;
}

double OrbitModel::coarse_guess(const Vec3& point, double lambda_m, double fd_hz) const noexcept {
    double time = 0.5 * length(), range_s = 0.0;
    // Three times the orbit's span: a guess may miss it by a little, and Newton's steps on their way by a lot.
    const TimeSpan span{-length(), 2.0 * length()};
    image_time({coarse_x_, coarse_y_, coarse_z_}, point, time, span, lambda_m, fd_hz, &time, &range_s);
    return time;
}

int OrbitModel::solve_near(double guess_since_first_s, const Vec3& point, double lambda_m, double fd_hz, double* t,
                           double* range_s) noexcept {
    const double guess = t0_ + guess_since_first_s;
    const OrbitRun& here = select(guess);
    const double length = (kRunVectors - 1) * dt_;
    double u = 0.0, tau = 0.0;
    if (const int status = image_time(here.curve(), point, std::clamp(guess - tc_, 0.0, length), {0.0, length},
                                      lambda_m, fd_hz, &u, &tau))
        return status;
    if (!(u >= 0.0 && u <= length)) return QUO_NOT_SEEN;
    *t = tc_ + u;
    *range_s = tau;
    return QUO_OK;
}

int OrbitModel::solve_anywhere(double guess_since_first_s, const Vec3& point, double lambda_m, double fd_hz,
                               double* t, double* range_s) const noexcept {
    const double length = (kRunVectors - 1) * dt_;
    const std::int32_t last = runs_count_ - 1;
    double since_first = guess_since_first_s;
    // Each turn moves on by up to a run's length: the turns suffice for any orbit and end any to and fro.
    for (std::int32_t turn = 0; turn < runs_count_ + 2; ++turn) {
        const std::int32_t k = centred_run(since_first / dt_);
        double u = 0.0, tau = 0.0;
        if (image_time(run(k).curve(), point, std::clamp(since_first - k * dt_, 0.0, length),
                       {-length, 2.0 * length}, lambda_m, fd_hz, &u, &tau))
            return QUO_NOT_SEEN;
        const double early = k == 0 ? -kEndTolerance_s : 0.0;
        const double late = k == last ? length + kEndTolerance_s : length;
        if (u >= early && u <= late) {
            *t = (t0_ + k * dt_) + u;
            *range_s = tau;
            return QUO_OK;
        }
        if ((u < early && k == 0) || (u > late && k == last)) return QUO_NOT_SEEN;
        since_first = k * dt_ + u;
    }
    return QUO_NOT_SEEN;
}

double OrbitModel::nearest_start(const Vec3& point) const noexcept {
    double nearest2 = std::numeric_limits<double>::infinity();
    std::int32_t at = 0;
    for (std::int32_t k = 0; k < runs_count_; ++k) {
        const Vec3 d = point - run(k).start();
        if (dot(d, d) >= nearest2) continue;
        nearest2 = dot(d, d);
        at = k;
    }
    return at * dt_;
}

}  // namespace quo
