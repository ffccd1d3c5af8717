// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_EXAMPLE_BLOCKS_H
#define QUO_EXAMPLE_BLOCKS_H

#include <algorithm>
#include <condition_variable>
#include <cstddef>
#include <exception>
#include <mutex>
#include <optional>
#include <system_error>
#include <thread>
#include <utility>
#include <vector>

namespace blocks {

/** As many threads as the process may run on processors. */
inline int all_processors() { return std::max(1, static_cast<int>(std::thread::hardware_concurrency())); }

/** Who is next to take a block, and who to hand on what became of one. The first failure, in the order of the
 * blocks, ends the work. */
class Turns {
public:
    /** Calls `take`, which gives a block or nothing, unless the work has ended. Fills the block's number. */
    template <typename Take>
    auto begin(std::size_t& number, Take take) -> decltype(take()) {
        const std::lock_guard guard{taking_};
        if (ended_) return {};
        number = begun_++;
        auto block = take_or_fail(number, take);
        ended_ = ended_ || !block;
        return block;
    }
    /** Calls `hand_on` when all blocks before have been handed on. False when one of them failed. */
    template <typename HandOn>
    bool end(std::size_t number, HandOn hand_on) {
        {
            std::unique_lock guard{waiting_};
            changed_.wait(guard, [&] { return handed_on_ == number || failure_; });
            if (failure_) return false;
        }
        std::exception_ptr failure;
        try {
            hand_on();
        } catch (...) {
            failure = std::current_exception();
        }
        const std::lock_guard guard{waiting_};
        ++handed_on_;
        failure_ = failure;
        changed_.notify_all();
        return !failure;
    }
    void rethrow() const {
        if (failure_) std::rethrow_exception(failure_);
    }

private:
    template <typename Take>
    auto take_or_fail(std::size_t number, Take& take) -> decltype(take()) {
        try {
            return take();
        } catch (...) {
            ended_ = true;
            end(number, [failure = std::current_exception()] { std::rethrow_exception(failure); });
            return {};
        }
    }

    std::mutex taking_, waiting_;
    std::condition_variable changed_;
    std::size_t begun_ = 0, handed_on_ = 0;
    bool ended_ = false;
    std::exception_ptr failure_;
};

/** Works on blocks with several threads; what becomes of them does not hang on how many there are.
 *
 * @param threads  at least 1; one of them is the caller's own
 * @param next     gives a block (std::optional), or nothing at the end; called by one thread at a time
 * @param make_worker  called for each thread, before any begins: what it gives is called with a block and gives
 * the result, which may be its own: it is not called again before that has been handed on
 * @param hand_on  called with each result, in the order of the blocks, by one thread at a time
 *
 * Throws what the first block that fails, in their order, makes one of them throw; results before it have been
 * handed on, none behind it. */
template <typename Next, typename MakeWorker, typename HandOn>
void in_order(int threads, Next next, MakeWorker make_worker, HandOn hand_on) {
    using Worker = decltype(make_worker());
    std::vector<Worker> workers;
    workers.reserve(static_cast<std::size_t>(threads));
    for (int i = 0; i < threads; ++i) workers.push_back(make_worker());
    Turns turns;
    const auto work = [&](Worker& worker) {
        std::size_t number = 0;
        while (auto block = turns.begin(number, next)) {
            std::optional<decltype(worker(*block))> result;
            std::exception_ptr failure;
            try {
                result.emplace(worker(*block));
            } catch (...) {
                failure = std::current_exception();
            }
            const auto finish = [&] {
                if (failure) std::rethrow_exception(failure);
                hand_on(std::move(*result));
            };
            if (!turns.end(number, finish)) return;
        }
    };
    {
        std::vector<std::jthread> others;
        try {
            for (std::size_t i = 1; i < workers.size(); ++i) others.emplace_back([&, i] { work(workers[i]); });
        } catch (const std::system_error&) {
            // The system has no more threads: those that there are do the work.
        }
        work(workers.front());
    }
    turns.rethrow();
}

}  // namespace blocks

#endif
