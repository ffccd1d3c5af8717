#ifndef QUO_PLACE_TABLE_H
#define QUO_PLACE_TABLE_H

#include <cstddef>
#include <cstdint>
#include <utility>
#include <vector>

namespace quo {

/** A hash table of places (pointers or iterators), which know themselves what they are found by: one array, so
 * that a look-up in a large table touches one of its lines and the thing itself. Hashes are below 2^63. */
template <typename Place>
class PlaceTable {
public:
    struct Slot {
        std::uint64_t mark = kFree;  // the hash, or that nothing stands here
        Place place{};
    };

    /** The slot of a place with this hash for which `matches(place)` holds, or null. It is good until the table
     * changes; its place may be replaced by one that is found by the same. */
    template <typename Matches>
    [[nodiscard]] Slot* find(std::uint64_t hash, Matches matches) {
        if (slots_.empty()) return nullptr;
        for (std::size_t i = home(hash | kTaken); slots_[i].mark != kFree; i = after(i))
            if (slots_[i].mark == (hash | kTaken) && matches(slots_[i].place)) return &slots_[i];
        return nullptr;
    }

    /** Adds a place; none that is found by the same may stand in the table. */
    void add(std::uint64_t hash, Place place) {
        if (2 * (used_ + 1) > slots_.size()) grow();
        put({hash | kTaken, place});
        ++used_;
    }

    /** Removes what find() gave, and closes the gap: those behind it move up as far as their hash allows. */
    void remove(Slot* slot) {
        std::size_t gap = static_cast<std::size_t>(slot - slots_.data());
        for (std::size_t i = after(gap); slots_[i].mark != kFree; i = after(i)) {
            if (distance(home(slots_[i].mark), i) < distance(gap, i)) continue;
            slots_[gap] = slots_[i];
            gap = i;
        }
        slots_[gap] = {};
        --used_;
    }

private:
    static constexpr std::uint64_t kFree = 0, kTaken = std::uint64_t{1} << 63;
    static constexpr std::size_t kFirstSize = 8;

    [[nodiscard]] std::size_t home(std::uint64_t mark) const { return mark & (slots_.size() - 1); }
    [[nodiscard]] std::size_t after(std::size_t i) const { return (i + 1) & (slots_.size() - 1); }
    [[nodiscard]] std::size_t distance(std::size_t from, std::size_t to) const {
        return (to - from) & (slots_.size() - 1);
    }

    void put(const Slot& slot) {
        std::size_t i = home(slot.mark);
        while (slots_[i].mark != kFree) i = after(i);
        slots_[i] = slot;
    }
    void grow() {
        std::vector<Slot> old(slots_.empty() ? kFirstSize : 2 * slots_.size());
        old.swap(slots_);
        for (const Slot& slot : old)
            if (slot.mark != kFree) put(slot);
    }

    std::vector<Slot> slots_;  // a power of two, at least twice as many as are used
    std::size_t used_ = 0;
};

}  // namespace quo

#endif
