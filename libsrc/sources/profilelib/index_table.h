// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_INDEX_TABLE_H
#define QUO_INDEX_TABLE_H

#include <cstddef>
#include <cstdint>
#include <limits>
#include <vector>

namespace quo {

/** A hash table of numbered things, which know themselves what they are found by. It takes ten to fifteen bytes
 * for each, where a table of nodes takes forty: more than the whole line of a parameter file with short names.
 *
 * It does not grow by itself, for that would need the old slots beside the new ones: who has the things makes it
 * anew when it is full. */
class IndexTable {
public:
    using Index = std::uint32_t;
    static constexpr Index kNone = std::numeric_limits<Index>::max();

    struct Slot {
        std::uint32_t mark = 0;  // the upper bits of the hash, which most others differ in
        Index index = kNone;     // none where nothing stands here
    };

    /** The slot of a thing with this hash, below 2^61, for which `matches(index)` holds, or null. It is good until
     * the table changes; its number may be replaced by that of a thing that is found by the same. */
    template <typename Matches>
    [[nodiscard]] Slot* find(std::uint64_t hash, Matches matches) {
        if (slots_.empty()) return nullptr;
        const std::uint32_t mark = mark_of(hash);
        for (std::size_t i = home(mark); slots_[i].index != kNone; i = after(i))
            if (slots_[i].mark == mark && matches(slots_[i].index)) return &slots_[i];
        return nullptr;
    }

    /** Whether one more has to wait until the table is made anew. */
    [[nodiscard]] bool is_full() const { return 5 * (used_ + 1) > 4 * slots_.size(); }
    /** Empties the table and makes room for half as many again as it held. */
    void make_anew() {
        const std::size_t size = 15 * used_ / 8 + kFirstSize;
        std::vector<Slot>{}.swap(slots_);  // given back before the new ones are taken
        slots_.resize(size);
        used_ = 0;
    }
    /** Adds a thing to a table that is not full; none that is found by the same may stand in it. */
    void add(Index index, std::uint64_t hash) {
        const std::uint32_t mark = mark_of(hash);
        std::size_t i = home(mark);
        while (slots_[i].index != kNone) i = after(i);
        slots_[i] = {mark, index};
        ++used_;
    }

    /** Removes what find() gave, and closes the gap: those behind it move up as far as their hash allows. */
    void remove(Slot* slot) {
        auto gap = static_cast<std::size_t>(slot - slots_.data());
        for (std::size_t i = after(gap); slots_[i].index != kNone; i = after(i)) {
            if (distance(home(slots_[i].mark), i) < distance(gap, i)) continue;
            slots_[gap] = slots_[i];
            gap = i;
        }
        slots_[gap] = {};
        --used_;
    }

private:
    static constexpr std::size_t kFirstSize = 8;

    static std::uint32_t mark_of(std::uint64_t hash) { return static_cast<std::uint32_t>(hash >> 29); }
    [[nodiscard]] std::size_t home(std::uint32_t mark) const { return mark * slots_.size() >> 32; }
    [[nodiscard]] std::size_t after(std::size_t i) const { return i + 1 < slots_.size() ? i + 1 : 0; }
    [[nodiscard]] std::size_t distance(std::size_t from, std::size_t to) const {
        return to >= from ? to - from : to + slots_.size() - from;
    }

    std::vector<Slot> slots_;  // at most four fifths used
    std::size_t used_ = 0;
};

}  // namespace quo

#endif
