// SPDX-License-Identifier: Apache-2.0
#include "quo_base/ckerr.h"

#include <sys/mman.h>

#include <cerrno>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <mutex>

#include "diagnosticslib/call_stack.h"
#include "diagnosticslib/errno_kept.h"
#include "diagnosticslib/report.h"
#include "diagnosticslib/tracked_blocks.h"
#include "sarutillib/ground/aligned_block.h"
#include "sarutillib/ground/bounded_text.h"

namespace {

using quo::call_stack;
using quo::CallStack;
using quo::TrackedBlocks;
using quo::TrackingTable;

constexpr char kSource[] = "ckerr.cpp";
constexpr std::size_t kHugePage = std::size_t{2} << 20;
constexpr std::size_t kHugeFrom = 2 * kHugePage;

bool is_tracking() noexcept { return quo::tracking.load(std::memory_order_relaxed); }

void reset_calls_and_blocks(bool tracking) noexcept {
    quo::tracking = tracking;
    call_stack().empty();
    quo::for_all_tables([](TrackingTable& table) { table.clear(); });
}

/** The table of this thread, which it takes with its first block. Null when there is no memory. */
TrackedBlocks* own_blocks() noexcept {
    CallStack& stack = call_stack();
    if (!stack.blocks) stack.blocks = quo::take_tracked_blocks();
    return stack.blocks;
}

/** Enters a block, or null where none could be had. False when the table is full. */
bool enter(TrackedBlocks& own, void* block) noexcept {
    const std::lock_guard guard{own.lock};
    if (own.table.full()) return false;
    own.table.add(block, call_stack());
    return true;
}

bool strike(TrackedBlocks& blocks, void* block) noexcept {
    const std::lock_guard guard{blocks.lock};
    return blocks.table.remove(block);
}

/** Takes a block out of the table that it is in: nearly always that of this thread. False when it is in none. A
 * null entry of another thread is that thread's business. */
bool strike_anywhere(void* block) noexcept {
    TrackedBlocks* const own = call_stack().blocks;
    if (own && strike(*own, block)) return true;
    for (TrackedBlocks* blocks = &quo::first_tracked_blocks(); block && blocks; blocks = quo::after(*blocks)) {
        if (blocks != own && strike(*blocks, block)) return true;
    }
    return false;
}

/** Fresh memory is asked for in huge pages where the system has them: touching it for the first time costs a
 * tenth. */
void prefer_huge_pages(void* system, std::size_t bytes) noexcept {
    const quo::ErrnoKept kept;  // only advice
    const std::size_t step = kHugePage - reinterpret_cast<std::uintptr_t>(system) % kHugePage;
    madvise(static_cast<char*>(system) + step, (bytes - step) / kHugePage * kHugePage, MADV_HUGEPAGE);
}

void release_block(void* block) noexcept { std::free(quo::system_memory(block)); }

using SystemAllocator = void*(std::size_t bytes);
void* plain_memory(std::size_t bytes) noexcept { return std::malloc(bytes); }
void* zeroed_memory(std::size_t bytes) noexcept { return std::calloc(1, bytes); }

void* system_block(std::size_t count, std::size_t size, SystemAllocator* system) noexcept {
    const auto bytes = quo::system_bytes(count, size);
    if (!bytes) errno = ENOMEM;
    void* const memory = bytes ? system(*bytes) : nullptr;
    if (memory && *bytes >= kHugeFrom) prefer_huge_pages(memory, *bytes);
    return quo::aligned_block(memory);
}

void* allocate(std::size_t count, std::size_t size, SystemAllocator* system, const char* function,
               int line) noexcept {
    if (!is_tracking()) return system_block(count, size, system);
    const int error_before = errno;
    TrackedBlocks* const own = own_blocks();
    if (!own) return nullptr;
    void* const block = system_block(count, size, system);
    if (enter(*own, block)) return block;  // a failed allocation leaves a null entry
    if (block) release_block(block);
    errno = error_before;
    quo_add_report("Too many tracked blocks", QUO_ERROR, line, function, kSource);
    return nullptr;
}

void write_owner(const quo::CallRecord& call) noexcept {
    std::fprintf(stderr, "%s : ", call.name);
    for (std::uint32_t depth = 0; depth <= call.slot; ++depth)
        std::fprintf(stderr, "%d\t", call.coordinates[depth]);
    std::fputs("\n", stderr);
}

void write_leak_report(std::size_t blocks) noexcept {
    const quo::ErrnoKept kept;
    std::fputs("\nPotential memory leaks detected!\n", stderr);
    std::fprintf(stderr, "\n%d buffers left to be de-allocated.!\n", static_cast<int>(blocks));
    std::fputs("--------------------------------\n", stderr);
    std::fputs("ML call graph coordinates: \n", stderr);
    quo::for_all_tables([](const TrackingTable& table) {
        for (const auto& entry : table) write_owner(*entry.call);
    });
}

}  // namespace

