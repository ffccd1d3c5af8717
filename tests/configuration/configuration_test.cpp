#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <map>
#include <string>
#include <vector>

#include "quo_base/generalSAR_configuration.h"
#include "support/diagnostics.h"
#include "support/fields.h"

namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

// What a record holds, by class: the number of elements and the bounds and defaults that are fixed.
struct Promise {
    const char* element;
    double minimum, maximum, value;
};
template <typename T>
struct Expected;
#define QUO_EXPECTED(Class, size, ...)                                   \
    template <>                                                          \
    struct Expected<Class> {                                             \
        static constexpr const char* kName = #Class;                     \
        static constexpr int kSize = size;                               \
        static std::vector<Promise> promises() { return {__VA_ARGS__}; } \
    };
constexpr double kMaxInt = 2147483647.0;
QUO_EXPECTED(AzimuthConf, 16, {"WhiteningFlag", 0, 1, 0}, {"LinesInBlock", 0, kMaxInt, 5000},
             {"SamplesInBlock", 0, kMaxInt, 256}, {"AzimuthOverlap", 0, kMaxInt, 2500},
             {"RangeOverlap", 0, kMaxInt, 20}, {"PerformInterpolation", 0, kMaxInt, 7}, {"ApplyRgShift", 0, 0, 0},
             {"ApplyAzShift", 0, 0, 0})
QUO_EXPECTED(DCestConf, 27, {"Dswst", 0, 1, 1}, {"Pol_weights", 0, 1, 1}, {"Amb_flag", 0, kMaxInt, 1})
QUO_EXPECTED(ExtractorConf, 2, {"RawLinesSkip", 0, kMaxInt, 0}, {"RawLinesToExtract", 0, kMaxInt, 0})
QUO_EXPECTED(generalProcessingConf, 11, {"Flag_incore", 0, 1, 0}, {"EraseTemp", 0, 1, 1})
QUO_EXPECTED(FinefitestConf, 4, {"RangeMaxShift", 0, kMaxInt, 8}, {"AzimuthBlockSize", 0, kMaxInt, 128})
QUO_EXPECTED(EnvisatCalibrationFactors, 10, {"IM_HH", 0, 0, 1}, {"WSS_VV", 0, 0, 1})
QUO_EXPECTED(DemExtractorConf, 7, {"LatitudeMarginPerc", 0, 100, 10}, {"InterpolationFlag", 0, 1, 1})
QUO_EXPECTED(GeocodingConf, 3, {"InterpolationPrecision", 1, 5, 2}, {"InterpolationFilterLength", 3, kMaxInt, 11})
QUO_EXPECTED(ATPrecise_FitestConf, 4, {"CoarseValidBlocks", 0, kMaxInt, 10})
QUO_EXPECTED(CoregistrationConf, 4, {"InterpolationPrecision", 1, 5, 3}, {"DCDemodulationType", 0, 1, 1})
QUO_EXPECTED(CoherenceConf, 19, {"EFFlag", 0, 1, 1}, {"AzimuthPresumSamples", 0, kMaxInt, 5})
#undef QUO_EXPECTED

template <typename T>
class Records : public testing::Test {
protected:
    // What the call throws, "" when it does not.
    template <typename Call>
    static std::string thrown(Call call) {
        try {
            call();
        } catch (const quorelException& e) {
            return e.what();
        }
        return "";
    }
    test::Report report_;
    std::string file_ = report_.file("configuration.xml");
};
using AllRecords = testing::Types<AzimuthConf, DCestConf, ExtractorConf, generalProcessingConf, FinefitestConf,
                                  EnvisatCalibrationFactors, DemExtractorConf, GeocodingConf, ATPrecise_FitestConf,
                                  CoregistrationConf, CoherenceConf>;
TYPED_TEST_SUITE(Records, AllRecords);

