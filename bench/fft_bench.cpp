// SPDX-License-Identifier: Apache-2.0

// Images of several shapes through the library's plans beside the batched plans of FFTW (measured): by our own
// kernels, by FFTW where the length has another prime factor; by MKL beside MKL where it is installed. Columns
// beside moving them into a tile and out; zero-padding row by row beside FFTW over the whole image; making a plan,
// known and new. The summary at the end prints the ratios.
#include <benchmark/benchmark.h>
#include <dlfcn.h>
#include <fftw3.h>

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

#include "quo_base/fft.h"
#include "quo_base/interp.h"
#include "ratio_reporter.h"
#include "signallib/fft_engine.h"

namespace {

struct Free {
    void operator()(fcomplex* buffer) const { fft_free(buffer); }
};
using Image = std::unique_ptr<fcomplex, Free>;

Image make_image(int n, int m) {
    const auto count = static_cast<std::size_t>(n) * static_cast<std::size_t>(m);
    Image image{static_cast<fcomplex*>(fft_malloc(count * sizeof(fcomplex)))};
    for (std::size_t k = 0; k < count; ++k)
        image.get()[k] = {static_cast<float>(k % 17) - 8.0F, static_cast<float>(k % 13) - 6.0F};
    return image;
}

/** Transforms along the rows, down the columns; how many times FFTW's speed is wanted, and by which engine. FFTW
 * itself, whose plans are chosen without measuring, is not as fast as measured. */
struct Job {
    const char* name;
    int n, m;
    bool rows, columns;
    double speed = 0.9;
    const char* engine = "quo";
};
constexpr Job kJobs[] = {{"rows_1024", 1024, 1024, true, false, 1.4},
                         {"columns_1024", 1024, 1024, false, true, 2.0},
                         {"both_1024", 1024, 1024, true, true, 1.8},
                         {"rows_4096", 4096, 4096, true, false},
                         {"columns_4096", 4096, 4096, false, true, 1.3},
                         {"both_4096", 4096, 4096, true, true},
                         {"rows_1080", 1080, 1080, true, false},
                         {"columns_1080", 1080, 1080, false, true, 1.8},
                         {"rows_5760", 5760, 1080, true, false},
                         {"columns_5760", 1080, 5760, false, true, 1.5},
                         {"wide_columns_1080", 5760, 1080, false, true},
                         {"rows_2", 2, 16384, true, false},
                         {"rows_16", 16, 4096, true, false},
                         {"rows_64", 64, 1024, true, false},
                         {"rows_320", 320, 256, true, false},
                         {"rows_400", 400, 256, true, false},
                         {"rows_4099", 4099, 256, true, false, 0.7, "fftw"},
                         {"columns_4099", 256, 4099, false, true, 0.7, "fftw"}};

// A transform of a transform of a transform would overflow, so each starts from a fresh image.
void tame(fcomplex* image, int n, int m) {
    std::fill_n(image, static_cast<std::size_t>(n) * static_cast<std::size_t>(m), fcomplex{0.37F, -0.11F});
}

void choose(const char* engine) {
    setenv("QUO_FFT_ENGINE", engine, 1);
    quo::forget_fft_engine();
}

void own(benchmark::State& state, const Job& job, const char* engine) {
    const Image image = make_image(job.n, job.m);
    FftPlan plan{};
    choose(engine);
    if (fft_makep_c(&plan, job.n, job.n, job.m, job.m, job.rows, job.columns, 1) != 0)
        return state.SkipWithError("no plan");
    for (auto _ : state) {
        state.PauseTiming();
        tame(image.get(), job.n, job.m);
        state.ResumeTiming();
        pfft_c(&plan, image.get(), image.get());
    }
    fft_destp_c(&plan);
}

fftwf_plan measured(const Job& job, bool rows, fftwf_complex* data) {
    return rows ? fftwf_plan_many_dft(1, &job.n, job.m, data, nullptr, 1, job.n, data, nullptr, 1, job.n,
                                      FFTW_FORWARD, FFTW_MEASURE)
                : fftwf_plan_many_dft(1, &job.m, job.n, data, nullptr, job.n, 1, data, nullptr, job.n, 1,
                                      FFTW_FORWARD, FFTW_MEASURE);
}

void bare(benchmark::State& state, const Job& job) {
    const Image image = make_image(job.n, job.m);
    auto* const data = reinterpret_cast<fftwf_complex*>(image.get());
    std::vector<fftwf_plan> plans;
    if (job.rows) plans.push_back(measured(job, true, data));
    if (job.columns) plans.push_back(measured(job, false, data));
    for (auto _ : state) {
        state.PauseTiming();
        tame(image.get(), job.n, job.m);
        state.ResumeTiming();
        for (fftwf_plan plan : plans) fftwf_execute(plan);
    }
    for (fftwf_plan plan : plans) fftwf_destroy_plan(plan);
}

/** MKL without the library: forward transforms in place, by their numbers in DFTI's C interface. */
class Dfti {
public:
    Dfti() {
        void* const library = dlopen("libmkl_rt.so", RTLD_NOW | RTLD_LOCAL);
        if (!library) return;
        const auto find = [library](const char* name, auto& function) {
            function = reinterpret_cast<std::remove_reference_t<decltype(function)>>(dlsym(library, name));
        };
        find("DftiCreateDescriptor", create_);
        find("DftiSetValue", set_);
        find("DftiCommitDescriptor", commit_);
        find("DftiComputeForward", forward_);
        find("DftiFreeDescriptor", free_);
    }
    [[nodiscard]] bool found() const { return create_ && set_ && commit_ && forward_ && free_; }

