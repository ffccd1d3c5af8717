// SPDX-License-Identifier: Apache-2.0
#include "quo_base/Coregist.h"

#include <cmath>
#include <limits>

#include "diagnosticslib/call_frame.h"
#include "quorelxmllib/field_table.h"
#include "roilib/rounding.h"

namespace {

constexpr const char* kSource = "Coregist";
constexpr const char* kNoInverse = "The mapping has no inverse there";

using Obj = Coregist;
constexpr quo::FieldTable kTable{
    "REGIST",
    QUO_FIELD(Az_Fit_Coeff),
    QUO_FIELD(Rg_Fit_Coeff),
    QUO_FIELD(RgFit, "Rg_Fit_Coeff_Time"),
    QUO_FIELD(AzFit, "Az_Fit_Coeff_Time"),
    QUO_FIELD(trg0, quo::element("trg0_s"), "Rg_Time_Origin", quo::unit("s")),
    QUO_FIELD(taz0, quo::element("taz0_s"), "Az_Time_Origin", quo::unit("s")),
    QUO_FIELD(Az_Samples_Origin),
    QUO_FIELD(Rg_Samples_Origin),
    QUO_FIELD(Rg_Fit_Coeffs_Relative_Errors, quo::kOptional),
    QUO_FIELD(Az_Fit_Coeffs_Relative_Errors, quo::kOptional),
};

double value_of(const double (&c)[4], double fast, double slow) {
    return (c[0] * fast + c[1]) * fast + c[2] * slow + c[3];
}

/** Time of sample or line 0 and the time from one to the next, s. */
struct Axis {
    double start = 0.0, interval = 0.0;
    [[nodiscard]] double time(double index) const { return start + index * interval; }
    [[nodiscard]] bool usable() const {
        return std::isfinite(start) && std::isfinite(interval) && interval != 0.0;
    }
};
struct Grid {
    Axis fast, slow;
    [[nodiscard]] bool usable() const { return fast.usable() && slow.usable(); }
};

/** One that is not usable where there is no region. */
Grid grid_of(const ROI_Obj* roi) {
    if (!roi) return {};
    return {{roi->FastStartTime, roi->FastTimeDelta}, {roi->SlowStartTime, roi->SlowTimeDelta}};
}

// The polynomial `time`, moved by (fast, slow) from its origin, with inputs counted in the master's intervals and
// the output in the slave's from its start.
void to_samples(const double (&time)[4], double fast, double slow, const Grid& master, const Axis& slave,
                double (&samples)[4]) {
    samples[0] = time[0] * master.fast.interval * master.fast.interval / slave.interval;
    samples[1] = (2.0 * time[0] * fast + time[1]) * master.fast.interval / slave.interval;
    samples[2] = time[2] * master.slow.interval / slave.interval;
    samples[3] = (value_of(time, fast, slow) - slave.start) / slave.interval;
}

void to_time(const double (&samples)[4], const Grid& master, const Axis& slave, double (&time)[4]) {
    time[0] = samples[0] * slave.interval / (master.fast.interval * master.fast.interval);
    time[1] = samples[1] * slave.interval / master.fast.interval;
    time[2] = samples[2] * slave.interval / master.slow.interval;
    time[3] = slave.time(samples[3]);
}

int make_samples(Coregist& fit, const Grid& master, const Grid& slave) {
    quo::CallFrame frame{"Coregist::Time2Samples", kSource};
    if (!master.usable() || !slave.usable())
        return frame.fail(QUO_REFUSED, "A sampling interval is 0 or not finite");
    fit.Rg_Samples_Origin = quo::round_clamped((fit.trg0 - master.fast.start) / master.fast.interval);
    fit.Az_Samples_Origin = quo::round_clamped((fit.taz0 - master.slow.start) / master.slow.interval);
    const double fast = master.fast.time(fit.Rg_Samples_Origin) - fit.trg0;
    const double slow = master.slow.time(fit.Az_Samples_Origin) - fit.taz0;
    to_samples(fit.RgFit, fast, slow, master, slave.fast, fit.Rg_Fit_Coeff);
    to_samples(fit.AzFit, fast, slow, master, slave.slow, fit.Az_Fit_Coeff);
    return frame.success();
}

}  // namespace

QUO_RECORD(Coregist, kTable)

int Coregist::clone(Coregist* to) const {
    const int status = kTable.copy(*this, *to);
    to->init();
    return status;
}

int Coregist::readpar(const char* file) {
    quo::CallFrame frame{"Coregist::readpar", kSource};
    const bool found = kTable.read(*this, file) == QUO_OK;
    init();
    if (!found) return frame.fail(QUO_REFUSED, "Fit polynomials read error");
    return frame.success();
}