extern "C" int init_ckerr_locking(void) noexcept {
    if (is_tracking()) return 0;
    reset_calls_and_blocks(true);
    quo::silence_report_and_log();
    return 0;
}

extern "C" int set_ckerr_fun(const char* name) noexcept {
    if (!is_tracking()) return 1;
    CallStack& stack = call_stack();
    stack.push("");
    // The name need not end within the room that it is given here.
    char* const copy = stack.copied_names[stack.slot()];
    quo::copy_bounded(copy, quo::kCallNameRoom, {name ? name : "", name ? strnlen(name, quo::kCallNameRoom) : 0});
    stack.running().name = copy;
    return 1;
}

extern "C" void deccurdep(void) noexcept { call_stack().pop(); }

extern "C" int ckflg_ckerr(void) noexcept { return is_tracking() ? 1 : 0; }

extern "C" void* malloc_ckerr(size_t size) noexcept {
    return allocate(1, size, plain_memory, "malloc_ckerr", __LINE__);
}

extern "C" void* calloc_ckerr(size_t count, size_t size) noexcept {
    return allocate(count, size, zeroed_memory, "calloc_ckerr", __LINE__);
}

extern "C" void free_ckerr(void* block) noexcept {
    // The system's free() will want the words below the block: they are fetched while the table is searched.
    if (block) __builtin_prefetch(static_cast<char*>(block) - quo::kBlockAlignment);
    // A block that is not in the table may have been freed already, with the call that owned it.
    if (is_tracking() && !strike_anywhere(block)) return;
    if (block) release_block(block);
}

extern "C" void freeall_ckerr(void) noexcept {
    CallStack& stack = call_stack();
    if (!is_tracking() || !stack.blocks) return;
    const std::lock_guard guard{stack.blocks->lock};
    stack.blocks->table.remove_since(stack.running().serial, release_block);
}

extern "C" void** matalloc_ckerr(int rows, size_t row_bytes) noexcept {
    const std::size_t count = rows > 0 ? static_cast<std::size_t>(rows) : 0;
    auto** const array =
        static_cast<void**>(allocate(count, sizeof(void*), plain_memory, "matalloc_ckerr", __LINE__));
    if (!array) return nullptr;
    for (int row = 0; row < rows; ++row) {
        array[row] = calloc_ckerr(1, row_bytes);
        if (array[row]) continue;
        // While tracking is on, freeall_ckerr() reclaims what was made so far; otherwise nobody could.
        if (!is_tracking()) matfree_ckerr(array, row);
        return nullptr;
    }
    return array;
}

extern "C" void matfree_ckerr(void** rows_array, int rows) noexcept {
    for (int row = 0; rows_array && row < rows; ++row) free_ckerr(rows_array[row]);
    free_ckerr(rows_array);
}

extern "C" void exit_ckerr(void) noexcept {
    if (!is_tracking()) return;
    std::size_t left = 0;
    quo::for_all_tables([&](const TrackingTable& table) { left += table.size(); });
    if (left > 0) write_leak_report(left);
    reset_calls_and_blocks(false);
}
