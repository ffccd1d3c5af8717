#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <csignal>
#include <string>
#include <thread>
#include <vector>

#include "header_files.h"
#include "quorelxmllib/field_table.h"
#include "sarutillib/file_io.h"
#include "shelf.h"

namespace {

using test::entries;
using test::header_text;
using test::OpenDocument;
using test::read_text;
using test::Shelf;
using test::write_text;

struct Hostile {
    const char* name;
    std::string text;
};

std::string repeated(const char* part, int times) {
    std::string text;
    while (times-- > 0) text += part;
    return text;
}

std::string with_declarations(const std::string& declarations, const std::string& inside) {
    std::string text = header_text("    <Shelf>\n<width>" + inside + "</width>\n    </Shelf>\n");
    return text.insert(text.find("<QuorelXmlDoc>"), "<!DOCTYPE QuorelXmlDoc [" + declarations + "]>\n");
}

std::string laughs() {
    std::string declarations = "<!ENTITY a0 \"ha\">";
    for (int i = 1; i < 40; ++i) {
        const std::string name = "&a" + std::to_string(i - 1) + ";";
        declarations += "<!ENTITY a" + std::to_string(i) + " \"";
        for (int copy = 0; copy < 4; ++copy) declarations += name;
        declarations += "\">";
    }
    return with_declarations(declarations, "&a39;");
}

/** The texts of a field as they pass while a file is read; none when that fails, with 1. */
std::vector<std::string> passing_texts(const std::string& file, const char* field) {
    std::vector<std::string> texts;
    const int status =
        quorelxml::readTexts(file.c_str(), 1, field, [&](std::string_view text) { texts.emplace_back(text); });
    EXPECT_TRUE(status == 0 || status == 1) << status;
    return status == 0 ? texts : std::vector<std::string>{};
}
/** The same from the document in memory. */
std::vector<std::string> kept_texts(const std::string& file, const char* field) {
    std::vector<std::string> texts;
    EXPECT_EQ(
        OpenDocument{file.c_str()}.readTexts(1, field, [&](std::string_view text) { texts.emplace_back(text); }),
        0);
    return texts;
}

/** XML that is not followed: what it holds may be a whole product. */
std::vector<Hostile> refused_files() {
    return {
        {"Entity", with_declarations("<!ENTITY e \"1.5\">", "&e;")},
        {"GrowingEntities", laughs()},
        {"EntityInAnAttribute", with_declarations("<!ENTITY e \"1\">", "1.5<x a=\"&e;\"/>")},
        {"OutsideFile", with_declarations("<!ENTITY e SYSTEM \"file:///etc/hostname\">", "&e;")},
        {"ParameterEntity", with_declarations("<!ENTITY % e SYSTEM \"file:///etc/hostname\"> %e;", "1.5")},
        {"AttributeDefaults", with_declarations("<!ATTLIST Channel Number CDATA \"1\">", "1.5")},
        {"AttributeChoice", with_declarations("<!ATTLIST Channel k (a|b) \"a\">", "1.5")},
        {"ElementDeclaration", with_declarations("<!ELEMENT width (#PCDATA|x)*>", "1.5")},
        {"Notation", with_declarations("<!NOTATION n SYSTEM \"n\">", "1.5")},
        {"DeepNesting", header_text(repeated("<a>", 400) + repeated("</a>", 400))},
        {"VeryDeepNesting", header_text(repeated("<a>", 300000))},
    };
}

std::vector<Hostile> hostile_files() {
    const std::string good = Shelf::text();
    const auto spliced = [&](const std::string& part) {
        std::string text = good;
        return text.insert(text.find("<width>") + 7, part);
    };
    return {
        {"UndeclaredEntity", spliced("&unknown;")},
        {"NulBytes", spliced(std::string(3, '\0'))},
        {"OnlyNulBytes", std::string(5000, '\0')},
        {"InvalidUtf8", spliced("\xE2\x28\xA1")},
        {"Latin1WithoutSayingSo", spliced("\xE8")},
        {"ControlCharacter", spliced("\x07")},
        {"UnknownEncoding", std::string{good}.replace(good.find("UTF-8"), 5, "EBCDI")},
        {"TwoRoots", good + good},
        {"TrailingGarbage", good + "x"},
        {"RepeatedAttribute", spliced("<x a=\"1\" a=\"2\"/>")},
        {"ForeignRoot", "<Other><NumberOfChannels>1</NumberOfChannels><Description/></Other>"},
        {"NoDescription", "<QuorelXmlDoc><NumberOfChannels>1</NumberOfChannels></QuorelXmlDoc>"},
        {"RootInANamespace", std::string{good}.insert(good.find("<QuorelXmlDoc>") + 13, " xmlns=\"urn:x\"")},
        {"ParameterFile", "[Shelf]\nwidth = 2.5\n"},
        {"Empty", ""},
        {"Blank", "\n"},
        {"Binary", std::string("\x7F\x45LF\x02\x01\x01\0\0\0", 10)},
        {"Compressed", std::string("\x1F\x8B\x08\0\0\0\0\0\0\x03", 10)},
    };
}

// Such a file used to pass for no header, and was replaced by one.
TEST(HostileHeaderFile, IsNeverReplacedWhereItIsXml) {
    for (const Hostile& hostile : refused_files()) {
        SCOPED_TRACE(hostile.name);
        const test::TemporaryFolder folder;
        const std::string file = folder.file("header.xml");
        write_text(file, hostile.text);
        Shelf object, fresh;
        EXPECT_EQ(quorelxml::readTexts(file.c_str(), 1, "Shelf/width", [](std::string_view) {}), 4);
        EXPECT_FALSE(object.readAuxiliaryFile(file.c_str(), 1, "Shelf"));
        EXPECT_TRUE(object == fresh);
        EXPECT_EQ(object.writeAuxiliaryFile(file.c_str(), 1, "Shelf"), 1);
        EXPECT_TRUE(read_text(file) == hostile.text);
        EXPECT_EQ(entries(folder), std::vector<std::string>{"header.xml"});
    }
}

/** What everything else that is no header must do: give nothing, then be replaced by a fresh header when written
 * to. */
TEST(HostileHeaderFile, ReadsAsAFreshDocument) {
    for (const Hostile& hostile : hostile_files()) {
        SCOPED_TRACE(hostile.name);
        const test::TemporaryFolder folder;
        const std::string file = folder.file("header.xml");
        write_text(file, hostile.text);
        OpenDocument document{file.c_str()};
        EXPECT_TRUE(document.isRecognized());
        EXPECT_EQ(document.numberOfChannels(), 0);
        EXPECT_EQ(document.description(), "My description");
        double value = -17.3;
        EXPECT_EQ(document.readDouble(1, "Shelf/width", &value, 1), 1);
        EXPECT_EQ(value, -17.3);
        EXPECT_EQ(quorelxml::readTexts(file.c_str(), 1, "Shelf/width", [](std::string_view) {}), 1);

        Shelf object, fresh;
        EXPECT_FALSE(object.readAuxiliaryFile(file.c_str(), 1, "Shelf"));
        EXPECT_TRUE(object == fresh);
        EXPECT_TRUE(read_text(file) == hostile.text) << "reading changes no file";
        object.fill(5);
        object.setExactNumbers(true);
        EXPECT_EQ(object.writeAuxiliaryFile(file.c_str(), 1, "Shelf"), 0);
        EXPECT_TRUE(fresh.readAuxiliaryFile(file.c_str(), 1, "Shelf"));
        EXPECT_TRUE(object == fresh);
    }
}

TEST(HostileHeaderFile, PassesByWithTheTextsOfTheDocument) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("header.xml");
    write_text(file, header_text("<a> </a><a>1<!-- -->2<b>3</b></a><a/><x:a xmlns:x='u'>4</x:a><c><a>5</a></c>"
                                 "</Channel><Channel Number='2'><a>6</a></Channel><Channel Number='1'>"
                                 "<a><![CDATA[<7>]]>&amp;</a><a><a>8</a></a>"));
    for (const char* field : {"a", "a/a", "c/a", "a/b", "", "/", "a/", "none", "c//a"}) {
        SCOPED_TRACE(field);
        EXPECT_EQ(passing_texts(file, field), kept_texts(file, field));
    }
    EXPECT_THAT(passing_texts(file, "a"), testing::ElementsAre(" ", "123", "", "<7>&", "8"));
    EXPECT_EQ(quorelxml::readTexts(folder.path().c_str(), 1, "a", [](std::string_view) {}), 4);
}

