#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstring>
#include <filesystem>
#include <sstream>
#include <string>
#include <typeinfo>
#include <vector>

#include "quo_base/generalSAR_configuration.h"
#include "support/diagnostics.h"
#include "support/fields.h"
#include "support/limits.h"

namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

// What a record must hold, by class: its elements in order as "name type", with the bounds of ints ("int" alone:
// from 0), and the defaults where they are fixed.
template <typename T>
struct Promise {
    static const char *const kName, *const kElements, *const kDefaults;
};
#define QUO_PROMISE(Class, elements, defaults)              \
    template <>                                             \
    const char* const Promise<Class>::kName = #Class;       \
    template <>                                             \
    const char* const Promise<Class>::kElements = elements; \
    template <>                                             \
    const char* const Promise<Class>::kDefaults = defaults;
QUO_PROMISE(AzimuthConf,
            "WhiteningFlag int:0:1, AntennaLength float, AzimuthWindowHammingParameter float, "
            "AzimuthLookBandwidth float, AzimuthTransitionBandwidth float, RangeWindowHammingParameter float, "
            "RangeLookBandwidth float, RangeTransitionBandwidth float, LinesInBlock int, SamplesInBlock int, "
            "AzimuthOverlap int, RangeOverlap int, PerformInterpolation int, StoltPadding float, "
            "ApplyRgShift int:0:0, ApplyAzShift int:0:0",
            "0 10 0 0 0 0 0 0 5000 256 2500 20 7 0.4 0 0")
QUO_PROMISE(DCestConf,
            "Nbestblocks int, Nummlbf int, Nwdarbloks int, Blocks int, Blockl int, Dswst int:0:1, Patchs int, "
            "Patchl int, RgBand float, AnLen float, Lookbf float, Lookbt float, Lookrp float, Lookrs float, "
            "Decfac int, Flength int, Dftstep float, Fftrgprc float, Fftazprc float, Peakwid float, Minamb float, "
            "Maxamb float, Kthr float, Sthr float, Varth float, Amb_flag int, Pol_weights int:0:1 x 7",
            nullptr)
QUO_PROMISE(ExtractorConf, "RawLinesSkip int, RawLinesToExtract int", "0 0")
QUO_PROMISE(generalProcessingConf,
            "Flag_incore int:0:1, Flag_ortog int:0:1, Flag_swstal int:0:1, Flag_ext int:0:1, "
            "Flag_rangefoc int:0:1, Flag_rgpatt int:0:1, Flag_azimuthfoc int:0:1, Flag_dcest int:0:1, "
            "Remove_interferences int:0:1, Azblk int:0:1, EraseTemp int:0:1",
            nullptr)
QUO_PROMISE(FinefitestConf, "RangeMaxShift int, AzimuthMaxShift int, RangeBlockSize int, AzimuthBlockSize int",
            "8 128 128 128")
QUO_PROMISE(EnvisatCalibrationFactors,
            "IM_HH double x 7, IM_VV double x 7, AP_HH double x 7, AP_HV double x 7, AP_VH double x 7, "
            "AP_VV double x 7, WSML_HH double, WSML_VV double, WSS_HH double, WSS_VV double",
            nullptr)
QUO_PROMISE(DemExtractorConf,
            "LatitudeOversampling int, LongitudeOversampling int, LatitudeMarginPerc int:0:100, "
            "LongitudeMarginPerc int:0:100, InterpolationFlag int:0:1, GeoidCorrectionFilename text, "
            "SRTMDirectory text",
            nullptr)
QUO_PROMISE(GeocodingConf,
            "InterpolationPrecision int:1:5, InterpolationFilterLength int:3:2147483647, "
            "InterpolationFilterBandwidth float",
            "2 11 0.8")
QUO_PROMISE(ATPrecise_FitestConf,
            "RangeMinOverlap int, AzimuthMinOverlap int, CoarseValidBlocks int, FineValidBlocks int", nullptr)
QUO_PROMISE(CoregistrationConf,
            "InterpolationPrecision int:1:5, InterpolationFilterLength int:3:2147483647, "
            "InterpolationFilterBandwidth float, DCDemodulationType int:0:1",
            nullptr)
QUO_PROMISE(CoherenceConf,
            "RangeEstimatesFrequencies int, AzimuthEstimatesFrequencies int, MaxBias float, "
            "MinimumNumberOfLooks float, CoherenceRangeSemiAperture int, CoherenceAzimuthSemiAperture int, "
            "APrioriRangeSemiAperture int, APrioriAzimuthSemiAperture int, RangeSemiAperture4Frequency int, "
            "AzimuthSemiAperture4Frequency int, ConfidenceLevel float, SaturationLevel float, "
            "AzimuthPresumSamples int, BiasMapFlag int:0:1, APrioriCoherenceFlag int:0:1, EFFlag int:0:1, "
            "DespeckleFlag int:0:1, ENLAzimuthAperture int, ENLRangeAperture int",
            nullptr)
