// SPDX-License-Identifier: Apache-2.0
#include "header_files.h"
#include "quo_base/quorelxml_v2.h"

namespace {

using test::header_text;
using test::read_text;
using test::write_text;

/** A header class whose registration and allocation the test decides. */
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

    int createBuffers() override { return allocation(*this); }

protected:
    void refreshParameters() override {
        if (registration) registration(*this);
    }
};

class Registry : public testing::Test {
protected:
    void make(int elements, std::function<void(Free&)> registration) {
        object_.registration = std::move(registration);
        EXPECT_EQ(object_.createElementsVector(elements), 0);
    }
    test::TemporaryFolder folder_;
    const std::string file_ = folder_.file("header.xml");
    std::int32_t i_ = 7;
    Free object_;
};

// Whether an element is one value is fixed at its first registration.
TEST_F(Registry, StoresWhatIsRegistered) {
    double d[3] = {};
    float f = 0;
    int first = 1, second = 0;
    char single[512] = "", other[20] = "";
    char* many[2] = {single, single};
    make(8, [&](Free& self) {
        EXPECT_EQ(self.addElementDouble("d", d, 3, -1.5, 2.5, true) +
                      self.addElementFloat("f", &f, 1, 0.25F, 0.5F, false) +
                      self.addElementInt(std::string(100, 'n').c_str(), &i_, 1, -7, 2147483647, true) +
                      self.addElementString("single", single, true) +
                      self.addElementString("many", many, 2, false) +
                      self.addElementText("other", other, sizeof other, false) +
                      self.addElementInt("first", &i_, first, 0, 0, true) +
                      self.addElementInt("second", &i_, second, 0, 0, true),
                  0);
    });
    std::swap(first, second);
    for (int round = 0; round < 4; ++round) object_.registration(object_);  // into the same slots
    using Row = std::tuple<std::string, int, int, void*, double, double, bool, bool, std::size_t>;
    const Row rows[] = {{"d", parElement::typeDouble, 3, d, -1.5, 2.5, true, false, 512},
                        {"f", parElement::typeFloat, 1, &f, 0.25, 0.5, false, true, 512},
                        {std::string(63, 'n'), parElement::typeInt, 1, &i_, -7, 2147483647, true, true, 512},
                        {"single", parElement::typeString, 1, single, 0, 0, true, true, 512},
                        {"many", parElement::typeString, 2, many, 0, 0, false, false, 512},
                        {"other", parElement::typeString, 1, other, 0, 0, false, true, 20},
                        {"first", parElement::typeInt, 0, &i_, 0, 0, true, true, 512},
                        {"second", parElement::typeInt, 1, &i_, 0, 0, true, false, 512}};
    for (int slot = 0; slot < object_.elementCount(); ++slot) {
        const parElement& e = *object_.element(slot);
        EXPECT_EQ(Row(e.name, e.type, e.count, e.pointer, e.minimum, e.maximum, e.mandatory, e.scalar, e.room),
                  rows[slot]);
        EXPECT_TRUE(e.registered);
    }
    EXPECT_TRUE(!object_.element(8) && !object_.element(-1) && object_.isBufferAllocated());
    parElement fresh;
    EXPECT_EQ(fresh.type, parElement::typeNone);
    for (const int count : {2, 1}) {  // open until it is marked registered
        fresh.setElement("a", &i_, parElement::typeInt, count, 0, 0, true);
        EXPECT_EQ(fresh.scalar, count == 1);
    }
}

TEST_F(Registry, RefusesWhatHasNoSlot) {
    const test::Report report;
    char text[512];
    char* texts[] = {text};
    set_ckerr_fun("test");
    ASSERT_NE(malloc_ckerr(1), nullptr);
    EXPECT_EQ(object_.addElementInt("i", &i_, 1, 0, 0, true) + object_.addElementString("s", text, true) +
                  object_.addElementString("s", texts, 1, true),
              3);
    deccurdep();  // the block is gone with the pending errors, or the report's own check would find it
    EXPECT_EQ(object_.createElementsVector(0), 0);
    EXPECT_EQ(object_.addElementInt("i", &i_, 1, 0, 0, true) + object_.createElementsVector(-1), 2);
}

