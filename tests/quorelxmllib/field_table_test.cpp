#include "quorelxmllib/field_table.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <limits>
#include <string>

#include "header_files.h"
#include "shelf.h"

namespace {

using test::Shelf;
using test::write_text;

constexpr int kBooks[] = {0, 1, 2, 31};

TEST(FieldTable, RegistersWhatTheRowsSay) {
    Shelf object;
    object.fill(5);
    const struct {
        const char* name;
        parElement::ParameterType type;
        int count;
        const void* pointer;
        double minimum, maximum;
        bool mandatory, scalar;
    } rows[] = {
        {"pages", parElement::typeDouble, 15, object.pages.get(), 0, 0, true, false},
        {"width", parElement::typeDouble, 1, &object.width, 0, 0, true, true},
        {"height", parElement::typeFloat, 1, &object.height, 0, 10, true, true},
        {"boards", parElement::typeInt, 1, &object.boards, 1, 1000, false, true},
        {"label", parElement::typeString, 1, object.label, 0, 0, true, true},
        {"code", parElement::typeString, 1, object.code, 0, 0, true, true},
        {"corner_m", parElement::typeDouble, 4, object.corners, 0, 0, true, false},
        {"shape", parElement::typeInt, 5, object.shape.data(), 0, 0, true, false},
        {"nBooks", parElement::typeInt, 1, &object.nBooks, 0, 0, true, true},
        {"weights", parElement::typeFloat, 5, object.weights, 0, 0, false, false},
    };
    ASSERT_EQ(object.elementCount(), static_cast<int>(std::size(rows)));
    for (int i = 0; i < object.elementCount(); ++i) {
        const auto& row = rows[i];
        const parElement& element = *object.element(i);
        SCOPED_TRACE(row.name);
        EXPECT_STREQ(element.name, row.name);
        EXPECT_EQ(element.type, row.type);
        EXPECT_EQ(element.count, row.count);
        EXPECT_EQ(element.pointer, row.pointer);
        EXPECT_EQ(element.minimum, row.minimum);
        EXPECT_EQ(element.maximum, row.maximum);
        EXPECT_EQ(element.mandatory, row.mandatory);
        EXPECT_EQ(element.scalar, row.scalar);
    }
    EXPECT_EQ(object.element(5)->room, sizeof object.code);
    object.destroyBuffers();
    for (const int array : {0, 7, 9}) EXPECT_EQ(object.element(array)->count, 0);
    EXPECT_EQ(object.nBooks, 0);
    EXPECT_FALSE(object.isBufferAllocated());
}

TEST(FieldTable, BringsEveryFieldThroughAHeader) {
    const test::TemporaryFolder folder;
    for (const int books : kBooks) {
        SCOPED_TRACE(books);
        Shelf object, back;
        object.fill(books);
        object.setExactNumbers(true);
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
            EXPECT_EQ(object.clone(&copy), 0);
            EXPECT_TRUE(copy == same) << from << " into " << to;
            EXPECT_TRUE(object == same);
            EXPECT_EQ(object.clone(&object), 0);
            EXPECT_TRUE(object == same);
            for (int i = 0; i < copy.elementCount(); ++i)
                EXPECT_EQ(copy.element(i)->count, object.element(i)->count);
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

TEST_F(FieldTableProfile, FailsOnMandatoryKeysButReadsTheOthers) {
    const test::Report report;
    const struct {
        const char* key;
        int status;
    } rows[] = {{"Pages", 1}, {"ShelfWidth", 1}, {"height", 1}, {"boards", 0},
                {"label", 1}, {"Corners", 0},    {"shape", 1},  {"weights", 0}};
    for (const auto& row : rows) {
        SCOPED_TRACE(row.key);
        Shelf object;
        EXPECT_EQ(read(object, without(kProfile, row.key)), row.status);
        EXPECT_EQ(object.nBooks, 2);
        const std::string key = row.key;
        EXPECT_EQ(object.width, key == "ShelfWidth" ? -999.0 : 2.25);
        EXPECT_EQ(object.boards, key == "boards" ? -999 : 3);
        EXPECT_STREQ(object.label, key == "label" ? "NOT_AVAILABLE" : "Novels");
        ASSERT_NE(object.weights, nullptr);
        EXPECT_EQ(object.weights[1], key == "weights" ? 0.0F : 0.75F);
    }
    Shelf object;
    EXPECT_EQ(read(object, without(kProfile, "Books")), 1);
    EXPECT_EQ(object.nBooks, 0);
    EXPECT_EQ(read(object, ""), 1);
    EXPECT_EQ(object.readhdr(folder_.file("none").c_str()), 1);
}

TEST_F(FieldTableProfile, CannotPromiseMoreValuesThanItHasRoomFor) {
    for (const char* books : {"2147483647", "1000000", "-2147483648"}) {
        std::string text = kProfile;
        Shelf object;
        EXPECT_EQ(read(object, text.replace(text.find("Books = 2") + 8, 1, books)), books[0] == '-' ? 0 : 1)
            << books;
        EXPECT_EQ(object.pages, nullptr);
    }
}

TEST_F(FieldTableProfile, CutsTextsToTheirRoom) {
    std::string text = kProfile;
    Shelf object;
    EXPECT_EQ(read(object, text.replace(text.find("Novels"), 6, std::string(700, 'x'))), 0);
    EXPECT_EQ(std::string{object.label}, std::string(511, 'x'));
}

}  // namespace
