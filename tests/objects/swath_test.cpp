#include "quo_base/swath.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstring>
#include <filesystem>
#include <string>
#include <vector>

#include "support/diagnostics.h"

namespace {

using testing::Each, testing::ElementsAre, testing::IsEmpty;

// A count beyond what a file can mean takes no memory. A missing single value once left the changes unread, beside
// an array of another length.
TEST(SwathFile, BringsAsManyChangesAsItTells) {
    const struct {
        const char *file, *from, *to;
        int status;
        std::vector<std::int32_t> bursts;
    } rows[] = {{".par", "changes = 3", "changes = 0", 0, {}},
                {".par", "29 803}", "29}", 1, {17, 29, 0}},
                {".par", "Rank", "other", 1, {17, 29, 803}},
                {".par", "changes = 3", "changes = 1048577", 1, {}},
                {".xml", "changes>3", "changes>2147483647", 1, {}}};
    const test::Report report;
    for (const auto& row : rows) {
        const std::string file = report.file(std::to_string(&row - rows));
        std::string text = test::read_text(QUO_TEST_DATA "/objects/SwathInfo" + std::string{row.file});
        if (const auto list = text.find("{0 0 0}"); list != text.npos) text.replace(list, 7, "{17 29 803}");
        test::write_text(file, text.replace(text.find(row.from), std::strlen(row.from), row.to));
        SwathInfo swath;
        EXPECT_EQ(swath.readhdr(file.c_str()), row.status) << row.to;
        EXPECT_EQ(swath.Swst_changes_bursts, row.bursts) << row.to;
    }
}

// --- burst times ----------------------------------------------------------------------------------------------

class BurstTimes : public testing::Test {
protected:
    /** Lays out a raster of three bursts of four lines, header bytes before them. */
    void make(int header = 0) {
        const std::string data = QUO_TEST_DATA "/objects/bursts";
        std::string description = test::read_text(data + ".hdr");
        description.replace(description.find("0</HeaderOffset>"), 1, std::to_string(header));
        test::write_text(name_ + ".hdr", description);
        test::write_text(name_, std::string(static_cast<std::size_t>(header), 'H') + test::read_text(data));
        describe(3, 4);
    }
    void describe(std::int32_t bursts, std::int32_t lines) {
        SwathInfo swath;
        swath.Bursts = bursts;
        swath.Lines_per_burst = lines;
        ASSERT_EQ(swath.writehdr((name_ + ".hdr").c_str()), 0);
    }
    /** What a failure leaves as it was comes with a clone. */
    void expect(int status, const std::vector<double>& times = {17.3}) {
        SwathInfo swath, copy;
        swath.BurstStartTimes = {17.3};
        EXPECT_EQ(swath.readBurstTimes(name_.c_str()), status);
        swath.Swst_changes_bursts = {17, 29};
        EXPECT_EQ(swath.clone(&copy), 0);
        EXPECT_THAT(copy.Swst_changes_bursts, ElementsAre(17, 29));
        EXPECT_EQ(copy.BurstStartTimes, times);
    }

