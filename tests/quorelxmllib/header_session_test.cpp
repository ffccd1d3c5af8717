// SPDX-License-Identifier: Apache-2.0
#include "quorelxmllib/header_session.h"

#include "header_files.h"
#include "shelf.h"

namespace {

using quo::HeaderSession;
using test::read_text;
using test::Shelf;
using test::write_text;

class HeaderSessionTest : public testing::Test {
protected:
    HeaderSessionTest() { object_.fill(3); }
    int write(const std::string& file, const char* section) {
        return object_.writeAuxiliaryFile(file.c_str(), 1, section);
    }
    bool read(const std::string& file, const char* section) {
        return Shelf{}.readAuxiliaryFile(file.c_str(), 1, section);
    }
    test::TemporaryFolder folder_;
    const std::string file_ = folder_.file("header.xml"), other_ = folder_.file("other.xml");
    Shelf object_;
};

// That the same bytes reach the disk in one save and object by object is tested with the products.
TEST_F(HeaderSessionTest, ParsesOnce) {
    write_text(file_, Shelf::text());
    const HeaderSession session{file_.c_str()};
    for (int round = 0; round < 2; ++round) {
        EXPECT_TRUE(read(file_, "Shelf") && !read(file_, "None"));
        std::filesystem::remove(file_);
    }
}

TEST_F(HeaderSessionTest, ServesOnlyItsOwnFileButUnderEveryName) {
    write_text(file_, Shelf::text());
    const std::string link = folder_.file("link.xml");
    std::filesystem::create_symlink("header.xml", link);
    HeaderSession outer{file_.c_str()};
    EXPECT_EQ(write(other_, "Elsewhere"), 0);
    EXPECT_TRUE(read(other_, "Elsewhere"));
    {
        HeaderSession inner{other_.c_str()};
        EXPECT_EQ(HeaderSession::find(link.c_str()), &outer);
        EXPECT_EQ(HeaderSession::find(other_.c_str()), &inner);
        EXPECT_EQ(write(folder_.path().string() + "/./header.xml", "A") + write(link, "B"), 0);
        EXPECT_EQ(write(other_, "Inner") + inner.commit(), 0);
        EXPECT_EQ(read_text(file_), Shelf::text());
    }
    EXPECT_TRUE(!HeaderSession::find(other_.c_str()) && !HeaderSession::find(nullptr));
    EXPECT_EQ(outer.commit(), 0);
    EXPECT_TRUE(read(other_, "Inner") && read(file_, "A") && read(file_, "B") && read(file_, "Shelf"));
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

// What replaced sections leave behind is given back; the document is the same as if each had been written once.
TEST_F(HeaderSessionTest, ReplacesASectionAsOftenAsOneLikes) {
    std::string start = Shelf::text();
    start.insert(start.rfind("</"), "<!-- kept --><A u=\"m\">1 &amp; 2</A><x:A xmlns:x=\"x\"><![CDATA[<]]></x:A>");
    write_text(file_, start);
    write_text(other_, start);
    HeaderSession often{file_.c_str()}, once{other_.c_str()};
    for (int round = 0; round < 12; ++round) {
        object_.fill(1000);
        EXPECT_EQ(write(file_, "Shelf"), 0);
    }
    EXPECT_EQ(write(other_, "Shelf") + often.commit() + once.commit(), 0);
    EXPECT_TRUE(read_text(file_) == read_text(other_));
}

// An object that cannot be written keeps its old section; what left the document incomplete, or stands in for a
// file that does not fit into memory, lets nothing be saved.
TEST_F(HeaderSessionTest, SavesWholeObjectsOnly) {
    write_text(file_, Shelf::text());
    HeaderSession session{file_.c_str()};
    object_.destroyBuffers();
    EXPECT_EQ(write(file_, "Shelf"), 1);
    object_.fill(1);
    object_.label[0] = '\x07';
    EXPECT_EQ(write(file_, "Shelf"), 1);
    for (const char* section : {"Other", "More"}) {  // a session may go on after it was saved
        object_.fill(1);
        EXPECT_EQ(write(file_, section) + session.commit(), 0);
        EXPECT_TRUE(read(file_, section) && read(file_, "Shelf"));
    }
    const std::string before = read_text(file_), folder = folder_.path().string();
    EXPECT_EQ(write(file_, "Fine"), 0);
    EXPECT_EQ(write(file_, "not a name"), 1);
    EXPECT_EQ(session.commit(), 1);
    EXPECT_EQ(read_text(file_), before);

    const std::string huge = test::replaced(Shelf::text(), "Novels", std::string(11'000'000, 'x'));
    write_text(other_, huge);
    HeaderSession stand_in{other_.c_str()};
    EXPECT_FALSE(read(other_, "Shelf"));
    EXPECT_EQ(write(other_, "Shelf") + stand_in.commit(), 2 * 7);
    EXPECT_TRUE(read_text(other_) == huge);
    // A file that could not be read may have every section.
    HeaderSession unread{folder.c_str()};
    EXPECT_FALSE(read(folder, "Shelf"));
    EXPECT_EQ(unread.failures(), 1);
}

}  // namespace
