// SPDX-License-Identifier: Apache-2.0
#include "quorelxmllib/field_table.h"

#include "header_files.h"
#include "shelf.h"

namespace {

using test::Shelf;

// Lengths are public members: one that was changed since the arrays were made once let copying run past their
// ends.
TEST(FieldTable, ClonesArraysAsTheyAreAllocated) {
    for (const std::int32_t books : {0, 3, 3000}) {
        Shelf object, same, copy;
        object.fill(3);
        same.fill(3);
        copy.fill(7);
        object.nBooks = same.nBooks = books;
        EXPECT_EQ(object.clone(&copy) + object.clone(&object), 0);
        EXPECT_TRUE(books != 3 || (copy == same && object == same && copy.pages != object.pages));
        EXPECT_EQ(copy.nBooks, books);
        EXPECT_TRUE(books != 3000 || copy.pages[8999] == 0.0);
    }
}

TEST(FieldTable, AllocatesNothingForImpossibleLengths) {
    using Limits = std::numeric_limits<std::int32_t>;
    for (const std::int32_t books : {-1, Limits::min(), Limits::max() / 3 + 1}) {
        Shelf object;
        object.fill(4);
        object.nBooks = books;
        EXPECT_EQ(object.createBuffers(), books > 0 ? 1 : 0);
        EXPECT_EQ(object.pages, nullptr);
        EXPECT_EQ(object.nBooks, books > 0 ? 0 : books);
    }
}

// Single values are tested with the classes that have them. A text longer than its member must not run into the
// next one.
TEST(FieldTableProfile, FailsOnMandatoryArraysButReadsTheOthers) {
    const std::string profile = test::read_text(QUO_TEST_DATA "/headers/shelf.par"), words(600, 'w');
    const struct {
        const char* from;
        std::string to;
        int status, books;
    } rows[] = {{"Pages", "x", 1, 2},           {"Corners", "x", 0, 2},
                {"weights", "x", 0, 2},         {"Novels", words, 0, 2},
                {"Books", "x", 1, 0},           {"= 2\n", "= 2147483647\n", 1, 0},
                {"= 2\n", "= 1000000\n", 1, 0}, {"= 2\n", "= -2147483648\n", 0, -2147483647 - 1}};
    const test::TemporaryFolder folder;
    for (const auto& row : rows) {
        SCOPED_TRACE(row.from + row.to);
        const std::string file = folder.file(std::to_string(&row - rows));  // parameter files stay in memory
        test::write_text(file, test::replaced(profile, row.from, row.to));
        Shelf object;
        EXPECT_EQ(object.readhdr(file.c_str()), row.status);
        EXPECT_EQ(object.nBooks, row.books);
        EXPECT_EQ(object.pages != nullptr, row.books == 2);
        EXPECT_EQ(object.label, row.to == words ? words.substr(0, 511) : "Novels");
        EXPECT_STREQ(object.code, "none") << "not in parameter files";
        if (row.books != 2) continue;
        EXPECT_EQ(object.weights[1], row.from == std::string{"weights"} ? 0.0F : 0.75F);
        EXPECT_EQ(object.pages[5], row.from == std::string{"Pages"} ? 0.0 : 6.5);
    }
}

}  // namespace
