// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_GEOMETRY_KERNELS_H
#define QUO_GEOMETRY_KERNELS_H

#include <cmath>
#include <limits>

#include "quo_base/geometry.h"
#include "sarutillib/geometry/geometry_formulas.h"

/* The geometry under the point solvers and the orbit model, without frames, reports or allocation. Metres,
 * seconds, hertz and degrees; conventions as in quo_base/geometry.h and quo_base/gr_pt.h. Outputs are written only
 * where 0 is returned. */

namespace quo {

using OrbitSegment = SegmentOf<double>;
using OrbitState = StateOf<Vec3>;

// --- Forward: from range time and Doppler to the ground ---------------------------------------------------------

using RadarLook = RadarLookOf<double>;
using LookCircle = LookCircleOf<Vec3>;
using CirclePoint = CirclePointOf<double>;

/** Finds where the circle leaves the ellipsoid on its look side, however near to the nadir or the horizon. False
 * where it never dips into the ellipsoid or leaves it on the other side only. */
bool search_crossing(const LookCircle& circle, CirclePoint* at) noexcept;

/** Ground point for a velocity V relative to the Earth. 1: an input that is not finite or must be positive and is
 * not, or no velocity; 10: a Doppler beyond what the velocity allows, flight straight up or down, a range shorter
 * than the height, or a target beyond the horizon.
 *
 * Meets the range and Doppler equations by construction, the ellipsoid's to rounding: where the range and Doppler
 * equations hold there is one unknown left (LookCircleOf). */
inline int ground_point(const Vec3& S, const Vec3& V, const RadarLook& look, const Ellipsoid& e,
                        Vec3* P) noexcept {
    if (!usable_look(S, V, look, e)) return QUO_REFUSED;
    LookCircle circle;
    Vec3 p;
    if (!fill_look_circle(S, V, look, e, &circle)) return QUO_NUMERIC;
    CrossingOf<double> crossing = begin_crossing(circle, S, e, true);
    for (int step = 0; step < kForwardSteps && crossing.open; ++step) step_crossing(circle, crossing);
    if (!crossing.found && !search_crossing(circle, &crossing.at)) return QUO_NUMERIC;
    if (!touch_down(circle, S, e, crossing.at, &p)) return QUO_NUMERIC;
    *P = p;
    return QUO_OK;
}

/** The velocity relative to the Earth of a platform with inertial velocity V. It decides the Doppler of a ground
 * point alone, the point's own velocity need not be known: both differ by the rotation of the line between them,
 * which is square to it. */
constexpr Vec3 relative_velocity(const Vec3& S, const Vec3& V, double omega) noexcept {
    return {V.x + omega * S.y, V.y - omega * S.x, V.z};
}

/** Newton's method on the range, Doppler and ellipsoid equations for a velocity V to be corrected by omega: at
 * most kForwardSteps steps from P, done when a squared step is at most kForwardStep2 or no longer less than half
 * the one before. Returns the number of steps taken. A step that is not finite is not taken. */
int refine_ground_point(const Vec3& S, const Vec3& V, const RadarLook& look, double omega, const Ellipsoid& e,
                        Vec3* P) noexcept;

/** Ground point for a velocity to be corrected by omega, where that is not 0. Statuses of ground_point(). */
inline int turning_ground_point(const Vec3& S, const Vec3& V, const RadarLook& look, double omega,
                                const Ellipsoid& e, Vec3* P) noexcept {
    Vec3 point;
    if (const int status = ground_point(S, relative_velocity(S, V, omega), look, e, &point)) return status;
    if (omega != 0.0) refine_ground_point(S, V, look, omega, e, &point);
    *P = point;
    return QUO_OK;
}

/** The same at a height above the ellipsoid; see gr_pt_at_height(). */
int ground_point_at_height(const Vec3& S, const Vec3& V, const RadarLook& look, double omega, double height_m,
                           const Ellipsoid& e, Vec3* P) noexcept;

// --- Inverse: from the ground to azimuth time and range time ----------------------------------------------------

using TimeSpan = TimeSpanOf<double>;
using DopplerResidual = DopplerResidualOf<double>;
using ImageTime = ImageTimeOf<double>;

/** Time at which P is seen with a Doppler, by Newton's method from `start_s`, and the range time before the last
 * step. Not seen, and then the last iterate, where one but the last leaves the span or anything is not a number.
 * Running out of steps is told by what is not settled alone.
 *
 * Targets seen close to either end need room beyond it: from the middle of a segment of 10 s spacing the first
 * iterate lands up to 0.1 s beside a solution at the end, at 60 s spacing up to 3 s. */
inline ImageTime search_time(const OrbitSegment& orbit, const Vec3& P, double start_s, const TimeSpan& span,
                             double range_rate_m_s) noexcept {
    auto search = TimeSearchOf<double>::begin(start_s, true);
    for (int step = 0; step < kInverseSteps && search.open; ++step) search.step(orbit, P, span, range_rate_m_s);
    return search.end();
}

/** The same with a Doppler in Hz; 12 and nothing written where P is not seen. */
inline int image_time(const OrbitSegment& orbit, const Vec3& P, double start_s, const TimeSpan& span,
                      double lambda_m, double fd_hz, ImageTime* seen) noexcept {
    const ImageTime found = search_time(orbit, P, start_s, span, 0.5 * lambda_m * fd_hz);
    if (!found.seen) return QUO_NOT_SEEN;
    *seen = found;
    return QUO_OK;
}

// --- Geometry at a sample ---------------------------------------------------------------------------------------

/** Everything that is asked of the sample whose target is P, at a height. Above or below the ellipsoid its
 * gradient is no longer the normal of the place: at 9 km they are 5e-4 degrees apart. */
inline GrPtGeometry sample_geometry(const OrbitState& s, const Vec3& P, double height_m, double lambda_m,
                                    double omega, const Ellipsoid& e) noexcept {
    const GeodeticPoint place = to_geodetic(P, e);
    return {{P.x, P.y, P.z},
            place.latitude_deg,
            place.longitude_deg,
            height_m == 0.0 ? incidence_deg(s.position, P, e) : angle_deg(ellipsoid_normal(place), s.position - P),
            look_angle_deg(s.position, P),
            fm_rate_hz_s(s, P, lambda_m, omega),
            norm(s.velocity)};
}

}  // namespace quo

#endif
