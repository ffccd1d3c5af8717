// SPDX-License-Identifier: Apache-2.0
/* What one point, one choice, one polynomial and one value cost as their number grows, each beside the same where
 * there are few. */

#include <benchmark/benchmark.h>

#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <map>
#include <memory>
#include <numeric>
#include <random>
#include <string>
#include <string_view>
#include <vector>

#include "orbit/made_orbits.h"
#include "quo_base/generalSAR.h"
#include "ratio_reporter.h"
#include "temporary_folder.h"

namespace {

using bench::folder;
using benchmark::State;

std::mt19937& random_bits() {
    static std::mt19937 made{7};
    return made;
}
double between(double least, double most) {
    return least + (most - least) * static_cast<double>(random_bits()()) / 4294967296.0;
}

// --- ground points on an orbit ----------------------------------------------------------------------------------

/** An orbit of so many vectors over so many seconds, and points seen from anywhere on it, in no order. */
struct Sightings {
    static constexpr std::size_t kPoints = 4096;
    GeneralSAROrbit orbit;
    std::vector<std::array<double, 3>> ground;

    Sightings(std::int64_t vectors, std::int64_t span_s) {
        const double spacing = static_cast<double>(span_s) / static_cast<double>(vectors - 1);
        const test::CircularOrbit circle{41.3, 12.8, -12.7};
        test::make_orbit(orbit, {803457.3, spacing, static_cast<int>(vectors)},
                         [&](double t) { return circle.earth_fixed(t - 803457.3); });
        while (ground.size() < kPoints) {
            std::array<double, 3> p;
            const double t = 803457.3 + between(0.01, 0.99) * static_cast<double>(span_s);
            if (orbit.sat2earth(t, between(5.2e-3, 6.1e-3), p.data()) == 0) ground.push_back(p);
        }
    }
};
Sightings& sightings(const State& state) {
    static std::map<std::array<std::int64_t, 2>, std::unique_ptr<Sightings>> made;
    auto& entry = made[{state.range(0), state.range(1)}];
    if (!entry) entry = std::make_unique<Sightings>(state.range(0), state.range(1));
    return *entry;
}
template <bool precise>
void earth2sat(State& state) {
    Sightings& scene = sightings(state);
    double t = 0.0, range = 0.0;
    std::size_t i = 0;
    for (auto _ : state) {
        const double* const p = scene.ground[i++ % Sightings::kPoints].data();
        const int status =
            precise ? scene.orbit.earth2satPrecise(p, &t, &range) : scene.orbit.earth2sat(p, &t, &range);
        if (status) state.SkipWithError("not seen");
    }
}
void orbits(benchmark::internal::Benchmark* job) {
    for (const std::int64_t vectors : {17, 161, 1601, 16001, 160001}) job->Args({vectors, 160});
    for (const std::int64_t vectors : {91, 9001, 90001}) job->Args({vectors, 900});
    for (const std::int64_t vectors : {500, 5000, 50000, 160000}) job->Args({vectors, 10 * (vectors - 1)});
}
BENCHMARK(earth2sat<false>)->Name("earth2sat")->Apply(orbits);
BENCHMARK(earth2sat<true>)->Name("earth2satPrecise")->Apply(orbits);

/** Points anywhere on the Earth, seen far ahead or behind: the nearest pass mostly is not the one, and some are
 * not seen at all. */
void search_orbit(State& state) {
    Sightings& scene = sightings(state);
    std::vector<std::array<double, 3>> points(Sightings::kPoints);
    for (auto& p : points) {
        const double z = between(-1.0, 1.0), turn = between(0.0, 6.283), aside = 6.371e6 * std::sqrt(1.0 - z * z);
        p = {aside * std::cos(turn), aside * std::sin(turn), 6.371e6 * z};
    }
    double t = 0.0, range = 0.0;
    std::size_t i = 0;
    for (auto _ : state) {
        const std::size_t k = i++ % points.size();
        benchmark::DoNotOptimize(scene.orbit.earth2sat(points[k].data(), &t, &range, k % 2 ? 130e3 : -17e3));
    }
}
BENCHMARK(search_orbit)->Args({500, 4990})->Args({160000, 1599990});

/** One load that waits for the one before it, from anywhere in a table as large as the runs of so many vectors. */
void waiting_load(State& state) {
    struct Run {
        std::size_t next, rest[19];
    };
    std::vector<std::size_t> order(static_cast<std::size_t>(state.range(0)));
    std::iota(order.begin(), order.end(), std::size_t{0});
    std::shuffle(order.begin(), order.end(), random_bits());
    std::vector<Run> runs(order.size());
    for (std::size_t i = 0; i < order.size(); ++i) runs[order[i]].next = order[(i + 1) % order.size()];
    std::size_t at = 0;
    for (auto _ : state) benchmark::DoNotOptimize(at = runs[at].next);
}
BENCHMARK(waiting_load)->Arg(160000);

// --- polynomials ------------------------------------------------------------------------------------------------

template <typename List>
void fill(const List& list, int count) {
    for (int i = 0; i < count; ++i) {
        for (double& c : list[i].pol) c = between(-5e6, 5e6);
        list[i].trg0 = 5.3e-3;
        list[i].taz0 = 803457.3 + 1.7 * i;
    }
}
std::unique_ptr<polySAR> made_polynomials(std::int64_t count) {
    auto set = std::make_unique<polySAR>();
    const int each = static_cast<int>(count / 6);
    set->CreatePolys(each, each, each, each, each, each);
    fill(set->DC, each);
    fill(set->FR, each);
    fill(set->SL2GR, each);
    fill(set->GR2SL, each);
    fill(set->SL2THETA, each);
    fill(set->SL2PHI, each);
    return set;
}
void choose(State& state) {
    static std::map<std::int64_t, std::unique_ptr<polySAR>> sets;
    auto& set = sets[state.range(0)];
    const int count = static_cast<int>(state.range(0));
    if (!set) {
        set = std::make_unique<polySAR>();
        set->CreatePolys(count, 0);
        fill(set->DC, count);
    }
    std::vector<double> times(4096);
    for (double& t : times) t = 803457.3 + between(-0.01, 1.01) * 1.7 * count;
    std::size_t i = 0;
    double value = 0.0;
    for (auto _ : state) benchmark::DoNotOptimize(set->EvaluateDC(5.4e-3, times[i++ % times.size()], &value));
}
BENCHMARK(choose)->RangeMultiplier(10)->Range(10, 100000)->Arg(240000);

std::string header_of_polynomials(std::int64_t count) {
    std::string file = folder().file("polynomials" + std::to_string(count) + ".hdr");
    if (!std::filesystem::exists(file)) made_polynomials(count)->writehdr(file.c_str());
    return file;
}
/** The time is that of one polynomial. */
template <typename Body>
void each_polynomial(State& state, Body body) {
    const std::string file = header_of_polynomials(state.range(0));
    const auto set = made_polynomials(state.range(0));
    while (state.KeepRunningBatch(state.range(0)))
        if (body(*set, file)) state.SkipWithError("failed");
}
void read_polynomials(State& state) {
    each_polynomial(state, [](polySAR& set, const std::string& file) { return set.readhdr(file.c_str()); });
}
void rewrite_polynomials(State& state) {
    each_polynomial(state, [](polySAR& set, const std::string& file) { return set.writehdr(file.c_str()); });
}
void polynomials(benchmark::internal::Benchmark* job) {
    for (const std::int64_t count : {600, 6000, 60000, 240000}) job->Arg(count);
}
BENCHMARK(read_polynomials)->Apply(polynomials);
BENCHMARK(rewrite_polynomials)->Apply(polynomials);

// --- arrays -----------------------------------------------------------------------------------------------------

constexpr const char* kField = "StateVectorData/pSV_m";

std::string header_of_values(std::int64_t count) {
    std::string file = folder().file("values" + std::to_string(count) + ".xml");
    if (std::filesystem::exists(file)) return file;
    std::vector<double> values(static_cast<std::size_t>(count));
    for (double& value : values) value = between(-7e6, 7e6);
    quorelxml document{file.c_str()};
    document.writeDouble(1, kField, values.data(), static_cast<int>(count));
    document.write();
    return file;
}
/** The time is that of one value. */
void read_values(State& state) {
    const std::string file = header_of_values(state.range(0));
    std::vector<double> values(static_cast<std::size_t>(state.range(0)));
    while (state.KeepRunningBatch(state.range(0))) {
        quorelxml document{file.c_str()};
        if (document.readDouble(1, kField, values.data(), static_cast<int>(values.size())))
            state.SkipWithError("failed");
    }
}
BENCHMARK(read_values)->RangeMultiplier(10)->Range(1000, 1000000);

/** The same without a document. */
void pass_values(State& state) {
    const std::string file = header_of_values(state.range(0));
    const std::string path = std::string{kField} + "/val";
    std::vector<double> values(static_cast<std::size_t>(state.range(0)));
    while (state.KeepRunningBatch(state.range(0))) {
        auto at = values.begin();
        if (quorelxml::readTexts(file.c_str(), 1, path.c_str(), [&](std::string_view text) {
                std::from_chars(text.data(), text.data() + text.size(), *at++);
            }))
            state.SkipWithError("failed");
    }
}
BENCHMARK(pass_values)->RangeMultiplier(10)->Range(1000, 1000000);

}  // namespace

