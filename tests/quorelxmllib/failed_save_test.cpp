#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <string>
#include <utility>

#include "header_files.h"
#include "quorelxmllib/header_session.h"
#include "shelf.h"
#include "support/limits.h"

namespace {

using test::OrdinaryUser;
using test::read_text;
using test::Shelf;
using test::write_text;
using testing::ElementsAre;

using Save = int (*)(Shelf& object, const char* file);
int by_object(Shelf& object, const char* file) { return object.writeAuxiliaryFile(file, 1, "Shelf"); }
int by_session(Shelf& object, const char* file) {
    quo::HeaderSession session{file};
    EXPECT_EQ(object.writeAuxiliaryFile(file, 1, "Shelf"), 0);
    return session.commit();
}
int by_document(Shelf& object, const char* file) {
    quorelxml document{file};
    document.writeDouble(1, "Shelf/width", &object.width, 1);
    return document.write();
}
int by_description(Shelf& object, const char* file) { return quorelxml{}.setDescription(file, object.label); }

struct SaveCase {
    const char* name;
    Save save;
};
constexpr SaveCase kSaves[] = {
    {"Object", by_object}, {"Session", by_session}, {"Document", by_document}, {"Description", by_description}};

class FailedSave : public testing::TestWithParam<SaveCase> {
protected:
    FailedSave() {
        write_text(file_, old_);
        object_.fill(20);
    }
    /** The save must fail, say so in the report, and leave the folder as it was. */
    void expect_failure(const std::string& file) {
        const auto before = test::entries(folder_);
        test::Report report;
        const test::CapturedStderr quiet;
        EXPECT_EQ(GetParam().save(object_, file.c_str()), 1);
        EXPECT_THAT(report.messages("ERROR"), testing::Contains("File writing failed!"));
        EXPECT_EQ(test::entries(folder_), before);
        EXPECT_TRUE(read_text(file_) == old_);
    }
    test::TemporaryFolder folder_;
    const std::string file_ = folder_.file("header.xml"), old_ = Shelf::text();
    Shelf object_;
};

TEST_P(FailedSave, RefusesFoldersDevicesAndPlacesThatAreNotThere) {
    expect_failure(folder_.path().string());
    expect_failure("/dev/full");
    expect_failure(folder_.file("none/header.xml"));
    expect_failure(file_ + "/header.xml");
    expect_failure(folder_.file(std::string(300, 'n')));
}

// A file that may be written in a folder that may not is written where it stands, with a warning.
TEST_P(FailedSave, RespectsFilesAndFoldersThatMayNotBeWritten) {
    for (const auto& [file_mode, folder_mode] : {std::pair{0444, 0777}, {0666, 0555}}) {
        ASSERT_EQ(chmod(file_.c_str(), static_cast<mode_t>(file_mode)), 0);
        ASSERT_EQ(chmod(folder_.path().c_str(), static_cast<mode_t>(folder_mode)), 0);
        const bool writable = file_mode == 0666;
        test::Report report;
        {
            const OrdinaryUser user;
            const test::CapturedStderr quiet;
            EXPECT_EQ(GetParam().save(object_, file_.c_str()), writable ? 0 : 1);
        }
        EXPECT_EQ(report.messages("WARNING").size(), writable ? 1U : 0U);
        EXPECT_EQ(read_text(file_) == old_, !writable);
    }
    EXPECT_THAT(test::entries(folder_), ElementsAre("header.xml"));
    ASSERT_EQ(chmod(folder_.path().c_str(), 0755), 0);
}
INSTANTIATE_TEST_SUITE_P(Saves, FailedSave, testing::ValuesIn(kSaves),
                         [](const auto& row) { return row.param.name; });

}  // namespace
