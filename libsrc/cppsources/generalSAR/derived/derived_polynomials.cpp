// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cmath>
#include <cstddef>

#include "diagnosticslib/call_frame.h"
#include "quo_base/MatrixAlgebraANSI.h"
#include "quo_base/SARpolynomials.h"
#include "quo_base/alloc_free.h"
#include "quo_base/generalSARorbit.h"
#include "quo_base/roi.h"

namespace {

constexpr const char* kSource = "generalSARorbit";
constexpr const char* kNull = "The region, the Doppler or the output is null";
constexpr const char* kNotFinite = "The fit does not give finite numbers";

using Obj = GeneralSAROrbit;

// Kernels pass the status of a callee through `frame` themselves, with its entry, and return it.

// --- sampling ---------------------------------------------------------------------------------------------------

/** Equally spaced times. */
struct Steps {
    double start_s, step_s;
    [[nodiscard]] double time(int i) const noexcept { return start_s + i * step_s; }
};
Steps fast_steps(const ROI_Obj& roi, int samples) noexcept {
    return {roi.FastStartTime, roi.FastTimeLength / (samples - 1)};
}
Steps slow_steps(const ROI_Obj& roi, int lines) noexcept {
    return {roi.SlowStartTime, roi.SlowTimeLength / (lines - 1)};
}
double middle_azimuth(const ROI_Obj& roi) noexcept { return roi.SlowStartTime + roi.SlowTimeLength * 0.5; }

/** An orbit that looks with the Doppler of a polynomial. */
struct View {
    GeneralSAROrbit& orbit;
    const polyDC& dc;

    [[nodiscard]] double doppler(double azimuth_s, double range_s) const noexcept {
        double value_hz = 0.0;
        dc.EvaluatePoly(range_s, azimuth_s, &value_hz);
        return value_hz;
    }
    int fm_rate(double azimuth_s, double range_s, double* rate) const noexcept {
        return orbit.SVGetFR(azimuth_s, range_s, doppler(azimuth_s, range_s), rate);
    }
    int angles(double azimuth_s, double range_s, double* incidence, double* look) const noexcept {
        return orbit.SVGetAngles(azimuth_s, range_s, doppler(azimuth_s, range_s), incidence, look);
    }
    int ground(double azimuth_s, double range_s, double* xyz) const noexcept {
        return orbit.sat2earth(azimuth_s, range_s, doppler(azimuth_s, range_s), xyz);
    }
};

/** Ground range of `samples` range times at one azimuth time: the sum of the chords. */
int ground_ranges(const View& view, double azimuth_s, const Steps& fast, int samples, double* ground_m) noexcept {
    double before[3]{}, point[3]{};
    double sum_m = 0.0;
    for (int i = 0; i < samples; ++i) {
        if (const int status = view.ground(azimuth_s, fast.time(i), point)) return status;
        if (i > 0) sum_m += std::hypot(point[0] - before[0], point[1] - before[1], point[2] - before[2]);
        ground_m[i] = sum_m;
        std::ranges::copy(point, before);
    }
    return QUO_OK;
}

// --- polynomials in range alone ---------------------------------------------------------------------------------

/** c0 + c1 x + c2 x^2. */
struct Parabola {
    double c[3]{};

    [[nodiscard]] bool finite() const noexcept { return std::isfinite(c[0] + c[1] + c[2]); }
    void store(poly& out, double trg0) const noexcept {
        const double pol[] = {c[0], c[1], 0.0, 0.0, c[2], 0.0, 0.0};
        std::ranges::copy(pol, out.pol);
        out.trg0 = trg0;
        out.taz0 = 0.0;
    }
    /** The same curve over (x + distance) / scale. */
    [[nodiscard]] Parabola moved(double distance, double scale) const noexcept {
        const double linear = c[1] / scale, quadratic = c[2] / (scale * scale);
        return {
            {c[0] + (linear + quadratic * distance) * distance, linear + 2.0 * quadratic * distance, quadratic}};
    }
};

int fit_parabola(quo::CallerFrame frame, const double* x, const double* y, int count, Parabola* fitted) noexcept {
    if (const int status = polfit(x, y, count, fitted->c, 2)) return frame.callee(status);
    return fitted->finite() ? QUO_OK : frame.fail(QUO_NUMERIC, kNotFinite);
}

constexpr int kSamples = 10;

/** Ten samples from the first range time to the last. */
struct RangeCut {
    Steps fast;
    double since_start_s[kSamples]{};

