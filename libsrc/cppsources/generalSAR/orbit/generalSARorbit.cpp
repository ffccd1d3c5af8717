// SPDX-License-Identifier: Apache-2.0
#include "quo_base/generalSARorbit.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <limits>
#include <new>
#include <optional>
#include <utility>

#include "diagnosticslib/call_frame.h"
#include "generalSAR/orbit/orbit_check.h"
#include "generalSAR/orbit/orbit_model.h"
#include "generalSAR/orbit/orbit_table.h"
#include "profilelib/profile_look.h"
#include "quo_base/profile.h"
#include "quorelxmllib/guarded.h"

namespace {

constexpr const char* kSource = "generalSARorbit";
constexpr const char* kTooFew = "You must provide at least 5 state vectors!";
constexpr const char* kNoModel = "There are no state vectors, or no model through them";
constexpr const char* kBadArgument = "An argument is null or not finite";
constexpr const char* kBadTimes = "The times of the state vectors are not finite or do not increase";

using Obj = GeneralSAROrbit;
constexpr const auto& kTable = quo::kStateVectorTable<Obj>;

quo::StateVectors states_of(const Obj& orbit) noexcept {
    return {orbit.pSV_m, orbit.vSV_mOs, orbit.nSV_n, orbit.dtSV_s};
}

/** Whether a parameter file tells the times and the number of vectors, but the number is too small. */
bool lists_too_few(const char* file) noexcept {
    const quo::ProfileLook look{file};
    double times[2] = {};
    std::int32_t count = 0;
    return file && GetProfileDoubleArray(kTable.section(), "TimeFirst", &times[0], 1, file) == QUO_OK &&
           GetProfileDoubleArray(kTable.section(), "TimeDelta", &times[1], 1, file) == QUO_OK &&
           GetMyProfileIntArray(kTable.section(), "nStateVectors", &count, 1, file) == QUO_OK &&
           count < quo::OrbitModel::kRunVectors;
}

/** Intervals of re-sampled vectors; 0 for more vectors than are made. */
std::int32_t intervals_for(double length, double spacing) noexcept {
    constexpr double kLeast = quo::OrbitModel::kRunVectors - 1;
    // A length that is a multiple of the spacing but for rounding keeps the spacing.
    const double wanted = std::max(kLeast, std::ceil(length / spacing * (1.0 - 1e-12)));
    return wanted < Obj::kMostResampled ? static_cast<std::int32_t>(wanted) : 0;
}

/** Places of vectors that stand at times of their own, s, in mean spacings after the first; empty where the times
 * are not finite or do not increase. Throws std::bad_alloc. */
std::vector<double> places_of(const double* times, std::int32_t count, double spacing) {
    std::vector<double> places(static_cast<std::size_t>(count));
    for (std::size_t i = 0; i < places.size(); ++i) {
        places[i] = (times[i] - times[0]) / spacing;
        if (!std::isfinite(places[i]) || (i > 0 && !(places[i] > places[i - 1]))) return {};
    }
    return places;
}

/** The first finding that says that the vectors are not one spacing apart. Throws std::bad_alloc. */
std::optional<SVFinding> first_uneven(const quo::StateVectors& states, double t0) {
    const auto findings = quo::check_state_vectors(states, t0);
    const auto found = std::ranges::find_if(findings, quo::is_uneven);
    return found == findings.end() ? std::nullopt : std::optional{*found};
}

/** Vectors made from others, with the model through them. */
struct Resampled {
    std::unique_ptr<double[]> positions, velocities;
    std::unique_ptr<quo::OrbitModel> model;
};

/** Fills `made` with vectors over the span of `old`, in so many intervals. 0, 7, or the status of the model's
 * build(). */
int make_resampled(const quo::StateVectors& old, double t0, std::int32_t intervals, Resampled& made) noexcept {
    const auto values = 3 * (static_cast<std::size_t>(intervals) + 1);
    made.positions.reset(new (std::nothrow) double[values]);
    made.velocities.reset(new (std::nothrow) double[values]);
    made.model = quo::OrbitModel::create(intervals + 1);
    if (!made.positions || !made.velocities || !made.model) return QUO_NO_MEMORY;
    const double last = old.place(old.count - 1);
    const quo::StateInterpolation interpolation{old};
    for (std::int32_t i = 0; i <= intervals; ++i) {
        const std::size_t at = 3 * static_cast<std::size_t>(i);
        interpolation.at(static_cast<double>(i) / intervals * last, &made.positions[at], &made.velocities[at]);
    }
    const double length = last * old.spacing_s;
    const int status =
        made.model->build({made.positions.get(), made.velocities.get(), intervals + 1, length / intervals}, t0);
    made.model->note_resampling(interpolation.error_m());
    return status;
}

}  // namespace

