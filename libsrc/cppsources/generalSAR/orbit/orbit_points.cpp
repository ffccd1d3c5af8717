#include "generalSAR/orbit/orbit_points.h"

namespace quo {
namespace {

// On arcs longer than kLongArc_rad straight flight is no guess, and already on these the coarse curve is none.
constexpr double kLongCoarseArc_rad = 3.0;

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

}  // namespace

int find_times(const OrbitModel& model, RunCursor& cursor, const Target& target, bool precise, double* t,
               double* range_s) noexcept {
    const double rate = target.range_rate_m_s();
    PointTimes guess{};
    if (model.arc_rad() <= (precise ? kLongCoarseArc_rad : kLongArc_rad)) {
        const bool at_hand =
            !precise && model.guess_on(cursor.in_use, target.point, rate, kFirstRoot, &guess.since_first_s);
        if (at_hand || model.linear_guess(target.point, rate, kFirstRoot, &guess)) {
            if (precise) guess.since_first_s = model.coarse_guess(target);
            if (model.solve_near(cursor, guess.since_first_s, target, t, range_s) == QUO_OK) return QUO_OK;
        }
    }
    PointTimes found{};
    if (const int status = search_times(model, target, &found)) return status;
    model.settle(cursor, found, target, t, range_s);
    return QUO_OK;
}

}  // namespace quo
