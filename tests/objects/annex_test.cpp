// SPDX-License-Identifier: Apache-2.0
#include "objects/records.h"
#include "support/diagnostics.h"
#include "support/raster.h"

// Droop gains and antenna patterns, out of binary files that name the place of their data set in a header of text.

namespace {

/** Two headers of fixed length, the offset of the data set in the second, the data set. */
std::string annex_file(std::string_view offset_text, std::size_t offset, std::string_view data) {
    constexpr std::size_t kHeaders = 1247 + 378, kOffsetPlace = 1247 + 231;
    std::string file(kHeaders, 'h');
    file.replace(kOffsetPlace, offset_text.size(), offset_text);
    file[kOffsetPlace + offset_text.size()] = '<';
    file.resize(std::max(offset, kHeaders), '?');
    return file.append(data);
}
std::string annex_file(std::size_t offset, std::string_view data) {
    return annex_file("+" + std::to_string(offset), offset, data);
}

/** A number of its own for each place of a record. */
float value(int record, int i) { return 17.25F * static_cast<float>(record) + 0.0625F * static_cast<float>(i); }
std::string droop_data() {
    std::string data(171232, 'x');
    for (int swath = 0; swath < 5; ++swath) {
        test::append_bytes(data, value(swath, 8), true);
        for (int i = 0; i < 8; ++i) test::append_bytes(data, double{value(swath, i)}, true);
    }
    data.resize(171648, 'y');
    return data;
}
std::string pattern_data() {
    std::string data;
    for (int i = 0; i < 32 * 203; ++i) test::append_bytes(data, value(i / 203, i % 203), true);
    return data;
}

class Annex : public testing::Test {
protected:
    Annex() {
        for (SensorAttitude_Obj* object : {&attitude_, &same_attitude_}) test::fill(*object);
        for (AntennaPattern_Obj* object : {&pattern_, &same_pattern_}) test::fill(*object);
    }
    int droop(const std::string& content, int swath) {
        test::write_text(file_, content);
        return attitude_.getDroopGain(file_.c_str(), swath);
    }
    int pattern(const std::string& content, int swath, int polarization) {
        test::write_text(file_, content);
        return pattern_.getPatternENVI(file_.c_str(), swath, polarization);
    }

    const test::Report report_;
    const std::string file_ = report_.file("annex");
    SensorAttitude_Obj attitude_, same_attitude_;
    AntennaPattern_Obj pattern_, same_pattern_;
};

TEST_F(Annex, HoldsDroopGainsAndTemperatureOfFiveSwaths) {
    for (int swath = 0; swath < 5; ++swath) {
        ASSERT_EQ(droop(annex_file(swath < 3 ? 1625 : 2017, droop_data()), swath), 0);
        EXPECT_EQ(attitude_.Temperature, double{value(swath, 8)});
        for (int i = 0; i < 8; ++i) EXPECT_EQ(attitude_.DroopGain[i], double{value(swath, i)}) << swath;
        EXPECT_THAT(test::differences(attitude_, same_attitude_),
                    testing::ElementsAre("DroopGain", "Temperature"));
    }
}

TEST_F(Annex, HoldsThePatternOfEverySwathAndPolarization) {
    for (int record = 0; record < 32; ++record) {
        ASSERT_EQ(pattern(annex_file(2017, pattern_data()), record / 4, record % 4), 0);
        EXPECT_EQ(pattern_.StartAngle, double{value(record, 0)});
        EXPECT_EQ(pattern_.DeltaAngle, double{value(record, 1)});
        std::vector<float> expected;
        for (int i = 2; i < 203; ++i) expected.push_back(value(record, i));
        EXPECT_EQ(pattern_.PatternSamples, 201);
        EXPECT_EQ(pattern_.Pattern, expected);
    }
}

TEST_F(Annex, ChangesNothingWhereItIsBad) {
    const std::string droops = annex_file(1700, droop_data()), patterns = annex_file(1700, pattern_data());
    for (const auto& [offset, status] : {std::pair{"offset", 1},
                                         {"        ", 1},
                                         {"-1625", 1},
                                         {"000000000012345678", 4},
                                         {"99999999999999999999999", 4}}) {
        EXPECT_EQ(droop(annex_file(offset, 1625, droop_data()), 2), status) << offset;
        EXPECT_EQ(pattern(annex_file(offset, 1625, pattern_data()), 0, 0), status) << offset;
    }
    EXPECT_EQ(report_.entries("ERROR_CALL_TREE").size(), 10U);
    for (const std::size_t length : {0U, 1246U, 1247U, 1624U, 1625U, 1699U, 1700U}) {
        EXPECT_EQ(droop(droops.substr(0, length), 0), 4) << length;
        EXPECT_EQ(pattern(patterns.substr(0, length), 0, 0), 4) << length;
    }
    for (const std::size_t length : {172931U, 173347U}) EXPECT_EQ(droop(droops.substr(0, length), 0), 4) << length;
    EXPECT_EQ(pattern(patterns.substr(0, patterns.size() - 1), 0, 0), 4);
    for (const int swath : {-1, 5, 2147483647, -2147483647}) EXPECT_EQ(droop(droops, swath), 0);
    for (const int bad : {-1, 8, 666}) EXPECT_EQ(pattern(patterns, bad, 0), 1);
    for (const int bad : {-1, 4, 666}) EXPECT_EQ(pattern(patterns, 0, bad), 1);
    for (const char* missing : {"/nowhere", static_cast<const char*>(nullptr)})
        EXPECT_EQ(attitude_.getDroopGain(missing, 0), 9);
    EXPECT_THAT(test::differences(attitude_, same_attitude_), testing::IsEmpty());
    EXPECT_THAT(test::differences(pattern_, same_pattern_), testing::IsEmpty());
    test::write_text(file_, droops);
    test::fail_every_allocation([&] { return attitude_.getDroopGain(file_.c_str(), 3); });
}

}  // namespace
