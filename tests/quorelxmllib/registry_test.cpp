#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstring>
#include <functional>
#include <string>
#include <vector>

#include "header_files.h"
#include "quo_base/quorelxml_v2.h"
#include "shelf.h"

namespace {

using test::header_text;
using test::read_text;
using test::Shelf;
using test::write_text;
using testing::ElementsAre;

/** A header class whose registration the test decides, and which counts what the registry asks of it. */
class Free : public GeneralSAR_Base {
public:
    using GeneralSAR_Base::addElementDouble;
    using GeneralSAR_Base::addElementFloat;
    using GeneralSAR_Base::addElementInt;
    using GeneralSAR_Base::addElementString;
    using GeneralSAR_Base::addElementText;
    using GeneralSAR_Base::createElementsVector;
    using GeneralSAR_Base::destroyElementsVector;
    using GeneralSAR_Base::setAllocationFlag;

    std::function<void(Free&)> registration;
    std::function<int(Free&)> allocation = [](Free&) { return 0; };
    int registered = 0, allocations = 0, released = 0;

    int createBuffers() override {
        ++allocations;
        return allocation(*this);
    }
    int destroyBuffers() override {
        ++released;
        return 0;
    }

protected:
    void refreshParameters() override {
        ++registered;
        if (registration) registration(*this);
    }
};

class Registry : public testing::Test {
protected:
    std::string file(const std::string& inside) {
        write_text(file_, header_text("<S>" + inside + "</S>"));
        return file_;
    }
    test::TemporaryFolder folder_;
    const std::string file_ = folder_.file("header.xml");
};

// --- registering ------------------------------------------------------------------------------------------------

TEST_F(Registry, StoresWhatIsRegistered) {
    double d[3] = {};
    float f = 0;
    std::int32_t i = 0;
    char single[512] = "", other[20] = "";
    char* many[2] = {single, single};
    Free object;
    object.registration = [&](Free& self) {
        self.addElementDouble("d", d, 3, -1.5, 2.5, true);
        self.addElementFloat("f", &f, 1, 0.25F, 0.5F, false);
        self.addElementInt("i", &i, 1, -7, 2147483647, true);
        self.addElementString("single", single, true);
        self.addElementString("many", many, 2, false);
        self.addElementText("other", other, sizeof other, false);
    };
    EXPECT_EQ(object.createElementsVector(6), 0);
    const struct {
        const char* name;
        parElement::ParameterType type;
        int count;
        void* pointer;
        double minimum, maximum;
        bool mandatory, scalar;
    } rows[] = {
        {"d", parElement::typeDouble, 3, d, -1.5, 2.5, true, false},
        {"f", parElement::typeFloat, 1, &f, 0.25, 0.5, false, true},
        {"i", parElement::typeInt, 1, &i, -7, 2147483647, true, true},
        {"single", parElement::typeString, 1, single, 0, 0, true, true},
        {"many", parElement::typeString, 2, many, 0, 0, false, false},
        {"other", parElement::typeString, 1, other, 0, 0, false, true},
    };
    ASSERT_EQ(object.elementCount(), 6);
    for (int slot = 0; slot < 6; ++slot) {
        const auto& row = rows[slot];
        const parElement& element = *object.element(slot);
        SCOPED_TRACE(row.name);
        EXPECT_STREQ(element.name, row.name);
        EXPECT_EQ(element.type, row.type);
        EXPECT_EQ(element.count, row.count);
        EXPECT_EQ(element.pointer, row.pointer);
        EXPECT_EQ(element.minimum, row.minimum);
        EXPECT_EQ(element.maximum, row.maximum);
        EXPECT_EQ(element.mandatory, row.mandatory);
        EXPECT_EQ(element.scalar, row.scalar);
        EXPECT_TRUE(element.registered);
    }
    EXPECT_EQ(object.element(5)->room, 20U);
    EXPECT_EQ(object.element(6), nullptr);
    EXPECT_EQ(object.element(-1), nullptr);
    EXPECT_TRUE(object.isBufferAllocated());
}

TEST_F(Registry, StartsElementsEmpty) {
    const parElement element;
    EXPECT_EQ(element.type, 4);
    EXPECT_EQ(element.count, 0);
    EXPECT_EQ(element.pointer, nullptr);
    EXPECT_STREQ(element.name, "");
    EXPECT_FALSE(element.registered);
}

TEST_F(Registry, FixesScalarsAtTheFirstRegistration) {
    std::int32_t values[2] = {};
    int first = 1, second = 0;
    Free object;
    object.registration = [&](Free& self) {
        self.addElementInt("first", values, first, 0, 0, true);
        self.addElementInt("second", values, second, 0, 0, true);
    };
    object.createElementsVector(2);
    std::swap(first, second);
    object.registration(object);
    EXPECT_TRUE(object.element(0)->scalar);
    EXPECT_FALSE(object.element(1)->scalar);
    EXPECT_EQ(object.element(0)->count, 0);
    EXPECT_EQ(object.element(1)->count, 1);

    parElement fresh;
    fresh.setElement("a", values, parElement::typeInt, 2, 0, 0, true);
    EXPECT_FALSE(fresh.scalar);
    fresh.setElement("a", values, parElement::typeInt, 1, 0, 0, true);
    EXPECT_TRUE(fresh.scalar) << "open until it is marked registered";
}

TEST_F(Registry, WrapsItsCursor) {
    std::int32_t values[3] = {};
    Free object;
    object.registration = [&](Free& self) {
        for (std::int32_t& value : values) EXPECT_EQ(self.addElementInt("i", &value, 1, 0, 0, true), 0);
    };
    object.createElementsVector(3);
    for (int round = 0; round < 4; ++round) object.registration(object);
    for (int slot = 0; slot < 3; ++slot) EXPECT_EQ(object.element(slot)->pointer, values + slot);
}

TEST_F(Registry, RefusesWhatHasNoSlot) {
    const test::Report report;
    std::int32_t value = 0;
    char text[512];
    char* texts[] = {text};
    Free object;
    set_ckerr_fun("test");
    ASSERT_NE(malloc_ckerr(1), nullptr);
    EXPECT_EQ(object.addElementInt("i", &value, 1, 0, 0, true), 1);
    EXPECT_EQ(object.addElementString("s", text, true), 1);
    EXPECT_EQ(object.addElementString("s", texts, 1, true), 1);
    deccurdep();  // the block is gone with the pending errors, or the report's own check would find it
    EXPECT_EQ(object.createElementsVector(0), 0);
    EXPECT_EQ(object.addElementInt("i", &value, 1, 0, 0, true), 1);
    const test::CapturedStderr quiet;
    EXPECT_EQ(object.createElementsVector(-1), 1);
}

TEST_F(Registry, MakesOneTableForAClassOfClasses) {
    std::int32_t value = 0;
    Free object;
    for (const int slots : {3, 5, 2}) {
        object.registration = [&, slots](Free& self) {
            for (int i = 0; i < slots; ++i) self.addElementInt("i", &value, 1, 0, 0, true);
        };
        EXPECT_EQ(object.createElementsVector(slots), 0);
        EXPECT_EQ(object.elementCount(), slots);
    }
    object.setParamListAlloc(false);
    const parElement* kept = object.element(0);
    object.destroyElementsVector();
    EXPECT_EQ(object.element(0), nullptr);
    EXPECT_STREQ(kept->name, "i") << "a table that is not owned outlives the object";
    delete[] kept;
}

TEST_F(Registry, CutsLongElementNames) {
    std::int32_t value = 0;
    Free object;
    object.registration = [&](Free& self) {
        self.addElementInt(std::string(100, 'n').c_str(), &value, 1, 0, 0, true);
    };
    object.createElementsVector(1);
    EXPECT_EQ(object.element(0)->name, std::string(63, 'n'));
}

// --- reading and writing ----------------------------------------------------------------------------------------

TEST_F(Registry, WritesItsSectionOnceAndKeepsTheOthers) {
    std::int32_t n = 3;
    double values[] = {1.5, 2.5, 3.5};
    char text[512] = "a < b";
    char one[512] = "x", two[512] = "";
    char* texts[] = {one, two};
    Free object;
    int count = 3;
    object.registration = [&](Free& self) {
        self.addElementDouble("values", values, count, 0, 0, true);
        self.addElementInt("n", &n, 1, 0, 0, true);
        self.addElementString("text", text, true);
        self.addElementString("texts", texts, 2, true);
    };
    object.createElementsVector(4);
    write_text(file_,
               header_text("    <S old=\"1\">\n      <gone/>\n    </S>\n    <T>\n      <kept/>\n    </T>\n"));
    const std::string start = "    <T>\n      <kept/>\n    </T>\n    <S>\n";
    const std::string end =
        "      <text>a &lt; b</text>\n      <texts N=\"1\">x</texts>\n      <texts N=\"2\"/>\n    </S>\n";
    const std::string values_text =
        "      <values>\n        <val N=\"1\">1.5</val>\n        <val N=\"2\">2.5</val>\n"
        "        <val N=\"3\">3.5</val>\n      </values>\n      <n>3</n>\n";
    const std::string whole = header_text(start + values_text + end);
    for (int round = 0; round < 3; ++round) {
        EXPECT_EQ(object.writeAuxiliaryFile(file_.c_str(), 1, "S"), 0);
        EXPECT_EQ(read_text(file_), whole);
    }
    count = n = 0;
    object.registration(object);
    EXPECT_EQ(object.writeAuxiliaryFile(file_.c_str(), 1, "S"), 0);
    EXPECT_EQ(read_text(file_), header_text(start + "      <n>0</n>\n" + end))
        << "no array element for a length of 0";
}

TEST_F(Registry, ReadsSinglesThenAllocatesThenEverything) {
    std::vector<std::string> calls;
    std::int32_t n = -1, late = -1;
    double array[5] = {-1, -1, -1, -1, -1};
    char text[512] = "default";
    Free object;
    int length = 0;
    object.registration = [&](Free& self) {
        self.addElementDouble("array", array, length, 0, 0, true);
        self.addElementInt("n", &n, 1, 0, 0, true);
        self.addElementString("text", text, true);
        self.addElementInt("late", &late, 1, 0, 0, false);
    };
    object.createElementsVector(4);
    object.allocation = [&](Free& self) {
        EXPECT_EQ(n, 5);
        EXPECT_EQ(late, 9);
        EXPECT_STREQ(text, "default") << "texts come with the second pass";
        n = late = 0;  // read again in the second pass
        length = 5;
        self.registration(self);
        return 0;
    };
    const std::string inside =
        "<n>5</n><late>9</late><text>read</text><array><val>1</val><val>2</val><val>3</val><val>4</val><val>5</"
        "val></array>";
    EXPECT_TRUE(object.readAuxiliaryFile(file(inside).c_str(), 1, "S"));
    EXPECT_THAT(array, ElementsAre(1, 2, 3, 4, 5));
    EXPECT_EQ(n, 5);
    EXPECT_EQ(late, 9);
    EXPECT_STREQ(text, "read");
    EXPECT_EQ(object.allocations, 1);
}

TEST_F(Registry, FailsOnMandatoryElementsOnly) {
    struct Row {
        const char* inside;
        bool array_mandatory, text_mandatory, scalar_mandatory, read;
    };
    const Row rows[] = {
        {"<i>7</i><t>read</t><a>1, 2</a>", true, true, true, true},
        {"<t>read</t><a>1, 2</a>", true, true, true, false},
        {"<t>read</t><a>1, 2</a>", true, true, false, true},
        {"<i>7</i><a>1, 2</a>", true, true, true, false},
        {"<i>7</i><a>1, 2</a>", true, false, true, true},
        {"<i>7</i><t>read</t>", true, true, true, false},
        {"<i>7</i><t>read</t>", false, true, true, true},
        {"", false, false, false, true},
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.inside);
        std::int32_t i = -5;
        char t[512] = "default";
        double a[2] = {-1, -2};
        Free object;
        object.registration = [&](Free& self) {
            self.addElementInt("i", &i, 1, 0, 0, row.scalar_mandatory);
            self.addElementString("t", t, row.text_mandatory);
            self.addElementDouble("a", a, 2, 0, 0, row.array_mandatory);
        };
        object.createElementsVector(3);
        EXPECT_EQ(object.readAuxiliaryFile(file(row.inside).c_str(), 1, "S"), row.read);
        const std::string inside = row.inside;
        EXPECT_EQ(i, inside.find("<i>") == inside.npos ? -5 : 7) << "what was there is read, the rest stays";
        EXPECT_STREQ(t, inside.find("<t>") == inside.npos || (!row.read && inside.find("<i>") == inside.npos)
                            ? "default"
                            : "read");
        if (inside.find("<a>") == inside.npos) {
            EXPECT_EQ(a[1], -2);
        }
        EXPECT_FALSE(object.readAuxiliaryFile(file_.c_str(), 1, "Other") && row.scalar_mandatory);
        EXPECT_FALSE(object.readAuxiliaryFile(file_.c_str(), 2, "S") && row.scalar_mandatory);
    }
}

