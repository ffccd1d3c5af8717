#include "quo_base/swath.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstring>
#include <filesystem>
#include <string>
#include <vector>

#include "quo_base/gen_utils.h"
#include "support/diagnostics.h"
#include "support/raster.h"

namespace {

using testing::Each, testing::ElementsAre, testing::IsEmpty;

// A count beyond what a file can mean takes no memory. A missing single value once left the changes unread, beside
// an array of another length.
TEST(SwathFile, BringsAsManyChangesAsItTells) {
    const struct {
        const char *file, *from, *to;
        int status;
        std::vector<std::int32_t> bursts;
    } rows[] = {{".par", "", "", 0, {17, 29, 803}},
                {".par", "changes = 3", "changes = 0", 0, {}},
                {".par", "Swst_changes_bursts", "other", 1, {0, 0, 0}},
                {".par", "29 803}", "29}", 1, {17, 29, 0}},
                {".par", "Rank", "other", 1, {17, 29, 803}},
                {".par", "changes = 3", "changes = 1048577", 1, {}},
                {".xml", "changes>3", "changes>2147483647", 1, {}}};
    const test::Report report;
    int files = 0;
    for (const auto& row : rows) {
        SCOPED_TRACE(row.to);
        std::string text = test::read_text(QUO_TEST_DATA "/objects/SwathInfo" + std::string{row.file});
        if (const auto list = text.find("{0 0 0}"); list != text.npos) text.replace(list, 7, "{17 29 803}");
        ASSERT_NE(text.find(row.from), text.npos);
        const std::string file = report.file("swath" + std::to_string(++files));
        test::write_text(file, text.replace(text.find(row.from), std::strlen(row.from), row.to));
        SwathInfo swath;
        EXPECT_EQ(swath.readhdr(file.c_str()), row.status);
        EXPECT_EQ(swath.Swst_changes_bursts, row.bursts);
    }
}

TEST(SwathFile, ClonesItsArrays) {
    SwathInfo source, target;
    source.Swst_changes_bursts = {17, 29};
    source.BurstStartTimes = {803457.3};
    EXPECT_EQ(source.clone(&target) + target.clone(&target), 0);
    EXPECT_THAT(target.Swst_changes_bursts, ElementsAre(17, 29));
    EXPECT_THAT(target.BurstStartTimes, ElementsAre(803457.3));
}

// --- burst times ----------------------------------------------------------------------------------------------

class BurstTimes : public testing::Test {
protected:
    static constexpr int kBursts = 3, kLines = 4, kSamples = 5;

    static double time_of(int burst) { return 473299200.0 + 86400.0 * 1717 + 37 * burst + 250000e-6; }

    /** Writes a raster of bursts, header bytes before them, and its description. */
    void make(int header = 0, int cell_type = INT16) {
        DataFile raster;
        raster.setFilename(name_.c_str());
        raster.NrOfPixelsPerLine = kSamples;
        raster.NrOfLinesPerImage = kBursts * kLines;
        raster.HeaderOffset = header;
        raster.RowPrefix = SwathInfo::kLineHeader;
        raster.CellType = cell_type;
        std::string bytes(static_cast<std::size_t>(header), 'H');
        for (int line = 0; line < kBursts * kLines; ++line) {
            const bool first = line % kLines == 0;
            MjdRecord record{};
            if (first) sec852mjd(time_of(line / kLines), &record);
            bytes.append(reinterpret_cast<const char*>(&record), sizeof record).append("flags");
            bytes.append(std::size_t{kSamples} * static_cast<std::size_t>(raster.element_sizeof()), 's');
        }
        test::write_text(name_, bytes);
        ASSERT_EQ(raster.write_hdr(), 0);
        describe(kBursts, kLines);
    }
    void describe(std::int32_t bursts, std::int32_t lines) {
        SwathInfo swath;
        swath.Bursts = bursts;
        swath.Lines_per_burst = lines;
        ASSERT_EQ(swath.writehdr((name_ + ".hdr").c_str()), 0);
    }
    void expect_status(int status) {
        SwathInfo swath;
        swath.BurstStartTimes = {17.3};
        EXPECT_EQ(swath.readBurstTimes(name_.c_str()), status);
        EXPECT_THAT(swath.BurstStartTimes, ElementsAre(17.3));
    }