TYPED_TEST(Records, HoldTheirElements) {
    const TypeParam record;
    EXPECT_STREQ(record.section(), Expected<TypeParam>::kName);
    ASSERT_EQ(record.elementCount(), Expected<TypeParam>::kSize);
    std::map<std::string, const parElement*> elements;
    for (int i = 0; i < record.elementCount(); ++i) {
        EXPECT_TRUE(record.element(i)->mandatory) << record.element(i)->name;
        EXPECT_STRNE(record.meaning(i), "") << record.element(i)->name;
        elements[record.element(i)->name] = record.element(i);
    }
    for (const Promise& promise : Expected<TypeParam>::promises()) {
        ASSERT_TRUE(elements.contains(promise.element)) << promise.element;
        const parElement& element = *elements[promise.element];
        EXPECT_EQ(element.minimum, promise.minimum) << promise.element;
        EXPECT_EQ(element.maximum, promise.maximum) << promise.element;
        EXPECT_EQ(test::values_of(element)[0], test::digits(promise.value)) << promise.element;
    }
    EXPECT_STREQ(record.meaning(-1), "");
    EXPECT_STREQ(record.unit(1000), "");
}

// Defaults must lie within the bounds that they are documented with.
TYPED_TEST(Records, HaveDefaultsWithinTheirBounds) {
    const TypeParam record;
    for (int i = 0; i < record.elementCount(); ++i) {
        const parElement& element = *record.element(i);
        if (element.type == parElement::typeString || element.minimum == element.maximum) continue;
        for (const std::string& text : test::values_of(element)) {
            EXPECT_GE(std::stod(text), element.minimum) << element.name;
            EXPECT_LE(std::stod(text), element.maximum) << element.name;
        }
    }
}

TYPED_TEST(Records, ComeBackFromAFileAndFromAClone) {
    TypeParam written, read, cloned;
    test::fill_fields(written);
    written.Memory = 1234;
    ASSERT_EQ(written.writepar(this->file_.c_str(), 1), 0);
    ASSERT_EQ(read.readpar(this->file_.c_str(), 1), 0);
    EXPECT_THAT(test::differing_fields(read, written), IsEmpty());
    EXPECT_EQ(read.Memory, 512) << "shared parameters are input only";
    ASSERT_EQ(written.clone(&cloned), 0);
    EXPECT_THAT(test::differing_fields(cloned, written), IsEmpty());
    EXPECT_EQ(cloned.Memory, 1234);
    GeneralSAR_BaseConfiguration plain;
    EXPECT_EQ(written.clone(&plain), 1);
    EXPECT_TRUE(this->report_.entries("ERROR").empty());
}

TYPED_TEST(Records, ThrowForEachMissingElement) {
    TypeParam written;
    test::fill_fields(written);
    ASSERT_EQ(written.writepar(this->file_.c_str(), 1), 0);
    const std::string whole = test::read_text(this->file_);
    for (const std::string& name : test::field_names(written)) {
        test::write_text(this->file_, test::without_element(whole, name));
        TypeParam read;
        EXPECT_EQ(this->thrown([&] { read.readpar(this->file_.c_str(), 1); }),
                  "Cannot read specific configuration file");
    }
    TypeParam read;
    EXPECT_EQ(this->thrown([&] { read.readpar(this->report_.file("missing.xml").c_str(), 1); }),
              "Cannot read specific configuration file");
}

TYPED_TEST(Records, ThrowWhenTheyCannotBeWrittenAndKeepTheOldFile) {
    const test::CapturedStderr silent;
    TypeParam record;
    EXPECT_EQ(this->thrown([&] { record.writepar("/dev/full", 1); }), "Cannot write specific configuration file");
    EXPECT_EQ(this->thrown([&] { record.writepar(this->report_.file("missing/c.xml").c_str(), 1); }),
              "Cannot write specific configuration file");
}

class Configuration : public testing::Test {
protected:
    test::Report report_;
    std::string file_ = report_.file("configuration.xml");
};

TEST_F(Configuration, WritesNoSharedSection) {
    GeocodingConf record;
    record.writepar(file_.c_str(), 1);
    const std::string text = test::read_text(file_);
    EXPECT_THAT(text, HasSubstr("<InterpolationPrecision>2</InterpolationPrecision>"));
    EXPECT_THAT(text, HasSubstr("<InterpolationFilterLength>11</InterpolationFilterLength>"));
    EXPECT_THAT(text, HasSubstr("<InterpolationFilterBandwidth>0.8"));
    EXPECT_THAT(text, Not(HasSubstr("generalProcessingConf")));
}

