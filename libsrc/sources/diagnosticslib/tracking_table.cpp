// SPDX-License-Identifier: Apache-2.0
#include "diagnosticslib/tracking_table.h"

#include <algorithm>
#include <bit>
#include <iterator>
#include <span>

#include "sarutillib/ground/bounded_text.h"

namespace quo {

// ---- entries

void TrackingTable::add(void* address, CallStack& stack) noexcept {
    const std::uint32_t entry = count_++;
    CallRecord* call = record_of(stack);
    ++call->blocks;
    entries_[entry] = {address, call};
    if (address) {
        insert_cell(entry);
    } else {
        flip_null(entry);
        ++null_count_;
    }
}

bool TrackingTable::remove(void* address) noexcept {
    if (!address) {
        if (null_count_ == 0) return false;
        remove_at(first_null());
        return true;
    }
    const std::uint32_t cell = find_address(address);
    if (cell == kNone) return false;
    const std::uint32_t entry = cells_[cell].entry_plus_1 - 1U;
    erase_cell(cell);
    close_gap(entry);
    return true;
}

void TrackingTable::remove_at(std::uint32_t entry) noexcept {
    if (entries_[entry].address) {
        erase_cell(find_entry(entry));
    } else {
        flip_null(entry);
        --null_count_;
    }
    close_gap(entry);
}

void TrackingTable::close_gap(std::uint32_t entry) noexcept {
    drop_block(entries_[entry].call);
    const std::uint32_t last = --count_;
    if (entry == last) return;
    if (entries_[last].address) {
        cells_[find_entry(last)].entry_plus_1 = static_cast<std::uint16_t>(entry + 1);
    } else {
        flip_null(last);
        flip_null(entry);
    }
    entries_[entry] = entries_[last];
}

// Serials rise, and a call that is running has a lower one than every call made from it: the blocks of a running
// call and its callees are those whose records have at least its serial.
void TrackingTable::remove_since(std::uint64_t serial, void (*release)(void*)) noexcept {
    const auto take = [&](std::uint32_t entry) {
        if (void* address = entries_[entry].address) release(address);
        remove_at(entry);
    };
    // Entries in front of `entry` do not match, so starting again at the front would lead back to it.
    for (std::uint32_t entry = lowest_since(serial); entry < count_;) {
        if (!is_since(entry, serial)) {
            ++entry;
        } else if (entries_[entry].address) {
            take(entry);
        } else {
            // What comes to stand in the place of the first null entry is the only unknown one in front of
            // `entry`.
            const std::uint32_t first = first_null();
            take(first);
            while (first < count_ && is_since(first, serial)) take(first);
        }
    }
}

std::uint32_t TrackingTable::lowest_since(std::uint64_t serial) const noexcept {
    std::uint32_t lowest = count_;
    // Young blocks stand at the end unless a removal moved them: usually a few steps find them all.
    std::uint32_t missing = count_since(serial);
    for (std::uint32_t entry = count_; missing > 0;) {
        if (!is_since(--entry, serial)) continue;
        lowest = entry;
        --missing;
    }
    return lowest;
}

// Threads that are running calls still know the records they have made, by their serials.
void TrackingTable::clear() noexcept {
    for (CallRecord& record : std::span{records_}.first(records_taken_)) record.serial = kNoCall;
    count_ = null_count_ = records_taken_ = 0;
    newest_ = unused_ = nullptr;
    std::fill(std::begin(cells_), std::end(cells_), Cell{});
    std::fill(std::begin(nulls_), std::end(nulls_), 0);
}

std::uint32_t TrackingTable::first_null() const noexcept {
    const auto* const word =
        std::find_if(std::begin(nulls_), std::end(nulls_), [](auto bits) { return bits != 0; });
    return static_cast<std::uint32_t>(word - nulls_) * kBits + static_cast<std::uint32_t>(std::countr_zero(*word));
}

// ---- index by address

// Blocks are 16 bytes apart at least; the golden ratio spreads their addresses over the cells.
std::uint32_t TrackingTable::home_cell(const void* address) noexcept {
    constexpr std::uint64_t kGolden = 0x9E3779B97F4A7C15;
    return static_cast<std::uint32_t>((reinterpret_cast<std::uintptr_t>(address) >> 4) * kGolden >>
                                      (64 - std::countr_zero(kCells)));
}

std::uint32_t TrackingTable::find_address(const void* address) const noexcept {
    const std::uint32_t home = home_cell(address);
    for (std::uint32_t cell = home; cells_[cell].entry_plus_1 != 0; cell = (cell + 1) & kCellMask) {
        if (cells_[cell].home == home && entries_[cells_[cell].entry_plus_1 - 1].address == address) return cell;
    }
    return kNone;
}

std::uint32_t TrackingTable::find_entry(std::uint32_t entry) const noexcept {
    std::uint32_t cell = home_cell(entries_[entry].address);
    while (cells_[cell].entry_plus_1 != entry + 1) cell = (cell + 1) & kCellMask;
    return cell;
}

void TrackingTable::insert_cell(std::uint32_t entry) noexcept {
    const std::uint32_t home = home_cell(entries_[entry].address);
    std::uint32_t cell = home;
    while (cells_[cell].entry_plus_1 != 0) cell = (cell + 1) & kCellMask;
    cells_[cell] = {static_cast<std::uint16_t>(entry + 1), static_cast<std::uint16_t>(home)};
}

// A cell may move back into the hole unless the hole lies in front of its home: then a search would miss it.
void TrackingTable::erase_cell(std::uint32_t hole) noexcept {
    for (std::uint32_t cell = (hole + 1) & kCellMask; cells_[cell].entry_plus_1 != 0;
         cell = (cell + 1) & kCellMask) {
        const std::uint32_t from_home = (cell - cells_[cell].home) & kCellMask;
        const std::uint32_t from_hole = (cell - hole) & kCellMask;
        if (from_home < from_hole) continue;
        cells_[hole] = cells_[cell];
        hole = cell;
    }
    cells_[hole] = {};
}

// ---- call records

CallRecord* TrackingTable::record_of(CallStack& stack) noexcept {
    RunningCall& call = stack.running();
    CallRecord* record = call.record;
    const bool own = record && record->serial == call.serial;
    if (own && record->blocks > 0) return record;
    if (own && record == unused_) {  // the call has freed all it had, and nobody has taken its record since
        unused_ = record->older;
    } else {
        record = call.record = take_record(stack);
    }
    link(record);
    return record;
}

// Every record in use has a block of its own, so there are never fewer records than entries.
CallRecord* TrackingTable::take_record(const CallStack& stack) noexcept {
    CallRecord* record = unused_;
    if (record) {
        unused_ = record->older;
    } else {
        record = &records_[records_taken_++];
    }
    const std::uint32_t slot = stack.slot();
    record->serial = stack.slots[slot].serial;
    record->blocks = 0;
    record->slot = slot;
    for (std::uint32_t depth = 0; depth <= slot; ++depth) record->coordinates[depth] = stack.slots[depth].entered;
    copy_bounded(record->name, stack.slots[slot].name);
    return record;
}

// A record comes into use while its call runs. All that came into use since a running call was entered therefore
// belong to it or its callees, and are the newest.
std::uint32_t TrackingTable::count_since(std::uint64_t serial) const noexcept {
    std::uint32_t blocks = 0;
    for (const CallRecord* record = newest_; record && record->serial >= serial; record = record->older)
        blocks += record->blocks;
    return blocks;
}

void TrackingTable::link(CallRecord* record) noexcept {
    record->newer = nullptr;
    record->older = newest_;
    if (newest_) newest_->newer = record;
    newest_ = record;
}

void TrackingTable::unlink(CallRecord* record) noexcept {
    (record->newer ? record->newer->older : newest_) = record->older;
    if (record->older) record->older->newer = record->newer;
}

void TrackingTable::drop_block(CallRecord* record) noexcept {
    if (--record->blocks > 0) return;
    unlink(record);
    record->older = unused_;
    unused_ = record;
}

}  // namespace quo
