#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstdint>
#include <set>
#include <string>

#include "list_model.h"
#include "profilelib/index_table.h"
#include "profilelib/name_hash.h"

namespace {

// Names that are compared anyway may meet; numbered ones must not, or look-ups become walks. 64 in each bucket,
// and ten standard deviations of 8: a good hash passes with any random numbers.
TEST(NameHash, SpreadsNumberedNamesOverTheLowBits) {
    std::set<std::uint64_t> hashes;
    std::array<int, 64> buckets{};
    for (int i = 0; i < 4096; ++i)
        hashes.insert(quo::NameHash{}.add("Section").add("Parameter" + std::to_string(i)).value());
    for (const std::uint64_t hash : hashes) ++buckets.at(hash % 64);
    EXPECT_EQ(hashes.size(), 4096U);
    EXPECT_LT(*std::max_element(buckets.begin(), buckets.end()), 144);
}

// Few hashes for many things: long runs that grow, shrink and wrap around the end of the array.
TEST(IndexTable, FindsWhatASetFinds) {
    for (const std::uint64_t hashes : {1U, 7U, 61U, 1000003U}) {
        test::Dice dice{static_cast<unsigned>(hashes)};
        quo::IndexTable table;
        std::set<std::uint32_t> model;
        const auto hash_of = [hashes](std::uint32_t thing) {
            return (thing * std::uint64_t{2654435761} % hashes) << (thing % 3) << 40;
        };
        for (int step = 0; step < 6000; ++step) {
            const std::uint32_t thing = dice.below(step % 2000 < 1000 ? 300 : 40);
            const auto found = table.find(hash_of(thing), [thing](std::uint32_t index) { return index == thing; });
            ASSERT_EQ(found != nullptr, model.contains(thing)) << "step " << step << ", " << hashes << " hashes";
            if (found) {
                ASSERT_EQ(found->index, thing);
                table.remove(found);
                model.erase(thing);
                continue;
            }
            if (table.is_full()) {
                table.make_anew();
                for (const std::uint32_t known : model) table.add(known, hash_of(known));
            }
            table.add(thing, hash_of(thing));
            model.insert(thing);
        }
    }
}

}  // namespace