TEST_F(Configuration, ReadsSharedParametersThatAreThere) {
    GeocodingConf record;
    record.writepar(file_.c_str(), 2);
    quorelxml document{file_.c_str()};
    const std::int32_t memory = 2048, level = 3;
    const char* name = "focus.txt";
    document.writeInt(2, "generalProcessingConf/Memory", &memory, 1);
    document.writeInt(2, "generalProcessingConf/ReportLevel", &level, 1);
    document.writeString(2, "generalProcessingConf/ReportFilename", &name, 1);
    document.write();
    record.Verbose = 17;
    ASSERT_EQ(record.readpar(file_.c_str(), 2), 0);
    EXPECT_EQ(record.Memory, 2048);
    EXPECT_EQ(record.ReportLevel, 3);
    EXPECT_STREQ(record.ReportFilename, "focus.txt");
    EXPECT_EQ(record.Verbose, 17);
}

TEST_F(Configuration, ContainerWritesAndClonesWhatIsEnabled) {
    GeneralSAR_configuration written, cloned;
    EXPECT_EQ(written.GSenable(gscAzimuthConf), 0);
    EXPECT_EQ(written.GSenable(gscFinefitestConf), 0);
    EXPECT_EQ(written.GSenable(static_cast<GScObject>(6)), 1);
    written.azimuth.LinesInBlock = 4321;
    EXPECT_EQ(written.GSwrite(file_.c_str(), 1), 0);
    const std::string text = test::read_text(file_);
    EXPECT_THAT(text, HasSubstr("<AzimuthConf>"));
    EXPECT_THAT(text, HasSubstr("<FinefitestConf>"));
    EXPECT_THAT(text, Not(HasSubstr("ExtractorConf")));
    cloned.GSenable(gscExtractorConf);
    EXPECT_EQ(written.GSclone(&cloned), 0);
    EXPECT_EQ(cloned.azimuth.LinesInBlock, 4321);
    EXPECT_TRUE(cloned.GSexists(gscAzimuthConf));
    EXPECT_TRUE(cloned.GSexists(gscExtractorConf)) << "absent records leave the other container alone";
    EXPECT_FALSE(cloned.GSexists(gscDCestConf));
    written.GSdisable(gscAzimuthConf);
    EXPECT_FALSE(written.GSexists(gscAzimuthConf));
}

TEST_F(Configuration, ContainerReadsAllOrThrowsAtTheFirst) {
    GeneralSAR_configuration all;
    for (int i = 0; i < 6; ++i) all.GSenable(static_cast<GScObject>(i));
    all.GSwrite(file_.c_str(), 1);
    GeneralSAR_configuration read;
    ASSERT_EQ(read.GSread(file_.c_str(), 1), 0);
    for (int i = 0; i < 6; ++i) EXPECT_TRUE(read.GSexists(static_cast<GScObject>(i))) << i;

    test::write_text(file_, test::without_element(test::read_text(file_), "ExtractorConf"));
    GeneralSAR_configuration partial;
    EXPECT_THROW(partial.GSread(file_.c_str(), 1), quorelException);
    EXPECT_TRUE(partial.GSexists(gscAzimuthConf));
    EXPECT_TRUE(partial.GSexists(gscDCestConf));
    EXPECT_FALSE(partial.GSexists(gscGeneralProcessingConf));

    const test::CapturedStderr silent;
    const std::string missing = report_.file("missing.xml");
    EXPECT_EQ(partial.GSread(missing.c_str(), 1), 1);
    EXPECT_THAT(report_.messages("ERROR"), ElementsAre("File : " + missing + " DOES NOT EXIST!"));
}

TEST_F(Configuration, GeneralRecordReadsAtConstruction) {
    generalProcessingConf written;
    written.Flag_rgpatt = 0;
    written.writepar(file_.c_str(), 1);
    EXPECT_EQ(generalProcessingConf(file_.c_str(), 1).Flag_rgpatt, 0);
    EXPECT_THROW(generalProcessingConf(report_.file("missing.xml").c_str(), 1), quorelException);
}

}  // namespace