#undef QUO_PROMISE

std::string described(const parElement& element) {
    constexpr const char* kTypes[] = {"double", "float", "int", "text", "none"};
    std::string text = element.name + std::string{" "} + kTypes[element.type];
    if (element.type == parElement::typeInt && (element.minimum != 0 || element.maximum != 2147483647.0))
        text += ":" + test::digits(element.minimum) + ":" + test::digits(element.maximum);
    return element.count == 1 ? text : text + " x " + std::to_string(element.count);
}

std::string first_value(const parElement& element) {
    if (element.type != parElement::typeFloat) return test::values_of(element)[0];
    std::ostringstream text;  // with the digits that a float has
    text << *static_cast<const float*>(element.pointer);
    return text.str();
}

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

TYPED_TEST(Records, HoldTheirElementsInOrder) {
    const TypeParam record;
    std::string elements, defaults;
    for (int i = 0; i < record.elementCount(); ++i) {
        const parElement& element = *record.element(i);
        EXPECT_TRUE(element.mandatory) << element.name;
        EXPECT_STRNE(record.meaning(i), "") << element.name;
        elements += (i > 0 ? ", " : "") + described(element);
        defaults += (i > 0 ? " " : "") + first_value(element);
    }
    EXPECT_EQ(elements, Promise<TypeParam>::kElements);
    if (Promise<TypeParam>::kDefaults) {
        EXPECT_EQ(defaults, Promise<TypeParam>::kDefaults);
    }
    EXPECT_STREQ(record.section(), Promise<TypeParam>::kName);
    const auto made = GeneralSAR_ConfigurationRecord::make(record.section());
    ASSERT_TRUE(made);
    EXPECT_EQ(typeid(*made), typeid(record));
    EXPECT_STREQ(record.meaning(-1), "");
    EXPECT_STREQ(record.unit(1000), "");
}

// A default outside its own bounds would be refused as soon as it is written and checked.
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
    EXPECT_EQ(written.clone(nullptr), 1);
    EXPECT_EQ(plain.clone(nullptr), 1);
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
    EXPECT_EQ(this->thrown([&] { record.writepar(this->report_.file("missing/c.xml").c_str(), 1); }),
              "Cannot write specific configuration file");
    record.writepar(this->file_.c_str(), 1);
    const std::string old = test::read_text(this->file_);
    test::fill_fields(record);
    std::string failure;
    for (const std::size_t room : {std::size_t{0}, old.size() / 2}) {
        {
            const test::FullDisk full{room};
            failure = this->thrown([&] { record.writepar(this->file_.c_str(), 1); });
        }
        EXPECT_EQ(failure, "Cannot write specific configuration file");
        EXPECT_EQ(test::read_text(this->file_), old);
    }
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

// Every record was saved by itself: a disk that filled up on the way left a mixture of old and new ones.
TEST_F(Configuration, ContainerIsSavedAsAWhole) {
    const std::string other = report_.file("one_by_one.xml");
    GeneralSAR_configuration all;
    for (int i = 0; i < 6; ++i) all.GSenable(static_cast<GScObject>(i));
    for (int i = 0; i < 6; ++i) ASSERT_EQ(all.GSget(static_cast<GScObject>(i))->writepar(other.c_str(), 1), 0);
    const std::string complete = test::read_text(other);
    const test::CapturedStderr silent;
    for (const std::string old :
         {"", "<QuorelXmlDoc><NumberOfChannels>0</NumberOfChannels><Description/></QuorelXmlDoc>"}) {
        for (std::size_t room = 0; room < complete.size(); room += 97) {
            test::write_text(file_, old);
            const test::FullDisk full{room};
            EXPECT_THROW(all.GSwrite(file_.c_str(), 1), quorelException);
            EXPECT_EQ(test::read_text(file_), old) << room;
        }
    }
    test::write_text(file_, "");
    EXPECT_EQ(all.GSwrite(file_.c_str(), 1), 0);
    EXPECT_EQ(test::read_text(file_), complete) << "the bytes of writing record by record";
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
    EXPECT_TRUE(partial.GSexists(gscExtractorConf)) << "set before it was read";
    EXPECT_FALSE(partial.GSexists(gscGeneralProcessingConf));

    const test::CapturedStderr silent;
    const std::string missing = report_.file("missing.xml");
    EXPECT_EQ(partial.GSread(missing.c_str(), 1), 1);
    EXPECT_THAT(report_.messages("ERROR"), ElementsAre("File : " + missing + " DOES NOT EXIST!"));
    EXPECT_EQ(partial.GSread(nullptr, 1), 1);
    EXPECT_EQ(partial.GSclone(nullptr), 1);
}

