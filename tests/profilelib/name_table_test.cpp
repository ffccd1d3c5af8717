#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstdint>
#include <map>
#include <set>
#include <string>

#include "list_model.h"
#include "profilelib/name_hash.h"
#include "profilelib/place_table.h"

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

// Few hashes for many places: long runs that grow, shrink and wrap around the end of the array.
TEST(PlaceTable, FindsWhatAMapFinds) {
    static const std::array<int, 300> things{};
    for (const std::uint64_t hashes : {1U, 7U, 61U, 1000003U}) {
        test::Dice dice{static_cast<unsigned>(hashes)};
        quo::PlaceTable<const int*> table;
        std::map<unsigned, std::uint64_t> model;
        for (int step = 0; step < 6000; ++step) {
            const unsigned thing = dice.below(step % 2000 < 1000 ? 300 : 40);
            const auto known = model.find(thing);
            const std::uint64_t its_hash = (thing * std::uint64_t{2654435761} % hashes) << (thing % 3);
            const auto found =
                table.find(its_hash, [thing](const int* place) { return place == &things.at(thing); });
            ASSERT_EQ(found != nullptr, known != model.end()) << "step " << step << ", " << hashes << " hashes";
            if (found) {
                ASSERT_EQ(found->place, &things.at(thing));
                table.remove(found);
                model.erase(known);
            } else {
                table.add(its_hash, &things.at(thing));
                model.emplace(thing, its_hash);
            }
        }
    }
}

}  // namespace
