#include <dlfcn.h>
#include <gtest/gtest.h>
#include <sys/resource.h>
#include <unistd.h>

#include <climits>
#include <fstream>
#include <string>

#include "signallib/engines.h"
#include "signallib/fft_engine.h"
#include "signallib/memory_room.h"
#include "signallib/plan_store.h"
#include "support/diagnostics.h"

#ifdef __SANITIZE_ADDRESS__
// What cannot be had is asked for on purpose here, and what is given back must be there to be had again.
extern "C" [[gnu::visibility("default")]] const char* __asan_default_options() {
    return "allocator_may_return_null=1:quarantine_size_mb=0:thread_local_quarantine_size_kb=0";
}
#endif

namespace {

using test::Engine;
using test::Samples;

TEST(FftEngine, IsTheOneAskedForOrTheOneThereIs) {
    const std::string fake = QUO_TEST_FAKE_DFTI, module = QUO_TEST_FFTW_MODULE, none = "/nowhere/lib.so";
    struct Row {
        std::string choice, mkl, fftw, name;
    };
    const Row rows[] = {{"mkl", fake, module, "mkl"}, {"fftw", fake, module, "fftw"},
                        {"auto", fake, none, "mkl"},  {"auto", none, module, "fftw"},
                        {"", none, module, "fftw"},   {"mkl", none, module, "none"},
                        {"fftw", fake, none, "none"}, {"auto", none, none, "none"},
                        {"auto", none, fake, "none"}, {"auto", module, none, "none"}};
    for (const Row& row : rows) {
        const Engine engine{row.choice, row.mkl, row.fftw};
        EXPECT_STREQ(fft_engine_name(), row.name.c_str()) << row.choice << " " << row.mkl << " " << row.fftw;
        EXPECT_EQ(errno, 0) << "what the loader left";
    }
}

TEST(FftEngine, AutoPrefersMklOnProcessorsOfItsMakerOnly) {
    const auto own = quo::engine_order("auto", true), other = quo::engine_order("auto", false);
    EXPECT_EQ(own.first, quo::engine_order("mkl", false).first);
    EXPECT_EQ(own.second, quo::engine_order("fftw", true).first);
    EXPECT_EQ(other.first, own.second);
    EXPECT_EQ(other.second, own.first);
    EXPECT_EQ(quo::engine_order("mkl", true).second, nullptr);
}

// A missing engine once stood in the report, where plans write nothing.
TEST(FftEngine, MissingIsToldWithAWayOutAndNotReported) {
    const test::Report report;
    const Engine engine{"auto", "/nowhere/mkl.so", "/nowhere/fftw.so"};
    FftPlan plan{};
    for (const int down : {0, 1}) {
        EXPECT_EQ(fft_makep_c(&plan, 8, 8, 4, 4, 1 - down, 1, 1), 4 + down);
        EXPECT_NE(std::string{fft_engine_error()}.find("QUO_FFTW_MODULE"), std::string::npos);
    }
    EXPECT_EQ(fft_makep_c(&plan, 8, 8, 4, 4, 0, 0, 1), 0) << "nothing to transform";
    EXPECT_STREQ(fft_engine_error(), "");
    EXPECT_EQ(report.text().find("engine"), std::string::npos);
}

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

// FFTW ended the process when an allocation of its own failed, while it planned and while it ran.
TEST(FftMemory, BeyondWhatThereIsIsRefusedBeforeTheEngineAsksForIt) {
    const test::Report report;
    const Engine engine{"fftw"};
    struct Row {
        decltype(&fft_makep_c) make;
        int n, m, down, in_place;
    };
    FftPlan plan{};
    Samples data = test::noise(8);
    const Row rows[] = {{fft_makep_c, INT_MAX, 1, 0, 1},
                        {fft_makep_c, 1, INT_MAX, 1, 0},
                        {fft_makep_c, 7, INT_MAX, 1, 1},
                        {fft_makep_r, INT_MAX, 1, 0, 1},
                        {fft_makep_r, 7, INT_MAX, 1, 0}};
    for (const Row& row : rows) {
        const AddressSpace limit{1 << 30};
        EXPECT_EQ(row.make(&plan, row.n, row.n, row.m, row.m, 1 - row.down, row.down, row.in_place), 4 + row.down);
        EXPECT_NE(std::string{fft_engine_error()}.find("not enough memory"), std::string::npos);
        EXPECT_EQ(fft_c(8, 8, 1, 1, 1, 0, data.data(), data.data()), 0) << "the next one that fits";
    }
    EXPECT_EQ(plan.n, 0);
    EXPECT_EQ(quo::plan_store().held(), 0U);
    EXPECT_TRUE(report.entries("ERROR").empty());
}
TEST(FftMemory, ShortageOfAnyDegreeGivesAStatus) {
    const Engine engine{"fftw"};
    for (const auto& [n, m] : {std::pair{10007, 1}, {1, 32768}, {5, 10009}, {300, 200}}) {
        SCOPED_TRACE(testing::Message() << n << " x " << m);
        Samples data = test::noise(static_cast<std::size_t>(n) * static_cast<std::size_t>(m));
        int status = -1;
        for (rlim_t room = 256 << 10; status != 0 && room < rlim_t{1} << 30; room += room / 3) {
            const AddressSpace limit{room};
            status = fft_c(n, n, m, m, n > m ? 1 : 0, n > m ? 0 : 1, data.data(), data.data());
            EXPECT_TRUE(status == 0 || status == (n > m ? 4 : 5) || status == 7) << status;
        }
        EXPECT_EQ(status, 0);
    }
    constexpr int kPrime = 60539;  // runs through buffers of several times its length
    Samples data = test::noise(kPrime);
    FftPlan plan{};
    ASSERT_EQ(fft_makep_c(&plan, kPrime, kPrime, 1, 1, 1, 0, 1), 0);
    {
        const AddressSpace limit{0};
        EXPECT_EQ(pfft_c(&plan, data.data(), data.data()), 7);
    }
    EXPECT_EQ(pfft_c(&plan, data.data(), data.data()), 0);
    EXPECT_EQ(fft_destp_c(&plan), 0);
}
// A system that promises more than it has gives the addresses and ends the process later.
TEST(FftMemory, PromisesOfTheSystemAreNotTaken) {
    constexpr std::size_t kPetabyte = std::size_t{1} << 50;
    EXPECT_FALSE(quo::has_room({4096, kPetabyte}));
    EXPECT_FALSE(quo::has_room({kPetabyte, 4096}));
    EXPECT_TRUE(quo::has_room({std::size_t{9} << 20, std::size_t{9} << 20}));
}

TEST(FftEngine, MklIsMadeSequentialAndGivesDescriptorsBack) {
    const Engine engine{"mkl"};
    ASSERT_STREQ(fft_engine_name(), "mkl");
    void* const library = dlopen(QUO_TEST_FAKE_DFTI, RTLD_NOW | RTLD_NOLOAD);
    ASSERT_NE(library, nullptr);
    const auto layer = reinterpret_cast<int (*)()>(dlsym(library, "fake_threading_layer"));
    const auto live = reinterpret_cast<long (*)()>(dlsym(library, "fake_live_descriptors"));
    EXPECT_EQ(layer(), 1);
    const long before = live();
    for (const char* call : {"create", "set", "commit"}) {
        setenv("FAKE_DFTI_FAILS", call, 1);
        FftPlan plan{};
        EXPECT_EQ(fft_makep_c(&plan, 27, 27, 4, 4, 1, 0, 1), 4) << call;
        EXPECT_EQ(fft_makep_c(&plan, 27, 27, 4, 4, 0, 1, 1), 5) << call;
        EXPECT_EQ(live(), before) << call;
        EXPECT_NE(std::string{fft_engine_error()}.find("mkl: transforms of length 4 are refused, status "),
                  std::string::npos);
    }
    setenv("FAKE_DFTI_FAILS", "compute", 1);
    Samples data = test::noise(27);
    EXPECT_EQ(fft_c(27, 27, 1, 1, 1, 0, data.data(), data.data()), QUO_NO_MEMORY);
    unsetenv("FAKE_DFTI_FAILS");
    dlclose(library);
}

TEST(FftwModule, ExportsItsEntryAloneAndRefusesOtherInterfaces) {
    void* const module = dlopen(QUO_TEST_FFTW_MODULE, RTLD_NOW | RTLD_LOCAL);
    ASSERT_NE(module, nullptr) << dlerror();
    const auto entry = reinterpret_cast<quo::FftwEntry>(dlsym(module, quo::kFftwEntryName));
    ASSERT_NE(entry, nullptr);
    EXPECT_EQ(entry(quo::kFftInterfaceVersion + 1), nullptr);
    EXPECT_NE(entry(quo::kFftInterfaceVersion), nullptr);
    EXPECT_EQ(dlsym(module, "fftwf_plan_dft_1d"), nullptr);
    EXPECT_EQ(dlsym(module, "fftwf_execute"), nullptr);
    dlclose(module);
}

struct Loading {
    const char* name;
    bool mkl_first;
    int binding;
};
class LoadingOrder : public testing::TestWithParam<Loading> {};

// MKL exports functions of FFTW's names. Whichever the program around us has loaded first, for itself or for all,
// each engine must keep to its own.
TEST_P(LoadingOrder, LeavesEachEngineItsOwnFunctions) {
    std::vector<std::pair<const char*, const char*>> order{{"fftw", "libfftw3f.so.3"}, {"mkl", "libmkl_rt.so"}};
    if (GetParam().mkl_first) std::swap(order.front(), order.back());
    for (const auto& [choice, library] : order) {
        void* const loaded = dlopen(library, RTLD_NOW | GetParam().binding);
        if (!loaded) GTEST_SKIP() << library << " is not installed here";
        // MKL takes in its other libraries with the first call.
        const auto first_call = reinterpret_cast<int (*)()>(dlsym(loaded, "MKL_Get_Max_Threads"));
        if (first_call) first_call();
    }
    constexpr int n = 60, m = 320, x = 7, y = 11;
    Samples tone(n * m), peak(n * m);
    for (std::size_t k = 0; k < tone.size(); ++k)
        tone[k] = fcomplex{test::root(k % n * x, n, 1.0) * test::root(k / n * y, m, 1.0)};
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
                         testing::Values(Loading{"MklFirstLocal", true, RTLD_LOCAL},
                                         Loading{"MklFirstGlobal", true, RTLD_GLOBAL},
                                         Loading{"FftwFirstLocal", false, RTLD_LOCAL},
                                         Loading{"FftwFirstGlobal", false, RTLD_GLOBAL}),
                         [](const auto& row) { return row.param.name; });

/** Counts what is made of it; makes batches that do nothing. */
class CountingEngine final : public quo::FftEngine {
public:
    class Batch final : public quo::FftBatch {
        bool run(const float* /*in*/, float* /*out*/, quo::FftFailure& /*why*/) noexcept override { return true; }
    };
    [[nodiscard]] const char* name() const noexcept override { return "counting"; }
    [[nodiscard]] int tiled_from() const noexcept override { return 2048; }
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
    EXPECT_EQ(store.kept(), quo::PlanStore::kMostKept);
    EXPECT_EQ(made_by(1), 0);
    EXPECT_EQ(made_by(2), 1);
    EXPECT_EQ(store.held(), 0U);

    // The memory of what is kept is bounded, too.
    quo::PlanStore full;
    constexpr int kLength = 20000, kTileRow = 64 + 8;  // a tile of 11 MB
    FftEnginePlan* const held = full.open(engine, {quo::FftDomain::Complex, kLength, 70, 80, 1, true, true});
    for (int extra = 1; extra <= 8; ++extra)
        full.close(full.open(engine, {quo::FftDomain::Complex, kLength + extra, 70, 80, 1, true, true}));
    EXPECT_EQ(full.kept(), quo::PlanStore::kMostKeptBytes / (kLength * kTileRow * sizeof(fcomplex)));
    EXPECT_NE(full.find(held), nullptr) << "a caller's plan stays, kept or not";
    EXPECT_TRUE(full.close(held));
    EXPECT_EQ(full.find(held), nullptr);
    EXPECT_FALSE(full.close(held));
}

}  // namespace