TEST_F(Configuration, GeneralRecordReadsAtConstruction) {
    generalProcessingConf written;
    written.Flag_rgpatt = 0;
    written.writepar(file_.c_str(), 1);
    EXPECT_EQ(generalProcessingConf(file_.c_str(), 1).Flag_rgpatt, 0);
    EXPECT_THROW(generalProcessingConf(report_.file("missing.xml").c_str(), 1), quorelException);
}

// --- files that mean no good ------------------------------------------------------------------------------------

/** A valid file of two records with one place changed. */
struct Damage {
    const char* name;
    std::string from, to;
    std::vector<std::string> findings;
    bool readable = true;  // whether both records can still be read
};
void PrintTo(const Damage& row, std::ostream* stream) { *stream << row.name; }

class DamagedConfiguration : public testing::TestWithParam<Damage> {
protected:
    static std::string good(const test::Report& report) {
        const std::string file = report.file("good.xml");
        DCestConf{}.writepar(file.c_str(), 1);
        DemExtractorConf{}.writepar(file.c_str(), 1);
        return test::read_text(file);
    }
    test::Report report_;
};

std::string values(int count) {
    std::string text = "<Pol_weights>";
    for (int i = 0; i < count; ++i) text += "<val>1</val>";
    return text + "</Pol_weights>";
}
constexpr const char* kDoctype = "<!DOCTYPE QuorelXmlDoc [<!ENTITY a \"ha\"><!ENTITY b \"&a;&a;&a;&a;\">]>";

const Damage kDamages[] = {
    {"Nothing", "", "", {}},
    {"UnknownElement", "<Blocks>", "<Bolcks>7</Bolcks><Blocks>", {"DCestConf/Bolcks is unknown"}},
    {"ElementOfAnotherNamespace",
     "<Blocks>20</Blocks>",
     "<x:Blocks xmlns:x='urn:x'>20</x:Blocks>",
     {"DCestConf/Blocks is unknown", "DCestConf/Blocks is missing"},
     false},
    {"ElementTwice", "<Blocks>", "<Blocks>7</Blocks><Blocks>", {"DCestConf/Blocks stands there more than once"}},
    {"Missing", "<Blocks>20</Blocks>", "", {"DCestConf/Blocks is missing"}, false},
    {"UnknownSection", "<DCestConf>", "<DcConf/><DCestConf>", {"DcConf/ is no configuration record"}},
    {"SectionTwice",
     "<DCestConf>",
     "<DemExtractorConf/><DCestConf>",
     {"DemExtractorConf/LatitudeOversampling is missing", "DemExtractorConf/ stands there more than once"}},
    {"AboveItsBounds", "<Dswst>1<", "<Dswst>2<", {"DCestConf/Dswst 2 lies above 1"}},
    {"BelowItsBounds", "<Lookbf>0.8", "<Lookbf>-0.8", {"DCestConf/Lookbf -0.8"}},
    {"BeyondAnInt", "<Blocks>20<", "<Blocks>99999999999<", {"DCestConf/Blocks 99999999999 lies above 2147483647"}},
    {"Words", "<Blocks>20<", "<Blocks>twenty<", {"DCestConf/Blocks \"twenty\" is no whole number"}},
    {"HalfANumber", "<Blocks>20<", "<Blocks>20.5<", {"DCestConf/Blocks \"20.5\" is no whole number"}},
    {"NoNumber", "<Kthr>3<", "<Kthr><", {"DCestConf/Kthr \"\" is no number"}},
    {"NotFinite", "<Kthr>3<", "<Kthr>nan<", {"DCestConf/Kthr \"nan\" is not finite"}},
    {"TooFewValues", "Pol_weights", values(5), {"DCestConf/Pol_weights has 5 values, not 7"}},
    {"TooManyValues", "Pol_weights", values(70000), {"DCestConf/Pol_weights has 70000 values, not 7"}},
    {"ListOfValues",
     "Pol_weights",
     "<Pol_weights>1, 0, 0, 1, 3, 0, 0</Pol_weights>",
     {"DCestConf/Pol_weights 3 lies above 1"}},
    {"LongText",
     "<SRTMDirectory>NOT_AVAILABLE",
     "<SRTMDirectory>" + std::string(600, 'd'),
     {"DemExtractorConf/SRTMDirectory has 600 bytes, more than 511"}},
};

