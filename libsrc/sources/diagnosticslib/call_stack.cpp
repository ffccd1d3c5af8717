// SPDX-License-Identifier: Apache-2.0
#include "diagnosticslib/call_stack.h"

#include <unistd.h>

#include <cstdio>
#include <cstdlib>

#include "diagnosticslib/tracked_blocks.h"

namespace quo {
namespace {

/** Calls that one thread can make before its serials meet those of the next; a thousand a microsecond for a
 * quarter of an hour, or ten for a day. */
constexpr unsigned kSerialBits = 40;

/** The main thread's stack needs no memory, and lasts as long as the process. Every call writes to it: what other
 * threads read, such as `tracking`, has no place in its cache lines. */
alignas(64) CallStack main_stack;

std::atomic<std::uint64_t> threads_met{0};

/** Gives back, when the thread ends, what it had. */
class Leaving {
public:
    void of(CallStack* stack) noexcept { stack_ = stack; }
    ~Leaving() {
        if (!stack_) return;
        own_call_stack = nullptr;
        if (stack_->blocks) leave_tracked_blocks(*stack_->blocks);
        std::free(stack_);
    }

private:
    CallStack* stack_ = nullptr;
};
thread_local Leaving leaving;

CallStack* stack_of_a_thread() noexcept {
    if (gettid() == getpid()) return &main_stack;
    auto* const stack = static_cast<CallStack*>(std::calloc(1, sizeof(CallStack)));
    if (!stack) {
        std::fputs("Memory allocation failure\n", stderr);
        std::_Exit(EXIT_FAILURE);
    }
    leaving.of(stack);
    return stack;
}

}  // namespace

constinit std::atomic<bool> tracking{false};
constinit thread_local CallStack* own_call_stack [[gnu::tls_model("initial-exec")]] = nullptr;

CallStack& make_call_stack() noexcept {
    own_call_stack = stack_of_a_thread();
    // Later threads have higher serials: what an earlier one has left in a table is older than all their calls.
    own_call_stack->calls = threads_met.fetch_add(1, std::memory_order_relaxed) << kSerialBits;
    own_call_stack->empty();
    return *own_call_stack;
}

void CallStack::empty() noexcept {
    depth = 0;
    for (RunningCall& call : slots) call = {"", 0, nullptr, 0};
    slots[0].name = "main()";
    slots[0].serial = calls >> kSerialBits << kSerialBits;
}

}  // namespace quo
