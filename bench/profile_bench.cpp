// SPDX-License-Identifier: Apache-2.0
/* Parameter files of 1 MB with 10,000 keys and of 10 MB with 100,000: loading and look-up must cost the same per
 * key in both, which the first ratios show. The floors: reading the same bytes and copying every name and value
 * once, and a plain hash table of the same keys. */

#include <unistd.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <string>
#include <string_view>
#include <unordered_map>
#include <utility>
#include <vector>

#include "quo_base/profile.h"
#include "ratio_reporter.h"
#include "sarutillib/ground/file_io.h"

namespace {

constexpr int kKeysPerSection = 500;
constexpr int kSmall = 10000, kLarge = 100000;

std::string key_name(int i) { return "Parameter" + std::to_string(i); }
std::string section_name(int i) { return "Section" + std::to_string(i / kKeysPerSection); }

/** A parameter file of about 100 bytes per key in the temporary folder, and its keys in an order that jumps about.
 */
class File {
public:
    explicit File(int keys)
        : path_{(std::filesystem::temp_directory_path() /
                 ("quo_profile_bench_" + std::to_string(getpid()) + "_" + std::to_string(keys) + ".par"))
                    .string()} {
        const quo::Stream stream{std::fopen(path_.c_str(), "w")};
        for (int i = 0; stream && i < keys; ++i) {
            if (i % kKeysPerSection == 0) std::fprintf(stream.get(), "\n[%s]\n", section_name(i).c_str());
            std::fprintf(stream.get(), "%s = {%d 803457.3%s}\n", key_name(i).c_str(), i, kRest);
            const int jumped = static_cast<int>(std::int64_t{i} * 7919 % keys);
            order_.emplace_back(section_name(jumped), key_name(jumped));
        }
    }
    ~File() { std::remove(path_.c_str()); }
    File(const File&) = delete;
    File& operator=(const File&) = delete;

    [[nodiscard]] const char* path() const { return path_.c_str(); }
    [[nodiscard]] const std::vector<std::pair<std::string, std::string>>& order() const { return order_; }

private:
    static constexpr const char* kRest = " 17.3 -12.7 0.05546576 951218.9 7.292115e-05 6378137 29.3 41.7";
    std::string path_;
    std::vector<std::pair<std::string, std::string>> order_;
};
const File& file(benchmark::State& state) {
    static const File small{kSmall}, large{kLarge};
    return state.range(0) == kSmall ? small : large;
}

/** Prints the time per key beside each benchmark. */
void count_keys(benchmark::State& state) {
    using benchmark::Counter;
    state.counters["per_key"] =
        Counter(static_cast<double>(state.range(0)), Counter::kIsIterationInvariantRate | Counter::kInvert);
}

void load(benchmark::State& state) {
    const File& f = file(state);
    while (state.KeepRunning()) {
        FreeProfile(f.path());
        benchmark::DoNotOptimize(GetSetProfileChar(0, "Section0", "Parameter0", nullptr, f.path()));
    }
    count_keys(state);
}

void look_up(benchmark::State& state) {
    const File& f = file(state);
    while (state.KeepRunning())
        for (const auto& [section, key] : f.order())
            benchmark::DoNotOptimize(GetSetProfileChar(0, section.c_str(), key.c_str(), nullptr, f.path()));
    count_keys(state);
}

/** Reads a file line by line into pairs of name and value. */
std::vector<std::pair<std::string, std::string>> copy_lines(const char* path) {
    const auto text = quo::read_file(path, std::int64_t{1} << 30);
    std::vector<std::pair<std::string, std::string>> lines;
    std::string_view rest = text ? std::string_view{*text} : "";
    while (!rest.empty()) {
        const std::string_view line = rest.substr(0, rest.find('\n'));
        const auto equals = line.find('=');
        if (equals != line.npos) lines.emplace_back(line.substr(0, equals - 1), line.substr(equals + 2));
        rest.remove_prefix(line.size() + 1);
    }
    return lines;
}

void copied_lines(benchmark::State& state) {
    const File& f = file(state);
    while (state.KeepRunning()) benchmark::DoNotOptimize(copy_lines(f.path()));
    count_keys(state);
}

void hash_table(benchmark::State& state) {
    const File& f = file(state);
    const auto lines = copy_lines(f.path());
    const std::unordered_map<std::string, std::string> table{lines.begin(), lines.end()};
    while (state.KeepRunning())
        for (const auto& [section, key] : f.order()) benchmark::DoNotOptimize(table.find(key));
    count_keys(state);
}

BENCHMARK(load)->Arg(kSmall)->Arg(kLarge)->Unit(benchmark::kMillisecond);
BENCHMARK(copied_lines)->Arg(kSmall)->Arg(kLarge)->Unit(benchmark::kMillisecond);
BENCHMARK(look_up)->Arg(kSmall)->Arg(kLarge)->Unit(benchmark::kMillisecond);
BENCHMARK(hash_table)->Arg(kSmall)->Arg(kLarge)->Unit(benchmark::kMillisecond);

}  // namespace

int main(int argc, char** argv) {
    // Ten times the keys count as ten times the work: a ratio of 1 is a cost that grows with the file alone.
    // Look-ups that jump about leave the cache in the large file; the plain hash table shows how much that costs
    // by itself.
    constexpr double kTimes = static_cast<double>(kLarge) / kSmall;
    return bench::run(argc, argv,
                      {{"load per key, large file / small", "load/100000", "load/10000", 2.0, kTimes},
                       {"look-up per key, large file / small", "look_up/100000", "look_up/10000", 6.0, kTimes},
                       {"hash table per key, large / small", "hash_table/100000", "hash_table/10000", 6.0, kTimes},
                       {"load / read and copy every line", "load/100000", "copied_lines/100000", 6.0},
                       {"look-up / plain hash table", "look_up/100000", "hash_table/100000", 3.0}});
}
