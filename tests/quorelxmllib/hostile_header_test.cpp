// SPDX-License-Identifier: Apache-2.0
#include <fcntl.h>

#include <thread>

#include "header_files.h"
#include "quorelxmllib/field_table.h"
#include "sarutillib/ground/file_io.h"
#include "shelf.h"
#include "xml_header_property.h"

namespace {

using test::header_text;
using test::OpenDocument;
using test::read_text;
using test::replaced;
using test::Shelf;
using test::write_text;

class HostileHeaderFile : public testing::Test {
protected:
    const test::TemporaryFolder folder_;
    const std::string file_ = folder_.file("header.xml"), good_ = Shelf::text();

    [[nodiscard]] bool read(Shelf& object) const { return object.readAuxiliaryFile(file_.c_str(), 1, "Shelf"); }
    [[nodiscard]] int write(Shelf& object) const { return object.writeAuxiliaryFile(file_.c_str(), 1, "Shelf"); }
};

std::filesystem::directory_iterator files_of(const char* folder) {
    return std::filesystem::directory_iterator{std::string{QUO_TEST_DATA} + "/headers/" + folder};
}

// XML that is not followed may hold a whole product. It used to pass for no header, and was replaced by one.
TEST_F(HostileHeaderFile, IsNeverReplacedWhereItIsXml) {
    for (const auto& data : files_of("refused")) {
        SCOPED_TRACE(data.path());
        const std::string refused = read_text(data.path());
        write_text(file_, refused);
        Shelf object, fresh;
        EXPECT_EQ(quorelxml::readTexts(file_.c_str(), 1, "Shelf/width", [](std::string_view) {}), 4);
        EXPECT_FALSE(read(object));
        EXPECT_TRUE(object == fresh);
        EXPECT_EQ(write(object), 1);
        EXPECT_TRUE(read_text(file_) == refused);
    }
}

// What everything else that is no header must do: give nothing, then be replaced by a fresh header when written
// to.
TEST_F(HostileHeaderFile, ReadsAsAFreshDocument) {
    for (const auto& data : files_of("hostile")) {
        SCOPED_TRACE(data.path());
        const std::string hostile = read_text(data.path());
        write_text(file_, hostile);
        OpenDocument document{file_.c_str()};
        EXPECT_TRUE(document.isRecognized() && document.numberOfChannels() == 0 &&
                    document.description() == "My description");
        EXPECT_EQ(quorelxml::readTexts(file_.c_str(), 1, "Shelf/width", [](std::string_view) {}), 1);
        Shelf object, fresh;
        EXPECT_FALSE(read(object));
        EXPECT_TRUE(object == fresh);
        EXPECT_TRUE(read_text(file_) == hostile) << "reading changes no file";
        object.fill(5);
        object.setExactNumbers(true);
        EXPECT_EQ(write(object), 0);
        EXPECT_TRUE(read(fresh) && object == fresh);
    }
}

/** The texts of a field as they pass while the file is read, or none with 1. Those of the document are the same.
 */
std::vector<std::string> expect_same_texts(const std::string& file, const char* field) {
    std::vector<std::string> passing, kept;
    const int status =
        quorelxml::readTexts(file.c_str(), 1, field, [&](std::string_view text) { passing.emplace_back(text); });
    EXPECT_TRUE(status == 0 || status == 1) << status;
    if (status != 0) passing.clear();
    EXPECT_EQ(
        OpenDocument{file.c_str()}.readTexts(1, field, [&](std::string_view text) { kept.emplace_back(text); }),
        0);
    EXPECT_EQ(passing, kept) << field;
    return passing;
}

TEST_F(HostileHeaderFile, PassesByWithTheTextsOfTheDocument) {
    write_text(file_, header_text("<a> </a><a>1<!-- -->2<b>3</b></a><a/><x:a xmlns:x='u'>4</x:a><c><a>5</a></c>"
                                  "</Channel><Channel Number='2'><a>6</a></Channel><Channel Number='1'>"
                                  "<a><![CDATA[<7>]]>&amp;</a><a><a>8</a></a>"));
    for (const char* field : {"a/a", "c/a", "a/b", "", "/", "a/", "none", "c//a"}) expect_same_texts(file_, field);
    EXPECT_THAT(expect_same_texts(file_, "a"), testing::ElementsAre(" ", "123", "", "<7>&", "8"));
    EXPECT_EQ(quorelxml::readTexts(folder_.path().c_str(), 1, "a", [](std::string_view) {}), 4);
}

// A header that was cut short anywhere is read as a whole or not at all. Only blanks follow the last bracket.
TEST_F(HostileHeaderFile, IsReadWholeOrNotAtAllWhenCutShort) {
    Shelf whole;
    write_text(file_, good_);
    ASSERT_TRUE(read(whole));
    for (std::size_t length = 0; length < good_.size(); ++length) {
        write_text(file_, good_.substr(0, length));
        Shelf object, fresh;
        EXPECT_EQ(read(object), length >= good_.rfind('>') + 1) << length;
        EXPECT_TRUE(object == (length >= good_.rfind('>') + 1 ? whole : fresh)) << length;
    }
}

// One byte changed: no crash, and what is read is written and read back the same.
TEST_F(HostileHeaderFile, SurvivesEveryChangedByte) {
    for (std::size_t place = 0; place < good_.size(); ++place) {
        std::string changed = good_;
        changed[place] = "<9\xFF"[place % 3];
        write_text(file_, changed);
        for (const char* field : {"Shelf", "Shelf/pages/val", "Shelf/label"}) expect_same_texts(file_, field);
        Shelf object;
        EXPECT_TRUE(!read(object) || place % 16 != 0 || write(object) == 0);
        EXPECT_NO_THROW(property::read_back(property::MemoryFile{changed, "header"})) << place;
    }
}

// A length costs nothing but its digits; the file has to be long enough for what it promises. Where an
// element fails after the length was read, no array of the old length may stay beside the new one.
TEST_F(HostileHeaderFile, CannotPromiseMoreValuesThanItHasRoomFor) {
    for (const auto& [length, read_as, is_read] : {std::tuple{"2", 2, true},
                                                   {"0", 0, true},
                                                   {"60", 60, true},
                                                   {"-1", -1, true},
                                                   {"1000000", 0, false},
                                                   {"-2147483648", -2147483647 - 1, true},
                                                   {"715827883", 0, false},
                                                   {"99999999999999", 0, false}}) {
        SCOPED_TRACE(length);
        const std::string text = replaced(good_, "<nBooks>2<", "<nBooks>" + std::string{length} + "<");
        for (const int before : {0, 7}) {
            write_text(file_, text);
            Shelf object, incomplete, copy;
            object.fill(before);
            EXPECT_EQ(read(object), is_read);
            EXPECT_EQ(object.nBooks, read_as);
            EXPECT_EQ(object.pages != nullptr, is_read && read_as > 0);

            write_text(file_, replaced(text, "<height>0.5</height>", ""));
            incomplete.fill(before);
            EXPECT_FALSE(read(incomplete));
            EXPECT_EQ(incomplete.element(0)->count, incomplete.pages ? 3 * incomplete.nBooks : 0);
            EXPECT_EQ(incomplete.clone(&copy), 0);  // the address sanitizer watches
            EXPECT_EQ(write(incomplete), incomplete.isBufferAllocated() ? 0 : 1);
        }
    }
}

TEST_F(HostileHeaderFile, HasTextsThatAreCutUpToALimitOfTheirs) {
    for (const std::size_t length : {511U, 512U, 9'999'999U, 11'000'000U}) {
        const std::string text = replaced(good_, "Novels", std::string(length, 'x'));
        write_text(file_, text);
        Shelf object;
        EXPECT_EQ(read(object), length < 10'000'000);
        EXPECT_EQ(object.label, length < 10'000'000 ? std::string(511, 'x') : Shelf{}.label);
        if (length < 10'000'000) continue;
        quorelxml document;
        const std::int32_t value = 1;
        EXPECT_EQ(write(object) + document.initXmlFile(file_.c_str()) + document.writeInt(1, "a", &value, 1),
                  3 * 7);
        EXPECT_EQ(document.write(), 1);
        EXPECT_TRUE(quo::read_file(file_.c_str(), 200'000'000) == text) << "never replaced";
    }
}

// A pipe has no length to look at beforehand; a file has, and is not read at all. What is too large stays.
TEST_F(HostileHeaderFile, IsNotReadBeyondTheLimit) {
    const test::Report report;
    const std::string pipe_name = folder_.file("pipe");
    ASSERT_EQ(mkfifo(pipe_name.c_str(), 0600), 0);
    std::signal(SIGPIPE, SIG_IGN);
    std::int64_t taken = 0;
    std::thread writer{[&] {
        const std::string blanks(1 << 20, ' ');
        const int pipe = open(pipe_name.c_str(), O_WRONLY);
        for (ssize_t done = 0; done >= 0 && taken < 2 * quorelxml::kMostFileBytes; taken += done)
            done = ::write(pipe, blanks.data(), blanks.size());
        close(pipe);
    }};
    EXPECT_EQ(quorelxml{}.initXmlFile(pipe_name.c_str()), 7);
    writer.join();
    EXPECT_LT(taken, quorelxml::kMostFileBytes + (16 << 20));

    constexpr auto kTooLong = static_cast<std::uintmax_t>(quorelxml::kMostFileBytes) + 1;
    write_text(file_, good_);
    std::filesystem::resize_file(file_, kTooLong);
    EXPECT_EQ(quorelxml{}.setDescription(file_.c_str(), "New"), 7);
    EXPECT_THAT(report.messages("ERROR"), testing::Contains("Header file " + file_ + " is larger than 1 GiB"));
    EXPECT_EQ(std::filesystem::file_size(file_), kTooLong);
}

}  // namespace