TEST_P(DamagedConfiguration, IsReviewedAndReadWithoutLoss) {
    const auto& [name, from, to, findings, readable] = GetParam();
    std::string text = good(report_);
    const std::string place = from == "Pol_weights" ? test::element_text(text, from) : from;
    ASSERT_NE(text.find(place), text.npos);
    text.replace(text.find(place), place.size(), to);
    const std::string file = report_.file("damaged.xml");
    test::write_text(file, text);

    ConfigurationReview review;
    ASSERT_EQ(reviewConfiguration(file.c_str(), 1, review), 0);
    std::size_t matched = 0;
    for (const auto& finding : review.findings) {
        const std::string line = finding.section + "/" + finding.name + " " + finding.reason;
        for (const std::string& expected : findings) matched += line.starts_with(expected) ? 1U : 0U;
    }
    EXPECT_EQ(matched, findings.size());
    if (name != std::string{"SectionTwice"}) {
        EXPECT_EQ(review.findings.size(), findings.size());
    }
    EXPECT_THAT(review.records, testing::UnorderedElementsAre("DCestConf", "DemExtractorConf"));

    DCestConf doppler;
    DemExtractorConf dem;
    const auto read = [&] { doppler.readpar(file.c_str(), 1), dem.readpar(file.c_str(), 1); };
    if (readable) {
        EXPECT_NO_THROW(read());
        EXPECT_LT(std::strlen(dem.SRTMDirectory), sizeof dem.SRTMDirectory);
    } else {
        EXPECT_THROW(read(), quorelException);
    }
}
INSTANTIATE_TEST_SUITE_P(Files, DamagedConfiguration, testing::ValuesIn(kDamages),
                         [](const auto& row) { return row.param.name; });

// What is no header at all: the review refuses it, records throw and keep every value, and nothing is written.
TEST_F(DamagedConfiguration, ThatIsNoDocumentIsRefused) {
    const std::string text = good(report_), file = report_.file("hostile.xml"), folder = report_.file("folder");
    std::string laughs = text;
    laughs.insert(laughs.find("<QuorelXmlDoc>"), kDoctype);
    laughs.replace(laughs.find("<Blocks>20"), 10, "<Blocks>&b;");
    std::filesystem::create_directory(folder);
    std::vector<std::string> contents{"", "[DCestConf]\nBlocks = 7\n", std::string(5000, '\0'), laughs,
                                      text + text};
    for (std::size_t length = 40; length < text.size() - 20; length += 97)
        contents.push_back(text.substr(0, length));
    ConfigurationReview review;
    for (const std::string& content : contents) {
        test::write_text(file, content);
        EXPECT_EQ(reviewConfiguration(file.c_str(), 1, review), 1);
        DCestConf record, fresh;
        EXPECT_THROW(record.readpar(file.c_str(), 1), quorelException);
        EXPECT_THAT(test::differing_fields(record, fresh), IsEmpty());
        EXPECT_EQ(test::read_text(file), content);
    }
    GeneralSAR_configuration container;
    EXPECT_THROW(container.GSread(folder.c_str(), 1), quorelException);
    EXPECT_EQ(reviewConfiguration(folder.c_str(), 1, review), 1);
    EXPECT_EQ(reviewConfiguration(report_.file("missing.xml").c_str(), 1, review), 1);
    EXPECT_EQ(reviewConfiguration(nullptr, 1, review), 1);
    EXPECT_THROW(DCestConf{}.readpar(nullptr, 1), quorelException);
    EXPECT_THROW(DCestConf{}.writepar(nullptr, 1), quorelException);
}

// The section of the shared parameters is the record of that name only where it holds an element of it.
TEST_F(DamagedConfiguration, SharedParametersAloneAreNoRecord) {
    const std::string file = report_.file("shared.xml");
    const auto review_with = [&](const std::string& inside) {
        std::string text = good(report_);
        const std::string section = "<generalProcessingConf>" + inside + "</generalProcessingConf>";
        test::write_text(file, text.insert(text.find("<DCestConf>"), section));
        ConfigurationReview review;
        EXPECT_EQ(reviewConfiguration(file.c_str(), 1, review), 0);
        return review;
    };
    const auto shared = review_with("<Memory>2048</Memory><ReportLevel>4</ReportLevel>");
    EXPECT_THAT(shared.records, Not(testing::Contains("generalProcessingConf")));
    ASSERT_EQ(shared.findings.size(), 1U);
    EXPECT_EQ(shared.findings[0].name + " " + shared.findings[0].reason, "ReportLevel 4 lies above 3");
    const auto record = review_with("<Memory>2048</Memory><Azblk>1</Azblk>");
    EXPECT_THAT(record.records, testing::Contains("generalProcessingConf"));
    EXPECT_EQ(record.findings.size(), 10U);
}

}  // namespace
