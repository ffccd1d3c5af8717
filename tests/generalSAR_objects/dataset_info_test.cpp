#include "quo_base/dataset_info.h"

#include <functional>
#include <map>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "sarutillib/ground/bounded_text.h"
#include "support/header_object_suite.h"

namespace {

using Info = DataSetInfo_Obj;
using test::real, test::text, test::whole;

constexpr auto kOptional = test::Presence::kOptional;
constexpr auto kXmlOnly = test::Presence::kXmlOnly;

struct DataSetInfo : test::HeaderCase {
    using Object = Info;
    static constexpr const char* kSection = "DataSetInfo";
    static constexpr test::FieldRow kRows[] = {
        text("OrbitNumber"),
        text("Track"),
        text("SenseDate"),
        text("SceneID"),
        text("Description"),
        text("AcquisitionStation"),
        text("ProcessingCenter"),
        text("ProcessingDate"),
        text("ProcessingSoftware"),
        real("SceneHeading"),
        text("OrbitConfiguration"),
        text("Polarization"),
        text("Swath"),
        real("SWST_MIN"),
        real("SWST_MAX"),
        real("RO_REF", 800000.0),
        whole("RangeLooks", 1, 1, 1000),
        real("RangeBandwidth", 0.0, 5),
        real("ExternalCalibrationFactor", 1.0),
        text("Projection", "PROJECTION UNDEFINED"),
        text("ImageType", "NOT SET").is(kOptional),
        whole("RGAntenna_flag", 0, 0, 1).is(kOptional),
        whole("AZAntenna_flag", 0, 0, 1).is(kOptional),
        whole("SpreadLoss_flag", 0, 0, 1).is(kOptional),
        whole("DroopGain_flag", 0, 0, 1).is(kOptional),
        whole("RGAntenna_AltitudeCorr_flag", 0, 0, 1).is(kOptional),
        whole("NoiseCorr_flag", 0, 0, 1).is(kOptional),
        text("SensorName", "SENSOR UNKNOWN").is(kOptional),
        text("AcquisitionMode", "ACQUISITION MODE UNDEFINED").is(kOptional),
        text("RefSystem", "REFERENCE SYSTEM UNDEFINED").is(kOptional),
        text("UnitType", "UNIT TYPE UNDEFINED").is(kOptional),
        whole("MissingLines", -1, 0, 2147483647).is(kOptional),
        whole("LookDirection", 0, 0, 2147483647).is(kXmlOnly),
    };
};
using Cases = testing::Types<DataSetInfo>;
}  // namespace
namespace test {
INSTANTIATE_TYPED_TEST_SUITE_P(Description, HeaderObject, Cases, CaseName);
}
namespace {

void put(char* member, std::string_view text) { quo::copy_bounded(member, 512, text); }

/** One enumeration with its setter, its test and its member, whatever its type. */
struct Classification {
    const char* name;
    std::function<int(Info&, int)> set;
    std::function<bool(const Info&, int)> is;
    std::function<char*(Info&)> member;
    std::vector<std::string> texts;  // by value
};

template <auto Set, auto Is, auto Member, typename Enumeration>
Classification classification(const char* name, std::vector<std::string> texts) {
    return {name, [](Info& info, int value) { return (info.*Set)(static_cast<Enumeration>(value)); },
            [](const Info& info, int value) { return (info.*Is)(static_cast<Enumeration>(value)); },
            [](Info& info) -> char* { return info.*Member; }, std::move(texts)};
}

std::vector<Classification> classifications() {
    return {classification<&Info::SetImageType, &Info::IsImageType, &Info::ImageType, Info::DSImageType>(
                "ImageType", {"NOT SET", "RANGE FOCUSED", "AZIMUTH FOCUSED", "RAW DATA", "MULTILOOK",
                              "INTERFEROMETRY", "FLAT EARTH", "COHERENCE MAP", "DEM", "SYNTHETIC FRINGES",
                              "DEM IMAGE TIMES MAP", "IMAGE HEIGHT MAP", "COREGISTERED SLANT RANGE COMPLEX IMAGE",
                              "PHASE UNWRAPPED", "RAW DATA ALIGNED"}),
            classification<&Info::SetSensorType, &Info::IsSensorType, &Info::SensorName, Info::DSSensorType>(
                "SensorName", {"SENSOR UNKNOWN", "ASAR", "RADARSAT", "ERS1", "ERS2", "PALSAR", "TERRA SAR-X",
                               "CSKS1", "CSKS2", "CSKS3", "CSKS4"}),
            classification<&Info::SetAcqMode, &Info::IsAcqMode, &Info::AcquisitionMode, Info::DSAcqMode>(
                "AcquisitionMode",
                {"ACQUISITION MODE UNDEFINED", "STRIPMAP", "DOUBLE POLARIZATION", "QUAD POLARIZATION", "SCANSAR"}),
            classification<&Info::SetProjection, &Info::IsProjection, &Info::Projection, Info::DSProjection>(
                "Projection", {"PROJECTION UNDEFINED", "GROUND RANGE", "SLANT RANGE", "GEOCODED"}),
            classification<&Info::SetUnitType, &Info::IsUnitType, &Info::UnitType, Info::DSUnitType>(
                "UnitType",
                {"UNIT TYPE UNDEFINED", "VOLT", "VOLT^2", "VOLTcomplex", "meter", "Radian", "Degree", "sec"}),
            classification<&Info::SetRefSys, &Info::IsRefSys, &Info::RefSystem, Info::DSRefSys>(
                "RefSystem", {"REFERENCE SYSTEM UNDEFINED", "WGS84", "EGM84"})};
}

TEST(DataSetInfoClassification, StoresAndRecognisesTheTextOfEachValue) {
    for (const Classification& kind : classifications()) {
        SCOPED_TRACE(kind.name);
        const int values = static_cast<int>(kind.texts.size());
        for (int set = -1; set <= values + 1; ++set) {
            Info info;
            const Info fresh;
            EXPECT_TRUE(kind.is(info, 0)) << "a new object is not classified";
            EXPECT_EQ(kind.set(info, set), 0);
            const bool listed = set >= 0 && set < values;
            EXPECT_EQ(kind.member(info), kind.texts[listed ? static_cast<std::size_t>(set) : 0]) << set;
            for (int asked = -1; asked <= values + 1; ++asked)
                EXPECT_EQ(kind.is(info, asked), asked == (listed ? set : 0)) << set << " is " << asked;
            if (listed && set > 0) {
                EXPECT_THAT(test::differing_fields(fresh, info), testing::ElementsAre(kind.name));
            }
        }
        for (const char* text : {"geocoded", "GEOCODED ", "", "wgs84", "DEM "}) {  // compared to the letter
            Info info;
            put(kind.member(info), text);
            for (int asked = 0; asked < values; ++asked) EXPECT_FALSE(kind.is(info, asked)) << text;
        }
    }
}

TEST(DataSetInfoType, SetsTheReferenceSystemOfGeocodedProductsOnly) {
    for (int projection = -1; projection <= 5; ++projection) {
        Info info;
        put(info.RefSystem, "LOCAL");
        put(info.Projection, "GEOCODED");  // the projection that counts is the new one
        EXPECT_EQ(info.SetType(Info::dsCoherenceMap, Info::dsTerraSarX, Info::dsScansar,
                               static_cast<Info::DSProjection>(projection), Info::dsVoltSquared, Info::dsEgm84),
                  0);
        EXPECT_STREQ(info.RefSystem, projection == Info::dsGeocoded ? "EGM84" : "LOCAL") << projection;
        EXPECT_STREQ(info.ImageType, "COHERENCE MAP");
        EXPECT_STREQ(info.SensorName, "TERRA SAR-X");
        EXPECT_STREQ(info.AcquisitionMode, "SCANSAR");
        EXPECT_STREQ(info.UnitType, "VOLT^2");
    }
}

TEST(DataSetInfoType, HoldsWhenAllSixHold) {
    Info info;
    info.SetType(Info::dsRawData, Info::dsErs2, Info::dsStripmap, Info::dsGeocoded, Info::dsMeter, Info::dsWgs84);
    for (int wrong = -1; wrong < 6; ++wrong) {
        int v[] = {3, 4, 1, 3, 4, 1};
        if (wrong >= 0) v[wrong] = 0;
        EXPECT_EQ(info.IsType(static_cast<Info::DSImageType>(v[0]), static_cast<Info::DSSensorType>(v[1]),
                              static_cast<Info::DSAcqMode>(v[2]), static_cast<Info::DSProjection>(v[3]),
                              static_cast<Info::DSUnitType>(v[4]), static_cast<Info::DSRefSys>(v[5])),
                  wrong < 0);
    }
}

TEST(DataSetInfoNumbers, FollowTheirTexts) {
    using Numbers = std::map<std::string, int>;
    const Numbers polarizations{{"H/H", 0}, {"V/V", 1}, {"H/V", 2}, {"V/H", 3}};
    // Deliberate: SS1 is 7, and the others share their numbers with IS3 to IS6.
    const Numbers swaths{{"SS1", 7}, {"SS2", 2}, {"SS3", 3}, {"SS4", 4}, {"SS5", 5}, {"IS1", 0},
                         {"IS2", 1}, {"IS3", 2}, {"IS4", 3}, {"IS5", 4}, {"IS6", 5}, {"IS7", 6}};
    std::vector<std::string> texts{"HH", "h/h", "IS8", "SS6", "IS", "", "NOT_AVAILABLE"};
    for (const Numbers* known : {&polarizations, &swaths})
        for (const auto& [text, number] : *known) texts.push_back(text);
    const auto number = [](const Numbers& known, const std::string& text) {
        return known.contains(text) ? known.at(text) : 666;
    };
    for (const std::string& text : texts) {
        Info info;
        put(info.Polarization, text);
        put(info.Swath, text);
        EXPECT_EQ(info.getPolarizationNbr(), number(polarizations, text)) << text;
        EXPECT_EQ(info.getISNbr(), number(swaths, text)) << text;
    }
}

TEST(DataSetInfoOrigin, IsTheProcessingCenter) {
    Info info;
    EXPECT_EQ(info.fillQUOREL(), 0);
    EXPECT_STREQ(info.ProcessingCenter, "QUOREL Vestra");
}

}  // namespace
