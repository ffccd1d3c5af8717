// SPDX-License-Identifier: Apache-2.0

// Says which FFT engines this machine has, and so which of them the tests of the transforms run with.
#include <cstdio>
#include <cstdlib>
#include <string>

#include "signallib/fft_engine.h"

int main() {
    setenv("QUO_FFTW_MODULE", QUO_TEST_FFTW_MODULE, 1);
    std::string present, absent;
    for (const char* name : {"quo", "fftw", "mkl"}) {
        setenv("QUO_FFT_ENGINE", name, 1);
        quo::forget_fft_engine();
        (quo::fft_engine(2) ? present : absent) += std::string{" "} + name;
    }
    std::printf("FFT engines tested:%s%s%s\n", present.c_str(),
                absent.empty() ? "" : "; not installed:", absent.c_str());
    return present.empty() ? EXIT_FAILURE : EXIT_SUCCESS;
}
