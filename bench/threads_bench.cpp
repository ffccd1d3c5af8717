// SPDX-License-Identifier: Apache-2.0
#include <unistd.h>

#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>

#include "quo_base/generalSARorbit.h"
#include "ratio_reporter.h"
#include "support/scenes.h"

// What a second thread gains, as the tool's users see it: a table of a million ground points located, an image
// focused. Wall clock times of whole programs, the start of the process included.

namespace {

namespace fs = std::filesystem;

constexpr int kRows = 1000000;

/** A table of places on the ground of a scene and echoes to focus, in a folder that goes with the program. */
class Jobs {
public:
    Jobs() : folder_{fs::temp_directory_path() / ("quo_threads_bench" + std::to_string(getpid()))} {
        fs::create_directories(folder_);
        write_places();
        run(std::string{QUO_BENCH_SIMULATOR} + " " + kHeader +
            " " QUO_BENCH_EXAMPLES "/echo_simulator/targets.csv " + file("raw") +
            " --type short --noise 20 --doppler 230");
    }
    ~Jobs() { fs::remove_all(folder_); }
    Jobs(const Jobs&) = delete;
    Jobs& operator=(const Jobs&) = delete;

    [[nodiscard]] bool geolocate(int threads) const {
        return run(std::string{QUO_BENCH_TOOL} + " geolocate " + kHeader + " --to radar --input " +
                   file("places") + " --output " + file("times") + of(threads));
    }
    [[nodiscard]] bool focus(int threads) const {
        return run(std::string{QUO_BENCH_PROCESSOR} + " " + file("raw") + " " + file("image") +
                   " --configuration " QUO_BENCH_EXAMPLES "/processor/focus.xml" + of(threads));
    }

    /** Takes away what the job before has left: to free an old image is no part of making one. */
    void clear() const {
        fs::remove(file("times"));
        fs::remove(file("image"));
    }

private:
    static constexpr const char* kHeader = QUO_TEST_DATA "/scenes/s1a_iw1_slc_20220104_asc.xml";

    static std::string of(int threads) { return " --threads " + std::to_string(threads); }
    static bool run(const std::string& command) { return std::system((command + " >/dev/null").c_str()) == 0; }
    [[nodiscard]] std::string file(const char* name) const { return (folder_ / name).string(); }
    void write_places() const {
        const auto ties = test::load_tie_points(test::kScenes[0]);
        std::ofstream table{file("places")};
        table.precision(12);
        table << "latitude_deg,longitude_deg,height_m\n";
        for (int i = 0; i < kRows; ++i) {
            const auto& tie = ties[static_cast<std::size_t>(i) % ties.size()];
            table << tie.latitude_deg + 1e-7 * i << ',' << tie.longitude_deg << ',' << tie.height_m << '\n';
        }
    }

    fs::path folder_;
};

void timed(benchmark::State& state, bool (Jobs::*job)(int threads) const) {
    static const Jobs jobs;
    for (auto _ : state) {
        jobs.clear();
        const auto start = std::chrono::steady_clock::now();
        if (!(jobs.*job)(static_cast<int>(state.range(0)))) state.SkipWithError("the program failed");
        state.SetIterationTime(std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count());
    }
    state.counters["rows"] = benchmark::Counter(kRows, benchmark::Counter::kIsIterationInvariantRate);
}
void Geolocate(benchmark::State& state) { timed(state, &Jobs::geolocate); }
void Focus(benchmark::State& state) {
    timed(state, &Jobs::focus);
    state.counters.clear();
}
BENCHMARK(Geolocate)->Arg(1)->Arg(2)->UseManualTime()->Unit(benchmark::kMillisecond);
BENCHMARK(Focus)->Arg(1)->Arg(2)->UseManualTime()->Unit(benchmark::kMillisecond);

}  // namespace

int main(int argc, char** argv) {
    return bench::run(argc, argv,
                      {{"geolocate, a million rows: two threads / one", "Geolocate/2/manual_time",
                        "Geolocate/1/manual_time", 1.0 / 1.7},
                       {"processor: two threads / one", "Focus/2/manual_time", "Focus/1/manual_time", 1.0 / 1.7}});
}