TEST_F(Registry, FailsWhenTheBuffersCannotBeHad) {
    std::int32_t i = 0;
    Free object;
    object.registration = [&](Free& self) { self.addElementInt("i", &i, 1, 0, 0, true); };
    object.createElementsVector(1);
    object.allocation = [](Free&) { return 7; };
    EXPECT_FALSE(object.readAuxiliaryFile(file("<i>7</i>").c_str(), 1, "S"));
    object.allocation = [](Free&) -> int { throw std::bad_alloc{}; };
    const test::CapturedStderr quiet;
    EXPECT_FALSE(object.readAuxiliaryFile(file_.c_str(), 1, "S"));
    object.allocation = [](Free& self) { return self.setAllocationFlag(false); };
    EXPECT_FALSE(object.readAuxiliaryFile(file_.c_str(), 1, "S"));
}

TEST_F(Registry, WritesNothingWithoutBuffers) {
    std::int32_t i = 7;
    Free object;
    object.registration = [&](Free& self) { self.addElementInt("i", &i, 1, 0, 0, true); };
    object.createElementsVector(1);
    object.setAllocationFlag(false);
    const std::string before = read_text(file("<i>1</i>"));
    const test::CapturedStderr quiet;
    EXPECT_EQ(object.writeAuxiliaryFile(file_.c_str(), 1, "S"), 1);
    EXPECT_EQ(read_text(file_), before);

    // Attached, the section is gone from the document in memory all the same.
    EXPECT_EQ(object.setAuxiliaryFile(file_.c_str(), 1, "S"), 0);
    EXPECT_EQ(object.writeAuxiliaryFile(), 1);
    i = 5;
    EXPECT_EQ(object.readAuxiliaryFile(), 1);
    EXPECT_EQ(i, 5);
    EXPECT_EQ(object.unsetAuxiliaryFile(), 0);
}