QUO_RECORD(GeneralSAROrbit, kTable)

Obj::GeneralSAROrbit(double lambda) : GeneralSAROrbit{} { lambda_ = lambda; }

Obj::~GeneralSAROrbit() { Obj::destroyBuffers(); }

int Obj::createBuffers() {
    quo::CallFrame frame{"GeneralSAROrbit::createBuffers", kSource};
    model_.reset();
    vectors_ = 0;
    return quo::create_state_vectors(frame, *this, [this] {
        vectors_ = nSV_n;
        if (nSV_n >= quo::OrbitModel::kRunVectors) model_ = quo::OrbitModel::create(nSV_n);
        return model_ || nSV_n < quo::OrbitModel::kRunVectors;
    });
}

int Obj::destroyBuffers() {
    model_.reset();
    vectors_ = 0;
    return kTable.destroy_buffers(*this);
}

int Obj::writehdr(const char* file) {
    quo::CallFrame frame{"GeneralSAROrbit::writehdr", kSource};
    nSV_n = std::min(nSV_n, vectors_);
    return quo::pass_on(frame, writeAuxiliaryFile(file, 1, kTable.section()));
}

int Obj::readhdr(const char* file) {
    quo::CallFrame frame{"GeneralSAROrbit::readhdr", kSource};
    int status = quo::read_state_vectors(*this, file);
    if (!status) status = computeApproximateSV();
    if (!status) return frame.success();
    SVDestroy();
    if (status == QUO_READ_FAILED && lists_too_few(file)) return frame.fail(QUO_REFUSED, kTooFew);
    return frame.callee(status);
}

int Obj::clone(GeneralSAROrbit* other) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::clone", kSource};
    if (!other) return frame.fail(QUO_REFUSED, kBadArgument);
    if (other == this) return frame.success();
    nSV_n = std::min(nSV_n, vectors_);
    if (const int status = kTable.copy(*this, *other)) return frame.callee(status);
    if (model_ && other->model_ && model_->vectors() == other->model_->vectors()) other->model_->copy(*model_);
    other->lambda_ = lambda_;
    other->look_sign_ = look_sign_;
    return frame.success();
}

int Obj::setLambda(double lambda) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::setLambda", kSource};
    if (!(lambda > 0.0 && std::isfinite(lambda))) return frame.fail(QUO_REFUSED, "The wavelength is not positive");
    lambda_ = lambda;
    return frame.success();
}

double Obj::getLambda() const noexcept { return lambda_; }

int Obj::setLookSign(int sign) noexcept {
    look_sign_ = sign;
    return QUO_OK;
}

int Obj::getLookSign() const noexcept { return look_sign_; }

int Obj::SVCreate(double timeFirst, double timeDelta, int nStateVectors) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::SVCreate", kSource};
    SVDestroy();
    if (nStateVectors < quo::OrbitModel::kRunVectors) return frame.fail(QUO_REFUSED, kTooFew);
    t0SV_s = timeFirst;
    dtSV_s = timeDelta;
    nSV_n = nStateVectors;
    return quo::pass_on(frame, createBuffers());
}

int Obj::SVDestroy() noexcept { return destroyBuffers(); }

bool Obj::modelReady() const noexcept { return model_ && model_->ready(); }

int Obj::computeApproximateSV() noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::computeApproximateSV", kSource};
    if (model_) model_->drop();
    if (!model_ || model_->vectors() != nSV_n) return frame.fail(QUO_REFUSED, kTooFew);
    if (!quo::OrbitModel::valid_times(t0SV_s, dtSV_s, nSV_n)) return frame.fail(QUO_REFUSED, kBadTimes);
    return quo::pass_on(frame, model_->build(states_of(*this), t0SV_s));
}

int Obj::SVResample(double spacing) noexcept { return SVResample(spacing, nullptr); }

