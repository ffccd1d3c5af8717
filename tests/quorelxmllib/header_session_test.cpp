#include "quorelxmllib/header_session.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <string>

#include "header_files.h"
#include "sarutillib/file_io.h"
#include "shelf.h"

namespace {

using quo::HeaderSession;
using test::read_text;
using test::Shelf;
using test::write_text;

class HeaderSessionTest : public testing::Test {
protected:
    HeaderSessionTest() { object_.fill(3); }
    int write(const std::string& file, const char* section, int channel = 1) {
        return object_.writeAuxiliaryFile(file.c_str(), channel, section);
    }
    bool read(const std::string& file, const char* section) {
        return Shelf{}.readAuxiliaryFile(file.c_str(), 1, section);
    }
    test::TemporaryFolder folder_;
    const std::string file_ = folder_.file("header.xml");
    Shelf object_;
};

// The same bytes must reach the disk in one save and object by object.
TEST_F(HeaderSessionTest, WritesTheBytesOfObjectByObject) {
    const auto write_product = [&](const std::string& file) {
        for (int round = 0; round < 2; ++round) {
            object_.fill(round == 0 ? 3 : 7);
            for (const char* section : {"Library", "Library/Room-0", "Library/Room-1", "Shelf"})
                EXPECT_EQ(write(file, section), 0);
            EXPECT_EQ(write(file, "Shelf", 2), 0);
        }
    };
    const std::string alone = folder_.file("alone.xml");
    for (const std::string& text : {std::string{}, std::string{"<Other/>"}, Shelf::text()}) {
        write_text(alone, text);
        write_text(file_, text);
        write_product(alone);
        HeaderSession session{file_.c_str()};
        write_product(file_);
        EXPECT_EQ(read_text(file_), text) << "nothing is saved before the end";
        EXPECT_EQ(session.commit(), 0);
        EXPECT_EQ(read_text(file_), read_text(alone));
    }
}

TEST_F(HeaderSessionTest, ParsesOnce) {
    write_text(file_, Shelf::text());
    const HeaderSession session{file_.c_str()};
    for (int round = 0; round < 2; ++round) {
        EXPECT_TRUE(read(file_, "Shelf"));
        EXPECT_FALSE(read(file_, "None"));
        std::filesystem::remove(file_);
    }
    char name[32];
    EXPECT_TRUE(object_.getConfigurationFile(file_.c_str(), 1, "Shelf", name, sizeof name));
}

TEST_F(HeaderSessionTest, ServesOnlyItsOwnFileButUnderEveryName) {
    write_text(file_, Shelf::text());
    const std::string link = folder_.file("link.xml"), other = folder_.file("other.xml");
    std::filesystem::create_symlink("header.xml", link);
    HeaderSession session{file_.c_str()};
    EXPECT_EQ(write(other, "Elsewhere"), 0);
    EXPECT_EQ(write(folder_.path().string() + "/./header.xml", "A"), 0);
    EXPECT_EQ(write(link, "B"), 0);
    EXPECT_EQ(read_text(file_), Shelf::text());
    EXPECT_NE(read_text(other).find("<Elsewhere>"), std::string::npos);
    EXPECT_EQ(session.commit(), 0);
    EXPECT_TRUE(read(file_, "A") && read(file_, "B") && read(file_, "Shelf"));
}

TEST_F(HeaderSessionTest, ShowsWhatWasWrittenAndTouchesNothingWithoutACommit) {
    {
        HeaderSession session{file_.c_str()};
        EXPECT_FALSE(read(file_, "Shelf"));
        EXPECT_EQ(session.commit(), 0);  // with nothing to save
        object_.fill(500);               // more values than the file, which is not there, could hold
        EXPECT_EQ(write(file_, "Shelf"), 0);
        EXPECT_TRUE(read(file_, "Shelf"));
    }
    EXPECT_FALSE(std::filesystem::exists(file_));
    EXPECT_EQ(write(file_, "Shelf"), 0) << "on its own again";
    EXPECT_TRUE(std::filesystem::exists(file_));
}

TEST_F(HeaderSessionTest, KeepsTheSectionOfAnObjectThatCannotBeWritten) {
    write_text(file_, Shelf::text());
    const test::CapturedStderr quiet;
    HeaderSession session{file_.c_str()};
    std::snprintf(object_.label, sizeof object_.label, "\x07");
    EXPECT_EQ(write(file_, "Shelf"), 1);
    object_.destroyBuffers();
    EXPECT_EQ(write(file_, "Shelf"), 1);
    for (const char* section : {"Other", "More"}) {  // a session may go on after it was saved
        object_.fill(1);
        EXPECT_EQ(write(file_, section), 0);
        EXPECT_EQ(session.commit(), 0);
        EXPECT_NE(read_text(file_).find(section), std::string::npos);
    }
    EXPECT_TRUE(read(file_, "Shelf"));
}

TEST_F(HeaderSessionTest, SavesNoDocumentThatAFailedWriteLeftIncomplete) {
    write_text(file_, Shelf::text());
    const test::CapturedStderr quiet;
    HeaderSession session{file_.c_str()};
    EXPECT_EQ(write(file_, "Fine"), 0);
    EXPECT_EQ(write(file_, "not a name"), 1);
    EXPECT_EQ(session.commit(), 1);
    EXPECT_EQ(read_text(file_), Shelf::text());
}

TEST_F(HeaderSessionTest, NestsForOtherFiles) {
    const std::string inner_file = folder_.file("inner.xml");
    HeaderSession outer{file_.c_str()};
    {
        HeaderSession inner{inner_file.c_str()};
        EXPECT_EQ(HeaderSession::find(file_.c_str()), &outer);
        EXPECT_EQ(HeaderSession::find(inner_file.c_str()), &inner);
        EXPECT_EQ(write(inner_file, "Inner") + write(file_, "Outer") + inner.commit(), 0);
    }
    EXPECT_TRUE(!HeaderSession::find(inner_file.c_str()) && !HeaderSession::find(nullptr));
    EXPECT_TRUE(std::filesystem::exists(inner_file) && !std::filesystem::exists(file_));
    EXPECT_EQ(outer.commit(), 0);
    EXPECT_TRUE(read(file_, "Outer"));
}

TEST_F(HeaderSessionTest, NeverReplacesAFileThatDoesNotFitIntoMemory) {
    std::string text = Shelf::text();
    text.insert(text.find("Novels"), 11'000'000, 'x');
    write_text(file_, text);
    const test::CapturedStderr quiet;
    HeaderSession session{file_.c_str()};
    EXPECT_FALSE(read(file_, "Shelf"));
    EXPECT_EQ(write(file_, "Shelf"), 7);
    EXPECT_EQ(session.commit(), 7);
    EXPECT_TRUE(quo::read_file(file_.c_str(), 200'000'000) == text);
}

}  // namespace
