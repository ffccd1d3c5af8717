#include "quo_base/swath.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <utility>
#include <vector>

#include "annex_files.h"
#include "quo_base/gen_utils.h"
#include "support/diagnostics.h"
#include "support/fields.h"
#include "support/limits.h"
#include "support/raster.h"

namespace {

using test::real, test::whole;
using testing::Each, testing::ElementsAre, testing::IsEmpty;

constexpr const char* kSection = "SwathInfo";
constexpr test::FieldRow kRows[] = {
    whole("Rank", -999),
    real("Rgate_bias"),
    whole("Echoes_per_burst", -999),
    whole("Lines_per_burst", -999),
    whole("Bursts", -999),
    whole("Order", -999),
    real("Acquisition_Start_Time"),
    whole("Swst_changes", -999),
    real("ProcessorGain", 1.0),
    real("NoisePower"),
    real("ChirpPower"),
};

/** The swath as a parameter file, `changes` values under Swst_changes_bursts. */
std::string profile(SwathInfo& swath, std::int32_t changes, const std::string& values) {
    test::fill_fields(swath);
    swath.Swst_changes = changes;
    return test::profile_text(swath, kSection, kRows) + values;
}

class SwathFile : public testing::Test {
protected:
    std::string file(const std::string& content) {
        std::string name = report_.file("header" + std::to_string(++files_));
        test::write_text(name, content);
        return name;
    }
    const test::Report report_;
    int files_ = 0;
};

TEST_F(SwathFile, ComesBackFromItsSection) {
    SwathInfo source, target;
    test::expect_fields(source, kRows);
    test::fill_fields(source);
    source.Swst_changes = 3;
    const std::string name = report_.file("swath.xml");
    ASSERT_EQ(source.writehdr(name.c_str()), 0);
    EXPECT_EQ(test::child_names(test::read_text(name), kSection), test::field_names(source));
    ASSERT_EQ(target.readhdr(name.c_str()), 0);
    EXPECT_THAT(test::differing_fields(source, target), IsEmpty());
    EXPECT_THAT(target.Swst_changes_bursts, ElementsAre(0, 0, 0));
}

TEST_F(SwathFile, ReadsTheChangesOfAParameterFile) {
    SwathInfo source, target, without;
    EXPECT_EQ(target.readhdr(file(profile(source, 3, "Swst_changes_bursts = {17 29 803}\n")).c_str()), 0);
    EXPECT_THAT(test::differing_fields(source, target), IsEmpty());
    EXPECT_THAT(target.Swst_changes_bursts, ElementsAre(17, 29, 803));
    EXPECT_EQ(without.readhdr(file(profile(source, 0, "Swst_changes_bursts = {17 29 803}\n")).c_str()), 0);
    EXPECT_THAT(without.Swst_changes_bursts, IsEmpty());
}

TEST_F(SwathFile, RefusesMissingKeys) {
    SwathInfo source, target;
    std::vector<std::string> contents{profile(source, 3, ""),
                                      profile(source, 3, "Swst_changes_bursts = {17 29}\n")};
    source.Swst_changes = 0;
    for (const test::FieldRow& row : kRows)
        contents.push_back(test::profile_text(source, kSection, kRows, row.key));
    for (const std::string& content : contents) EXPECT_EQ(target.readhdr(file(content).c_str()), 1) << content;

    // A missing single value once left the changes unread, beside an array of another length.
    source.Swst_changes = 3;
    const std::string changes = "Swst_changes_bursts = {17 29 803}\n";
    EXPECT_EQ(target.readhdr(file(test::profile_text(source, kSection, kRows, "Rank") + changes).c_str()), 1);
    EXPECT_THAT(target.Swst_changes_bursts, ElementsAre(17, 29, 803));
}

// A count far beyond what a file can mean takes no memory.
TEST_F(SwathFile, RefusesCountsThatNoSwathHas) {
    for (const std::int32_t changes : {2147483647, SwathInfo::kMaxSwstChanges + 1}) {
        SwathInfo source, target;
        test::fill_fields(source);
        source.Swst_changes = changes;
        const std::string header = report_.file("hostile.xml");
        ASSERT_EQ(source.writehdr(header.c_str()), 0);
        for (const std::string& name : {header, file(profile(source, changes, "Swst_changes_bursts = {1}\n"))}) {
            EXPECT_EQ(target.readhdr(name.c_str()), 1);
            EXPECT_THAT(target.Swst_changes_bursts, IsEmpty());
        }
    }
}

TEST_F(SwathFile, ClonesItsArrays) {
    SwathInfo source, target;
    test::fill_fields(source, 1);
    test::fill_fields(target, 2);
    source.Swst_changes_bursts = {17, 29};
    source.BurstStartTimes = {803457.3};
    EXPECT_EQ(source.clone(&target), 0);
    EXPECT_THAT(test::differing_fields(source, target), IsEmpty());
    EXPECT_THAT(target.Swst_changes_bursts, ElementsAre(17, 29));
    EXPECT_THAT(target.BurstStartTimes, ElementsAre(803457.3));
    EXPECT_EQ(target.destroyBuffers(), 0);
    EXPECT_EQ(source.clone(&source), 0);
    EXPECT_THAT(source.Swst_changes_bursts, ElementsAre(17, 29));
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

TEST_F(BurstTimes, AreThoseOfTheFirstLineOfEachBurst) {
    for (const int type : {INT8, INT16, FLOAT_COMPLEX})
        for (const int header : {0, 803}) {
            make(header, type);
            SwathInfo swath;
            ASSERT_EQ(swath.readBurstTimes(name_.c_str()), 0);
            EXPECT_THAT(swath.BurstStartTimes, ElementsAre(time_of(0), time_of(1), time_of(2)));
        }
}

TEST_F(BurstTimes, NeedOnlyTheHeadersOfTheFirstLines) {
    make();
    const std::string bytes = test::read_text(name_);
    const std::size_t needed = 2 * kLines * (kSamples * 2 + 17) + 17;
    SwathInfo swath;
    test::write_text(name_, bytes.substr(0, needed));
    EXPECT_EQ(swath.readBurstTimes(name_.c_str()), 0);
    for (const std::size_t length : {needed - 1, needed / 2, std::size_t{17}, std::size_t{0}}) {
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
    SwathInfo none;
    describe(0, 4);
    EXPECT_EQ(none.readBurstTimes(name_.c_str()), 0);
    EXPECT_THAT(none.BurstStartTimes, IsEmpty());
}

TEST_F(BurstTimes, PassOnWhatFails) {
    expect_status(1);  // no description
    make();
    std::filesystem::remove(name_);
    expect_status(9);
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

TEST_F(Pattern, ComesBackFromItsFiles) {
    write_pattern();
    std::string line;
    for (const float value : {1.5F, 0.0F, -0.25F}) test::append_bytes(line, value, false);
    EXPECT_EQ(test::read_text(name_), line);

    AntennaPattern_Obj source, target;
    const test::FieldRow rows[] = {real("StartAngle"), real("DeltaAngle"),
                                   whole("PatternSamples", 0, 0, 10000).is(test::Presence::kOptional)};
    test::expect_fields(source, rows);
    make_pattern(source);
    ASSERT_EQ(target.readhdr(header_.c_str()), 0);
    EXPECT_THAT(test::differing_fields(source, target), IsEmpty());
    EXPECT_EQ(target.PatternFile.FileName, name_);
    EXPECT_THAT(target.Pattern, Each(0.0F));
    EXPECT_THAT(samples(target), ElementsAre(1.5F, 0.0F, -0.25F));
    EXPECT_THAT(target.Pattern, ElementsAre(1.5F, 0.0F, -0.25F));
    std::filesystem::remove(name_);
    EXPECT_THAT(samples(target), ElementsAre(1.5F, 0.0F, -0.25F)) << "read again although loaded";
    AntennaPattern_Obj copy;
    EXPECT_EQ(source.clone(&copy), 0);
    EXPECT_THAT(test::differing_fields(source, copy), IsEmpty());
    EXPECT_EQ(copy.Pattern, source.Pattern);
    EXPECT_EQ(copy.PatternFile.FileName, name_);
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

TEST_F(Pattern, FallsBackToTheParameterFile) {
    const std::string start = "[AntennaPattern]\nStartAngle = 17.25\n", delta = "DeltaAngle = 0.0625\n",
                      raster =
                          "[RasterInfo]\nHeaderOffset = 0\nRowPrefix = 0\nNrOfPixelsPerLine = 3\n"
                          "NrOfLinesPerImage = 1\nCellType = FLOAT32\nByteOrder = LSBFirst\n";
    const std::pair<std::string, int> rows[] = {{start + delta + raster, 0},
                                                {start + delta + "PatternSamples = 17\n" + raster, 0},
                                                {start + raster, 1},
                                                {"[AntennaPattern]\n" + delta + raster, 1},
                                                {start + delta, 1}};
    for (const auto& [content, status] : rows) {
        const std::string header = report_.file(std::to_string(content.size()) + ".hdr");
        test::write_text(header, content);
        AntennaPattern_Obj pattern;
        EXPECT_EQ(pattern.readhdr(header.c_str()), status) << content;
        EXPECT_EQ(pattern.PatternSamples == 3 && pattern.StartAngle == 17.25, status == 0);
    }
    EXPECT_GE(report_.entries("ERROR_CALL_TREE").size(), 1U) << "a failing raster read is reported";
}

TEST_F(Pattern, RefusesWhatIsNoPattern) {
    AntennaPattern_Obj empty, complex, hostile, nameless;
    EXPECT_THAT(samples(empty, 1), Each(803.5F));
    EXPECT_EQ(empty.getPatternArray(nullptr), 1);
    EXPECT_EQ(empty.WritePatternArray(), 1);
    EXPECT_EQ(nameless.writehdr(), 1);
    EXPECT_EQ(nameless.readhdr(".hdr"), 1);

    make_pattern(complex);
    {
        const test::FullDisk full{5};
        EXPECT_EQ(complex.WritePatternArray(), 5);
        EXPECT_EQ(complex.writehdr(), 1);
    }
    std::filesystem::remove(name_);
    complex.Pattern.clear();
    complex.PatternFile.CellType = FLOAT_COMPLEX;
    EXPECT_THAT(samples(complex, 1), Each(803.5F));
    complex.PatternFile.CellType = FLOAT32;
    complex.PatternFile.NrOfPixelsPerLine = 3;
    complex.PatternFile.NrOfLinesPerImage = 1;
    EXPECT_THAT(samples(complex, 9), Each(803.5F));
    test::write_text(name_, "eleven byte");
    EXPECT_THAT(samples(complex, 4), Each(803.5F));

    hostile.PatternSamples = AntennaPattern_Obj::kMaxPatternSamples + 1;
    EXPECT_EQ(hostile.createBuffers(), 1);
    EXPECT_THAT(hostile.Pattern, IsEmpty());
}

TEST_F(Pattern, FailsWithoutMemory) {
    write_pattern();
    test::fail_every_allocation([&] {
        AntennaPattern_Obj pattern;
        EXPECT_EQ(pattern.readhdr(header_.c_str()), 0);
        float values[3];
        return pattern.getPatternArray(values);
    });
}

// --- patterns of an annex file --------------------------------------------------------------------------------

float annex_value(int record, int i) {
    return 17.25F * static_cast<float>(record) + 0.0625F * static_cast<float>(i);
}

std::string annex_data() {
    std::string data;
    for (int record = 0; record < 32; ++record)
        for (int i = 0; i < 203; ++i) test::append_bytes(data, annex_value(record, i), true);
    return data;
}

TEST_F(Pattern, ComesFromItsRecordOfAnAnnexFile) {
    test::write_text(name_, test::annex_file(2017, annex_data()));
    for (int swath = 0; swath < 8; ++swath)
        for (int polarization = 0; polarization < 4; ++polarization) {
            AntennaPattern_Obj pattern;
            const int record = 4 * swath + polarization;
            ASSERT_EQ(pattern.getPatternENVI(name_.c_str(), swath, polarization), 0);
            EXPECT_EQ(pattern.StartAngle, static_cast<double>(annex_value(record, 0)));
            EXPECT_EQ(pattern.DeltaAngle, static_cast<double>(annex_value(record, 1)));
            ASSERT_EQ(pattern.PatternSamples, 201);
            ASSERT_EQ(pattern.Pattern.size(), 201U);
            for (int i = 0; i < 201; ++i)
                ASSERT_EQ(pattern.Pattern[static_cast<std::size_t>(i)], annex_value(record, 2 + i));
        }
}

TEST_F(Pattern, RefusesABadAnnexFile) {
    AntennaPattern_Obj pattern, same;
    make_pattern(pattern);
    make_pattern(same);
    const auto expect = [&](const std::string& content, int swath, int polarization, int status) {
        test::write_text(name_, content);
        EXPECT_EQ(pattern.getPatternENVI(name_.c_str(), swath, polarization), status);
        EXPECT_THAT(test::differing_fields(pattern, same), IsEmpty());
        EXPECT_EQ(pattern.Pattern, same.Pattern);
    };
    const std::string whole_file = test::annex_file(1700, annex_data());
    for (const int bad : {-1, 8, 666}) expect(whole_file, bad, 0, 1);
    for (const int bad : {-1, 4, 666}) expect(whole_file, 0, bad, 1);
    for (const test::BadOffset& row : test::kBadOffsets)
        expect(test::annex_file(row.offset_text, 1700, annex_data()), 0, 0, row.status);
    for (const std::size_t length : {std::size_t{0}, std::size_t{1624}, std::size_t{1700}, whole_file.size() - 1})
        expect(whole_file.substr(0, length), 0, 0, 4);
}

}  // namespace
