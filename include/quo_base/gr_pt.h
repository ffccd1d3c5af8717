// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_GR_PT_H
#define QUO_BASE_GR_PT_H

#include "quo_base/api.h"

QUO_BASE_C_BEGIN

/** @file
 * Range-Doppler point solvers: from an image sample to the ground and back, and the geometry at a sample.
 *
 * Vectors are x, y, z: positions in metres, velocities in m/s, in an Earth-fixed frame unless said otherwise.
 * Range times are two-way, in seconds; the speed of light is 299792458 m/s. Doppler is in Hz, positive while the
 * platform approaches the target. The ellipsoid has semi-axes a (equatorial) and b (polar), its axis is z. Angles
 * are in degrees. Orbit polynomials hold five coefficients per axis, highest degree first, as in interp_orb.h.
 *
 * Look side: a target is on the right where cross(velocity, position) has a positive component along the line of
 * sight. A negative look sign looks left, zero or a positive one right.
 *
 * The range, Doppler and ellipsoid equations: J. C. Curlander, "Location of Spaceborne SAR Imagery", IEEE
 * Transactions on Geoscience and Remote Sensing GE-20(3), 1982.
 *
 * Nothing is kept between calls: any number of threads may call at a time. */

/** Writes v / |v| to `unit`; where |v| is zero or not a number, (0, 0, 0). `unit` may be `v` itself. */
QUO_BASE_API void make_versor(const double v[3], double unit[3]) QUO_NOEXCEPT;

/** Writes the cross product a x b to `r`, which may be one of the operands. */
QUO_BASE_API void v1pv2(const double a[3], const double b[3], double r[3]) QUO_NOEXCEPT;

/** Starting point of gr_pt(), from the same inputs.
 *
 * Within 1 mm of the solution wherever there is one: from 12 km above the ground to geosynchronous heights, at
 * every latitude, either side.
 *
 * @return 0; 1 for an input that is not finite, a range time, wavelength or semi-axis that is not positive, or a
 *         platform that stands still over the ground; 10 where the range is shorter than the height, the target
 * lies beyond the horizon or the Doppler exceeds what the velocity allows. P is unchanged unless 0 is returned. */
QUO_BASE_API int gr_pt0(double P[3], const double S[3], const double V[3], double tau, double fd, double lambda,
                        double omega, double side, double a, double b) QUO_NOEXCEPT;

/** Ground point seen at one range time and Doppler.
 *
 * @param[out] P       point on the ellipsoid; unchanged unless 0 is returned
 * @param[in]  S, V    satellite position and velocity
 * @param[in]  tau     two-way range time, > 0
 * @param[in]  fd      Doppler frequency
 * @param[in]  lambda  wavelength, m, > 0
 * @param[in]  omega   Earth-rotation rate to correct V with, rad/s: 0 where V is Earth-fixed, 7.292115189334571e-5
 *                     where it is inertial (with the axes turned to the Earth-fixed ones at that instant)
 * @param[in]  side    look sign: negative looks left, anything else right
 * @param[in]  a, b    equatorial and polar semi-axes, m, > 0
 * @return 0, or the status of gr_pt0(), passed on with an ERROR_CALL_TREE entry.
 *
 * Range and Doppler leave a circle about the line of flight. Where it leaves the ellipsoid is found by Newton's
 * method in one unknown, the angle along the circle, at most 20 steps, and by a bracketed search near the nadir
 * and the horizon, where Newton's steps do not settle; this is gr_pt0()'s point, which meets all three equations
 * where omega is 0. Where it is not, the point's own velocity enters the Doppler equation, and Newton's method on
 * the three equations follows: at most 20 steps, done when a step is no longer than 1e-5 m or the squared steps no
 * longer shrink to less than half. Running out of those steps is no error: the last point is returned with 0, as
 * good as the starting point or better.
 */
QUO_BASE_API int gr_pt(double P[3], const double S[3], const double V[3], double tau, double fd, double lambda,
                       double omega, double side, double a, double b) QUO_NOEXCEPT;

/** Geometry of one image sample, as gr_pt_lat_lon() finds it on the ellipsoid, and SVGetGeometry() at a height. */
typedef struct GrPtGeometry {
    double point_m[3];    /**< ground point, Earth-fixed */
    double latitude_deg;  /**< geodetic, -90 to 90, north positive */
    double longitude_deg; /**< -180 to 180, east positive */
    double incidence_deg; /**< at the target, from the ellipsoid's outward normal to the line to the satellite */
    double look_deg;      /**< at the satellite, from the direction to the Earth's centre to the line of sight */
    double fm_rate_hz_s;  /**< azimuth FM rate d(Doppler)/dt of the fixed target, Hz/s; negative at broadside */
    double speed_m_s;     /**< length of the velocity that the polynomials give */
} GrPtGeometry;

/** Ground point, angles, FM rate and speed for one time, range time and Doppler on one orbit segment.
 *
 * @param[in]  tc          reference time of the polynomials, s
 * @param[in]  dt          spacing of the segment's state vectors, s. Not used: the polynomials are evaluated at
 *                         t - tc whatever the spacing.
 * @param[in]  t           azimuth time, on the scale of tc
 * @param[in]  tau         two-way range time, > 0
 * @param[in]  fd          Doppler frequency
 * @param[in]  lambda      wavelength, m, > 0
 * @param[in]  side        look sign: negative looks left, anything else right
 * @param[in]  omega       Earth-rotation rate to correct the velocity with, rad/s; 0 for Earth-fixed polynomials
 * @param[in]  cx, cy, cz  position polynomials, five coefficients each
 * @param[in]  a, b        equatorial and polar semi-axes, m, > 0
 * @param[out] out         unchanged unless 0 is returned
 * @return 0, or the status of gr_pt0(), passed on with an ERROR_CALL_TREE entry. */
QUO_BASE_API int gr_pt_lat_lon(double tc, double dt, double t, double tau, double fd, double lambda, double side,
                               double omega, const double cx[5], const double cy[5], const double cz[5], double a,
                               double b, GrPtGeometry* out) QUO_NOEXCEPT;

/** Time at which a ground point is seen with a given Doppler, and its range time then.
 *
 * @param[out] t           time in [0, span], relative to the polynomials' reference time, s
 * @param[out] tau         two-way range time, s, at the last time but one, so that no further position is worked
 * out: t moves by less than 1e-8 s after it, tau by less than a rounding at Doppler 0
 * @param[in]  scratch     not used; may be null
 * @param[in]  cx, cy, cz  position polynomials, five coefficients each
 * @param[in]  P           ground point
 * @param[in]  span        length of the segment, s
 * @param[in]  lambda      wavelength, m
 * @param[in]  fd          Doppler frequency
 * @return 0, or 12 when the iteration leaves [0, span] or an input is not a number; t and tau are then unchanged.
 *
 * Newton's method in time from span / 2: at most 8 steps, done when a step is shorter than 1e-8 s; running out of
 * steps is not an error. The span is checked before each step, so that the last one may end up to its own length
 * outside. Satellite and target rotate with the Earth alike: the rotation cancels in the Doppler equation, and
 * Earth-fixed vectors serve as they are. */
QUO_BASE_API int inv_grpt_opt(double* t, double* tau, void* scratch, const double cx[5], const double cy[5],
                              const double cz[5], const double P[3], double span, double lambda,
                              double fd) QUO_NOEXCEPT;

QUO_BASE_C_END

#endif
