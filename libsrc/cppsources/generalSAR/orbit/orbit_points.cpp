// SPDX-License-Identifier: Apache-2.0
#include "generalSAR/orbit/orbit_points.h"

#include <algorithm>

namespace quo {
namespace {

// Straight flight is no guess on arcs longer than this: it leads to the far side of the Earth, where the equations
// have a solution, too. And already on these the coarse curve is none.
constexpr double kLongArc_rad = 5.0, kLongCoarseArc_rad = 3.0;
// On arcs longer than this a guess that did not lead to the point at once may lead to another pass of it.
constexpr double kOnePassArc_rad = 1.2;
// A guess is off by no more than that, or a run's length.
constexpr double kReach_rad = 0.02;

/** When the point is seen where the first guess does not lead there: from the other guess through the whole orbit,
 * from the nearest state vector, or wherever the Doppler equation changes sign. 0 or 12. */
int search_times(const OrbitModel& model, const Target& target, PointTimes* found) noexcept {
    PointTimes guess{};
    if (model.arc_rad() <= kLongArc_rad && target.fd_hz != 0.0 &&
        model.linear_guess(target.point, target.range_rate_m_s(), kOtherRoot, &guess) &&
        model.solve_anywhere(guess.since_first_s, target, found) == QUO_OK)
        return QUO_OK;
    if (model.solve_anywhere(model.nearest_start(target.point), target, found) == QUO_OK) return QUO_OK;
    return model.search_all(target, found);
}

/** Whether a guess by straight flight, on the orbit and then on a run, leads far from the run that serves: it is
 * off by a tenth of a tenth of its distance from the orbit's middle, and a run serves for three spacings. */
bool has_short_runs(const OrbitModel& model) noexcept {
    constexpr std::int32_t kMostVectors = 500;
    return model.vectors() > kMostVectors && model.arc_rad() <= kLongCoarseArc_rad;
}

/** The first guess, as a time since the first vector: on the run in use, else through the whole orbit. False where
 * the speed does not allow the Doppler, or where the arc is too long for a guess. */
bool first_guess(const OrbitModel& model, const RunCursor& cursor, const Target& target, bool precise,
                 double* since_first_s) noexcept {
    if (model.arc_rad() > (precise ? kLongCoarseArc_rad : kLongArc_rad)) return false;
    const double rate = target.range_rate_m_s();
    if (!precise && model.guess_on(cursor.in_use, target.point, rate, kFirstRoot, since_first_s)) return true;
    if (has_short_runs(model)) return model.close_guess(target, since_first_s);
    PointTimes guess{};
    if (!model.linear_guess(target.point, rate, kFirstRoot, &guess)) return false;
    *since_first_s = precise ? model.coarse_guess(target) : guess.since_first_s;
    return true;
}

}  // namespace

bool guessed_straight(const OrbitModel& model) noexcept {
    return model.arc_rad() <= kLongArc_rad && !has_short_runs(model);
}

int find_times(const OrbitModel& model, RunCursor& cursor, const Target& target, bool precise, double* t,
               double* range_s) noexcept {
    const bool one_pass = model.arc_rad() <= kOnePassArc_rad;
    const double reach_s = std::max(model.flight_s(kReach_rad), model.run_length());
    double start_s = 0.0;
    if (first_guess(model, cursor, target, precise, &start_s) &&
        model.solve_from(cursor, start_s, one_pass ? reach_s : 0.0, target, t, range_s) == QUO_OK)
        return QUO_OK;
    if (!one_pass &&
        model.solve_from(cursor, model.nearest_start(target.point), reach_s, target, t, range_s) == QUO_OK)
        return QUO_OK;
    PointTimes found{};
    if (const int status = search_times(model, target, &found)) return status;
    model.settle(cursor, found, target, t, range_s);
    return QUO_OK;
}

}  // namespace quo
