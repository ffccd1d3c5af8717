// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BENCH_RATIO_REPORTER_H
#define QUO_BENCH_RATIO_REPORTER_H

#include <benchmark/benchmark.h>

#include <algorithm>
#include <cstdio>
#include <map>
#include <string>
#include <vector>

namespace bench {

/** One line of the summary: the time of `measured` over that of `beside`, its floor or peer in the same run. */
struct Ratio {
    const char *name, *measured, *beside;
    double target;       ///< what the ratio should not exceed
    double share = 1.0;  ///< part of the peer's time that counts, where it does more or less work
};

/** Prints every run as usual and keeps the shortest time of each benchmark: what disturbs a run only ever makes it
 * longer. It is the processor's time, or what the benchmark itself has taken. */
class RatioReporter : public benchmark::ConsoleReporter {
public:
    void ReportRuns(const std::vector<Run>& runs) override {
        ConsoleReporter::ReportRuns(runs);
        for (const Run& run : runs) {
            if (run.error_occurred || run.run_type != Run::RT_Iteration) continue;
            const std::string name = run.run_name.str();
            const double seconds =
                name.ends_with("/manual_time") ? run.real_accumulated_time : run.cpu_accumulated_time;
            const double nanoseconds = seconds * 1e9 / static_cast<double>(run.iterations);
            const auto [entry, first] = best_.try_emplace(name, nanoseconds);
            if (!first) entry->second = std::min(entry->second, nanoseconds);
        }
    }

    void print(const std::vector<Ratio>& ratios) const {
        std::printf("\n%-44s %12s %12s %8s %8s\n", "ratio", "measured ns", "beside ns", "ratio", "target");
        for (const Ratio& ratio : ratios) {
            const auto measured = best_.find(ratio.measured), beside = best_.find(ratio.beside);
            if (measured == best_.end() || beside == best_.end()) continue;
            const double floor = beside->second * ratio.share;
            std::printf("%-44s %12.1f %12.1f %8.2f %8.2f\n", ratio.name, measured->second, floor,
                        measured->second / floor, ratio.target);
        }
    }

private:
    std::map<std::string, double> best_;
};

/** Runs the registered benchmarks and prints the ratios; the result is the program's exit status. Benchmarks take
 * turns in many short runs, so that what disturbs the machine for a while meets both sides of a ratio; options on
 * the command line come later and win. */
inline int run(int argc, char** argv, const std::vector<Ratio>& ratios) {
    std::string turns[] = {"--benchmark_enable_random_interleaving=true", "--benchmark_repetitions=15",
                           "--benchmark_min_time=0.03"};
    std::vector<char*> arguments{argv[0]};
    for (std::string& option : turns) arguments.push_back(option.data());
    arguments.insert(arguments.end(), argv + 1, argv + argc);
    argc = static_cast<int>(arguments.size());
    argv = arguments.data();
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
    RatioReporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    reporter.print(ratios);
    benchmark::Shutdown();
    return 0;
}

}  // namespace bench

#endif
