// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TRACKING_TABLE_H
#define QUO_TRACKING_TABLE_H

#include <cstddef>
#include <cstdint>

#include "diagnosticslib/call_stack.h"

namespace quo {

/** Who allocated: stored once per call that allocates, and referred to by each of its blocks. */
struct CallRecord {
    CallRecord* newer;  ///< neighbours among the records in use, in the order in which they were taken into use
    CallRecord* older;  ///< for an unused record: the next unused one
    std::uint64_t serial;
    std::uint32_t blocks;  ///< table entries that refer to this record
    std::uint32_t slot;
    std::uint16_t coordinates[kCallSlots];  ///< call counters at depths 0..slot; the rest is not filled
    char name[kCallNameRoom];
};

/** The blocks that the tracked allocator has handed out on one thread and not yet taken back.
 *
 * The entries form a dense array. Removing one moves the last entry into its place, so that the order is not that
 * of allocation; the order is observable (leak report, choice among null entries) and kept whatever the index
 * does. An index by address (open addressing, twice as many cells as entries, deletion by shifting back) spares
 * the search. A failed allocation leaves an entry with a null address; these are no part of the index but marked
 * in a bit set.
 *
 * Instances have static storage: zero-filled memory is the empty table. */
class TrackingTable {
public:
    static constexpr std::uint32_t kCapacity = 16384;

    struct Entry {
        void* address;
        CallRecord* call;
    };

    [[nodiscard]] bool full() const noexcept { return count_ == kCapacity; }
    [[nodiscard]] std::uint32_t size() const noexcept { return count_; }
    [[nodiscard]] const Entry* begin() const noexcept { return entries_; }
    [[nodiscard]] const Entry* end() const noexcept { return entries_ + count_; }

    /** Enters a block of the running call. The table must not be full. */
    void add(void* address, CallStack& stack) noexcept;

    /** Removes the first entry with this address, null included. False when there is none. */
    bool remove(void* address) noexcept;

    /** Removes the blocks of the call with this serial and of all calls made since, and hands each to `release`.
     *
     * The outcome is that of a plain scan: find the first entry that belongs to the call, remove the first entry
     * with its address, start again at the front. For a null entry the two may differ, and then it is the null
     * entry of another call that goes first. */
    void remove_since(std::uint64_t serial, void (*release)(void*)) noexcept;

    void clear() noexcept;

private:
    static constexpr std::uint32_t kCells = 2 * kCapacity;
    static constexpr std::uint32_t kCellMask = kCells - 1;
    static constexpr std::uint32_t kBits = 64;
    static constexpr std::uint32_t kNone = ~0U;
    static constexpr std::uint64_t kNoCall = ~std::uint64_t{0};

    /** Zero is the empty cell. */
    struct Cell {
        std::uint16_t entry_plus_1;
        std::uint16_t home;  ///< the cell where the search for this entry's address begins
    };

    static std::uint32_t home_cell(const void* address) noexcept;
    [[nodiscard]] std::uint32_t find_address(const void* address) const noexcept;
    [[nodiscard]] std::uint32_t find_entry(std::uint32_t entry) const noexcept;
    void insert_cell(std::uint32_t entry) noexcept;
    void erase_cell(std::uint32_t hole) noexcept;

    [[nodiscard]] std::uint32_t first_null() const noexcept;
    void flip_null(std::uint32_t entry) noexcept { nulls_[entry / kBits] ^= std::uint64_t{1} << (entry % kBits); }

    void remove_at(std::uint32_t entry) noexcept;
    /** Moves the last entry to the place of one that is no longer in the index. */
    void close_gap(std::uint32_t entry) noexcept;
    [[nodiscard]] bool is_since(std::uint32_t entry, std::uint64_t serial) const noexcept {
        return entries_[entry].call->serial >= serial;
    }
    [[nodiscard]] std::uint32_t count_since(std::uint64_t serial) const noexcept;
    [[nodiscard]] std::uint32_t lowest_since(std::uint64_t serial) const noexcept;

    CallRecord* record_of(CallStack& stack) noexcept;
    CallRecord* take_record(const CallStack& stack) noexcept;
    void link(CallRecord* record) noexcept;
    void unlink(CallRecord* record) noexcept;
    void drop_block(CallRecord* record) noexcept;

    std::uint32_t count_;
    std::uint32_t null_count_;
    Entry entries_[kCapacity];
    Cell cells_[kCells];
    std::uint64_t nulls_[kCapacity / kBits];

    CallRecord* newest_;           // records in use
    CallRecord* unused_;           // records that were in use before, the latest first
    std::uint32_t records_taken_;  // records from here on were never used
    CallRecord records_[kCapacity];
};

}  // namespace quo

#endif
