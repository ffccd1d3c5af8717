// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_EXAMPLES_RANGE_HISTORIES_H
#define QUO_EXAMPLES_RANGE_HISTORIES_H

#include <array>

#include "quo_base/SARpolynomials.h"
#include "quo_base/generalSAR.h"
#include "quo_base/roi.h"

namespace example {

/** How a target's distance R changes while it is passed, as azimuth frequency f sees it.
 *
 * A platform in straight flight with speed v passes a target at the distance R0: R(t)^2 = R0^2 + v^2 t^2, where t
 * counts from the closest approach. Its Doppler f = -2 R'(t) / lambda gives the times and distances at which f is
 * received (the stationary points of the azimuth transform), with D(f) = sqrt(1 - (lambda f / 2 v)^2):
 *
 *     t(f) = -lambda R0 f / (2 v^2 D),    R(f) = R0 / D,    phase(f) = -4 pi R0 D / lambda
 *
 * (I. G. Cumming, F. H. Wong, "Digital Processing of Synthetic Aperture Radar Data", 2005, chapter 5; R. K. Raney,
 * "A New and Fundamental Fourier Transform Pair", IGARSS 1992). An orbit over the rotating Earth is no straight
 * flight. Its FM rate at closest approach, FR = -2 v^2 / (lambda R0), defines the effective speed v of a hyperbola
 * that fits there. */
struct Hyperbola {
    double range_m;  // R0
    double speed2;   // v^2, (m/s)^2
    double lambda_m;

    [[nodiscard]] double cosine(double doppler_hz) const;        // D
    [[nodiscard]] double time_s(double doppler_hz) const;        // t
    [[nodiscard]] double migration_m(double doppler_hz) const;   // R - R0
    [[nodiscard]] double fm_rate_hz_s(double doppler_hz) const;  // df/dt at f
    [[nodiscard]] double phase_rad(double doppler_hz) const;     // phase, against that at zero Doppler
};

/** The range histories within a region of zero-Doppler times. */
class RangeHistories {
public:
    /** A polynomial in (f - centre) / half_band, rad. */
    struct PhasePolynomial {
        double centre_hz, half_band_hz;
        std::array<double, 4> coefficients;
        [[nodiscard]] double at(double doppler_hz) const;
    };

    /** For targets at a height above the ellipsoid, m. */
    RangeHistories(GeneralSAR& product, const ROI_Obj& region, double height_m);

    /** Of a target at this range time, s. */
    [[nodiscard]] Hyperbola at(double range_s) const;
    /** How far the phase of a target in the middle of the region, at this range time, is from its hyperbola's,
     * over a Doppler band. The true phase is that of the orbit: f is received where the target is seen with the
     * Doppler f, at the time t and the distance R, and has the phase -4 pi R / lambda - 2 pi f t. */
    [[nodiscard]] PhasePolynomial miss(double range_s, double centre_hz, double band_hz);

private:
    GeneralSAR& product_;
    double middle_s_;  // azimuth time
    double height_m_;
    polyFR fm_rate_;  // at zero Doppler
};

}  // namespace example

#endif