TEST_F(Registry, MakesOneTableForAClassOfClasses) {
    for (const int slots : {3, 5, 2}) {
        make(slots, [&, slots](Free& self) {
            for (int i = 0; i < slots; ++i) self.addElementInt("i", &i_, 1, 0, 0, true);
        });
        EXPECT_EQ(object_.elementCount(), slots);
    }
    object_.setParamListAlloc(false);
    const parElement* kept = object_.element(0);
    object_.destroyElementsVector();
    EXPECT_EQ(object_.element(0), nullptr);
    EXPECT_STREQ(kept->name, "i") << "a table that is not owned outlives the object";
    delete[] kept;
}

// Which elements may be missing is tested with the classes that have them, lengths that follow their arrays with
// the shelf.
TEST_F(Registry, WorksOnTheAttachedFileStepByStep) {
    const char* const file = file_.c_str();
    write_text(file_, header_text("    <S>\n      <i>1</i>\n    </S>\n"));
    make(1, [this](Free& self) { self.addElementInt("i", &i_, 1, 0, 0, true); });
    for (const auto& bad : std::vector<std::function<int(Free&)>>{
             [](Free&) { return 7; }, [](Free&) -> int { throw std::bad_alloc{}; },
             [](Free& self) { return self.setAllocationFlag(false); }, [](Free&) { return 0; }}) {
        object_.allocation = bad;
        EXPECT_FALSE(object_.readAuxiliaryFile(file, 1, "S"));
        EXPECT_EQ(i_, 1);
    }
    object_.setAllocationFlag(true);
    i_ = 7;
    EXPECT_EQ(object_.setAuxiliaryFile(file, 1, "S") + object_.readAuxiliaryFile(), 0);
    EXPECT_EQ(i_, 1);
    EXPECT_EQ(object_.cleanAuxiliaryFile(), 0);
    EXPECT_EQ(object_.readAuxiliaryFile(), 1);
    i_ = 42;
    EXPECT_EQ(object_.writeAuxiliaryFile(), 0);
    const std::string written = header_text("    <S>\n      <i>42</i>\n    </S>\n");
    EXPECT_EQ(read_text(file_), written);
    EXPECT_EQ(object_.unsetAuxiliaryFile(), 0);
    EXPECT_EQ(object_.readAuxiliaryFile() + object_.writeAuxiliaryFile(), 2);

    const std::string long_name(600, 's');
    for (const char* section : {static_cast<const char*>(nullptr), "", "a b", "..", "S/", long_name.c_str()})
        EXPECT_EQ(object_.writeAuxiliaryFile(file, 1, section), 1);
    EXPECT_EQ(object_.writeAuxiliaryFile(folder_.file(long_name).c_str(), 1, "S"), 1);

    // Without buffers nothing is written, but the section is gone from the document in memory all the same.
    object_.setAllocationFlag(false);
    EXPECT_EQ(object_.setAuxiliaryFile(file, 1, "S"), 0);
    EXPECT_EQ(object_.writeAuxiliaryFile() + object_.readAuxiliaryFile(), 2);
    EXPECT_EQ(i_, 42);
    EXPECT_EQ(read_text(file_), written);
}

TEST_F(Registry, FindsTheConfigurationFile) {
    char whole[512] = "unset", cut[5] = "";
    write_text(file_, header_text("<S><ConfigurationFile>/etc/\xC3\xA8.xml</ConfigurationFile></S>"));
    EXPECT_TRUE(object_.getConfigurationFile(file_.c_str(), 1, "S", whole));
    EXPECT_TRUE(object_.getConfigurationFile(file_.c_str(), 1, "S", cut, sizeof cut));
    EXPECT_STREQ(cut, "/etc");
    EXPECT_FALSE(object_.getConfigurationFile(file_.c_str(), 2, "S", whole) ||
                 object_.getConfigurationFile(folder_.file("none").c_str(), 1, "S", whole));
    EXPECT_STREQ(whole, "/etc/\xC3\xA8.xml");
}

}  // namespace
