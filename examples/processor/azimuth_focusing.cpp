// SPDX-License-Identifier: Apache-2.0
#include "azimuth_focusing.h"

#include <algorithm>
#include <cmath>
#include <numbers>

#include "filters.h"

namespace example {
namespace {

constexpr double kPi = std::numbers::pi;
constexpr int kGuardLines = 8;                  // beyond the aperture, for its soft ends
constexpr double kLargestMigrationMiss = 0.05;  // samples
constexpr double kLargestDrift = 0.05;          // rad, of the phase between the middle of a strip and its ends
constexpr int kFewestSamples = 64;              // of a block, whatever the migration

/** What the histories of all targets of the data run through. */
struct Reach {
    double first_s, last_s;  // times of the aperture, after zero Doppler
    double migration_s;      // range time, at most
    double steepest;         // migration per range, at most
    double drift_rad_s;      // of the phase that a squint adds
};

/** How fast the phase that a squint adds changes along the orbit, rad/s. */
double drift_of(GeneralSAR& product, const ROI_Obj& data, double height_m) {
    const double middle_s = data.SlowStartTime + 0.5 * data.SlowTimeLength;
    const double range_s = data.FastStartTime + 0.5 * data.FastTimeLength;
    double centre_hz = 0.0;
    require(product.polynomials.EvaluateDC(range_s, middle_s, &centre_hz), "the Doppler centroid");
    ROI_Obj half;
    data.clone(&half);
    half.SetSlowAxe(data.SlowStartTime, 0.5 * data.SlowTimeDelta, data.Lines);
    const double early = RangeHistories{product, half, height_m}.at(range_s).phase_rad(centre_hz);
    half.SetSlowAxe(middle_s, 0.5 * data.SlowTimeDelta, data.Lines);
    const double late = RangeHistories{product, half, height_m}.at(range_s).phase_rad(centre_hz);
    return std::abs(late - early) / (0.5 * data.SlowTimeLength);
}

Reach reach_of(GeneralSAR& product, const ROI_Obj& data, const DopplerBand& band, double height_m) {
    constexpr int kRanges = 5;
    const RangeHistories histories{product, data, height_m};
    const double middle_s = data.SlowStartTime + 0.5 * data.SlowTimeLength;
    Reach reach{1e9, -1e9, 0.0, 0.0, drift_of(product, data, height_m)};
    for (int i = 0; i < kRanges; ++i) {
        const double range_s = data.FastStartTime + i * data.FastTimeLength / (kRanges - 1);
        double centre_hz = 0.0;
        require(product.polynomials.EvaluateDC(range_s, middle_s, &centre_hz), "the Doppler centroid");
        const Hyperbola history = histories.at(range_s);
        for (const double side : {-0.5, 0.5}) {
            const double doppler_hz = centre_hz + side * band.width_hz;
            reach.first_s = std::min(reach.first_s, history.time_s(doppler_hz));
            reach.last_s = std::max(reach.last_s, history.time_s(doppler_hz));
            reach.migration_s =
                std::max(reach.migration_s, 2.0 * history.migration_m(doppler_hz) / quo::kLightSpeed);
            reach.steepest = std::max(reach.steepest, history.migration_m(doppler_hz) / history.range_m);
        }
    }
    return reach;
}

void lay_out_lines(BlockLayout& layout, const AzimuthConf& conf, const ROI_Obj& data, const Reach& reach) {
    const int before = static_cast<int>(std::floor(reach.first_s / data.SlowTimeDelta)) - kGuardLines;
    const int after = static_cast<int>(std::ceil(reach.last_s / data.SlowTimeDelta)) + kGuardLines;
    layout.lead_lines = before;
    layout.first_line = -before;
    layout.lines = data.Lines - (after - before);
    if (layout.lines < 1)
        throw Failure{"the data has " + std::to_string(data.Lines) + " lines; an aperture has " +
                      std::to_string(after - before + 1)};
    const int overlap = std::max(after - before, conf.AzimuthOverlap);
    const double strip = 2.0 * kLargestDrift / (reach.drift_rad_s * data.SlowTimeDelta);
    const int longest = overlap + static_cast<int>(std::min(strip, static_cast<double>(data.Lines)));
    const int wanted = std::max(std::min(conf.LinesInBlock, longest), overlap + overlap / 2);
    layout.block_lines = genpow(std::min(wanted, data.Lines + overlap - (after - before)), 1);
    layout.step_lines = layout.block_lines - overlap;
}

void lay_out_samples(BlockLayout& layout, const AzimuthConf& conf, const ROI_Obj& data, const Reach& reach) {
    const int migration = static_cast<int>(std::ceil(reach.migration_s / data.FastTimeDelta));
    layout.guard_samples = conf.RangeOverlap;
    layout.samples = data.Samples - migration;
    if (layout.samples < 1) throw Failure{"the data is narrower than its targets' migration"};
    const int overlap = 2 * layout.guard_samples + migration;
    const int widest = static_cast<int>(2.0 * kLargestMigrationMiss / reach.steepest);
    const int wanted = std::min({conf.SamplesInBlock, widest, data.Samples + 2 * layout.guard_samples});
    layout.block_samples = genpow(std::max({wanted, overlap + overlap / 2, kFewestSamples}), 1);
    layout.step_samples = layout.block_samples - overlap;
}

}  // namespace

BlockLayout lay_out(GeneralSAR& product, const AzimuthConf& conf, const ROI_Obj& data, const DopplerBand& band,
                    double height_m) {
    const Reach reach = reach_of(product, data, band, height_m);
    BlockLayout layout{};
    lay_out_lines(layout, conf, data, reach);
    lay_out_samples(layout, conf, data, reach);
    return layout;
}

AzimuthFocusing::AzimuthFocusing(const BlockLayout& layout, const DopplerBand& band, double range_step_s)
    : band_{band},
      range_step_s_{range_step_s},
      block_{layout.block_lines, layout.block_samples},
      forward_{layout.block_lines, layout.block_samples, +1, +1},
      inverse_range_{layout.block_lines, layout.block_samples, -2, 0},
      inverse_azimuth_{layout.block_lines, layout.block_samples, 0, -2},
      weights_(static_cast<std::size_t>(layout.block_lines)) {}

void AzimuthFocusing::aim(GeneralSAR& product, RangeHistories& histories, double range_s, double azimuth_s) {
    const int middle = block_.samples() / 2;
    const double middle_s = range_s + middle * range_step_s_;
    require(product.polynomials.EvaluateDC(middle_s, azimuth_s, &centre_hz_), "the Doppler centroid");
    middle_ = histories.at(middle_s);
    near_ = histories.at(range_s);
    far_ = histories.at(range_s + 2.0 * middle * range_step_s_);
    miss_ = histories.miss(middle_s, centre_hz_, band_.width_hz);

    double bins = 0.0;
    for (int bin = 0; bin < block_.lines(); ++bin) {
        double& weight = weights_[static_cast<std::size_t>(bin)];
        weight = band_weight(doppler_hz(bin) - centre_hz_, band_.width_hz, band_.hamming);
        bins += weight;
    }
    // A history of amplitude 1 has prf / sqrt(|FM rate|) in each bin of its band. The peak becomes 1.
    scale_ = std::sqrt(-middle_.fm_rate_hz_s(centre_hz_)) / (band_.prf_hz * bins * block_.samples());
}

/** The Doppler of a bin: that of its aliases which lies within half a PRF of the centroid. */
double AzimuthFocusing::doppler_hz(int bin) const {
    const double alias_hz = bin * band_.prf_hz / block_.lines();
    return alias_hz + band_.prf_hz * std::round((centre_hz_ - alias_hz) / band_.prf_hz);
}

/** The conjugate phase of a target at the middle range along the range frequencies, in steps of these, up to its
 * phase at zero Doppler. The stationary point of a falling Doppler leaves -pi / 4 behind. */
RowPhase AzimuthFocusing::middle_phase(double doppler_hz) const {
    const double d = middle_.cosine(doppler_hz);
    const double step_hz = 1.0 / (range_step_s_ * block_.samples());
    const double phase_per_hz = 4.0 * kPi * middle_.range_m / quo::kLightSpeed;
    const double dispersion =
        -0.5 * phase_per_hz * (1.0 - d * d) * middle_.lambda_m / (quo::kLightSpeed * d * d * d);
    return {kPi / 4.0 - middle_.phase_rad(doppler_hz) - miss_.at(doppler_hz),
            phase_per_hz * (1.0 / d - 1.0) * step_hz, dispersion * step_hz * step_hz};
}

/** What the phase of a column's own history adds to that of the middle, as a parabola in the column's number. */
RowPhase AzimuthFocusing::column_phase(double doppler_hz) const {
    const int middle = block_.samples() / 2;
    const double half = middle;  // columns from the near to the middle range, and on to the far
    const double phase = middle_.phase_rad(doppler_hz);
    const double near = phase - near_.phase_rad(doppler_hz), far = phase - far_.phase_rad(doppler_hz);
    return {0.0, (far - near) / (2.0 * half), (far + near) / (2.0 * half * half)};
}

void AzimuthFocusing::filter_middle() {
    const int samples = block_.samples(), positive = (samples + 1) / 2;
    for (int bin = 0; bin < block_.lines(); ++bin) {
        const double weight = weights_[static_cast<std::size_t>(bin)];
        fcomplex* row = block_.line(bin);
        if (weight == 0.0) {
            std::fill_n(row, samples, fcomplex{});
            continue;
        }
        const RowPhase phase = middle_phase(doppler_hz(bin));
        turn(row, positive, 0, weight * scale_, phase);
        turn(row + positive, samples - positive, positive - samples, weight * scale_, phase);
    }
}

void AzimuthFocusing::filter_columns() {
    const int middle = block_.samples() / 2;
    for (int bin = 0; bin < block_.lines(); ++bin)
        if (weights_[static_cast<std::size_t>(bin)] > 0.0)
            turn(block_.line(bin), block_.samples(), -middle, 1.0, column_phase(doppler_hz(bin)));
}

void AzimuthFocusing::focus(GeneralSAR& product, RangeHistories& histories, double range_s, double azimuth_s,
                            Stopwatch& watch) {
    watch.time(kTransforms, [this] { forward_.run(block_); });
    watch.time(kFilters, [&] {
        aim(product, histories, range_s, azimuth_s);
        filter_middle();
    });
    watch.time(kTransforms, [this] { inverse_range_.run(block_); });
    watch.time(kFilters, [this] { filter_columns(); });
    watch.time(kTransforms, [this] { inverse_azimuth_.run(block_); });
}

}  // namespace example