    [[nodiscard]] void* batch(const Job& job, bool rows) const {
        void* handle = nullptr;
        const long strides[] = {0, rows ? 1 : job.n}, distance = rows ? job.n : 1;
        create_(&handle, 35, 32, 1L, long{rows ? job.n : job.m});
        set_(handle, 7, long{rows ? job.m : job.n});
        for (const int parameter : {12, 13}) set_(handle, parameter, strides);
        for (const int parameter : {14, 15}) set_(handle, parameter, distance);
        set_(handle, 27, 1L);
        commit_(handle);
        return handle;
    }
    void run(void* handle, fcomplex* data) const { forward_(handle, data); }
    void release(void* handle) const { free_(&handle); }

private:
    long (*create_)(void**, int, int, long, ...) = nullptr;
    long (*set_)(void*, int, ...) = nullptr;
    long (*commit_)(void*) = nullptr;
    long (*forward_)(void*, void*, ...) = nullptr;
    long (*free_)(void**) = nullptr;
};

const Dfti& dfti() {
    static const Dfti dfti;
    return dfti;
}

void bare_mkl(benchmark::State& state, const Job& job) {
    const Image image = make_image(job.n, job.m);
    std::vector<void*> batches;
    if (job.rows) batches.push_back(dfti().batch(job, true));
    if (job.columns) batches.push_back(dfti().batch(job, false));
    for (auto _ : state) {
        state.PauseTiming();
        tame(image.get(), job.n, job.m);
        state.ResumeTiming();
        for (void* batch : batches) dfti().run(batch, image.get());
    }
    for (void* batch : batches) dfti().release(batch);
}

/** Columns of 4096 samples, 32 at a time, into a tile and out of it: each run a line of the cache or several. */
void move_columns(benchmark::State& state) {
    constexpr std::ptrdiff_t kSide = 4096, kWidth = 32, kLine = 8;
    const Image image = make_image(kSide, kSide), tile = make_image(kWidth + kLine, kSide);
    const auto skew =
        static_cast<std::ptrdiff_t>(reinterpret_cast<std::uintptr_t>(image.get()) / sizeof(fcomplex));
    for (auto _ : state)
        for (std::ptrdiff_t first = 0, width = kWidth - skew % kLine; first < kSide;
             first += width, width = kWidth)
            for (const bool in : {true, false})
                for (std::ptrdiff_t row = 0; row < kSide; ++row) {
                    fcomplex* const there = image.get() + row * kSide + first;
                    fcomplex* const here = tile.get() + row * (kWidth + kLine);
                    std::copy_n(in ? there : here, std::min(width, kSide - first), in ? here : there);
                    benchmark::ClobberMemory();
                }
}

constexpr int kRows = 1024, kShort = 4096, kLong = 8192;

void pad_own(benchmark::State& state) {
    const Image in = make_image(kShort, kRows), out = make_image(kLong, kRows);
    interp resampler;
    choose("quo");
    if (resampler.setplans(kShort, kRows, kLong, kRows) != 0) return state.SkipWithError("no plan");
    for (auto _ : state) {
        state.PauseTiming();
        tame(in.get(), kShort, kRows);
        state.ResumeTiming();
        resampler.interpft_p(in.get(), out.get());
    }
}

void pad_bare(benchmark::State& state) {
    const Image in = make_image(kShort, kRows), out = make_image(kLong, kRows);
    fftwf_plan forward =
        measured({"", kShort, kRows, true, false}, true, reinterpret_cast<fftwf_complex*>(in.get()));
    auto* const data = reinterpret_cast<fftwf_complex*>(out.get());
    fftwf_plan inverse = fftwf_plan_many_dft(1, &kLong, kRows, data, nullptr, 1, kLong, data, nullptr, 1, kLong,
                                             FFTW_BACKWARD, FFTW_MEASURE);
    for (auto _ : state) {
        state.PauseTiming();
        tame(in.get(), kShort, kRows);
        state.ResumeTiming();
        fftwf_execute(forward);
        for (std::ptrdiff_t row = 0; row < kRows; ++row) {
            const fcomplex* from = in.get() + row * kShort;
            fcomplex* to = out.get() + row * kLong;
            std::copy_n(from, kShort / 2 + 1, to);
            std::fill_n(to + kShort / 2 + 1, kLong - kShort, fcomplex{});
            std::copy_n(from + kShort / 2 + 1, kShort / 2 - 1, to + kLong - kShort / 2 + 1);
        }
        fftwf_execute(inverse);
        for (std::ptrdiff_t k = 0; k < std::ptrdiff_t{kRows} * kLong; ++k) out.get()[k] *= 2.0F / kLong;
    }
    fftwf_destroy_plan(forward);
    fftwf_destroy_plan(inverse);
}

void make_known_plan(benchmark::State& state) {
    FftPlan plan{};
    const auto make = [&plan] { return fft_makep_c(&plan, 1080, 1080, 1024, 1024, 1, 1, 1); };
    if (make() == 0) fft_destp_c(&plan);  // made here
    for (auto _ : state) {
        if (make() != 0) return state.SkipWithError("no plan");
        fft_destp_c(&plan);
    }
}

/** Plans of 60 lengths by turns, which is more than are kept. */
void make_new_plan(benchmark::State& state) {
    choose("quo");
    for (int length = 0; auto _ : state) {
        FftPlan plan{};
        length = genpow(length < 20000 ? length + 1 : 1000, 1);
        if (fft_makep_c(&plan, length, length, 64, 64, 1, 0, 1) != 0) return state.SkipWithError("no plan");
        fft_destp_c(&plan);
    }
}

/** Stands for the time that a known plan may take: the ratio's other side. */
void two_microseconds(benchmark::State& state) {
    for (auto _ : state) {
        const auto end = std::chrono::steady_clock::now() + std::chrono::microseconds{2};
        while (std::chrono::steady_clock::now() < end) {
        }
    }
}

}  // namespace

