#ifndef QUO_CALL_STACK_H
#define QUO_CALL_STACK_H

#include <algorithm>
#include <cstddef>
#include <cstdint>

namespace quo {

struct CallRecord;

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

/** The calls that are running. Depth 0 is main(). Nothing here allocates, copies names or makes system calls, so
 * that a call that succeeds pays next to nothing for being tracked. */
struct CallStack {
    bool tracking;
    std::uint32_t depth;
    std::uint64_t calls;  ///< serial of the latest call; never reset, so that serials stay unique
    RunningCall slots[kCallSlots];
    std::uint32_t muted;  ///< nothing is added to the report while this is above 0
    int system_error;     ///< the latest that was reported, until somebody asks

    [[nodiscard]] std::uint32_t slot() const noexcept { return std::min(depth, kCallSlots - 1); }
    [[nodiscard]] RunningCall& running() noexcept { return slots[slot()]; }

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

/** The one stack of the process. */
extern CallStack call_stack;

}  // namespace quo

#endif