TEST_F(Registry, WorksOnTheAttachedFileStepByStep) {
    std::int32_t i = 7;
    Free object;
    object.registration = [&](Free& self) { self.addElementInt("i", &i, 1, 0, 0, true); };
    object.createElementsVector(1);
    EXPECT_EQ(object.setAuxiliaryFile(file("<i>1</i>").c_str(), 1, "S"), 0);
    EXPECT_EQ(object.readAuxiliaryFile(), 0);
    EXPECT_EQ(i, 1);
    EXPECT_EQ(object.cleanAuxiliaryFile(), 0);
    EXPECT_EQ(object.readAuxiliaryFile(), 1);
    i = 42;
    EXPECT_EQ(object.writeAuxiliaryFile(), 0);
    EXPECT_EQ(read_text(file_), header_text("    <S>\n      <i>42</i>\n    </S>\n"));
    EXPECT_EQ(object.unsetAuxiliaryFile(), 0);
    const test::CapturedStderr quiet;
    EXPECT_EQ(object.readAuxiliaryFile(), 1);
    EXPECT_EQ(object.writeAuxiliaryFile(), 1);
    EXPECT_TRUE(object.checkAuxiliaryFile());
    EXPECT_TRUE(object.checkAuxiliaryFile("none", 9, "none"));
}