int Obj::SVResample(double spacing, const double* times) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::SVResample", kSource};
    const bool enough = nSV_n >= quo::OrbitModel::kRunVectors && nSV_n == vectors_;
    if (!enough || (!times && !modelReady())) return frame.fail(QUO_REFUSED, kNoModel);
    if (!(spacing > 0.0 && std::isfinite(spacing))) return frame.fail(QUO_REFUSED, "The spacing is not positive");
    const double length = times ? times[nSV_n - 1] - times[0] : model_->length();
    const double t0 = times ? t0SV_s + times[0] : model_->first_time();
    if (!quo::OrbitModel::valid_times(t0, length, 2)) return frame.fail(QUO_REFUSED, kBadTimes);
    const std::int32_t intervals = intervals_for(length, spacing);
    if (intervals == 0) return frame.fail(QUO_REFUSED, "That would make more than 1000000 state vectors");

    return quo::guarded(frame, [&] {
        quo::StateVectors old{pSV_m, vSV_mOs, nSV_n, length / (nSV_n - 1)};
        std::vector<double> places;
        Resampled made;
        if (times) {
            places = places_of(times, nSV_n, old.spacing_s);
            if (places.empty()) return frame.fail(QUO_REFUSED, kBadTimes);
            old.places = places.data();
        } else if (const auto finding = first_uneven(old, t0)) {
            return frame.fail(QUO_REFUSED, finding->text);
        }
        if (const int status = make_resampled(old, t0, intervals, made))
            return status == QUO_NO_MEMORY ? frame.fail(status, "Memory allocation failure")
                                           : frame.callee(status);

        const double before_m = modelReady() ? model_->resampling_error_m() : 0.0;
        made.model->note_resampling(before_m + made.model->resampling_error_m());
        delete[] std::exchange(pSV_m, made.positions.release());
        delete[] std::exchange(vSV_mOs, made.velocities.release());
        model_ = std::move(made.model);
        t0SV_s = model_->first_time();
        dtSV_s = model_->spacing();
        nSV_n = vectors_ = model_->vectors();
        refreshParameters();
        return frame.success();
    });
}

double Obj::orbitFitError() const noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::orbitFitError", kSource};
    double error_m = std::numeric_limits<double>::quiet_NaN();
    if (!modelReady() || model_->vectors() != nSV_n) {
        (void)frame.fail(QUO_REFUSED, kNoModel);
        return error_m;
    }
    error_m = quo::run_error_m(states_of(*this)) + model_->resampling_error_m();
    (void)frame.success();
    return error_m;
}

int Obj::SVCheck(std::vector<SVFinding>& findings) const noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::SVCheck", kSource};
    return quo::guarded(frame, [&] {
        quo::StateVectors states = states_of(*this);
        states.count = std::min(nSV_n, vectors_);
        findings = quo::check_state_vectors(states, t0SV_s);
        return frame.success();
    });
}

int Obj::SVGetPos(double t, double* xyz) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::SVGetPos", kSource};
    if (!modelReady()) return frame.fail(QUO_REFUSED, kNoModel);
    if (!xyz || !std::isfinite(t)) return frame.fail(QUO_REFUSED, kBadArgument);
    const quo::OrbitSegment curve = model_->select(t).curve();
    quo::store(quo::orbit_position(curve, t - model_->reference()), xyz);
    return frame.success();
}

int Obj::SVGetVel(double t, double* vxyz) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::SVGetVel", kSource};
    if (!modelReady()) return frame.fail(QUO_REFUSED, kNoModel);
    if (!vxyz || !std::isfinite(t)) return frame.fail(QUO_REFUSED, kBadArgument);
    const quo::OrbitSegment curve = model_->select(t).curve();
    quo::store(quo::orbit_velocity(curve, t - model_->reference()), vxyz);
    return frame.success();
}

double* Obj::SVGetPos(double t) noexcept {
    if (SVGetPos(t, position_)) std::fill_n(position_, 3, std::numeric_limits<double>::quiet_NaN());
    return position_;
}

double* Obj::SVGetVel(double t) noexcept {
    if (SVGetVel(t, velocity_)) std::fill_n(velocity_, 3, std::numeric_limits<double>::quiet_NaN());
    return velocity_;
}

int Obj::updatePolys(double t) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::updatePolys", kSource};
    if (!modelReady()) return frame.fail(QUO_REFUSED, kNoModel);
    if (!std::isfinite(t)) return frame.fail(QUO_REFUSED, kBadArgument);
    model_->select(t);
    return frame.success();
}

std::int64_t Obj::polyUpdates() const noexcept { return model_ ? model_->switches() : 0; }

bool Obj::isAscending() const noexcept { return nSV_n > 0 && vSV_mOs && vSV_mOs[2] > 0.0; }

int Obj::computeRotationMatrix(const double v[3], double R[9], double* speed) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::computeRotationMatrix", kSource};
    if (!v || !R || !speed || !std::isfinite(v[0] + v[1] + v[2])) return frame.fail(QUO_REFUSED, kBadArgument);
    quo::along_track_rotation(v, R, speed);
    return frame.success();
}
