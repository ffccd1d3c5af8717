// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_OUT_OF_MEMORY_H
#define QUO_OUT_OF_MEMORY_H

#include <cstdio>
#include <cstdlib>
#include <exception>
#include <utility>

namespace quo {

inline constexpr const char* kNoMemory = "Memory allocation failure\n";
inline constexpr const char* kNoMoreMemory = "Memory re-allocation failure\n";

[[noreturn]] inline void end_process(const char* message) noexcept {
    std::fputs(message, stderr);
    std::exit(EXIT_FAILURE);
}

/** Runs a step of the store. There is no way back from a failed allocation: the process ends with status 1,
 * because every caller counts on a value that was set being there. */
template <typename Step>
decltype(auto) or_end_process(const char* message, Step&& step) noexcept {
    try {
        return std::forward<Step>(step)();
    } catch (const std::exception&) {
        end_process(message);
    }
}

}  // namespace quo

#endif
