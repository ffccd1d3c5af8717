// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_SIGNALLIB_ENGINES_H
#define QUO_TESTS_SIGNALLIB_ENGINES_H

#include <gtest/gtest.h>
#include <sys/resource.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <complex>
#include <cstdlib>
#include <fstream>
#include <numbers>
#include <ostream>
#include <random>
#include <string>
#include <vector>

#include "quo_base/fft.h"
#include "signallib/fft_engine.h"

namespace test {

using Samples = std::vector<fcomplex>;
using Exact = std::vector<dcomplex>;

/** Chooses the engine of the following plans; gives the choice back when it goes. */
class Engine {
public:
    explicit Engine(const std::string& choice, const std::string& mkl = QUO_TEST_FAKE_DFTI,
                    const std::string& fftw = QUO_TEST_FFTW_MODULE) {
        setenv("QUO_FFT_ENGINE", choice.c_str(), 1);
        mkl.empty() ? unsetenv("QUO_MKL_LIBRARY") : setenv("QUO_MKL_LIBRARY", mkl.c_str(), 1);
        setenv("QUO_FFTW_MODULE", fftw.c_str(), 1);
        quo::forget_fft_engine();
    }
    ~Engine() {
        for (const char* name : {"QUO_FFT_ENGINE", "QUO_MKL_LIBRARY", "QUO_FFTW_MODULE"}) unsetenv(name);
        quo::forget_fft_engine();
        errno = 0;
    }
    Engine(const Engine&) = delete;
    Engine& operator=(const Engine&) = delete;
};

/** The engines that every plan must work with: our own, with FFTW for other lengths, FFTW, a stand-in for DFTI,
 * and MKL itself where it is installed. */
struct EngineChoice {
    const char *name, *choice, *mkl;
};
inline void PrintTo(const EngineChoice& engine, std::ostream* out) { *out << engine.name; }
inline constexpr EngineChoice kEngines[] = {
    {"Auto", "auto", ""}, {"Fftw", "fftw", ""}, {"DftiStandIn", "mkl", QUO_TEST_FAKE_DFTI}, {"Mkl", "mkl", ""}};

class WithEngine : public testing::TestWithParam<EngineChoice> {
protected:
    void SetUp() override {
        if (std::string{fft_engine_name()} == "none") GTEST_SKIP() << "not installed here";
    }

    /** The stand-in takes the definition as it stands, so that long transforms would take minutes. */
    const bool fast_ = *GetParam().name != 'D';

private:
    Engine engine_{GetParam().choice, GetParam().mkl};
};

/** Leaves the process so many bytes of address space beyond what it has. */
class AddressSpace {
public:
    explicit AddressSpace(rlim_t bytes) {
        getrlimit(RLIMIT_AS, &before_);
        std::ifstream pages{"/proc/self/statm"};
        rlim_t taken = 0;
        pages >> taken;
        const rlimit limit{taken * static_cast<rlim_t>(sysconf(_SC_PAGESIZE)) + bytes, before_.rlim_max};
        setrlimit(RLIMIT_AS, &limit);
    }
    ~AddressSpace() {
        setrlimit(RLIMIT_AS, &before_);
        errno = 0;
    }
    AddressSpace(const AddressSpace&) = delete;
    AddressSpace& operator=(const AddressSpace&) = delete;

private:
    rlimit before_{};
};

inline Samples noise(std::size_t count, unsigned seed = 17) {
    std::mt19937 generator{seed};
    std::normal_distribution<float> normal;
    Samples samples(count);
    for (fcomplex& sample : samples) sample = {normal(generator), normal(generator)};
    return samples;
}

/** The defining sum of m bins, `w` apart from `a` on, in radians per sample and backwards. */
Exact direct(const fcomplex* x, int n, int m, double w, double a);
/** The transform in double precision. */
Exact exact_dft(const Exact& x);
/** Of a forward transform, or of an unscaled inverse one, which runs the samples backwards. */
Exact exact_dft(const Samples& x, bool forward = true);

/** Root mean square of the difference, relative to that of the expected values. */
template <typename Got, typename Expected>
double relative_error(const Got& got, const Expected& expected) {
    double error = 0.0, size = 0.0;
    for (std::size_t k = 0; k < expected.size(); ++k) {
        const dcomplex truth{expected[k]};
        error += std::norm(dcomplex{got[k]} - truth);
        size += std::norm(truth);
    }
    return got.size() != expected.size() ? INFINITY : size > 0.0 ? std::sqrt(error / size) : std::sqrt(error);
}

}  // namespace test

#endif