TEST_F(Registry, RefusesBadFilesAndSections) {
    Shelf object;
    object.fill(2);
    const test::CapturedStderr quiet;
    const std::string before = read_text(file("<i>1</i>"));
    const std::string long_name(600, 's');
    for (const char* section : {static_cast<const char*>(nullptr), "", "a b", "..", "S/", long_name.c_str()})
        EXPECT_EQ(object.writeAuxiliaryFile(file_.c_str(), 1, section), 1);
    EXPECT_EQ(object.writeAuxiliaryFile(folder_.file(long_name).c_str(), 1, "S"), 1);
    EXPECT_EQ(object.writeAuxiliaryFile(nullptr, 1, "S"), 1);
    EXPECT_FALSE(object.readAuxiliaryFile(nullptr, 1, "Shelf"));
    std::snprintf(object.label, sizeof object.label, "bell \x07");
    EXPECT_EQ(object.writeAuxiliaryFile(file_.c_str(), 1, "S"), 1);
    EXPECT_EQ(read_text(file_), before);
}

TEST_F(Registry, WritesAndReadsSectionsWithinSections) {
    Shelf object, back;
    object.fill(2);
    EXPECT_EQ(object.writeAuxiliaryFile(file_.c_str(), 1, "Library/Room-2"), 0);
    EXPECT_EQ(object.writeAuxiliaryFile(file_.c_str(), 2, "Library/Room-3"), 0);
    EXPECT_TRUE(back.readAuxiliaryFile(file_.c_str(), 1, "Library/Room-2"));
    EXPECT_FALSE(back.readAuxiliaryFile(file_.c_str(), 1, "Library/Room-3"));
}

