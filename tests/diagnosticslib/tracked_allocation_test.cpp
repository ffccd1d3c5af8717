// SPDX-License-Identifier: Apache-2.0
#include "tracking.h"

// Requests beyond all memory are refused with null under the address sanitizer too, as by the system.
// NOLINTNEXTLINE(bugprone-reserved-identifier): the sanitizer looks for this name
extern "C" [[gnu::visibility("default")]] const char* __asan_default_options() {
    return "allocator_may_return_null=1";
}

namespace {

using Tracked = test::Tracking;

constexpr int kCapacity = 16384;
/** Volatile: compilers warn of such a request. */
volatile std::size_t overflowing = SIZE_MAX;

TEST_F(Tracked, BlocksAreAlignedAndLeadBackToTheSystemsAddress) {
    for (const bool tracking : {true, false}) {
        if (!tracking) exit_ckerr();
        for (std::size_t size = 0; size < 200; ++size) {
            void* block = size % 2 ? malloc_ckerr(size) : calloc_ckerr(1, size);
            const auto address = reinterpret_cast<std::uintptr_t>(block);
            std::uintptr_t system = 0;
            std::memcpy(&system, static_cast<char*>(block) - sizeof system, sizeof system);
            EXPECT_EQ(address, (system + 16) / 16 * 16);
            std::memset(block, 0xA5, size);  // every byte is there
            free_ckerr(block);
        }
    }
}

TEST_F(Tracked, CallocClearsWhatWasUsedBefore) {
    for (const std::size_t size : {17U, 9000000U}) {
        void* const used = malloc_ckerr(size);
        std::memset(used, 0xA5, size);
        free_ckerr(used);
        auto* const block = static_cast<char*>(calloc_ckerr(size, 1));
        EXPECT_EQ(std::count(block, block + size, '\0'), static_cast<std::ptrdiff_t>(size));
        free_ckerr(block);
    }
}

// The counters have 16 bits: after 65536 calls the coordinates of a callee equal those that its caller's blocks
// carry, and a comparison of counters would free the caller's blocks under it.
TEST_F(Tracked, CallersBlocksSurviveTheWrapAroundOfTheCounters) {
    set_ckerr_fun("caller");
    auto* block = static_cast<char*>(malloc_ckerr(100));
    for (int i = 0; i < 65536 + 40000; ++i) {
        set_ckerr_fun("callee");
        freeall_ckerr();
        deccurdep();
    }
    std::memset(block, 1, 100);
    free_ckerr(block);
    set_ckerr_fun("callee");
    mark();
    EXPECT_EQ(test::leak_lines(), "callee : 0\t1\t40001\t\n");
}

// Without tracking nothing could reclaim the parts of one that fails: the leak sanitizer looks for them.
TEST_F(Tracked, MatrixRowsAreZeroFilledAndGoTogether) {
    for (const bool tracking : {true, false}) {
        if (!tracking) exit_ckerr();
        void** const rows = matalloc_ckerr(17, 33);
        for (int row = 0; row < 17; ++row) {
            auto* bytes = static_cast<char*>(rows[row]);
            EXPECT_EQ(std::count(bytes, bytes + 33, 0), 33);
            std::memset(bytes, row + 1, 33);
        }
        matfree_ckerr(rows, 17);
        for (const int none : {0, INT_MIN}) {
            void** const array = matalloc_ckerr(none, 10);
            EXPECT_NE(array, nullptr);
            matfree_ckerr(array, none);
        }
        matfree_ckerr(nullptr, 5);
        EXPECT_EQ(matalloc_ckerr(3, overflowing), nullptr);
        freeall_ckerr();
    }
    // What is there of one that fails stays in the table: the array and four rows.
    init_ckerr_locking();
    test::AllocationLimit limit{5};
    set_ckerr_fun("f");
    EXPECT_EQ(matalloc_ckerr(6, 8), nullptr);
    EXPECT_EQ(limit.room(), 0);
    freeall_ckerr();
    EXPECT_EQ(limit.room(), 5);
    deccurdep();
}

TEST_F(Tracked, FullTableFailsTheAllocationWithAnErrorEntry) {
    test::Report report;
    test::AllocationLimit limit{kCapacity};
    EXPECT_EQ(limit.room(), kCapacity);
    const test::AllocationLimit none{0};
    const test::CapturedStderr quiet;
    EXPECT_FALSE(malloc_ckerr(8) || calloc_ckerr(8, 8) || malloc_ckerr(overflowing));
    ASSERT_EQ(report.entries("ERROR").size(), 3U);
    EXPECT_EQ(report.entries("ERROR")[1].function, "calloc_ckerr");
}

// ---- Against a plain model

/** The simplest table that does the same: a list that is searched from the front, with all counters in every
 * entry. */
struct PlainTable {
    using Counters = std::array<std::uint16_t, 64>;
    struct Entry {
        void* block;
        std::size_t slot;
        Counters counters;
        std::string name;
    };

