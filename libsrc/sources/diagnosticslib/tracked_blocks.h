// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TRACKED_BLOCKS_H
#define QUO_TRACKED_BLOCKS_H

#include <sched.h>
#include <sys/single_threaded.h>

#include <atomic>
#include <mutex>

#include "diagnosticslib/tracking_table.h"

namespace quo {

/** A lock for a few instructions, free as long as the process has one thread. Zero-filled memory is open. */
class BriefLock {
public:
    void lock() noexcept {
        if (__libc_single_threaded) return;
        std::atomic_ref<bool> taken{taken_};
        while (taken.exchange(true, std::memory_order_acquire)) sched_yield();
    }
    void unlock() noexcept { std::atomic_ref<bool>{taken_}.store(false, std::memory_order_release); }

private:
    bool taken_;
};

/** What one thread at a time has allocated. All of them stay until the process ends: blocks outlive the thread
 * that asked for them, and any thread may free them. The next thread goes on with the table of one that has ended.
 *
 * Zero-filled memory is the state in which nobody uses it, so that only what is used comes into being. */
struct TrackedBlocks {
    BriefLock lock;
    bool in_use;
    TrackedBlocks* next;  ///< in the list of all, which the first begins
    TrackingTable table;
};

/** Makes a table the caller's own. Null when there is no memory. */
[[nodiscard]] TrackedBlocks* take_tracked_blocks() noexcept;
/** Leaves it, with what is in it, to another thread. */
void leave_tracked_blocks(TrackedBlocks& blocks) noexcept;

/** The first of the list. */
[[nodiscard]] TrackedBlocks& first_tracked_blocks() noexcept;
/** The one behind, or null. */
[[nodiscard]] TrackedBlocks* after(TrackedBlocks& blocks) noexcept;

/** Calls `visit` with each table, which is locked meanwhile. */
template <typename Visit>
void for_all_tables(Visit visit) noexcept {
    for (TrackedBlocks* blocks = &first_tracked_blocks(); blocks; blocks = after(*blocks)) {
        const std::lock_guard guard{blocks->lock};
        visit(blocks->table);
    }
}

}  // namespace quo

#endif