    const test::Report report_;
    const std::string name_ = report_.file("raster");
};

// Only the headers of the bursts' first lines are needed.
TEST_F(BurstTimes, AreThoseOfTheFirstLineOfEachBurst) {
    for (const int type : {INT8, FLOAT_COMPLEX, INT16})
        for (const int header : {803, 0}) {
            make(header, type);
            SwathInfo swath;
            ASSERT_EQ(swath.readBurstTimes(name_.c_str()), 0);
            EXPECT_THAT(swath.BurstStartTimes, ElementsAre(time_of(0), time_of(1), time_of(2)));
        }
    const std::string bytes = test::read_text(name_);
    const std::size_t needed = 2 * kLines * (kSamples * 2 + 17) + 17;
    SwathInfo swath;
    test::write_text(name_, bytes.substr(0, needed));
    EXPECT_EQ(swath.readBurstTimes(name_.c_str()), 0);
    for (const std::size_t length : {needed - 1, std::size_t{17}, std::size_t{0}}) {
        test::write_text(name_, bytes.substr(0, length));
        expect_status(4);
    }
}

TEST_F(BurstTimes, RefuseHostileCounts) {
    make();
    constexpr std::int32_t kMost = 2147483647;
    const std::int32_t rows[][3] = {{kMost, 4, 4}, {3, kMost, 4}, {kMost, kMost, 1}, {4, 4, 4},
                                    {3, 0, 1},     {3, -4, 1},    {-999, 4, 1}};
    for (const auto& [bursts, lines, status] : rows) {
        SCOPED_TRACE(testing::Message() << bursts << " bursts of " << lines << " lines");
        describe(bursts, lines);
        expect_status(status);
    }
    describe(0, 4);
    EXPECT_EQ(SwathInfo{}.readBurstTimes(name_.c_str()), 0);
    std::filesystem::remove(name_);
    expect_status(9);
    std::filesystem::remove(name_ + ".hdr");
    expect_status(1);
    for (const char* name : {"", static_cast<const char*>(nullptr)})
        EXPECT_EQ(SwathInfo{}.readBurstTimes(name), 1);
}

// --- the antenna pattern --------------------------------------------------------------------------------------

class Pattern : public testing::Test {
protected:
    void make_pattern(AntennaPattern_Obj& pattern) {
        pattern.StartAngle = 17.25;
        pattern.DeltaAngle = 0.0625;
        pattern.PatternSamples = 3;
        pattern.Pattern = {1.5F, 0.0F, -0.25F};
        pattern.PatternFile.setFilename(name_.c_str());
    }
    void write_pattern() {
        AntennaPattern_Obj pattern;
        make_pattern(pattern);
        ASSERT_EQ(pattern.WritePatternArray(), 0);
        ASSERT_EQ(pattern.writehdr(), 0);
    }
    std::vector<float> samples(AntennaPattern_Obj& pattern, int status = 0) {
        std::vector<float> values(3, 803.5F);
        EXPECT_EQ(pattern.getPatternArray(values.data()), status);
        return values;
    }

    const test::Report report_;
    const std::string name_ = report_.file("pattern"), header_ = name_ + ".hdr";
};

TEST_F(Pattern, LoadsItsSamplesOnce) {
    write_pattern();
    AntennaPattern_Obj target;
    ASSERT_EQ(target.readhdr(header_.c_str()), 0);
    EXPECT_THAT(target.Pattern, Each(0.0F));
    EXPECT_THAT(samples(target), ElementsAre(1.5F, 0.0F, -0.25F));
    EXPECT_THAT(target.Pattern, ElementsAre(1.5F, 0.0F, -0.25F));
    std::filesystem::remove(name_);
    EXPECT_THAT(samples(target), ElementsAre(1.5F, 0.0F, -0.25F)) << "read again although loaded";
    write_pattern();
    test::fail_every_allocation([&] {
        AntennaPattern_Obj pattern;
        EXPECT_EQ(pattern.readhdr(header_.c_str()), 0);
        float values[3];
        return pattern.getPatternArray(values);
    });
}

TEST_F(Pattern, HasAsManySamplesAsItsRaster) {
    write_pattern();
    AntennaPattern_Obj more, target;
    make_pattern(more);
    more.PatternSamples = 5;
    ASSERT_EQ(more.writehdr(header_.c_str()), 0);
    ASSERT_EQ(target.readhdr(header_.c_str()), 0);
    EXPECT_EQ(target.PatternSamples, 3);
    EXPECT_EQ(target.Pattern.size(), 3U);
    DataFile raster;
    ASSERT_EQ(raster.read_hdr(name_.c_str()), 0);
    raster.NrOfPixelsPerLine = 2147483647;  // more than is plausible
    ASSERT_EQ(raster.write_hdr(), 0);
    EXPECT_EQ(target.readhdr(header_.c_str()), 1);
    EXPECT_THAT(target.Pattern, IsEmpty());
}

TEST_F(Pattern, RefusesWhatIsNoPattern) {
    AntennaPattern_Obj empty, pattern;
    EXPECT_THAT(samples(empty, 1), Each(803.5F));
    EXPECT_EQ(
        empty.getPatternArray(nullptr) + empty.WritePatternArray() + empty.writehdr() + empty.readhdr(".hdr"), 4);

    make_pattern(pattern);
    pattern.Pattern.clear();
    pattern.PatternFile.CellType = FLOAT_COMPLEX;
    EXPECT_THAT(samples(pattern, 1), Each(803.5F));
    pattern.PatternFile.CellType = FLOAT32;
    pattern.PatternFile.NrOfPixelsPerLine = 3;
    EXPECT_THAT(samples(pattern, 9), Each(803.5F));
    test::write_text(name_, "eleven byte");
    EXPECT_THAT(samples(pattern, 4), Each(803.5F));
    pattern.PatternSamples = AntennaPattern_Obj::kMaxPatternSamples + 1;
    EXPECT_EQ(pattern.createBuffers(), 1);
    EXPECT_THAT(pattern.Pattern, IsEmpty());
}

}  // namespace
