// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_ORBIT_POINTS_H
#define QUO_ORBIT_POINTS_H

#include "generalSAR/orbit/orbit_model.h"

/* Geolocation of one point on an orbit model, without frames or reports. The run in use is the caller's: calls on
 * one model may run side by side. */

namespace quo {

/** One image sample: at which height its ground point is wanted, where the platform is on its run's curve, and the
 * point it sees. */
struct OrbitSample {
    double height_m;
    OrbitSegment curve;
    double since_run_start_s;
    Vec3 position, velocity, point;

    [[nodiscard]] OrbitState state() const noexcept { return orbit_state(curve, since_run_start_s); }
};

/** Fills in where the platform is at time t, which is finite. */
inline void place_platform(const OrbitModel& model, RunCursor& cursor, double t, OrbitSample* sample) noexcept {
    sample->curve = model.select(cursor, t).curve();
    const double u = sample->since_run_start_s = t - cursor.in_use.start_s;
    sample->position = orbit_position(sample->curve, u);
    sample->velocity = orbit_velocity(sample->curve, u);
}

/** Fills in the ground point at the sample's height. Statuses of gr_pt_at_height(). */
inline int find_ground(const RadarLook& look, OrbitSample* sample) noexcept {
    if (sample->height_m == 0.0)
        return ground_point(sample->position, sample->velocity, look, kWgs84, &sample->point);
    return ground_point_at_height(sample->position, sample->velocity, look, 0.0, sample->height_m, kWgs84,
                                  &sample->point);
}

/** Whether find_times() takes its first guess from straight flight, as the array kernels do. */
bool guessed_straight(const OrbitModel& model) noexcept;

/** When the point is seen: on the run that the first guess lands in, else by a search. 0 or 12. */
int find_times(const OrbitModel& model, RunCursor& cursor, const Target& target, bool precise, double* t,
               double* range_s) noexcept;

}  // namespace quo

#endif
