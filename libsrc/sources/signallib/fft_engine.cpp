// SPDX-License-Identifier: Apache-2.0
#include "signallib/fft_engine.h"

#include <atomic>
#include <memory>
#include <mutex>
#include <string>

#include "diagnosticslib/errno_kept.h"
#include "sarutillib/ground/bounded_text.h"
#include "sarutillib/ground/own_module.h"
#include "signallib/own_fft/fft_plans.h"

#if defined(__x86_64__) || defined(__i386__)
#include <cpuid.h>
#endif

namespace quo {
namespace {

/** MKL picks slow generic code on processors of other makers, where FFTW is faster. */
bool is_makers_processor() {
#if defined(__x86_64__) || defined(__i386__)
    unsigned greatest = 0, b = 0, c = 0, d = 0;
    return __get_cpuid(0, &greatest, &b, &c, &d) && b == signature_INTEL_ebx && d == signature_INTEL_edx &&
           c == signature_INTEL_ecx;
#else
    return false;
#endif
}

FftEngine* engine_of(FftwEntry entry) { return entry(kFftInterfaceVersion); }

FftEngine* mkl() { return load_mkl_engine(setting("QUO_MKL_LIBRARY")); }
FftEngine* fftw() { return load_fftw_engine(setting("QUO_FFTW_MODULE")); }

std::mutex choosing;
/** For the lengths that our own engine does not take, and for those that it does. */
std::atomic<FftEngine*> chosen[2];

FftEngine* first_to_take(int length) {
    const char* choice = setting("QUO_FFT_ENGINE");
    for (const auto load : engine_order(choice ? choice : "auto", is_makers_processor()))
        if (FftEngine* const engine = load ? load() : nullptr)
            if (engine->takes(length)) return engine;
    return nullptr;
}

/** Of each thread, as errno is: the plans of two threads may fail at the same time. */
thread_local char error_text[512];

}  // namespace

FftEngine* load_fftw_engine(const char* file) noexcept try {
    return file ? use_module<FftwEntry>(file, kFftwEntryName, engine_of)
                : use_own_module<FftwEntry>("libquo_base_fftw.so", kFftwEntryName, engine_of);
} catch (...) {
    return nullptr;  // out of memory
}

EngineOrder engine_order(std::string_view choice, bool makers_processor) noexcept {
    if (choice == "mkl") return {mkl};
    if (choice == "fftw") return {fftw};
    if (choice == "quo") return {load_own_engine};
    return makers_processor ? EngineOrder{mkl, load_own_engine, fftw} : EngineOrder{load_own_engine, fftw, mkl};
}

FftEngine* fft_engine(int length) noexcept {
    std::atomic<FftEngine*>& known = chosen[is_own_fft_length(length) ? 1 : 0];
    if (FftEngine* const engine = known) return engine;
    const std::lock_guard guard{choosing};
    if (FftEngine* const engine = known) return engine;
    const ErrnoKept kept;
    return known = first_to_take(length);
}

void forget_fft_engine() noexcept { chosen[0] = chosen[1] = nullptr; }

void forget_fft_error() noexcept { error_text[0] = '\0'; }

void note_no_fft_engine() noexcept {
    copy_bounded(
        error_text,
        "no FFT engine can be loaded that does transforms of this length: install libquo_base_fftw.so beside the "
        "library in quo_base/, or name it in QUO_FFTW_MODULE; or install MKL (libmkl_rt.so, in Debian the package "
        "libmkl-rt), or name it in QUO_MKL_LIBRARY. QUO_FFT_ENGINE chooses: auto, mkl, fftw or quo, which takes "
        "lengths without a prime factor above 7");
}

void note_fft_error(const FftEngine& engine, int length, const FftFailure& why) noexcept {
    constexpr std::size_t kMebibyte = std::size_t{1} << 20;
    if (why.bytes != 0) {
        format_bounded(error_text, sizeof error_text,
                       "%s: not enough memory for transforms of length %d, which may take %zu MiB", engine.name(),
                       length, why.bytes / kMebibyte + (why.bytes % kMebibyte != 0 ? 1 : 0));
    } else {
        format_bounded(error_text, sizeof error_text, "%s: transforms of length %d are refused, status %ld",
                       engine.name(), length, why.code);
    }
}

const char* fft_error() noexcept { return error_text; }

}  // namespace quo