int main(int argc, char** argv) {
    return bench::run(
        argc, argv,
        {
            {"earth2sat: 1601 / 17 vectors over 160 s", "earth2sat/1601/160", "earth2sat/17/160", 2.0},
            {"earth2sat: 16001 / 17 vectors over 160 s", "earth2sat/16001/160", "earth2sat/17/160", 2.0},
            {"earth2sat: 160001 / 17 vectors over 160 s", "earth2sat/160001/160", "earth2sat/17/160", 2.0},
            {"earth2sat: 9001 / 91 vectors over 900 s", "earth2sat/9001/900", "earth2sat/91/900", 2.0},
            {"earth2sat: 160000 / 500 vectors 10 s apart", "earth2sat/160000/1599990", "earth2sat/500/4990", 5.0},
            {"earth2sat: 160000, 10 s apart / one load from memory", "earth2sat/160000/1599990",
             "waiting_load/160000", 10.0},
            {"earth2sat, far off: 160000 / 500, 10 s apart", "search_orbit/160000/1599990",
             "search_orbit/500/4990", 2.0},
            {"earth2satPrecise: 16001 / 17 over 160 s", "earth2satPrecise/16001/160", "earth2satPrecise/17/160",
             2.0},
            {"EvaluateDC: 240000 / 10 polynomials", "choose/240000", "choose/10", 6.0},
            {"read: 6000 / 600 polynomials", "read_polynomials/6000", "read_polynomials/600", 1.2},
            {"read: 240000 / 600 polynomials", "read_polynomials/240000", "read_polynomials/600", 1.2},
            {"rewrite: 6000 / 600 polynomials", "rewrite_polynomials/6000", "rewrite_polynomials/600", 1.2},
            {"rewrite: 240000 / 600 polynomials", "rewrite_polynomials/240000", "rewrite_polynomials/600", 1.2},
            {"read: 1000000 / 10000 values", "read_values/1000000", "read_values/10000", 1.2},
            {"pass: 1000000 / 10000 values", "pass_values/1000000", "pass_values/10000", 1.2},
            {"pass / read: 1000000 values", "pass_values/1000000", "read_values/1000000", 1.2},
        });
}
