// SPDX-License-Identifier: Apache-2.0
#include <dlfcn.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <string>

#include "signallib/engines.h"
#include "signallib/fft_engine.h"
#include "signallib/memory_room.h"
#include "signallib/own_fft/fft_plans.h"
#include "signallib/plan_store.h"

#ifdef __SANITIZE_ADDRESS__
// What cannot be had is asked for on purpose here, and what is given back must be there to be had again.
extern "C" [[gnu::visibility("default")]] const char* __asan_default_options() {
    return "allocator_may_return_null=1:quarantine_size_mb=0:thread_local_quarantine_size_kb=0";
}
#endif

namespace {

using test::Engine;
using test::Samples;

TEST(FftEngine, AutoPrefersMklOnProcessorsOfItsMakerOnly) {
    auto* const mkl = quo::engine_order("mkl", false)[0];
    auto* const fftw = quo::engine_order("fftw", true)[0];
    auto* const own = quo::engine_order("quo", true)[0];
    EXPECT_EQ(quo::engine_order("auto", true), (quo::EngineOrder{mkl, own, fftw}));
    EXPECT_EQ(quo::engine_order("auto", false), (quo::EngineOrder{own, fftw, mkl}));
    EXPECT_EQ(quo::engine_order("mkl", true)[1], nullptr);
}

// FFTW ended the process when an allocation of its own failed, while it planned and while it ran.
TEST(FftMemory, ShortageOfAnyDegreeGivesAStatus) {
    constexpr int kPrime = 60539;  // runs through buffers of several times its length
    Samples data = test::noise(kPrime);
    for (const char* choice : {"quo", "fftw"})
        for (const auto& [n, m] :
             {std::pair{choice[0] == 'q' ? 10000 : 10007, 1}, {1, 32768}, {5, 10080}, {300, 200}}) {
            SCOPED_TRACE(testing::Message() << choice << " " << n << " x " << m);
            const Engine engine{choice};
            int status = -1;
            for (rlim_t room = 64 << 10; status != 0 && room < rlim_t{1} << 30; room += room / 3) {
                const test::AddressSpace limit{room};
                status = fft_c(n, n, m, m, n > m, n <= m, data.data(), data.data());
                EXPECT_TRUE(status == 0 || status == (n > m ? 4 : 5) || status == 7) << status;
            }
            EXPECT_EQ(status, 0);
        }
    const Engine engine{"fftw"};
    FftPlan plan{};
    ASSERT_EQ(fft_makep_c(&plan, kPrime, kPrime, 1, 1, 1, 0, 1), 0);
    {
        const test::AddressSpace limit{0};
        EXPECT_EQ(pfft_c(&plan, data.data(), data.data()), 7);
    }
    EXPECT_EQ(pfft_c(&plan, data.data(), data.data()) + fft_destp_c(&plan), 0);
    // A system that promises more than it has gives the addresses and ends the process later.
    constexpr std::size_t kPetabyte = std::size_t{1} << 50;
    EXPECT_FALSE(quo::has_room({4096, kPetabyte}) || quo::has_room({kPetabyte, 4096}));
    EXPECT_TRUE(quo::has_room({std::size_t{9} << 20, std::size_t{9} << 20}));
}

/** A function of a library. */
template <typename Function>
Function* symbol(void* library, const char* name) {
    return reinterpret_cast<Function*>(dlsym(library, name));
}

TEST(FftwModule, ExportsItsEntryAloneAndRefusesOtherInterfaces) {
    void* const module = dlopen(QUO_TEST_FFTW_MODULE, RTLD_NOW | RTLD_LOCAL);
    ASSERT_NE(module, nullptr) << dlerror();
    const auto entry = reinterpret_cast<quo::FftwEntry>(dlsym(module, quo::kFftwEntryName));
    ASSERT_NE(entry, nullptr);
    EXPECT_EQ(entry(quo::kFftInterfaceVersion + 1), nullptr);
    EXPECT_NE(entry(quo::kFftInterfaceVersion), nullptr);
    EXPECT_FALSE(dlsym(module, "fftwf_plan_dft_1d") || dlsym(module, "fftwf_execute"));
    dlclose(module);
}

class LoadingOrder : public testing::TestWithParam<std::string> {};

// MKL exports functions of FFTW's names. Whichever the program around us has loaded first, for itself or for all,
// each engine must keep to its own.
TEST_P(LoadingOrder, LeavesEachEngineItsOwnFunctions) {
    std::vector<std::pair<const char*, const char*>> order{{"fftw", "libfftw3f.so.3"}, {"mkl", "libmkl_rt.so"}};
    if (GetParam().starts_with("Mkl")) std::swap(order.front(), order.back());
    for (const auto& [choice, library] : order) {
        void* const loaded =
            dlopen(library, RTLD_NOW | (GetParam().ends_with("Global") ? RTLD_GLOBAL : RTLD_LOCAL));
        if (!loaded) GTEST_SKIP() << library << " is not installed here";
        // MKL takes in its other libraries with the first call.
        if (auto* const first_call = symbol<int()>(loaded, "MKL_Get_Max_Threads")) first_call();
    }
    constexpr int n = 60, m = 320, x = 7, y = 11;
    Samples tone, peak(n * m);
    for (int k = 0; k < n * m; ++k)
        tone.emplace_back(
            std::polar(1.0, 2.0 * std::numbers::pi * (double{x} / n * (k % n) + double{y} / m * (k / n))));
    peak[y * n + x] = fcomplex{n * m};
    for (const auto& [choice, library] : order) {
        const Engine engine{choice, ""};
        ASSERT_STREQ(fft_engine_name(), choice);
        Samples spectrum = tone;
        ASSERT_EQ(fft_c(n, n, m, m, 1, 1, spectrum.data(), spectrum.data()), 0);
        EXPECT_LE(test::relative_error(spectrum, peak), 1e-6) << choice;
    }
}
INSTANTIATE_TEST_SUITE_P(Host, LoadingOrder,
                         testing::Values("MklFirstLocal", "MklFirstGlobal", "FftwFirstLocal", "FftwFirstGlobal"),
                         [](const auto& row) { return row.param; });

// Every way of our own engine at every width of vector that the processor has, at numbers of transforms that fill
// no vector and at ones that fill several: all of them meet the truth.
TEST(OwnFft, EveryWidthOfVectorMeetsTheTruth) {
    using quo::FftWay;
    constexpr std::ptrdiff_t kSpare = 3;
    for (const int lanes : {4, 8, 16})
        for (const auto& [way, length] : {std::pair{FftWay::Columns, 7},
                                          {FftWay::Columns, 120},
                                          {FftWay::Columns, 1080},
                                          {FftWay::ShortRows, 3},
                                          {FftWay::ShortRows, 9},
                                          {FftWay::ShortRows, 180},
                                          {FftWay::Rows, 256},
                                          {FftWay::Rows, 2310 / 11 * 10},
                                          {FftWay::Rows, 36000},
                                          {FftWay::Rows, 134400}})
            for (const int count : {1, 17, 70})
                for (const bool forward : {true, false}) {
                    const quo::FftKernels* const kernels = quo::fft_kernels(lanes);
                    if (!kernels || (length > 30000 && count > 1)) continue;
                    if (way == FftWay::ShortRows && lanes > 2 * length) continue;  // a row fills no vector
                    SCOPED_TRACE(testing::Message() << lanes << " lanes, " << count << " of " << length);
                    const bool rows = way != FftWay::Columns;
                    const auto pitch = (rows ? length : count) + kSpare;
                    const auto number = static_cast<std::size_t>(pitch * (rows ? count : length));
                    const Samples in = test::noise(number);
                    Samples out = in;
                    const quo::FftTables tables{{way, length, forward, lanes}};
                    std::vector<float> room(tables.room());
                    tables.run(reinterpret_cast<const float*>(out.data()), reinterpret_cast<float*>(out.data()),
                               2 * pitch, count, room.data());
                    for (const int t : {0, count / 2, count - 1}) {
                        Samples x, got;
                        for (std::ptrdiff_t k = 0; k < length; ++k) {
                            const auto at = static_cast<std::size_t>(rows ? t * pitch + k : k * pitch + t);
                            x.push_back(in[at]);
                            got.push_back(out[at]);
                        }
                        ASSERT_LE(test::relative_error(got, test::exact_dft(x, forward)),
                                  2e-7 * std::log2(length));
                    }
                    for (std::size_t k = number - kSpare; k < number; ++k) EXPECT_EQ(out[k], in[k]);
                }
}

// How rows are grouped must not show: not in the last few of a block, nor in one alone.
TEST(OwnFft, ARowHasTheBitsAloneThatItHasAmongOthers) {
    const Engine engine{"quo"};
    for (const int n : {2, 5, 14, 30, 75, 256, 378, 640, 1080, 4096}) {
        constexpr int kRows = 37;
        const auto length = static_cast<std::size_t>(n);
        Samples rows = test::noise(length * kRows), alone(rows.begin(), rows.begin() + n);
        std::copy(alone.begin(), alone.end(), rows.end() - n);
        ASSERT_EQ(fft_c(n, n, 1, 1, -2, 0, alone.data(), alone.data()), 0);
        ASSERT_EQ(fft_c(n, n, kRows, kRows, -2, 0, rows.data(), rows.data()), 0);
        EXPECT_TRUE(std::equal(alone.begin(), alone.end(), rows.begin())) << n;
        EXPECT_TRUE(std::equal(alone.begin(), alone.end(), rows.end() - n)) << n;
    }
}

// Columns of an image that no cache holds are stored past the caches: neither that nor where their lines begin may
// show.
TEST(OwnFft, AColumnHasTheBitsInALargeImageThatItHasInASmallOne) {
    constexpr std::size_t kLength = 4096, kColumns = 2056, kFew = 40, kLine = 8;
    for (const int lanes : {4, 8, 16}) {
        if (!quo::fft_kernels(lanes)) continue;
        const quo::FftTables tables{{quo::FftWay::Columns, kLength, true, lanes}};
        const quo::Floats room = quo::allocate_floats(tables.room());
        const auto transform = [&](fcomplex* image, std::size_t columns) {
            auto* const floats = reinterpret_cast<float*>(image);
            tables.run(floats, floats, static_cast<std::ptrdiff_t>(2 * columns), static_cast<int>(columns),
                       room.get());
        };
        const Samples few = test::noise(kLength * kFew);
        Samples alone = few;
        transform(alone.data(), kFew);
        for (const std::size_t skew : {std::size_t{0}, std::size_t{3}}) {
            Samples large(kLength * kColumns + kLine + skew);
            const auto begin = reinterpret_cast<std::uintptr_t>(large.data()) / sizeof(fcomplex) % kLine;
            fcomplex* const image = large.data() + (kLine - begin) % kLine + skew;
            for (std::size_t k = 0; k < kLength; ++k) {
                std::copy_n(&few[k * kFew], kFew, image + k * kColumns);
                std::copy_n(&few[k * kFew], kFew, image + (k + 1) * kColumns - kFew);
            }
            transform(image, kColumns);
            for (std::size_t k = 0; k < kLength; ++k)
                for (const std::size_t first : {k * kColumns, (k + 1) * kColumns - kFew})
                    ASSERT_EQ(std::memcmp(image + first, &alone[k * kFew], kFew * sizeof(fcomplex)), 0)
                        << lanes << " lanes, skew " << skew << ", row " << k;
        }
    }
}

/** Counts what is made of it; makes batches that do nothing. */
struct CountingEngine final : quo::FftEngine {
    struct Batch final : quo::FftBatch {
        bool run(const float* /*in*/, float* /*out*/, quo::FftFailure& /*why*/) noexcept override { return true; }
    };
    [[nodiscard]] const char* name() const noexcept override { return "counting"; }
    [[nodiscard]] bool wants_tile(const quo::FftGeometry& columns) const noexcept override {
        return columns.length >= 2048;
    }
    [[nodiscard]] std::unique_ptr<quo::FftBatch> make(const quo::FftGeometry& /*geometry*/,
                                                      quo::FftFailure& /*why*/) noexcept override {
        ++made;
        return std::make_unique<Batch>();
    }
    int made = 0;
};

TEST(PlanStore, MeasuresAGeometryOnceAndForgetsTheOneUsedLongestAgo) {
    CountingEngine engine;
    quo::PlanStore store;
    const auto made_by = [&](int length) {
        const int before = engine.made;
        store.close(store.open(engine, {quo::FftDomain::Complex, length, 1, 1, length, true, true}));
        return engine.made - before;
    };
    constexpr int kMost = quo::PlanStore::kMostKept;
    for (int length = 1; length <= kMost; ++length) EXPECT_EQ(made_by(length), 1);
    EXPECT_EQ(made_by(1), 0);  // used again: 2 is the oldest now
    EXPECT_EQ(made_by(kMost + 1), 1);
    EXPECT_EQ(made_by(1), 0);
    EXPECT_EQ(made_by(2), 1);
    EXPECT_TRUE(store.kept() == kMost && store.held() == 0);

    // The memory of what is kept is bounded, too.
    constexpr int kLength = 20000, kTileRow = 64 + 8;  // a tile of 11 MB
    const auto open = [&](int extra) {
        return store.open(engine, {quo::FftDomain::Complex, kLength + extra, 70, 80, 1, true, true});
    };
    FftEnginePlan* const held = open(0);
    for (int extra = 1; extra <= 8; ++extra) store.close(open(extra));
    EXPECT_EQ(store.kept(), quo::PlanStore::kMostKeptBytes / (kLength * kTileRow * sizeof(fcomplex)));
    EXPECT_NE(store.find(held), nullptr) << "a caller's plan stays, kept or not";
    EXPECT_TRUE(store.close(held));
    EXPECT_FALSE(store.find(held) || store.close(held));
}

}  // namespace