int Coregist::writepar(const char* file) {
    writeAuxiliaryFile(file, 1, kTable.section());  // callers rely on 0: the outcome stands in the report alone
    return QUO_OK;
}

int Coregist::evaluateSLtime(double rangeTime, double azimuthTime, double* slaveRange,
                             double* slaveAzimuth) const {
    *slaveRange = evaluateSLtimeRange(rangeTime, azimuthTime);
    *slaveAzimuth = evaluateSLtimeAzimuth(rangeTime, azimuthTime);
    return QUO_OK;
}
double Coregist::evaluateSLtimeRange(double rangeTime, double azimuthTime) const {
    return value_of(RgFit, rangeTime - trg0, azimuthTime - taz0);
}
double Coregist::evaluateSLtimeAzimuth(double rangeTime, double azimuthTime) const {
    return value_of(AzFit, rangeTime - trg0, azimuthTime - taz0);
}

int Coregist::init() {
    quadratic_ = AzFit[2] * RgFit[0] - RgFit[2] * AzFit[0];
    linear_ = AzFit[2] * RgFit[1] - RgFit[2] * AzFit[1];
    linear_square_ = linear_ * linear_;
    return QUO_OK;
}

int Coregist::evaluateMAtime(double slaveRange, double slaveAzimuth, double* masterRange,
                             double* masterAzimuth) const {
    quo::CallFrame frame{"Coregist::evaluateMAtime", kSource};
    const double range = slaveRange - RgFit[3], azimuth = slaveAzimuth - AzFit[3];
    const double right = AzFit[2] * range - RgFit[2] * azimuth;
    const double square = linear_square_ + 4.0 * quadratic_ * right;
    if (!(square >= 0.0)) return frame.fail(QUO_NUMERIC, kNoInverse);
    // The root as a quotient, which neither cancels nor divides by a quadratic term that is 0.
    const double root = std::sqrt(square);
    const double dr = 2.0 * right / (linear_ + std::copysign(root, linear_));
    // da from the equation that depends on it more.
    const bool by_azimuth = std::abs(AzFit[2]) >= std::abs(RgFit[2]);
    const double(&fit)[4] = by_azimuth ? AzFit : RgFit;
    const double da = ((by_azimuth ? azimuth : range) - (fit[0] * dr + fit[1]) * dr) / fit[2];
    if (!std::isfinite(dr) || !std::isfinite(da)) return frame.fail(QUO_NUMERIC, kNoInverse);
    *masterRange = trg0 + dr;
    *masterAzimuth = taz0 + da;
    return frame.success();
}

double Coregist::evaluateMAtimeRange(double slaveRange, double slaveAzimuth) const {
    double range = std::numeric_limits<double>::quiet_NaN(), azimuth = range;
    evaluateMAtime(slaveRange, slaveAzimuth, &range, &azimuth);
    return range;
}
double Coregist::evaluateMAtimeAzimuth(double slaveRange, double slaveAzimuth) const {
    double range = std::numeric_limits<double>::quiet_NaN(), azimuth = range;
    evaluateMAtime(slaveRange, slaveAzimuth, &range, &azimuth);
    return azimuth;
}

int Coregist::Time2Samples(const ROI_Obj* master, const ROI_Obj* slave) {
    return make_samples(*this, grid_of(master), grid_of(slave));
}
int Coregist::Time2Samples(double masterRangeStart, double masterAzimuthStart, double slaveRangeStart,
                           double slaveAzimuthStart, double rangeInterval, double azimuthInterval) {
    return make_samples(*this, {{masterRangeStart, rangeInterval}, {masterAzimuthStart, azimuthInterval}},
                        {{slaveRangeStart, rangeInterval}, {slaveAzimuthStart, azimuthInterval}});
}

int Coregist::ConvertPolys(const ROI_Obj* master, const ROI_Obj* slave) {
    quo::CallFrame frame{"Coregist::ConvertPolys", kSource};
    const Grid from = grid_of(master), to = grid_of(slave);
    if (!from.usable() || !to.usable()) return frame.fail(QUO_REFUSED, "A sampling interval is 0 or not finite");
    trg0 = from.fast.time(Rg_Samples_Origin);
    taz0 = from.slow.time(Az_Samples_Origin);
    to_time(Rg_Fit_Coeff, from, to.fast, RgFit);
    to_time(Az_Fit_Coeff, from, to.slow, AzFit);
    init();
    return frame.success();
}