int main(int argc, char** argv) {
    setenv("QUO_FFTW_MODULE", QUO_BENCH_FFTW_MODULE, 0);
    choose("mkl");  // before anything else calls MKL, so that all its transforms are sequential
    const bool has_mkl = dfti().found() && std::string{fft_engine_name()} == "mkl";
    static std::vector<std::string> names;
    names.reserve(6 * std::size(kJobs));
    std::vector<bench::Ratio> ratios;
    const auto add = [&](const Job& job, const char* engine, const char* peer, auto bare_engine, double target) {
        const std::string& own_name = names.emplace_back(std::string{"own_"} + engine + "/" + job.name);
        const std::string& bare_name = names.emplace_back(std::string{peer} + "/" + job.name);
        const std::string& ratio = names.emplace_back(std::string{job.name} + ", own by " + engine + " / " + peer);
        benchmark::RegisterBenchmark(own_name.c_str(), own, job, engine)->Unit(benchmark::kMillisecond);
        benchmark::RegisterBenchmark(bare_name.c_str(), bare_engine, job)->Unit(benchmark::kMillisecond);
        ratios.push_back({ratio.c_str(), own_name.c_str(), bare_name.c_str(), target});
    };
    for (const Job& job : kJobs) {
        add(job, job.engine, "fftw", bare, 1.0 / job.speed);
        if (has_mkl) add(job, "mkl", "mkl", bare_mkl, 1.05);
    }
    benchmark::RegisterBenchmark("move_columns_4096", move_columns)->Unit(benchmark::kMillisecond);
    ratios.push_back({"columns_4096 / moved only", "own_quo/columns_4096", "move_columns_4096", 1.3});
    benchmark::RegisterBenchmark("own/zero_padding", pad_own)->Unit(benchmark::kMillisecond);
    benchmark::RegisterBenchmark("fftw/zero_padding", pad_bare)->Unit(benchmark::kMillisecond);
    benchmark::RegisterBenchmark("own/known_plan", make_known_plan);
    benchmark::RegisterBenchmark("own/new_plan", make_new_plan);
    benchmark::RegisterBenchmark("two_microseconds", two_microseconds);
    ratios.push_back({"zero padding 4096 -> 8192 by quo / fftw", "own/zero_padding", "fftw/zero_padding", 1.0});
    ratios.push_back({"making and releasing a known plan / 2 us", "own/known_plan", "two_microseconds", 1.0});
    ratios.push_back({"making and releasing a new plan / 2 us", "own/new_plan", "two_microseconds", 100.0});
    return bench::run(argc, argv, ratios);
}