    explicit RangeCut(const ROI_Obj& roi) noexcept : fast{fast_steps(roi, kSamples)} {
        for (int i = 0; i < kSamples; ++i) since_start_s[i] = i * fast.step_s;
    }
};

// --- polynomials in both times ----------------------------------------------------------------------------------

constexpr int kRanges = 100, kAzimuths = 50, kPoints = kRanges * kAzimuths, kTerms = 7;
constexpr std::size_t kGridSize = kPoints;

/** The terms of `poly` at point number p, in units of samples and lines. */
void grid_terms(double p, double values[], int /*count*/) {
    const double line = std::floor(p / kRanges), sample = p - kRanges * line;
    const double square = sample * sample;
    const double terms[kTerms] = {1.0, sample, line, sample * line, square, square * sample, square * square};
    std::ranges::copy(terms, values + 1);
}

/** A quantity on the grid, from element 1 on as lfitd() takes it, range index first. */
class GridValues {
public:
    GridValues() noexcept : values_{kGridSize + 1} {}
    explicit operator bool() const noexcept { return static_cast<bool>(values_); }
    [[nodiscard]] const double* one_based() const noexcept { return values_.data(); }
    /** The values of one azimuth time. */
    [[nodiscard]] double* line(int j) noexcept { return values_.data() + 1 + std::ptrdiff_t{kRanges} * j; }
    [[nodiscard]] const double* line(int j) const noexcept {
        return values_.data() + 1 + std::ptrdiff_t{kRanges} * j;
    }

private:
    quo::TrackedBuffer<double> values_;
};

/** Fits quantities on the grid. */
class GridFit {
public:
    GridFit() noexcept {
        if (!has_memory()) return;
        for (int p = 0; p < kPoints; ++p) *(numbers_.line(0) + p) = p;
        std::fill_n(ones_.line(0), kPoints, 1.0);
    }
    [[nodiscard]] bool has_memory() const noexcept { return numbers_ && ones_; }

    /** Coefficients around the grid's origin, for the steps of the two axes. The fit runs in units of samples and
     * lines, where its terms are of like weight; a coefficient in seconds is that of the fit over the steps. */
    int run(quo::CallerFrame frame, const GridValues& values, double x_step, double y_step,
            double (&pol)[kTerms]) const noexcept {
        double a[kTerms + 1]{};
        if (const int status = run_in_steps(values, a)) return frame.callee(status);
        const double xx = x_step * x_step;
        const double units[kTerms] = {1.0, x_step, y_step, x_step * y_step, xx, xx * x_step, xx * xx};
        for (int k = 0; k < kTerms; ++k) {
            pol[k] = a[k + 1] / units[k];
            if (!std::isfinite(pol[k])) return frame.fail(QUO_NUMERIC, kNotFinite);
        }
        return QUO_OK;
    }

private:
    int run_in_steps(const GridValues& values, double* a) const noexcept {
        int all[kTerms + 1];
        std::ranges::fill(all, 1);
        double chi_square = 0.0;
        double** covariance = dmatrix(1, kTerms, 1, kTerms);
        if (!covariance) return QUO_NO_MEMORY;
        const int status = lfitd(numbers_.one_based(), values.one_based(), ones_.one_based(), kPoints, a, all,
                                 kTerms, covariance, &chi_square, grid_terms);
        free_dmatrix(covariance, 1, kTerms, 1, kTerms);
        return status;
    }

