// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_EXAMPLES_STOPWATCH_H
#define QUO_EXAMPLES_STOPWATCH_H

#include <array>
#include <chrono>
#include <cstddef>

namespace example {

/** What the processor's time goes into. */
enum Work : std::size_t { kPlanning, kReading, kWriting, kTransforms, kFilters, kWorks };
inline constexpr std::array<const char*, kWorks> kWorkNames{"planning transforms", "reading", "writing",
                                                            "transforms", "filters"};

/** Adds up the time that each kind of work takes. */
class Stopwatch {
public:
    template <typename Piece>
    void time(Work work, Piece&& piece) {
        const auto start = Clock::now();
        piece();
        seconds_[work] += since(start);
    }
    /** Adds what another watch has counted, such as that of a thread. */
    void add(const Stopwatch& other) {
        for (std::size_t work = 0; work < kWorks; ++work) seconds_[work] += other.seconds_[work];
    }
    [[nodiscard]] double seconds(std::size_t work) const { return seconds_[work]; }
    /** Since the object was made. */
    [[nodiscard]] double total() const { return since(start_); }

private:
    using Clock = std::chrono::steady_clock;
    [[nodiscard]] static double since(Clock::time_point start) {
        return std::chrono::duration<double>(Clock::now() - start).count();
    }
    Clock::time_point start_ = Clock::now();
    std::array<double, kWorks> seconds_{};
};

}  // namespace example

#endif