TEST_F(Registry, DoesNotMakeAFileByReading) {
    Shelf object;
    EXPECT_FALSE(object.readAuxiliaryFile(folder_.file("none.xml").c_str(), 1, "Shelf"));
    EXPECT_TRUE(object == Shelf{});
    EXPECT_THAT(test::entries(folder_), testing::IsEmpty());
}

TEST_F(Registry, FindsTheConfigurationFile) {
    Free object;
    char whole[512] = "unset", cut[5] = "";
    file("<ConfigurationFile>/etc/\xC3\xA8.xml</ConfigurationFile>");
    EXPECT_TRUE(object.getConfigurationFile(file_.c_str(), 1, "S", whole));
    EXPECT_STREQ(whole, "/etc/\xC3\xA8.xml");
    EXPECT_TRUE(object.getConfigurationFile(file_.c_str(), 1, "S", cut, sizeof cut));
    EXPECT_STREQ(cut, "/etc");
    EXPECT_FALSE(object.getConfigurationFile(file_.c_str(), 2, "S", whole));
    EXPECT_FALSE(object.getConfigurationFile(folder_.file("none").c_str(), 1, "S", whole));
    EXPECT_STREQ(whole, "/etc/\xC3\xA8.xml");
}

TEST_F(Registry, WritesExactNumbersWhereAskedTo) {
    Shelf object, back;
    object.fill(2);
    for (const bool exact : {true, false}) {
        object.setExactNumbers(exact);
        EXPECT_EQ(object.writeAuxiliaryFile(file_.c_str(), 1, "Shelf"), 0);
        EXPECT_TRUE(back.readAuxiliaryFile(file_.c_str(), 1, "Shelf"));
        EXPECT_EQ(back.width == object.width, exact);
    }
    Shelf common;
    common.fill(2);
    quorelxml::setExactNumbers(true);
    EXPECT_EQ(common.writeAuxiliaryFile(file_.c_str(), 1, "Shelf"), 0);
    quorelxml::setExactNumbers(false);
    EXPECT_TRUE(back.readAuxiliaryFile(file_.c_str(), 1, "Shelf"));
    EXPECT_TRUE(back == common);
}

TEST_F(Registry, DoesNothingInTheBaseClass) {
    GeneralSAR_Base object;
    EXPECT_EQ(object.writehdr(), 0);
    EXPECT_EQ(object.writehdr(file_.c_str()), 0);
    EXPECT_EQ(object.readhdr(file_.c_str()), 0);
    EXPECT_EQ(object.createBuffers(), 0);
    EXPECT_EQ(object.destroyBuffers(), 0);
    EXPECT_FALSE(object.isBufferAllocated());
    EXPECT_THAT(test::entries(folder_), testing::IsEmpty());
}

}  // namespace