TEST(HostileHeaderFile, IsAcceptedWithADoctypeThatDeclaresNothing) {
    const test::TemporaryFolder folder;
    for (const char* type : {"<!DOCTYPE QuorelXmlDoc>", "<!DOCTYPE QuorelXmlDoc [ <!-- none --> ]>",
                             "<!DOCTYPE QuorelXmlDoc SYSTEM \"http://localhost:1/none.dtd\">"}) {
        std::string text = Shelf::text();
        write_text(folder.file("header.xml"), text.insert(text.find("<QuorelXmlDoc>"), type));
        EXPECT_TRUE(Shelf{}.readAuxiliaryFile(folder.file("header.xml").c_str(), 1, "Shelf")) << type;
    }
}

// A header that was cut short anywhere is read as a whole or not at all. Only blanks follow the last bracket.
TEST(HostileHeaderFile, IsReadWholeOrNotAtAllWhenCutShort) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("header.xml"), text = Shelf::text();
    Shelf whole;
    write_text(file, text);
    ASSERT_TRUE(whole.readAuxiliaryFile(file.c_str(), 1, "Shelf"));
    for (std::size_t length = 0; length < text.size(); ++length) {
        write_text(file, text.substr(0, length));
        Shelf object, fresh;
        const bool read = object.readAuxiliaryFile(file.c_str(), 1, "Shelf");
        EXPECT_EQ(read, length >= text.rfind('>') + 1) << length;
        EXPECT_TRUE(object == (read ? whole : fresh)) << length;
    }
}