    std::size_t depth = 0;
    Counters counters{};
    std::array<std::string, 64> names{"main()"};
    std::vector<Entry> entries;

    [[nodiscard]] std::size_t slot() const { return std::min<std::size_t>(depth, 63); }
    void enter(const std::string& name) {
        ++depth;
        ++counters[slot()];
        names[slot()] = name;
    }
    void add(void* block) { entries.push_back({block, slot(), counters, names[slot()]}); }
    void remove(void* block) {
        const auto found = std::ranges::find(entries, block, &Entry::block);
        if (found == entries.end()) return;
        *found = entries.back();
        entries.pop_back();
    }
    void remove_own() {
        const auto is_own = [this](const Entry& one) {
            return std::equal(counters.begin() + 1, counters.begin() + 1 + slot(), one.counters.begin() + 1);
        };
        for (auto own = entries.begin(); (own = std::ranges::find_if(entries, is_own)) != entries.end();)
            remove(own->block);  // of failed allocations the first there is
    }
    [[nodiscard]] std::string leak_lines() const {
        std::string text;
        for (const Entry& entry : entries) {
            text += entry.name + " : ";
            for (std::size_t i = 0; i <= entry.slot; ++i) text += std::to_string(entry.counters[i]) + "\t";
            text += "\n";
        }
        return text;
    }
};

/** Weights of the random steps, and how deep the calls go. */
struct Mix {
    int rounds, steps;
    std::size_t deepest;
    std::vector<double> weights;
};
const std::map<std::string, Mix> kMixes = {{"Everything", {300, 200, 6, {20, 18, 40, 5, 20, 3, 2, 2}}},
                                           {"MostlyNull", {300, 120, 5, {20, 17, 10, 30, 8, 3, 1, 4}}},
                                           {"BeyondTheLastSlot", {60, 900, 90, {40, 20, 20, 3, 8, 1, 1, 1}}},
                                           {"MissingLeaves", {100, 200, 70, {30, 5, 40, 5, 20, 3, 2, 2}}},
                                           {"MoreLeaves", {100, 200, 8, {20, 40, 40, 5, 20, 3, 2, 2}}},
                                           {"Growing", {5, 6000, 8, {20, 19, 60, 2, 10, 1, 1, 0.02}}}};

// Names differ from call to call, so the leak report shows the order of the table; blocks that the plain table
// holds and the other has freed, or the reverse, show under the sanitizers.
TEST_F(Tracked, BlocksStandAsInAPlainTable) {
    std::mt19937 engine{20140403};
    PlainTable plain;
    std::size_t deepest = 0;
    int calls = 0;
    char unknown[16] = {};
    const auto enter = [&] {
        if (plain.depth >= deepest) return;
        const std::string name = "f" + std::to_string(calls++);
        plain.enter(name);
        set_ckerr_fun(name.c_str());
    };
    const auto remove = [&](void* block) { plain.remove(block), free_ckerr(block); };
    const std::function<void()> steps[] = {
        enter,
        [&] { plain.depth -= plain.depth > 0, deccurdep(); },
        [&] { plain.add(malloc_ckerr(engine() % 40)); },
        [&] { plain.add(malloc_ckerr(overflowing)); },
        [&] { remove(plain.entries.empty() ? nullptr : plain.entries[engine() % plain.entries.size()].block); },
        [&] { remove(nullptr); },
        [&] { remove(&unknown[engine() % 16]); },
        [&] { plain.remove_own(), freeall_ckerr(); }};
    for (const auto& [name, mix] : kMixes) {
        std::discrete_distribution<std::size_t> kinds{mix.weights.begin(), mix.weights.end()};
        deepest = mix.deepest;
        for (int round = 0; round < mix.rounds; ++round) {
            plain = {};
            exit_ckerr();
            init_ckerr_locking();
            for (int i = 0; i < mix.steps; ++i) steps[kinds(engine)]();
            ASSERT_TRUE(test::leak_lines() == plain.leak_lines()) << name << " round " << round;
            for (const auto& entry : plain.entries) free_ckerr(entry.block);  // tracking is off
        }
    }
}

}  // namespace
