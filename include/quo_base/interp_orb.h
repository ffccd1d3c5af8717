// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_INTERP_ORB_H
#define QUO_BASE_INTERP_ORB_H

#include "quo_base/api.h"

QUO_BASE_C_BEGIN

/** @file
 * Orbit polynomials: evaluation, and the fit through state vectors.
 *
 * A polynomial of n coefficients is stored highest degree first: at u seconds from its reference time its value is
 * c[n-1] + c[n-2] u + ... + c[0] u^(n-1). A trajectory is three of them, for x, y and z in metres.
 * Nothing is kept between calls: any number of threads may call at a time. */

/** Value of the polynomial at u. With n = 1 it is c[0]; with n = 0 it is 0 and c is not read. */
QUO_BASE_API double POSMACRO(double u, const double* c, unsigned n) QUO_NOEXCEPT;

/** Exact first derivative of the polynomial at u; 0 for n < 2. */
QUO_BASE_API double VELMACRO(double u, const double* c, unsigned n) QUO_NOEXCEPT;

/** Exact second derivative of the polynomial at u; 0 for n < 3. */
QUO_BASE_API double ACCMACRO(double u, const double* c, unsigned n) QUO_NOEXCEPT;

/** Position (m), velocity (m/s) and acceleration (m/s^2) at u of a trajectory of three 5-coefficient polynomials.
 */
QUO_BASE_API void POSVELACC_5(double u, const double cx[5], const double cy[5], const double cz[5], double pos[3],
                              double vel[3], double acc[3]) QUO_NOEXCEPT;

/** Polynomial of degree n - 1 through n equally spaced values of one axis.
 *
 * @param[in]  t0      time of the first value, from the polynomial's reference time, s
 * @param[in]  dt      spacing, s, not 0 (any value where n is 1)
 * @param[in]  values  n values
 * @param[in]  n       their number, >= 1
 * @param[out] c       n coefficients, highest degree first; unchanged unless 0 is returned
 * @return 0; 1 for n < 1 or a spacing that is 0 or not finite; 7 when memory cannot be had; 10 where a value is
 * not finite or a coefficient would not be.
 *
 * The fit is made in a variable that is centred on the span and scaled to it, and expanded once, at the end.
 *
 * As stored and evaluated in double precision the polynomial meets the values to rounding up to about n = 20.
 * Beyond, no such polynomial does: rounding the coefficients of degree 30 alone moves an orbit by metres, at the
 * state vectors too. The fit then ends at the degree, in the sense of least squares, whose polynomial lies closest
 * to the values as POSMACRO() evaluates it, and the coefficients above are 0. For a reference time near the
 * values; one that is many spans away costs digits. */
QUO_BASE_API int orbffit(double t0, double dt, const double* values, int n, double* c) QUO_NOEXCEPT;

/** Position polynomials through n equally spaced state vectors, fitted axis by axis with orbffit().
 *
 * @param[in]  t0          time of the first state vector, from the polynomials' reference time, s
 * @param[in]  dt          spacing of the state vectors, s
 * @param[in]  pos         n x 3 positions, x y z of each state vector in turn, m
 * @param[in]  vel         n x 3 velocities, m/s. Not used, and may be null: n positions fix n coefficients.
 * @param[in]  n           number of state vectors and of coefficients, >= 1
 * @param[out] cx, cy, cz  n coefficients each, highest degree first; unchanged unless 0 is returned
 * @return 0; 1 for n < 1; 7 when memory cannot be had; otherwise the status of orbffit(), passed on with an
 *         ERROR_CALL_TREE entry. */
QUO_BASE_API int orb_interp(double t0, double dt, const double* pos, const double* vel, int n, double* cx,
                            double* cy, double* cz) QUO_NOEXCEPT;

QUO_BASE_C_END

#endif
