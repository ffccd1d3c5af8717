// SPDX-License-Identifier: Apache-2.0

// Numbers as text beside the C library in one run: "%.15g" beside snprintf, reading beside strtod. Half of the
// numbers are as products hold them, half are any bit pattern. The summary at the end prints the ratios; a time is
// that of all the numbers.
#include <benchmark/benchmark.h>

#include <bit>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <random>
#include <string>
#include <vector>

#include "ratio_reporter.h"
#include "sarutillib/ground/number_text.h"

namespace {

// Few enough to stay in the cache, enough for no branch to be learnt by heart.
constexpr std::size_t kCount = 20000;

const std::vector<double>& numbers() {
    static const std::vector<double> all = [] {
        std::mt19937_64 random{20040703};
        std::vector<double> values;
        while (values.size() < kCount) {
            const auto digits = static_cast<double>(static_cast<std::int64_t>(random() % 2000000000) - 1000000000);
            values.push_back(digits * std::pow(10.0, -static_cast<int>(random() % 12)));
            values.push_back(std::bit_cast<double>(random()));
        }
        return values;
    }();
    return all;
}

const std::vector<std::string>& texts() {
    static const std::vector<std::string> all = [] {
        std::vector<std::string> found;
        for (const double value : numbers()) found.emplace_back(quo::format_general(value, 15).data);
        return found;
    }();
    return all;
}

/** Calls `handle` with every one of `items`, again and again. */
template <typename Items, typename Handle>
void handle_all(benchmark::State& state, const Items& items, Handle handle) {
    for (auto _ : state)
        for (const auto& item : items) benchmark::DoNotOptimize(handle(item));
    state.SetItemsProcessed(state.iterations() * static_cast<std::int64_t>(items.size()));
}

void write_own(benchmark::State& state) {
    handle_all(state, numbers(), [](double value) { return quo::format_general(value, 15).size; });
}
void write_snprintf(benchmark::State& state) {
    char text[quo::kNumberRoom];
    handle_all(state, numbers(), [&](double value) { return std::snprintf(text, sizeof text, "%.15g", value); });
}
void write_exact_own(benchmark::State& state) {
    handle_all(state, numbers(), [](double value) { return quo::format_exact(value).size; });
}
void write_exact_snprintf(benchmark::State& state) {
    char text[quo::kNumberRoom];
    handle_all(state, numbers(), [&](double value) { return std::snprintf(text, sizeof text, "%.17g", value); });
}
void read_own(benchmark::State& state) {
    handle_all(state, texts(), [](const std::string& text) { return quo::scan_double(text).value; });
}
void read_strtod(benchmark::State& state) {
    handle_all(state, texts(), [](const std::string& text) { return std::strtod(text.c_str(), nullptr); });
}

BENCHMARK(write_own);
BENCHMARK(write_snprintf);
BENCHMARK(write_exact_own);
BENCHMARK(write_exact_snprintf);
BENCHMARK(read_own);
BENCHMARK(read_strtod);

}  // namespace

int main(int argc, char** argv) {
    return bench::run(argc, argv,
                      {{"write %.15g / snprintf", "write_own", "write_snprintf", 0.25},
                       {"write exactly / snprintf %.17g", "write_exact_own", "write_exact_snprintf", 0.25},
                       {"read / strtod", "read_own", "read_strtod", 0.25}});
}