    GridValues numbers_, ones_;
};

/** Where the samples of a region stand. */
struct Grid {
    Steps fast, slow;
    explicit Grid(const ROI_Obj& roi) noexcept
        : fast{fast_steps(roi, kRanges)}, slow{slow_steps(roi, kAzimuths)} {}
    [[nodiscard]] bool has_extent() const noexcept { return fast.step_s != 0.0 && slow.step_s != 0.0; }
    void store(const double (&pol)[kTerms], poly& out) const noexcept {
        std::ranges::copy(pol, out.pol);
        out.trg0 = fast.start_s;
        out.taz0 = slow.start_s;
    }
};
constexpr const char* kNoExtent = "The region has no extent";
constexpr const char* kNoMemory = "Memory allocation failure";

int sample_angles(const View& view, const Grid& grid, GridValues& theta, GridValues& phi) noexcept {
    for (int j = 0; j < kAzimuths; ++j) {
        double *incidence = theta.line(j), *look = phi.line(j);
        for (int i = 0; i < kRanges; ++i) {
            if (const int status = view.angles(grid.slow.time(j), grid.fast.time(i), incidence + i, look + i))
                return status;
        }
    }
    return QUO_OK;
}

int sample_ground(const View& view, const Grid& grid, GridValues& ground) noexcept {
    for (int j = 0; j < kAzimuths; ++j) {
        if (const int status = ground_ranges(view, grid.slow.time(j), grid.fast, kRanges, ground.line(j)))
            return status;
    }
    return QUO_OK;
}

/** The sample index, with its fraction, at which a line reaches a ground range: the cubic through the four samples
 * around it. Its error is far below a thousandth of what the fit leaves. */
double index_at(const double* ground_m, double wanted_m) noexcept {
    const auto above = std::lower_bound(ground_m, ground_m + kRanges, wanted_m) - ground_m;
    const int first = static_cast<int>(std::clamp<std::ptrdiff_t>(above - 2, 0, kRanges - 4));
    double index = 0.0;
    for (int k = first; k < first + 4; ++k) {
        double weight = 1.0;
        for (int m = first; m < first + 4; ++m) {
            if (m != k) weight *= (wanted_m - ground_m[m]) / (ground_m[k] - ground_m[m]);
        }
        index += weight * k;
    }
    return index;
}

/** Turns ground ranges over range time into range times over ground range, after the region's start: steps from 0
 * to the shortest line's ground range. Returns the step, m. */
double invert_ground(const GridValues& ground, double step_s, GridValues& slant) noexcept {
    double reach_m = ground.line(0)[kRanges - 1];
    for (int j = 1; j < kAzimuths; ++j) reach_m = std::min(reach_m, ground.line(j)[kRanges - 1]);
    const double step_m = reach_m / (kRanges - 1);
    for (int j = 0; j < kAzimuths; ++j) {
        for (int i = 0; i < kRanges; ++i) slant.line(j)[i] = step_s * index_at(ground.line(j), i * step_m);
    }
    return step_m;
}

}  // namespace

int Obj::SVGetFRpoly(const ROI_Obj* roi, const polyDC* dc, polyFR* fr) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::SVGetFRpoly", kSource};
    if (!roi || !dc) return frame.fail(QUO_REFUSED, kNull);
    if (!fr) return frame.success();
    const View view{*this, *dc};
    const RangeCut cut{*roi};
    double rates[kSamples];
    for (int i = 0; i < kSamples; ++i) {
        if (const int status = view.fm_rate(middle_azimuth(*roi), cut.fast.time(i), rates + i))
            return frame.callee(status);
    }
    Parabola fitted;
    if (const int status = fit_parabola(frame, cut.since_start_s, rates, kSamples, &fitted)) return status;
    fitted.store(*fr, roi->FastStartTime);
    return frame.success();
}

int Obj::SVGetFRpoly_v2(const ROI_Obj* roi, const polyDC* dc, polyFR* fr) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::SVGetFRpoly_v2", kSource};
    if (!roi || !dc) return frame.fail(QUO_REFUSED, kNull);
    if (!fr) return frame.success();
    constexpr int kFineSamples = 50;
    const View view{*this, *dc};
    const Steps fast = fast_steps(*roi, kFineSamples);
    // The normal equations in powers of range time - trg0 lose all digits where trg0 is far off. So the parabola
    // is fitted over -1..1 and then moved, which gives the same curve.
    const double half_s = roi->FastTimeLength * 0.5, scale_s = half_s != 0.0 ? half_s : 1.0;
    double x[kFineSamples], rates[kFineSamples];
    for (int i = 0; i < kFineSamples; ++i) {
        x[i] = (i * fast.step_s - half_s) / scale_s;
        if (const int status = view.fm_rate(middle_azimuth(*roi), fast.time(i), rates + i))
            return frame.callee(status);
    }
    Parabola fitted;
    if (const int status = fit_parabola(frame, x, rates, kFineSamples, &fitted)) return status;
    const Parabola around = fitted.moved(dc->trg0 - roi->FastStartTime - half_s, scale_s);
    if (!around.finite()) return frame.fail(QUO_NUMERIC, kNotFinite);
    around.store(*fr, dc->trg0);
    return frame.success();
}

