// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_CALL_STACK_H
#define QUO_CALL_STACK_H

#include <algorithm>
#include <atomic>
#include <cstddef>
#include <cstdint>

namespace quo {

struct CallRecord;
struct TrackedBlocks;

/** Calls deeper than the last slot share it: their depth keeps counting, their names and counters do not. */
inline constexpr std::uint32_t kCallSlots = 64;
/** Room for a function's name, the final NUL included. */
inline constexpr std::size_t kCallNameRoom = 128;

/** The innermost call that runs at one depth. */
struct RunningCall {
    const char* name;       ///< a frame's literal, or the slot's copy of a name that came from outside
    std::uint64_t serial;   ///< number among all calls, rising along the stack; 0 for main()
    CallRecord* record;     ///< what this call's blocks refer to, once it has made one; valid while serials agree
    std::uint16_t entered;  ///< functions entered at this depth since tracking began, modulo 65536
};

/** The calls that run on one thread. Depth 0 is main(), also where a thread has another beginning. Nothing here
 * allocates, copies names, locks or makes system calls, so that a call that succeeds pays next to nothing for
 * being tracked. */
struct CallStack {
    std::uint32_t depth;
    std::uint64_t calls;  ///< serial of the latest call; never reset, so that serials stay unique
    RunningCall slots[kCallSlots];
    std::uint32_t muted;    ///< nothing is added to the report while this is above 0
    int system_error;       ///< the latest that was reported, until somebody asks
    TrackedBlocks* blocks;  ///< what the thread's allocations are entered in; null before the first
    char copied_names[kCallSlots][kCallNameRoom];  ///< of the slots whose names came from outside

    [[nodiscard]] std::uint32_t slot() const noexcept { return std::min(depth, kCallSlots - 1); }
    [[nodiscard]] RunningCall& running() noexcept { return slots[slot()]; }

    /** Leaves all functions and forgets how many there were. */
    void empty() noexcept;

    /** Enters a function. `name` is kept by address: a literal, or text that stands until the call returns. While
     * tracking is off nobody looks, and turning it on empties the stack. */
    void push(const char* name) noexcept {
        ++depth;
        RunningCall& call = running();
        ++call.entered;
        call.name = name;
        call.serial = ++calls;
    }
    /** Leaves a function; main() is never left. */
    void pop() noexcept {
        if (depth > 0) --depth;
    }
};

/** Whether calls and blocks are tracked, in the whole process. */
extern constinit std::atomic<bool> tracking;

/** This thread's stack once it has one. A pointer in the thread's first storage costs one access; the stack itself
 * would not find room there when the library is loaded into a running program. */
extern constinit thread_local CallStack* own_call_stack [[gnu::tls_model("initial-exec")]];

/** Gives the thread a stack, until it ends. Where there is no memory for it, the process ends. */
[[gnu::cold]] CallStack& make_call_stack() noexcept;

inline CallStack& call_stack() noexcept { return own_call_stack ? *own_call_stack : make_call_stack(); }

}  // namespace quo

#endif
