// SPDX-License-Identifier: Apache-2.0
#include "range_histories.h"

#include <cmath>
#include <numbers>

#include "../common/session.h"
#include "quo_base/MatrixAlgebraANSI.h"

namespace example {

double Hyperbola::cosine(double doppler_hz) const {
    const double sine = lambda_m * doppler_hz / 2.0;
    return std::sqrt(1.0 - sine * sine / speed2);
}
double Hyperbola::time_s(double doppler_hz) const {
    return -lambda_m * range_m * doppler_hz / (2.0 * speed2 * cosine(doppler_hz));
}
double Hyperbola::migration_m(double doppler_hz) const { return range_m * (1.0 / cosine(doppler_hz) - 1.0); }
double Hyperbola::fm_rate_hz_s(double doppler_hz) const {
    const double d = cosine(doppler_hz);
    return -2.0 * speed2 * d * d * d / (lambda_m * range_m);
}

double Hyperbola::phase_rad(double doppler_hz) const {
    return 4.0 * std::numbers::pi * range_m / lambda_m * (1.0 - cosine(doppler_hz));
}

double RangeHistories::PhasePolynomial::at(double doppler_hz) const {
    const double x = (doppler_hz - centre_hz) / half_band_hz;
    return ((coefficients[3] * x + coefficients[2]) * x + coefficients[1]) * x + coefficients[0];
}

RangeHistories::RangeHistories(GeneralSAR& product, const ROI_Obj& region, double height_m)
    : product_{product}, middle_s_{region.SlowStartTime + 0.5 * region.SlowTimeLength}, height_m_{height_m} {
    const polyDC zero_doppler;
    require(product.orbit.SVGetFRpoly(&region, &zero_doppler, &fm_rate_), "the FM rate");
}

Hyperbola RangeHistories::at(double range_s) const {
    const double range_m = 0.5 * quo::kLightSpeed * range_s, lambda_m = product_.orbit.getLambda();
    double rate_hz_s = 0.0;
    fm_rate_.EvaluatePoly(range_s, middle_s_, &rate_hz_s);
    return {range_m, -0.5 * rate_hz_s * lambda_m * range_m, lambda_m};
}

RangeHistories::PhasePolynomial RangeHistories::miss(double range_s, double centre_hz, double band_hz) {
    constexpr int kFrequencies = 9;
    constexpr double kTurn = 2.0 * std::numbers::pi;
    GeneralSAROrbit& orbit = product_.orbit;
    double target[3], platform[3];
    require(orbit.sat2earth(middle_s_, range_s, 0.0, height_m_, target), "a ground point");
    const Hyperbola hyperbola = at(range_s);
    PhasePolynomial missing{centre_hz, 0.5 * band_hz, {}};
    double x[kFrequencies], phase[kFrequencies];
    for (int i = 0; i < kFrequencies; ++i) {
        x[i] = 2.0 * i / (kFrequencies - 1) - 1.0;
        const double doppler_hz = centre_hz + x[i] * missing.half_band_hz;
        double azimuth_s = 0.0, unused = 0.0;
        require(orbit.earth2sat(target, &azimuth_s, &unused, doppler_hz), "the history of a target");
        require(orbit.SVGetPos(azimuth_s, platform), "the orbit's position");
        const double distance_m = norm(quo::load(target) - quo::load(platform));
        const double cycles = 2.0 * distance_m / hyperbola.lambda_m + doppler_hz * (azimuth_s - middle_s_);
        const double turns = cycles - 2.0 * hyperbola.range_m / hyperbola.lambda_m;
        phase[i] = -kTurn * turns - hyperbola.phase_rad(doppler_hz);
    }
    require(polfit(x, phase, kFrequencies, missing.coefficients.data(), 3), "the phase of a target");
    return missing;
}

}  // namespace example
