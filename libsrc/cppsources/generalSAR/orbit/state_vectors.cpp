// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cmath>
#include <cstddef>
#include <new>

#include "diagnosticslib/call_frame.h"
#include "generalSAR/orbit/orbit_table.h"
#include "quo_base/generalSARorbit.h"
#include "quo_base/interp_orb.h"
#include "quorelxmllib/guarded.h"

namespace {

constexpr const char* kSource = "generalSARorbit";
constexpr const char* kNoVectors = "There are no state vectors, or no polynomials through them";
constexpr const char* kBadArgument = "An argument is null or not finite";
using Obj = SAROrbitStateVectors_Obj;
constexpr const auto& kTable = quo::kStateVectorTable<Obj>;

}  // namespace

QUO_RECORD(SAROrbitStateVectors_Obj, kTable)

Obj::~SAROrbitStateVectors_Obj() { Obj::destroyBuffers(); }

int Obj::createBuffers() {
    quo::CallFrame frame{"SAROrbitStateVectors_Obj::createBuffers", kSource};
    drop_polynomials();
    return quo::create_state_vectors(frame, *this, [this] {
        vectors_ = nSV_n;
        return quo::renew_array(polynomials_, 6 * static_cast<std::size_t>(nSV_n));
    });
}

int Obj::destroyBuffers() {
    drop_polynomials();
    return kTable.destroy_buffers(*this);
}

void Obj::drop_polynomials() noexcept {
    polynomials_.reset();
    vectors_ = 0;
    fitted_ = false;
}

int Obj::writehdr(const char* file) {
    quo::CallFrame frame{"SAROrbitStateVectors_Obj::writehdr", kSource};
    nSV_n = std::min(nSV_n, vectors_);
    return quo::pass_on(frame, writeAuxiliaryFile(file, 1, kTable.section()));
}

int Obj::readhdr(const char* file) {
    quo::CallFrame frame{"SAROrbitStateVectors_Obj::readhdr", kSource};
    const int status = quo::read_state_vectors(*this, file);
    if (!status) return frame.success();
    SVDestroy();
    return frame.callee(status);
}

int Obj::SVCreate(double timeFirst, double timeDelta, int nStateVectors) noexcept {
    quo::CallFrame frame{"SAROrbitStateVectors_Obj::SVCreate", kSource};
    SVDestroy();
    t0SV_s = timeFirst;
    dtSV_s = timeDelta;
    nSV_n = nStateVectors;
    return quo::pass_on(frame, createBuffers());
}

int Obj::SVDestroy() noexcept { return destroyBuffers(); }

int Obj::SVPolyCompute() noexcept {
    quo::CallFrame frame{"SAROrbitStateVectors_Obj::SVPolyCompute", kSource};
    fitted_ = false;
    if (vectors_ == 0 || nSV_n != vectors_) return frame.fail(QUO_REFUSED, kNoVectors);
    const std::ptrdiff_t n = vectors_;
    double* c = polynomials_.get();
    if (const int status = orb_interp(0.0, dtSV_s, pSV_m, vSV_mOs, vectors_, c, c + n, c + 2 * n))
        return frame.callee(status);
    c += 3 * n;
    if (const int status = orb_interp(0.0, dtSV_s, vSV_mOs, nullptr, vectors_, c, c + n, c + 2 * n))
        return frame.callee(status);
    fitted_ = true;
    return frame.success();
}

const double* Obj::positionPoly(int axis) const noexcept {
    if (!fitted_ || axis < 0 || axis > 2) return nullptr;
    return polynomials_.get() + static_cast<std::ptrdiff_t>(axis) * vectors_;
}

const double* Obj::velocityPoly(int axis) const noexcept {
    const double* position = positionPoly(axis);
    return position ? position + 3 * static_cast<std::ptrdiff_t>(vectors_) : nullptr;
}

int Obj::SVGetPos(double t, double* xyz) noexcept {
    quo::CallFrame frame{"SAROrbitStateVectors_Obj::SVGetPos", kSource};
    if (!fitted_) return frame.fail(QUO_REFUSED, kNoVectors);
    if (!xyz || !std::isfinite(t - t0SV_s)) return frame.fail(QUO_REFUSED, kBadArgument);
    for (int axis = 0; axis < 3; ++axis)
        xyz[axis] = POSMACRO(t - t0SV_s, positionPoly(axis), static_cast<unsigned>(vectors_));
    return frame.success();
}

int Obj::SVGetVel(double t, double* vxyz) noexcept {
    quo::CallFrame frame{"SAROrbitStateVectors_Obj::SVGetVel", kSource};
    if (!fitted_) return frame.fail(QUO_REFUSED, kNoVectors);
    if (!vxyz || !std::isfinite(t - t0SV_s)) return frame.fail(QUO_REFUSED, kBadArgument);
    for (int axis = 0; axis < 3; ++axis)
        vxyz[axis] = VELMACRO(t - t0SV_s, positionPoly(axis), static_cast<unsigned>(vectors_));
    return frame.success();
}

int Obj::clone(SAROrbitStateVectors_Obj* other) noexcept {
    quo::CallFrame frame{"SAROrbitStateVectors_Obj::clone", kSource};
    if (!other) return frame.fail(QUO_REFUSED, kBadArgument);
    if (other == this) return frame.success();
    nSV_n = std::min(nSV_n, vectors_);
    if (const int status = kTable.copy(*this, *other)) return frame.callee(status);
    other->LookDirection = LookDirection;
    other->fitted_ = fitted_ && other->vectors_ == vectors_;
    if (other->fitted_)
        std::copy_n(polynomials_.get(), 6 * static_cast<std::size_t>(vectors_), other->polynomials_.get());
    return frame.success();
}