// One byte changed: no crash, and what is read is written and read back the same.
TEST(HostileHeaderFile, SurvivesEveryChangedByte) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("header.xml"), text = Shelf::text();
    int read = 0;
    for (std::size_t place = 0; place < text.size(); ++place) {
        std::string changed = text;
        changed[place] = "<9\xFF"[place % 3];
        write_text(file, changed);
        for (const char* field : {"Shelf", "Shelf/pages/val", "Shelf/label"})
            EXPECT_EQ(passing_texts(file, field), kept_texts(file, field)) << place;
        Shelf object, again;
        if (!object.readAuxiliaryFile(file.c_str(), 1, "Shelf") || ++read % 16 != 0) continue;
        EXPECT_EQ(object.writeAuxiliaryFile(file.c_str(), 1, "Shelf"), 0);
        EXPECT_TRUE(again.readAuxiliaryFile(file.c_str(), 1, "Shelf"));
        EXPECT_TRUE(object == again) << place;
    }
    EXPECT_GT(read, 50);
}

// A length costs nothing but its digits; the file has to be long enough for what it promises.
TEST(HostileHeaderFile, CannotPromiseMoreValuesThanItHasRoomFor) {
    const struct {
        const char* text;
        bool read;
        int length;
    } rows[] = {{"2", true, 2},          {"0", true, 0},           {"60", true, 60},
                {"-1", true, -1},        {"1000000", false, 0},    {"-2147483648", true, -2147483647 - 1},
                {"715827883", false, 0}, {"2147483647", false, 0}, {"99999999999999", false, 0}};
    const test::TemporaryFolder folder;
    const std::string file = folder.file("header.xml");
    for (const auto& row : rows) {
        SCOPED_TRACE(row.text);
        std::string text = Shelf::text();
        write_text(file, text.replace(text.find("<nBooks>2<") + 8, 1, row.text));
        for (const int before : {0, 7}) {
            Shelf object;
            object.fill(before);
            EXPECT_EQ(object.readAuxiliaryFile(file.c_str(), 1, "Shelf"), row.read);
            EXPECT_EQ(object.nBooks, row.length);
            EXPECT_EQ(object.pages != nullptr, row.read && row.length > 0);
        }
    }
}

