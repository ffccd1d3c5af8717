#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstdint>
#include <initializer_list>
#include <map>
#include <set>
#include <string>
#include <string_view>

#include "list_model.h"
#include "profilelib/name_hash.h"
#include "profilelib/place_table.h"

namespace {

std::uint64_t hash(std::initializer_list<std::string_view> names) {
    quo::NameHash all;
    for (const std::string_view name : names) all.add(name);
    return all.value();
}

TEST(NameHash, TellsWhereOneNameEndsAndTheNextBegins) {
    const std::set<std::uint64_t> hashes{hash({"ab", "c"}), hash({"a", "bc"}), hash({"abc"}), hash({"abc", ""}),
                                         hash({"", "abc"}), hash({"c", "ab"}), hash({""}),    hash({})};
    EXPECT_EQ(hashes.size(), 8U);
    // The end of a name, written backwards and with what marks its length, must not pass for the middle of
    // another.
    EXPECT_NE(hash({"abcdef", "x"}), hash({"fedcba\x01x"}));
    EXPECT_EQ(hash({"ab", "c"}), hash({std::string{"ab"}, std::string{"c"}}));
}

// Every byte of a name counts, whatever chunk of the hash it falls into, and so does the length.
TEST(NameHash, EveryByteAndTheLengthCount) {
    std::set<std::uint64_t> hashes;
    std::size_t names = 0;
    for (std::size_t length = 0; length < 40; ++length) {
        std::string name(length, '\0');
        hashes.insert(hash({name}));
        ++names;
        for (char& byte : name) {
            for (const char other : {'\x01', '\x7f', '\xff'}) {
                byte = other;
                hashes.insert(hash({name}));
                ++names;
            }
            byte = '\0';
        }
    }
    EXPECT_EQ(hashes.size(), names);
}

TEST(NameHash, SpreadsNumberedNamesOverTheLowBits) {
    constexpr int kNames = 4096;
    std::array<int, 64> buckets{};
    for (int i = 0; i < kNames; ++i) ++buckets.at(hash({"Section", "Parameter" + std::to_string(i)}) % 64);
    // 64 in each, and ten standard deviations of 8: a good hash passes with any random numbers.
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
