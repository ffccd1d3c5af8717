// SPDX-License-Identifier: Apache-2.0

// Builds a product header from scratch: five state vectors, the sampling, and the numbers exactly as they are.
#include <cstdio>

#include "quo_base/acquisition.h"
#include "quo_base/generalSARorbit.h"

int main(int argc, char** argv) {
    if (argc != 2) return 1;
    const double start[3] = {5636962.746301, 791500.369838, 4194525.433967};  // m, Earth-fixed
    const double velocity[3] = {-4107.992113, -2336.516439, 5944.308959};     // m/s

    GeneralSAROrbit orbit;
    if (orbit.SVCreate(1167930296.781409, 10.0, 5) != 0) return 1;  // first time and spacing, s
    for (int i = 0; i < 5; ++i) {
        for (int axis = 0; axis < 3; ++axis) {
            orbit.pSV_m[3 * i + axis] = start[axis] + 10.0 * i * velocity[axis];  // straight on
            orbit.vSV_mOs[3 * i + axis] = velocity[axis];
        }
    }
    if (orbit.computeApproximateSV() != 0) return 1;

    SamplingConstants_Obj sampling;
    sampling.lambda_m = 0.05546576;
    sampling.prf_hz = 1717.128973878037;

    quorelxml::setExactNumbers(true);  // "%.15g" would cost the times their sixth decimal
    if (orbit.writehdr(argv[1]) != 0 || sampling.writehdr(argv[1]) != 0) return 1;

    GeneralSAROrbit copy;
    if (copy.readhdr(argv[1]) != 0) return 1;
    std::printf("%d state vectors from %.6f s on, model error %.1e m\n", copy.nSV_n, copy.t0SV_s,
                copy.orbitFitError());
    return 0;
}