// The first element fails after the length was read: an array of the old length must not stay beside the new
// length.
TEST(HostileHeaderFile, KeepsLengthsAndArraysTogetherWhenAReadFails) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("header.xml");
    for (const char* length : {"3", "60", "2147483647", "-4"}) {
        std::string text = Shelf::text();
        text.replace(text.find("<nBooks>2<") + 8, 1, length);
        text.erase(text.find("<width>"), text.find("</width>") + 8 - text.find("<width>"));
        write_text(file, text);
        Shelf object, copy;
        object.fill(7);
        EXPECT_FALSE(object.readAuxiliaryFile(file.c_str(), 1, "Shelf"));
        EXPECT_EQ(object.clone(&copy), 0);  // the address sanitizer watches
        EXPECT_EQ(object.writeAuxiliaryFile(folder.file("out.xml").c_str(), 1, "Shelf"),
                  object.isBufferAllocated() ? 0 : 1);
    }
}

TEST(HostileHeaderFile, CutsLongTextsToTheirRoom) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("header.xml");
    for (const std::size_t length : {511U, 512U, 4096U, 9'999'999U}) {
        std::string text = Shelf::text();
        const auto place = text.find("<label>") + 7;
        write_text(file, text.replace(place, text.find("</label>") - place, std::string(length, 'x')));
        Shelf object;
        EXPECT_TRUE(object.readAuxiliaryFile(file.c_str(), 1, "Shelf"));
        EXPECT_EQ(std::string{object.label}, std::string(511, 'x'));
        char buffer[16];
        EXPECT_TRUE(object.getConfigurationFile(file.c_str(), 1, "Shelf", buffer, sizeof buffer));
        EXPECT_STREQ(buffer, "/etc/shelf.conf");
    }
}

TEST(HostileHeaderFile, NeverReplacesAFileThatDoesNotFitIntoMemory) {
    const test::TemporaryFolder folder;
    const test::CapturedStderr quiet;
    const std::string file = folder.file("header.xml");
    std::string text = Shelf::text();
    const auto place = text.find("<label>") + 7;
    write_text(file, text.replace(place, text.find("</label>") - place, 100'000'000, 'x'));
    Shelf object;
    EXPECT_FALSE(object.readAuxiliaryFile(file.c_str(), 1, "Shelf"));
    EXPECT_TRUE(object == Shelf{});
    EXPECT_EQ(object.writeAuxiliaryFile(file.c_str(), 1, "Shelf"), 7);
    quorelxml document;
    const std::int32_t value = 1;
    EXPECT_EQ(document.initXmlFile(file.c_str()), 7);
    EXPECT_EQ(document.writeInt(1, "a", &value, 1), 7);
    EXPECT_EQ(document.write(), 1);
    EXPECT_TRUE(quo::read_file(file.c_str(), 200'000'000) == text);
}

// A pipe has no length to look at beforehand; a file has, and is not read at all. What is too large stays.
TEST(HostileHeaderFile, IsNotReadBeyondTheLimit) {
    const test::TemporaryFolder folder;
    const test::Report report;
    const test::CapturedStderr quiet;
    const std::string pipe_name = folder.file("pipe"), file = folder.file("large.xml");
    ASSERT_EQ(mkfifo(pipe_name.c_str(), 0600), 0);
    std::signal(SIGPIPE, SIG_IGN);
    std::int64_t taken = 0;
    std::thread writer{[&] {
        const std::string blanks(1 << 20, ' ');
        const int pipe = open(pipe_name.c_str(), O_WRONLY);
        for (ssize_t done = 0; done >= 0 && taken < 2 * quorelxml::kMostFileBytes; taken += done)
            done = write(pipe, blanks.data(), blanks.size());
        close(pipe);
    }};
    EXPECT_EQ(quorelxml{}.initXmlFile(pipe_name.c_str()), 7);
    writer.join();
    EXPECT_LT(taken, quorelxml::kMostFileBytes + (16 << 20));

    write_text(file, Shelf::text());
    std::filesystem::resize_file(file, static_cast<std::uintmax_t>(quorelxml::kMostFileBytes) + 1);
    EXPECT_EQ(quorelxml{}.setDescription(file.c_str(), "New"), 7);
    EXPECT_THAT(report.messages("ERROR"), testing::Contains("Header file " + file + " is larger than 1 GiB"));
    EXPECT_EQ(std::filesystem::file_size(file), static_cast<std::uintmax_t>(quorelxml::kMostFileBytes) + 1);
}

}  // namespace
