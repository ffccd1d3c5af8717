#include "quo_base/ckerr.h"

#include <sys/mman.h>

#include <cerrno>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "diagnosticslib/call_stack.h"
#include "diagnosticslib/errno_kept.h"
#include "diagnosticslib/report.h"
#include "diagnosticslib/tracking_table.h"
#include "sarutillib/ground/aligned_block.h"
#include "sarutillib/ground/bounded_text.h"

quo::CallStack quo::call_stack;

namespace {

using quo::call_stack;

constexpr char kSource[] = "ckerr.cpp";
constexpr std::size_t kHugePage = std::size_t{2} << 20;
constexpr std::size_t kHugeFrom = 2 * kHugePage;

quo::TrackingTable tracked;

/** The slots' copies of names that came through the plain interface. */
char copied_names[quo::kCallSlots][quo::kCallNameRoom];

void reset_calls_and_blocks(bool tracking) noexcept {
    call_stack.tracking = tracking;
    call_stack.depth = 0;
    for (quo::RunningCall& call : call_stack.slots) call = {"", 0, nullptr, 0};
    call_stack.slots[0].name = "main()";
    tracked.clear();
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

void* allocate(std::size_t count, std::size_t size, SystemAllocator* system, const char* function,
               int line) noexcept {
    if (call_stack.tracking && tracked.full()) {
        quo_add_report("Too many tracked blocks", QUO_ERROR, line, function, kSource);
        return nullptr;
    }
    const auto bytes = quo::system_bytes(count, size);
    if (!bytes) errno = ENOMEM;
    void* const memory = bytes ? system(*bytes) : nullptr;
    if (memory && *bytes >= kHugeFrom) prefer_huge_pages(memory, *bytes);
    void* const block = quo::aligned_block(memory);
    if (call_stack.tracking) tracked.add(block, call_stack);  // a failed allocation leaves a null entry
    return block;
}

void write_leak_report() noexcept {
    const quo::ErrnoKept kept;
    std::fputs("\nPotential memory leaks detected!\n", stderr);
    std::fprintf(stderr, "\n%d buffers left to be de-allocated.!\n", static_cast<int>(tracked.size()));
    std::fputs("--------------------------------\n", stderr);
    std::fputs("ML call graph coordinates: \n", stderr);
    for (const auto& entry : tracked) {
        std::fprintf(stderr, "%s : ", entry.call->name);
        for (std::uint32_t depth = 0; depth <= entry.call->slot; ++depth)
            std::fprintf(stderr, "%d\t", entry.call->coordinates[depth]);
        std::fputs("\n", stderr);
    }
}

}  // namespace

extern "C" int init_ckerr_locking(void) noexcept {
    if (call_stack.tracking) return 0;
    reset_calls_and_blocks(true);
    quo::silence_report_and_log();
    return 0;
}

extern "C" int set_ckerr_fun(const char* name) noexcept {
    if (!call_stack.tracking) return 1;
    call_stack.push("");
    // The name need not end within the room that it is given here.
    char* const copy = copied_names[call_stack.slot()];
    quo::copy_bounded(copy, quo::kCallNameRoom, {name ? name : "", name ? strnlen(name, quo::kCallNameRoom) : 0});
    call_stack.running().name = copy;
    return 1;
}

extern "C" void deccurdep(void) noexcept { call_stack.pop(); }

extern "C" int ckflg_ckerr(void) noexcept { return call_stack.tracking ? 1 : 0; }

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
    if (call_stack.tracking && !tracked.remove(block)) return;
    if (block) release_block(block);
}

extern "C" void freeall_ckerr(void) noexcept {
    if (call_stack.tracking) tracked.remove_since(call_stack.running().serial, release_block);
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
        if (!call_stack.tracking) matfree_ckerr(array, row);
        return nullptr;
    }
    return array;
}

extern "C" void matfree_ckerr(void** rows_array, int rows) noexcept {
    for (int row = 0; rows_array && row < rows; ++row) free_ckerr(rows_array[row]);
    free_ckerr(rows_array);
}

extern "C" void exit_ckerr(void) noexcept {
    if (!call_stack.tracking) return;
    if (tracked.size() > 0) write_leak_report();
    reset_calls_and_blocks(false);
}
