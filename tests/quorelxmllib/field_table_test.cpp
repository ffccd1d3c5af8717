#include "quorelxmllib/field_table.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <limits>
#include <string>
#include <vector>

#include "header_files.h"
#include "shelf.h"
#include "support/fields.h"

namespace {

using test::Shelf;
using test::write_text;

constexpr int kBooks[] = {0, 1, 2, 31};

TEST(FieldTable, RegistersWhatTheRowsSay) {
    using test::real, test::whole;
    const test::FieldRow rows[] = {
        real("pages", 0, 0),
        real("width"),
        {"height", parElement::typeFloat, 1, 2.5, "", "height", test::Presence::kMandatory, 0, 10},
        whole("boards", -999, 1, 1000).is(test::Presence::kOptional),
        test::text("label"),
        test::text("code", "none"),
        real("corner_m", 0, 4),
        {"shape", parElement::typeInt, 0, 0, ""},
        whole("nBooks", 0),
        test::FieldRow{"weights", parElement::typeFloat, 0, 0, ""}.is(test::Presence::kOptional),
    };
    Shelf object;
    test::expect_fields(object, rows);
    EXPECT_EQ(object.element(5)->room, sizeof object.code);
    object.fill(5);
    const auto count = [&](int element) { return object.element(element)->count; };
    EXPECT_EQ(count(0) + 100 * count(7) + 1000 * count(9), 15 + 500 + 5000);
    for (int i = 0; i < object.elementCount(); ++i)
        EXPECT_EQ(object.element(i)->scalar, i != 0 && i != 6 && i != 7 && i != 9) << i;
    object.destroyBuffers();
    EXPECT_EQ(count(0) + count(7) + count(9) + object.nBooks, 0);
    EXPECT_FALSE(object.isBufferAllocated());
}

TEST(FieldTable, BringsEveryFieldThroughAHeader) {
    const test::TemporaryFolder folder;
    for (const int books : kBooks) {
        SCOPED_TRACE(books);
        Shelf object, back;
        object.fill(books);
        back.fill(9);
        EXPECT_EQ(object.writehdr(folder.file("header.xml").c_str()), 0);
        EXPECT_EQ(back.readhdr(folder.file("header.xml").c_str()), 0);
        EXPECT_TRUE(back == object);
        EXPECT_TRUE(back.isBufferAllocated());
    }
}

TEST(FieldTable, ClonesIntoObjectsOfAnyLength) {
    for (const int from : kBooks)
        for (const int to : kBooks) {
            Shelf object, same, copy;
            object.fill(from);
            same.fill(from);
            copy.fill(to);
            EXPECT_EQ(object.clone(&copy) + object.clone(&object), 0);
            EXPECT_TRUE(copy == same && object == same) << from << " into " << to;
            EXPECT_EQ(test::differing_fields(copy, object), std::vector<std::string>{});
            EXPECT_TRUE(from == 0 || copy.pages != object.pages);
        }
}

// Lengths are public members: one that was changed since the arrays were made once let copying run past their
// ends.
TEST(FieldTable, ClonesArraysAsTheyAreAllocated) {
    Shelf object, copy;
    object.fill(3);
    object.nBooks = 3000;
    EXPECT_EQ(object.clone(&copy), 0);
    EXPECT_EQ(copy.nBooks, 3000);
    EXPECT_EQ(copy.pages[8999], 0.0);
}

TEST(FieldTable, AllocatesNothingForImpossibleLengths) {
    for (const std::int32_t books : {-1, std::numeric_limits<std::int32_t>::min()}) {
        Shelf object;
        object.nBooks = books;
        EXPECT_EQ(object.createBuffers(), 0);
        EXPECT_EQ(object.pages, nullptr);
        EXPECT_EQ(object.nBooks, books);
    }
    Shelf object;
    object.fill(4);
    object.nBooks = std::numeric_limits<std::int32_t>::max() / 3 + 1;
    EXPECT_EQ(object.createBuffers(), 1);
    EXPECT_EQ(object.pages, nullptr);
    EXPECT_EQ(object.nBooks, 0);
}

// --- the parameter file -----------------------------------------------------------------------------------------

const char* const kProfile =
    "[Shelf]\nPages = {1.5 2.5 3.5 4.5 5.5 6.5}\nShelfWidth = 2.25\nheight = 0.5\nboards = 3\nlabel = Novels\n"
    "Corners = {1.5 2.5 3.5 4.5}\nshape = {1 2}\nBooks = 2\nweights = {0.25 0.75}\n";

class FieldTableProfile : public testing::Test {
protected:
    /** Every content under a name of its own, because parameter files stay in memory. */
    int read(Shelf& object, const std::string& text) {
        const std::string file = folder_.file("profile" + std::to_string(++files_));
        write_text(file, text);
        return object.readhdr(file.c_str());
    }
    static std::string without(std::string text, const std::string& key) {
        const auto start = text.find("\n" + key + " =") + 1;
        return text.erase(start, text.find('\n', start) + 1 - start);
    }
    test::TemporaryFolder folder_;
    int files_ = 0;
};

TEST_F(FieldTableProfile, FillsEveryFieldWithAKey) {
    Shelf object, expected;
    const std::string file = folder_.file("header.xml");
    write_text(file, Shelf::text());
    EXPECT_EQ(expected.readhdr(file.c_str()), 0);
    std::snprintf(expected.code, sizeof expected.code, "none");  // not in parameter files
    expected.weights[0] = 0.25F;
    expected.weights[1] = 0.75F;
    EXPECT_EQ(read(object, kProfile), 0);
    EXPECT_TRUE(object == expected);
}

// Single values are tested with the classes that have them.
TEST_F(FieldTableProfile, FailsOnMandatoryArraysButReadsTheOthers) {
    const test::Report report;
    for (const std::string key : {"Pages", "Corners", "shape", "weights"}) {
        SCOPED_TRACE(key);
        Shelf object;
        EXPECT_EQ(read(object, without(kProfile, key)), key == "Corners" || key == "weights" ? 0 : 1);
        EXPECT_EQ(object.nBooks, 2);
        EXPECT_EQ(object.weights[1], key == "weights" ? 0.0F : 0.75F);
        EXPECT_EQ(object.pages[5], key == "Pages" ? 0.0 : 6.5);
    }
    Shelf object;
    EXPECT_EQ(read(object, without(kProfile, "Books")), 1);
    EXPECT_EQ(object.nBooks, 0);
}

TEST_F(FieldTableProfile, CannotPromiseMoreValuesThanItHasRoomFor) {
    for (const std::string books : {"2147483647", "1000000", "-2147483648"}) {
        std::string text = kProfile;
        Shelf object;
        EXPECT_EQ(read(object, text.replace(text.find("Books = 2") + 8, 1, books)), books[0] == '-' ? 0 : 1);
        EXPECT_EQ(object.pages, nullptr) << books;
    }
}

}  // namespace
