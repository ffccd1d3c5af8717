// SPDX-License-Identifier: Apache-2.0
#include <cmath>
#include <cstddef>

#include "diagnosticslib/call_frame.h"
#include "quo_base/interp.h"
#include "signallib/image_size.h"

namespace {

// Reports name this source so; programs that read them look for it.
constexpr const char* kSource = R"(..\..\..\binsrc\cutover\sources\interp)";

/** Multiplies every row by exp(i sign phase). */
int turn(const demodulationPhase& law, double sign, fcomplex* data, int nx, int ny,
         const quo::SharedCall& function) {
    quo::CallFrame frame{function, kSource};
    if (!data || !quo::addressable<fcomplex>(nx, ny)) return frame.fail(QUO_REFUSED, "No image or a size below 1");
    quo::TrackedBuffer<fcomplex> turns{static_cast<std::size_t>(nx)};
    if (!turns) return frame.fail(QUO_NO_MEMORY, "Memory allocation failure");
    for (int k = 0; k < nx; ++k) turns[static_cast<std::size_t>(k)] = std::polar(1.0, sign * law.getDemodPhase(k));
    for (int row = 0; row < ny; ++row)
        for (const fcomplex& by : turns) {
            const fcomplex sample = *data;
            *data++ = {sample.real() * by.real() - sample.imag() * by.imag(),
                       sample.real() * by.imag() + sample.imag() * by.real()};
        }
    return frame.success();
}

}  // namespace

int demodulationPhase::applyDemodPhase(fcomplex* data, int nx, int ny) const {
    return turn(*this, -1.0, data, nx, ny, "demodulationPhase::applyDemodPhase");
}

int demodulationPhase::applyModPhase(fcomplex* data, int nx, int ny) const {
    return turn(*this, +1.0, data, nx, ny, "demodulationPhase::applyModPhase");
}
