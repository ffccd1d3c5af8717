// SPDX-License-Identifier: Apache-2.0
#include "diagnosticslib/tracked_blocks.h"

#include <cstdlib>

namespace quo {
namespace {

TrackedBlocks oldest;

bool take(TrackedBlocks& blocks) noexcept {
    return !std::atomic_ref<bool>{blocks.in_use}.exchange(true, std::memory_order_acquire);
}

/** Puts one behind the first, where readers of the list find it from now on. */
void publish(TrackedBlocks& fresh) noexcept {
    std::atomic_ref<TrackedBlocks*> place{oldest.next};
    fresh.next = place.load(std::memory_order_relaxed);
    while (!place.compare_exchange_weak(fresh.next, &fresh, std::memory_order_release)) {
    }
}

}  // namespace

TrackedBlocks& first_tracked_blocks() noexcept { return oldest; }

TrackedBlocks* after(TrackedBlocks& blocks) noexcept {
    return std::atomic_ref<TrackedBlocks*>{blocks.next}.load(std::memory_order_acquire);
}

TrackedBlocks* take_tracked_blocks() noexcept {
    for (TrackedBlocks* blocks = &oldest; blocks; blocks = after(*blocks)) {
        if (take(*blocks)) return blocks;
    }
    auto* const fresh = static_cast<TrackedBlocks*>(std::calloc(1, sizeof(TrackedBlocks)));
    if (!fresh) return nullptr;
    fresh->in_use = true;
    publish(*fresh);
    return fresh;
}

void leave_tracked_blocks(TrackedBlocks& blocks) noexcept {
    std::atomic_ref<bool>{blocks.in_use}.store(false, std::memory_order_release);
}

}  // namespace quo
