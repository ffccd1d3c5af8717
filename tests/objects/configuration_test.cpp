#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/inotify.h>
#include <unistd.h>

#include <cstring>
#include <filesystem>
#include <string>
#include <vector>

#include "quo_base/generalSAR_configuration.h"
#include "support/diagnostics.h"
#include "support/fields.h"
#include "support/limits.h"

namespace {

using testing::HasSubstr, testing::Not;

// The records' own fields are tested with those of every other header object.
class Configuration : public testing::Test {
protected:
    test::Report report_;
    std::string file_ = report_.file("configuration.xml");
};

// A default outside its own bounds would be refused as soon as it is written and checked.
TEST_F(Configuration, RecordsHaveDefaultsWithinTheirBounds) {
    for (const char* name : GeneralSAR_ConfigurationRecord::names()) {
        const auto record = GeneralSAR_ConfigurationRecord::make(name);
        record->writepar(file_.c_str(), 1);
        for (int i = 0; i < record->elementCount(); ++i) EXPECT_STRNE(record->meaning(i), "") << name << i;
    }
    ConfigurationReview review;
    ASSERT_EQ(reviewConfiguration(file_.c_str(), 1, review), 0);
    EXPECT_EQ(review.records.size(), 11U);
    EXPECT_EQ(review.findings.size(), 0U);
    EXPECT_EQ(GeneralSAR_ConfigurationRecord::make("AzimuthCon"), nullptr);
}

// They are input only: what a file lacks stays.
TEST_F(Configuration, SharedParametersAreReadAndClonedButNotWritten) {
    const auto fields = test::listed_fields("GeneralSAR_BaseConfiguration");
    ASSERT_EQ(fields.size(), 5U);
    GeneralSAR_BaseConfiguration plain;
    for (int i = 0; i < 5; ++i)
        EXPECT_EQ(test::described(plain.sharedParameter(i)) + "," + GeneralSAR_BaseConfiguration::sharedUnit(i) +
                      "," + GeneralSAR_BaseConfiguration::sharedMeaning(i),
                  fields[static_cast<std::size_t>(i)].description);
    GeocodingConf record, copy;
    DemExtractorConf other;
    record.writepar(file_.c_str(), 2);
    EXPECT_THAT(test::read_text(file_), Not(HasSubstr("generalProcessingConf")));
    quorelxml document{file_.c_str()};
    const std::int32_t memory = 2048, level = 3;
    const char* name = "focus.txt";
    document.writeInt(2, "generalProcessingConf/Memory", &memory, 1);
    document.writeInt(2, "generalProcessingConf/ReportLevel", &level, 1);
    document.writeString(2, "generalProcessingConf/ReportFilename", &name, 1);
    document.write();
    record.Verbose = 17;
    ASSERT_EQ(record.readpar(file_.c_str(), 2) + record.clone(&copy), 0);
    for (const auto* shown : {&record, &copy}) {
        EXPECT_EQ(shown->Memory, 2048);
        EXPECT_EQ(shown->ReportLevel, 3);
        EXPECT_STREQ(shown->ReportFilename, "focus.txt");
        EXPECT_EQ(shown->Verbose, 17);
    }
    EXPECT_EQ(record.clone(&plain), 1);
    EXPECT_EQ(record.clone(&other), 1);
    EXPECT_EQ(record.clone(nullptr) + plain.clone(nullptr), 2);
}

TEST_F(Configuration, ContainerClonesAndWritesWhatIsEnabled) {
    GeneralSAR_configuration written, cloned;
    for (const GScObject object : {gscAzimuthConf, gscFinefitestConf, static_cast<GScObject>(6)})
        EXPECT_EQ(written.GSenable(object), object == 6 ? 1 : 0);
    written.azimuth.LinesInBlock = 4321;
    cloned.GSenable(gscExtractorConf);
    EXPECT_EQ(written.GSclone(nullptr), 1);
    EXPECT_EQ(written.GSclone(&cloned), 0);
    EXPECT_EQ(cloned.azimuth.LinesInBlock, 4321);
    for (int i = 0; i < 6; ++i)  // absent records leave the other container alone
        EXPECT_EQ(cloned.GSexists(static_cast<GScObject>(i)),
                  i == gscAzimuthConf || i == gscExtractorConf || i == gscFinefitestConf);
    cloned.GSdisable(gscExtractorConf);
    EXPECT_EQ(cloned.GSwrite(file_.c_str(), 1), 0);
    EXPECT_THAT(test::read_text(file_), testing::AllOf(HasSubstr("<AzimuthConf>"), HasSubstr("<FinefitestConf>"),
                                                       Not(HasSubstr("ExtractorConf"))));
}

// Saved as a whole, with the bytes of writing record by record.
TEST_F(Configuration, ContainerReadsAllOrThrowsAtTheFirst) {
    const std::string other = report_.file("one_by_one.xml"), missing = report_.file("missing.xml");
    GeneralSAR_configuration all, read, partial;
    for (int i = 0; i < 6; ++i) {
        all.GSenable(static_cast<GScObject>(i));
        ASSERT_EQ(all.GSget(static_cast<GScObject>(i))->writepar(other.c_str(), 1), 0);
    }
    const std::string complete = test::read_text(other);
    test::write_text(file_, "");
    {
        const test::CapturedStderr silent;
        const test::FullDisk full{complete.size() / 2};
        EXPECT_THROW(all.GSwrite(file_.c_str(), 1), quorelException);
    }
    EXPECT_EQ(test::read_text(file_), "");
    ASSERT_EQ(all.GSwrite(file_.c_str(), 1), 0);
    EXPECT_EQ(test::read_text(file_), complete);
    ASSERT_EQ(read.GSread(file_.c_str(), 1), 0);
    test::write_text(file_, test::without_element(test::read_text(file_), "ExtractorConf"));
    EXPECT_THROW(partial.GSread(file_.c_str(), 1), quorelException);
    for (int i = 0; i < 6; ++i) {
        EXPECT_TRUE(read.GSexists(static_cast<GScObject>(i))) << i;
        EXPECT_EQ(partial.GSexists(static_cast<GScObject>(i)), i <= gscExtractorConf)
            << i << ": set before it was read";
    }
    const test::CapturedStderr silent;
    EXPECT_EQ(partial.GSread(missing.c_str(), 1), 1);
    EXPECT_EQ(report_.messages("ERROR").back(), "File : " + missing + " DOES NOT EXIST!");
    EXPECT_EQ(partial.GSread(nullptr, 1), 1);
    EXPECT_THROW(all.GSwrite(report_.file("no_such_folder/c.xml").c_str(), 1), quorelException);
}

// What six records and the shared parameters say is parsed once; the other look tells whether the file is there.
TEST_F(Configuration, ContainerOpensItsFileTwice) {
    GeneralSAR_configuration all;
    for (int i = 0; i < 6; ++i) all.GSenable(static_cast<GScObject>(i));
    ASSERT_EQ(all.GSwrite(file_.c_str(), 1), 0);
    const int watch = inotify_init1(IN_NONBLOCK);
    ASSERT_GE(inotify_add_watch(watch, file_.c_str(), IN_OPEN | IN_CLOSE), 0);
    ASSERT_EQ(all.GSread(file_.c_str(), 1), 0);
    char events[100 * sizeof(inotify_event)];  // of a file that is watched itself they bear no name
    EXPECT_EQ(read(watch, events, sizeof events), 2 * 2 * static_cast<ssize_t>(sizeof(inotify_event)));
    close(watch);
}

TEST_F(Configuration, GeneralRecordReadsAtConstruction) {
    generalProcessingConf written;
    written.Flag_rgpatt = 0;
    written.writepar(file_.c_str(), 1);
    EXPECT_EQ(generalProcessingConf(file_.c_str(), 1).Flag_rgpatt, 0);
    EXPECT_THROW(generalProcessingConf(report_.file("missing.xml").c_str(), 1), quorelException);
}

// --- files that mean no good ------------------------------------------------------------------------------------

class DamagedConfiguration : public Configuration {
protected:
    static std::string good(const std::string& file) {
        DCestConf{}.writepar(file.c_str(), 1);
        DemExtractorConf{}.writepar(file.c_str(), 1);
        return test::read_text(file);
    }
};

/** "{3*ab}" as "ababab". */
std::string unfolded(const std::string& text) {
    const auto start = text.find('{'), star = text.find('*'), end = text.find('}');
    if (start == text.npos) return text;
    std::string all = text.substr(0, start);
    for (int i = std::stoi(text.substr(start + 1)); i > 0; --i) all += text.substr(star + 1, end - star - 1);
    return all + text.substr(end + 1);
}

TEST_F(DamagedConfiguration, IsReviewedAndReadWithoutLoss) {
    const std::string whole = good(file_);
    for (const std::vector<std::string>& row : test::read_table("objects/damaged_configurations.txt", '|')) {
        SCOPED_TRACE(row[0]);
        std::string text = whole;
        ASSERT_NE(text.find(row[1]), text.npos);
        test::write_text(file_, text.replace(text.find(row[1]), row[1].size(), unfolded(row[2])));
        ConfigurationReview review;
        ASSERT_EQ(reviewConfiguration(file_.c_str(), 1, review), 0);
        ASSERT_EQ(review.findings.size() + 3, row.size());
        for (std::size_t i = 3; i < row.size(); ++i) {
            const auto& [section, name, reason] = review.findings[i - 3];
            std::string line = section;
            line.append("/").append(name).append(" ").append(reason);
            EXPECT_THAT(line, testing::StartsWith(row[i]));
        }
        EXPECT_THAT(review.records, testing::UnorderedElementsAre("DCestConf", "DemExtractorConf"));

        DCestConf doppler;
        DemExtractorConf dem;
        const auto read = [&] { doppler.readpar(file_.c_str(), 1), dem.readpar(file_.c_str(), 1); };
        if (text.find("<Blocks>") == text.npos) {
            EXPECT_THROW(read(), quorelException);
        } else {
            EXPECT_NO_THROW(read());
            EXPECT_LT(std::strlen(dem.SRTMDirectory), sizeof dem.SRTMDirectory);
        }
    }
}

// What is no header at all: the review refuses it.
TEST_F(DamagedConfiguration, ThatIsNoDocumentIsRefused) {
    const std::string text = good(file_), folder = report_.file("folder"), missing = report_.file("missing.xml");
    std::filesystem::create_directory(folder);
    const std::string contents[] = {"", "[DCestConf]\nBlocks = 7\n", std::string(5000, '\0'), text + text,
                                    text.substr(0, text.size() / 2)};
    ConfigurationReview review;
    for (const std::string& content : contents) {
        test::write_text(file_, content);
        EXPECT_EQ(reviewConfiguration(file_.c_str(), 1, review), 1);
        EXPECT_THROW(DCestConf{}.readpar(file_.c_str(), 1), quorelException);
        EXPECT_EQ(test::read_text(file_), content);
    }
    GeneralSAR_configuration container;
    EXPECT_THROW(container.GSread(folder.c_str(), 1), quorelException);
    for (const char* file : {folder.c_str(), missing.c_str(), static_cast<const char*>(nullptr)})
        EXPECT_EQ(reviewConfiguration(file, 1, review), 1);
}

// The section of the shared parameters is the record of that name only where it holds an element of it.
TEST_F(DamagedConfiguration, SharedParametersBesideAnElementAreARecord) {
    std::string text = good(file_);
    test::write_text(file_, text.insert(text.find("<DCestConf>"),
                                        "<generalProcessingConf><Azblk>1</Azblk></generalProcessingConf>"));
    ConfigurationReview review;
    EXPECT_EQ(reviewConfiguration(file_.c_str(), 1, review), 0);
    EXPECT_THAT(review.records, testing::Contains("generalProcessingConf"));
    EXPECT_EQ(review.findings.size(), 10U);
}

}  // namespace