int Obj::SVGetSlantToAnglesPolys(const ROI_Obj* roi, const polyDC* dc, polySL2THETA* theta,
                                 polySL2PHI* phi) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::SVGetSlantToAnglesPolys", kSource};
    if (!roi || !dc) return frame.fail(QUO_REFUSED, kNull);
    const View view{*this, *dc};
    const RangeCut cut{*roi};
    double incidence[kSamples], look[kSamples];
    for (int i = 0; i < kSamples; ++i) {
        if (const int status = view.angles(middle_azimuth(*roi), cut.fast.time(i), incidence + i, look + i))
            return frame.callee(status);
    }
    Parabola to_theta, to_phi;
    int status = theta ? fit_parabola(frame, cut.since_start_s, incidence, kSamples, &to_theta) : QUO_OK;
    if (!status && phi) status = fit_parabola(frame, cut.since_start_s, look, kSamples, &to_phi);
    if (status) return status;
    if (theta) to_theta.store(*theta, roi->FastStartTime);
    if (phi) to_phi.store(*phi, roi->FastStartTime);
    return frame.success();
}

int Obj::SVGetGroundToSlantPolys(const ROI_Obj* roi, const polyDC* dc, polySL2GR* sl2gr,
                                 polyGR2SL* gr2sl) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::SVGetGroundToSlantPolys", kSource};
    if (!roi || !dc) return frame.fail(QUO_REFUSED, kNull);
    const RangeCut cut{*roi};
    double ground_m[kSamples];
    if (const int status = ground_ranges({*this, *dc}, middle_azimuth(*roi), cut.fast, kSamples, ground_m))
        return frame.callee(status);
    Parabola to_ground, to_slant;
    int status = sl2gr ? fit_parabola(frame, cut.since_start_s, ground_m, kSamples, &to_ground) : QUO_OK;
    if (!status && gr2sl) status = fit_parabola(frame, ground_m, cut.since_start_s, kSamples, &to_slant);
    if (status) return status;
    if (sl2gr) to_ground.store(*sl2gr, roi->FastStartTime);
    if (gr2sl) to_slant.store(*gr2sl, roi->FastStartTime);
    return frame.success();
}

int Obj::SVGetTimeToAnglesPolys(const ROI_Obj* roi, const polyDC* dc, polySL2THETA* theta,
                                polySL2PHI* phi) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::SVGetTimeToAnglesPolys", kSource};
    if (!roi || !dc) return frame.fail(QUO_REFUSED, kNull);
    const Grid grid{*roi};
    if (!grid.has_extent()) return frame.fail(QUO_NUMERIC, kNoExtent);
    const GridFit fit;
    GridValues incidence, look;
    if (!fit.has_memory() || !incidence || !look) return frame.fail(QUO_NO_MEMORY, kNoMemory);
    if (const int status = sample_angles({*this, *dc}, grid, incidence, look)) return frame.callee(status);

    double to_theta[kTerms], to_phi[kTerms];
    int status = theta ? fit.run(frame, incidence, grid.fast.step_s, grid.slow.step_s, to_theta) : QUO_OK;
    if (!status && phi) status = fit.run(frame, look, grid.fast.step_s, grid.slow.step_s, to_phi);
    if (status) return status;
    if (theta) grid.store(to_theta, *theta);
    if (phi) grid.store(to_phi, *phi);
    return frame.success();
}

int Obj::SVGetGroundToTimePolys(const ROI_Obj* roi, const polyDC* dc, polySL2GR* sl2gr,
                                polyGR2SL* gr2sl) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::SVGetGroundToTimePolys", kSource};
    if (!roi || !dc) return frame.fail(QUO_REFUSED, kNull);
    const Grid grid{*roi};
    if (!grid.has_extent()) return frame.fail(QUO_NUMERIC, kNoExtent);
    const GridFit fit;
    GridValues ground, slant;
    if (!fit.has_memory() || !ground || !slant) return frame.fail(QUO_NO_MEMORY, kNoMemory);
    if (const int status = sample_ground({*this, *dc}, grid, ground)) return frame.callee(status);
    const double ground_step_m = invert_ground(ground, grid.fast.step_s, slant);

    double to_ground[kTerms], to_slant[kTerms];
    int status = sl2gr ? fit.run(frame, ground, grid.fast.step_s, grid.slow.step_s, to_ground) : QUO_OK;
    if (!status && gr2sl) status = fit.run(frame, slant, ground_step_m, grid.slow.step_s, to_slant);
    if (status) return status;
    if (sl2gr) grid.store(to_ground, *sl2gr);
    if (gr2sl) grid.store(to_slant, *gr2sl);
    return frame.success();
}
