#include "quo_base/dataset_info.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <map>
#include <string>
#include <string_view>
#include <vector>

#include "support/fields.h"

namespace {

using Info = DataSetInfo_Obj;
void put(char* member, std::string_view text) { member[text.copy(member, 511)] = 0; }

/** Sets and asks for every value of one enumeration, and some beyond: its texts are those that its field lists. */
template <auto kSet, auto kIs, auto kMember, typename Enumeration>
void expect_texts(const char* name, std::vector<std::string> texts = {}) {
    SCOPED_TRACE(name);
    const Info fresh;
    for (int i = 0; i < fresh.elementCount(); ++i)
        if (fresh.element(i)->name == std::string_view{name})
            texts.insert(texts.end(), fresh.element(i)->rule.texts.begin(), fresh.element(i)->rule.texts.end());
    const int values = static_cast<int>(texts.size());
    ASSERT_GT(values, 2);
    for (int set = -1; set <= values + 1; ++set) {
        Info info;
        EXPECT_TRUE((info.*kIs)(Enumeration{})) << "a new object is not classified";
        EXPECT_EQ((info.*kSet)(static_cast<Enumeration>(set)), 0);
        const int expected = set >= 0 && set < values ? set : 0;
        EXPECT_EQ(info.*kMember, texts[static_cast<std::size_t>(expected)]) << set;
        for (int asked = -1; asked <= values + 1; ++asked)
            EXPECT_EQ((info.*kIs)(static_cast<Enumeration>(asked)), asked == expected) << set << " is " << asked;
        if (expected > 0) {
            EXPECT_THAT(test::differing_fields(fresh, info), testing::ElementsAre(name));
        }
    }
    for (const char* text : {"geocoded", "GEOCODED ", "", "wgs84", "DEM "}) {  // compared to the letter
        Info info;
        put(info.*kMember, text);
        for (int asked = 0; asked < values; ++asked) EXPECT_FALSE((info.*kIs)(static_cast<Enumeration>(asked)));
    }
}

TEST(DataSetInfoClassification, StoresAndRecognisesTheTextOfEachValue) {
    expect_texts<&Info::SetImageType, &Info::IsImageType, &Info::ImageType, Info::DSImageType>("ImageType");
    expect_texts<&Info::SetAcqMode, &Info::IsAcqMode, &Info::AcquisitionMode, Info::DSAcqMode>("AcquisitionMode");
    expect_texts<&Info::SetProjection, &Info::IsProjection, &Info::Projection, Info::DSProjection>("Projection");
    expect_texts<&Info::SetUnitType, &Info::IsUnitType, &Info::UnitType, Info::DSUnitType>("UnitType");
    expect_texts<&Info::SetRefSys, &Info::IsRefSys, &Info::RefSystem, Info::DSRefSys>("RefSystem");
    expect_texts<&Info::SetSensorType, &Info::IsSensorType, &Info::SensorName, Info::DSSensorType>(
        "SensorName", {"SENSOR UNKNOWN", "ASAR", "RADARSAT", "ERS1", "ERS2", "PALSAR", "TERRA SAR-X", "CSKS1",
                       "CSKS2", "CSKS3", "CSKS4"});
}

TEST(DataSetInfoType, SetsTheReferenceSystemOfGeocodedProductsOnly) {
    for (int projection = -1; projection <= 5; ++projection) {
        Info info;
        put(info.RefSystem, "LOCAL");
        put(info.Projection, "GEOCODED");  // the projection that counts is the new one
        const auto type = static_cast<Info::DSProjection>(projection);
        EXPECT_EQ(
            info.SetType(Info::dsRawData, Info::dsErs2, Info::dsStripmap, type, Info::dsMeter, Info::dsEgm84), 0);
        EXPECT_STREQ(info.RefSystem, projection == Info::dsGeocoded ? "EGM84" : "LOCAL") << projection;
        if (projection != Info::dsGeocoded) continue;
        for (int wrong = -1; wrong < 6; ++wrong) {  // it holds when all six hold
            int v[] = {Info::dsRawData, Info::dsErs2, Info::dsStripmap, projection, Info::dsMeter, Info::dsEgm84};
            if (wrong >= 0) v[wrong] = 0;
            EXPECT_EQ(info.IsType(static_cast<Info::DSImageType>(v[0]), static_cast<Info::DSSensorType>(v[1]),
                                  static_cast<Info::DSAcqMode>(v[2]), static_cast<Info::DSProjection>(v[3]),
                                  static_cast<Info::DSUnitType>(v[4]), static_cast<Info::DSRefSys>(v[5])),
                      wrong < 0);
        }
    }
}

// SS1 has a number of its own; the other wide swaths share those of IS3 to IS6.
TEST(DataSetInfoNumbers, FollowTheirTexts) {
    using Numbers = std::map<std::string, int>;
    const Numbers polarizations{{"H/H", 0},  {"V/V", 1},   {"H/V", 2}, {"V/H", 3},
                                {"HH", 666}, {"h/h", 666}, {"", 666}};
    const Numbers swaths{{"SS1", 7}, {"SS2", 2}, {"SS3", 3},   {"SS4", 4},   {"SS5", 5},
                         {"IS1", 0}, {"IS2", 1}, {"IS3", 2},   {"IS4", 3},   {"IS5", 4},
                         {"IS6", 5}, {"IS7", 6}, {"IS8", 666}, {"SS6", 666}, {"IS", 666}};
    Info info;
    for (const auto& [text, number] : polarizations) {
        put(info.Polarization, text);
        EXPECT_EQ(info.getPolarizationNbr(), number) << text;
    }
    for (const auto& [text, number] : swaths) {
        put(info.Swath, text);
        EXPECT_EQ(info.getISNbr(), number) << text;
    }
    EXPECT_EQ(info.fillQUOREL(), 0);
    EXPECT_STREQ(info.ProcessingCenter, "QUOREL Vestra");
}

}  // namespace