    const test::Report report_;
    const std::string name_ = report_.file("raster");
    static constexpr double kFirst_s = 473299200.0 + 86400.0 * 1717 + 0.25;
    const std::vector<double> times_ = {kFirst_s, kFirst_s + 37.0, kFirst_s + 74.0};
};

// Only the headers of the bursts' first lines are needed.
TEST_F(BurstTimes, AreThoseOfTheFirstLineOfEachBurst) {
    for (const int header : {803, 0}) {
        make(header);
        expect(0, times_);
    }
    const std::string bytes = test::read_text(name_);
    const std::size_t needed = 2 * 4 * (5 * 2 + 17) + 17;
    test::write_text(name_, bytes.substr(0, needed));
    expect(0, times_);
    test::write_text(name_, bytes.substr(0, needed - 1));
    expect(4);
}

TEST_F(BurstTimes, RefuseHostileCounts) {
    make();
    constexpr std::int32_t kMost = 2147483647;
    const std::int32_t rows[][3] = {{kMost, 4, 4}, {3, kMost, 4}, {kMost, kMost, 1}, {4, 4, 4},
                                    {3, 0, 1},     {3, -4, 1},    {-999, 4, 1}};
    for (const auto& [bursts, lines, status] : rows) {
        SCOPED_TRACE(testing::Message() << bursts << " bursts of " << lines << " lines");
        describe(bursts, lines);
        expect(status);
    }
    describe(0, 4);
    expect(0, {});
    std::filesystem::remove(name_);
    expect(9);
    std::filesystem::remove(name_ + ".hdr");
    expect(1);
    for (const char* name : {"", static_cast<const char*>(nullptr)})
        EXPECT_EQ(SwathInfo{}.readBurstTimes(name), 1);
}

// --- the antenna pattern --------------------------------------------------------------------------------------

class Pattern : public testing::Test {
protected:
    Pattern() {
        pattern_.PatternSamples = 3;
        pattern_.Pattern = {1.5F, 0.0F, -0.25F};
        pattern_.PatternFile.setFilename(name_.c_str());
    }
    std::vector<float> samples(AntennaPattern_Obj& pattern, int status = 0) {
        std::vector<float> values(3, 803.5F);
        EXPECT_EQ(pattern.getPatternArray(values.data()), status);
        return values;
    }

    const test::Report report_;
    const std::string name_ = report_.file("pattern"), header_ = name_ + ".hdr";
    AntennaPattern_Obj pattern_, target_;
};

TEST_F(Pattern, LoadsItsSamplesOnceAndHasAsManyAsItsRaster) {
    ASSERT_EQ(pattern_.WritePatternArray() + pattern_.writehdr(), 0);
    pattern_.PatternSamples = 5;
    ASSERT_EQ(pattern_.writehdr(header_.c_str()), 0);
    ASSERT_EQ(target_.readhdr(header_.c_str()), 0);
    EXPECT_EQ(target_.PatternSamples, 3);
    EXPECT_THAT(target_.Pattern, ElementsAre(0.0F, 0.0F, 0.0F));
    test::fail_every_allocation([&] {
        AntennaPattern_Obj pattern;
        EXPECT_EQ(pattern.readhdr(header_.c_str()), 0);
        float values[3];
        return pattern.getPatternArray(values);
    });
    for (int twice = 0; twice < 2; ++twice) {
        EXPECT_THAT(samples(target_), ElementsAre(1.5F, 0.0F, -0.25F));
        EXPECT_THAT(target_.Pattern, ElementsAre(1.5F, 0.0F, -0.25F));
        std::filesystem::remove(name_);
    }
    DataFile raster;
    ASSERT_EQ(raster.read_hdr(name_.c_str()), 0);
    raster.NrOfPixelsPerLine = 2147483647;  // more than is plausible
    ASSERT_EQ(raster.write_hdr(), 0);
    EXPECT_EQ(target_.readhdr(header_.c_str()), 1);
    EXPECT_THAT(target_.Pattern, IsEmpty());
}

TEST_F(Pattern, RefusesWhatIsNoPattern) {
    EXPECT_THAT(samples(target_, 1), Each(803.5F));
    EXPECT_EQ(target_.getPatternArray(nullptr) + target_.WritePatternArray() + target_.writehdr() +
                  target_.readhdr(".hdr"),
              4);
    pattern_.Pattern.clear();
    pattern_.PatternFile.CellType = FLOAT_COMPLEX;
    EXPECT_THAT(samples(pattern_, 1), Each(803.5F));
    pattern_.PatternFile.CellType = FLOAT32;
    pattern_.PatternFile.NrOfPixelsPerLine = 3;
    EXPECT_THAT(samples(pattern_, 9), Each(803.5F));
    test::write_text(name_, "eleven byte");
    EXPECT_THAT(samples(pattern_, 4), Each(803.5F));
    pattern_.PatternSamples = AntennaPattern_Obj::kMaxPatternSamples + 1;
    EXPECT_EQ(pattern_.createBuffers(), 1);
    EXPECT_THAT(pattern_.Pattern, IsEmpty());
}

}  // namespace
