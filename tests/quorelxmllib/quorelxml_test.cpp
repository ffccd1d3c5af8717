#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <cstring>
#include <iterator>
#include <limits>
#include <string>
#include <vector>

#include "header_files.h"
#include "quo_base/quorelxml_v2.h"

namespace {

using test::header_text;
using test::OpenDocument;
using test::read_text;
using test::write_text;
using testing::ElementsAre;

class Quorelxml : public testing::Test {
protected:
    std::string file(const std::string& content) {
        write_text(folder_.file("header.xml"), content);
        return folder_.file("header.xml");
    }
    test::TemporaryFolder folder_;
    const std::string new_file_ = folder_.file("new.xml");
};

// --- opening ----------------------------------------------------------------------------------------------------

TEST_F(Quorelxml, MakesAFreshDocumentInMemoryForAMissingFile) {
    const test::Report report;
    OpenDocument document{new_file_.c_str()};
    EXPECT_TRUE(document.isRecognized());
    EXPECT_EQ(document.numberOfChannels(), 0);
    EXPECT_EQ(document.description(), "My description");
    EXPECT_FALSE(std::filesystem::exists(new_file_));
    errno = 0;
    EXPECT_EQ(document.write(), 0);
    EXPECT_EQ(read_text(new_file_),
              "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<QuorelXmlDoc>\n"
              "  <NumberOfChannels>0</NumberOfChannels>\n  <Description>My description</Description>\n"
              "</QuorelXmlDoc>\n");
    EXPECT_THAT(report.entries(), testing::IsEmpty()) << "a missing file is no error";
}

TEST_F(Quorelxml, MirrorsChannelsAndDescription) {
    std::string text = header_text("");
    text.replace(text.find("A scene"), 7, std::string(3000, 'd'));
    OpenDocument document{file(text).c_str()};
    EXPECT_EQ(document.numberOfChannels(), 1);
    EXPECT_EQ(document.description(), std::string(2047, 'd')) << "the copy is cut, the document is not";
    EXPECT_EQ(document.write(), 0);
    EXPECT_EQ(read_text(document.fileName()), text);
}

TEST_F(Quorelxml, IsEmptyWithoutAFileAndAfterCleaning) {
    OpenDocument document;
    double value = -17.3;
    for (int round = 0; round < 2; ++round) {
        EXPECT_FALSE(document.isRecognized() || document.channelExists(1) || document.fieldExists(1, "a"));
        EXPECT_EQ(document.countNodes(1, "a"), 0);
        EXPECT_EQ(document.clearField(1, "a"), 0);
        EXPECT_EQ(document.readDouble(1, "a", &value, 1), 1);
        EXPECT_EQ(document.write(), 1);
        EXPECT_EQ(document.initXmlFile(file(header_text("<a>2.5</a>")).c_str()), 0);
        EXPECT_TRUE(document.fieldExists(1, "a"));
        EXPECT_EQ(document.clean() + document.clean(), 0);
    }
    EXPECT_EQ(value, -17.3);
}

// The name of another file must never be written to, so a name that does not fit is not cut.
TEST_F(Quorelxml, RefusesFileNamesThatDoNotFit) {
    const std::string longest = folder_.file(std::string(250, 'n')) + "/" + std::string(600, 'n');
    OpenDocument document;
    EXPECT_EQ(document.initXmlFile(longest.c_str()), 1);
    EXPECT_EQ(document.fileName(), "");
    EXPECT_EQ(document.write(), 1);
    EXPECT_EQ(document.initXmlFile(nullptr), 0);
    EXPECT_EQ(document.write(), 1);
    // A document without a file once stayed behind.
    EXPECT_EQ(document.setDescription(longest.c_str(), "New"), 1);
    EXPECT_FALSE(document.loaded());
}

// --- what the documentation shows -------------------------------------------------------------------------------

TEST_F(Quorelxml, WritesTheDocumentedLayout) {
    quorelxml document{new_file_.c_str()};
    const std::int32_t count = -3, ints[] = {7, 8};
    const double scalar = 1.0 / 3.0, doubles[] = {1e300, 0.1, -17.25};
    const float narrow = 0.1F;
    const char *one[] = {"H/H & <V/V>"}, *two[] = {"first", ""};
    EXPECT_EQ(document.writeInt(1, "Sec/count", &count, 1), 0);
    EXPECT_EQ(document.writeDouble(1, "Sec/Arr", doubles, 3), 0);
    EXPECT_EQ(document.writeDouble(1, "Sec/scalar", &scalar, 1), 0);
    EXPECT_EQ(document.writeFloat(1, "Sec/narrow", &narrow, 1), 0);
    EXPECT_EQ(document.writeString(1, "Sec/one", one, 1), 0);
    EXPECT_EQ(document.writeString(1, "Sec/two", two, 2), 0);
    EXPECT_EQ(document.writeInt(3, "Other/deep/ints", ints, 2), 0);
    EXPECT_EQ(document.write(), 0);
    EXPECT_EQ(read_text(new_file_), R"(<?xml version="1.0" encoding="UTF-8"?>
<QuorelXmlDoc>
  <NumberOfChannels>2</NumberOfChannels>
  <Description>My description</Description>
  <Channel Number="1">
    <Sec>
      <count>-3</count>
      <Arr>
        <val N="1">1e+300</val>
        <val N="2">0.1</val>
        <val N="3">-17.25</val>
      </Arr>
      <scalar>0.333333333333333</scalar>
      <narrow>0.100000001490116</narrow>
      <one>H/H &amp; &lt;V/V&gt;</one>
      <two N="1">first</two>
      <two N="2"/>
    </Sec>
  </Channel>
  <Channel Number="3">
    <Other>
      <deep>
        <ints>
          <val N="1">7</val>
          <val N="2">8</val>
        </ints>
      </deep>
    </Other>
  </Channel>
</QuorelXmlDoc>
)");
}

TEST_F(Quorelxml, KeepsWhatItDoesNotKnow) {
    const std::string text = R"(<?xml version="1.0" encoding="UTF-8"?>
<!DOCTYPE QuorelXmlDoc SYSTEM "header.dtd">
<!-- by hand -->
<?keep me?>
<QuorelXmlDoc xmlns:x="urn:x" version="7">
  <NumberOfChannels unit="-">1</NumberOfChannels>
  <Description>A scene</Description>
  <!-- inside -->
  <x:Extra a="&lt;1&gt;">mixed <b>text</b> here</x:Extra>
  <Channel Number="1" name="HH">
    <Sec by="tool">
      <known unit="Hz">1.5</known>
      <unknown><![CDATA[<raw> & text]]></unknown>
    </Sec>
  </Channel>
  <Trailer/>
</QuorelXmlDoc>
<!-- after -->
)";
    quorelxml document{file(text).c_str()};
    const double value = 2.5;
    EXPECT_EQ(document.writeDouble(1, "Sec/known", &value, 1), 0);
    EXPECT_EQ(document.write(), 0);
    std::string expected = text;
    expected.replace(expected.find("1.5"), 3, "2.5");
    EXPECT_EQ(read_text(folder_.file("header.xml")), expected);
}

TEST_F(Quorelxml, TurnsOtherEncodingsIntoUtf8) {
    const auto text = [](const char* encoding, const char* letter) {
        std::string whole = header_text(std::string{"    <a b=\""} + letter + "\">Universit" + letter + "</a>\n");
        return whole.replace(whole.find("UTF-8"), 5, encoding);
    };
    EXPECT_EQ(quorelxml{file(text("ISO-8859-1", "\xE0")).c_str()}.write(), 0);
    EXPECT_EQ(read_text(folder_.file("header.xml")), text("UTF-8", "\xC3\xA0"));
}

TEST_F(Quorelxml, SetsTheDescriptionOnDisk) {
    OpenDocument document;
    EXPECT_EQ(document.setDescription(file(header_text("    <a>1</a>\n")).c_str(), "Pass <2> & more"), 0);
    EXPECT_FALSE(document.loaded());
    EXPECT_EQ(document.description(), "Pass <2> & more");
    std::string expected = header_text("    <a>1</a>\n");
    expected.replace(expected.find("A scene"), 7, "Pass &lt;2&gt; &amp; more");
    EXPECT_EQ(read_text(folder_.file("header.xml")), expected);

    EXPECT_EQ(document.setDescription(new_file_.c_str(), "New"), 0);
    EXPECT_EQ(OpenDocument{new_file_.c_str()}.description(), "New");
    EXPECT_EQ(document.setDescription(folder_.file("none/x.xml").c_str(), "New"), 1);
    EXPECT_EQ(document.setDescription(new_file_.c_str(), "\x07"), 1);
    EXPECT_EQ(OpenDocument{new_file_.c_str()}.description(), "New");
}

TEST_F(Quorelxml, AddsTheStyleSheetOnce) {
    for (int round = 0; round < 3; ++round) {
        quorelxmlPi document;
        EXPECT_EQ(document.initXmlFile(new_file_.c_str(), "view/\"a\"?>.xsl"), 0);
        EXPECT_EQ(document.initXmlFile(new_file_.c_str(), "view/\"a\"?>.xsl"), 0);
        EXPECT_EQ(document.write(), 0);
        const std::string text = read_text(new_file_);
        EXPECT_TRUE(
            text.starts_with("<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<?xml-stylesheet type=\"text/xsl\" "
                             "href=\"view/&quot;a&quot;?&gt;.xsl\"?>\n<QuorelXmlDoc>\n"))
            << text;
        EXPECT_EQ(text.find("xml-stylesheet"), text.rfind("xml-stylesheet"));
    }
    quorelxmlPi commented;
    EXPECT_EQ(commented.initXmlFile(file("<!-- first -->" + header_text("").substr(39)).c_str(), "a.xsl"), 0);
    EXPECT_EQ(commented.write(), 0);
    EXPECT_EQ(read_text(folder_.file("header.xml")).find("xml-stylesheet"), std::string::npos);
}

// --- values -----------------------------------------------------------------------------------------------------

// The choice of all documents, and that of one, which rules where it was made.
TEST_F(Quorelxml, ReadsFifteenDigitsBackOrAllOfThem) {
    using Limits = std::numeric_limits<double>;
    const double values[] = {1.0 / 3.0, 803457.318291746, -0.0, 5e-324, Limits::max(), Limits::infinity()};
    constexpr int kCount = std::size(values);
    for (const bool all : {false, true})
        for (const int own : {-1, 0, 1}) {
            quorelxml::setExactNumbers(all);
            quorelxml document{new_file_.c_str()};
            if (own >= 0) document.useExactNumbers(own == 1);
            document.writeDouble(1, "a", values, kCount);
            document.write();
            double back[kCount] = {};
            EXPECT_EQ(quorelxml{new_file_.c_str()}.readDouble(1, "a", back, kCount), 0);
            for (int i = 0; i < kCount; ++i) {
                char rounded[40];
                std::snprintf(rounded, sizeof rounded, "%.15g", values[i]);
                EXPECT_EQ(back[i], own == 1 || (own < 0 && all) ? values[i] : std::strtod(rounded, nullptr));
                EXPECT_EQ(std::signbit(back[i]), std::signbit(values[i]));
            }
        }
    quorelxml::setExactNumbers(false);
}

TEST_F(Quorelxml, ConvertsTextsAsFarAsTheyAreNumbers) {
    quorelxml document{file(header_text("<a>  -12abc</a><a2>2.5, 3.5</a2><a3/><a4>x</a4>"
                                        "<a5><![CDATA[7]]>.5<!-- , -->0</a5>"))
                           .c_str()};
    const struct {
        const char* field;
        std::int32_t i;
        double d, second;  // as one value, and the second of a list
    } rows[] = {
        {"a", -12, -12.0, -3}, {"a2", 2, 2.5, 3.5}, {"a3", 0, 0.0, -3}, {"a4", 0, 0.0, -3}, {"a5", 7, 7.5, -3}};
    for (const auto& row : rows) {
        SCOPED_TRACE(row.field);
        std::int32_t i = 5, ints[] = {-1, -2, -3};
        double d = 5.0, doubles[] = {-2, -3};
        float floats[] = {-2, -3};
        EXPECT_EQ(document.readInt(1, row.field, &i, 1) + document.readDouble(1, row.field, &d, 1), 0);
        EXPECT_EQ(i, row.i);
        EXPECT_EQ(d, row.d);
        EXPECT_EQ(document.readDouble(1, row.field, doubles, 2) + document.readFloat(1, row.field, floats, 2), 0);
        EXPECT_EQ(doubles[1], row.second);
        EXPECT_EQ(static_cast<double>(floats[1]), row.second);
        EXPECT_EQ(document.readInt(1, row.field, ints, 3), 0);
        EXPECT_EQ(ints[2], -3) << "what a list does not have stays";
    }
}

TEST_F(Quorelxml, LeavesTheRestWhereValuesAreMissing) {
    quorelxml document{file(header_text("<a><val N=\"1\">1</val><other/><val N=\"2\">2</val></a>"
                                        "<t N=\"1\">one</t><t N=\"2\">two</t>"))
                           .c_str()};
    std::int32_t values[4] = {9, 9, 9, 9};
    EXPECT_EQ(document.readInt(1, "a", values, 4), 0);
    EXPECT_THAT(values, ElementsAre(1, 2, 9, 9));
    EXPECT_EQ(document.readInt(1, "a", values, 1), 0);
    EXPECT_THAT(values, ElementsAre(12, 2, 9, 9)) << "a single value is the whole text of the element";
    EXPECT_EQ(document.readInt(1, "b", values, 4), 1);
    EXPECT_EQ(document.readInt(2, "a", values, 4), 1);
    EXPECT_EQ(document.readInt(1, "a", values, 0), 0);
    EXPECT_THAT(values, ElementsAre(12, 2, 9, 9));

    char texts[3][8] = {"x", "y", "z"};
    char* const places[] = {texts[0], texts[1], texts[2]};
    EXPECT_EQ(document.readString(1, "t", places, 3), 1) << "texts are all there or not read";
    EXPECT_STREQ(texts[0], "x");
    EXPECT_EQ(document.readString(1, "t", places, 2, 3), 0);
    EXPECT_STREQ(texts[0], "on");
    EXPECT_STREQ(texts[1], "tw");
    EXPECT_EQ(document.readString(1, "t", places, 2), 0);
    EXPECT_STREQ(texts[1], "two");
}

TEST_F(Quorelxml, KeepsEveryTextThatXmlCanHold) {
    std::vector<std::string> texts{"", " ", "  blanks around  ", "a\rb\nc\td", "]]>&amp;<x/>", "\xE2\x82\xAC"};
    for (int code = 1; code < 128; ++code)
        if (code >= 32 || std::strchr("\t\n\r", code)) texts.emplace_back(3, static_cast<char>(code));
    quorelxml document{new_file_.c_str()};
    std::vector<const char*> places;
    std::vector<std::array<char, 64>> room(texts.size());
    std::vector<char*> buffers;
    for (const std::string& text : texts) places.push_back(text.c_str());
    for (auto& buffer : room) buffers.push_back(buffer.data());
    const int count = static_cast<int>(texts.size());
    EXPECT_EQ(document.writeString(1, "Sec/t", places.data(), count), 0);
    EXPECT_EQ(document.write(), 0);
    EXPECT_EQ(quorelxml{new_file_.c_str()}.readString(1, "Sec/t", buffers.data(), count), 0);
    for (std::size_t i = 0; i < texts.size(); ++i) EXPECT_EQ(buffers[i], texts[i]);
}

TEST_F(Quorelxml, RefusesTextsAndNamesThatXmlCannotHold) {
    const test::Report report;
    const test::CapturedStderr quiet;
    quorelxml document{file(header_text("    <a>1</a>\n")).c_str()};
    const char* bad[] = {"fine", "\x01"};
    const double value = 1.5;
    EXPECT_EQ(document.writeString(1, "t", bad, 2), 1);
    for (const char* name : {"", "a b", "a//b", "<x>", "val[1]", "a\"][\"", "p:q"})
        EXPECT_EQ(document.writeDouble(1, name, &value, 1), 1) << name;
    EXPECT_EQ(document.writeDouble(1, nullptr, &value, 1), 1);
    EXPECT_EQ(document.writeDouble(1, "a", nullptr, 1), 1);
    EXPECT_EQ(document.readDouble(1, "a", nullptr, 1), 1);
    EXPECT_GE(report.entries("ERROR").size(), 11U);
    EXPECT_EQ(document.write(), 0);
    EXPECT_EQ(read_text(folder_.file("header.xml")), header_text("    <a>1</a>\n"));
}

TEST_F(Quorelxml, OverwritesWithoutLeavingASecondIndex) {
    quorelxml document{new_file_.c_str()};
    const std::int32_t four[] = {1, 2, 3, 4}, two[] = {8, 9}, one = 7;
    document.writeInt(1, "a", four, 4);
    document.writeInt(1, "a", two, 2);
    document.writeInt(1, "b", two, 2);
    document.writeInt(1, "b", &one, 1);
    EXPECT_EQ(document.writeInt(1, "a", two, 0), 0);
    EXPECT_EQ(document.writeInt(1, "c", two, 0), 0);
    document.write();
    EXPECT_NE(read_text(new_file_).find("    <a>\n      <val N=\"1\">8</val>\n      <val N=\"2\">9</val>\n"
                                        "      <val N=\"3\">3</val>\n      <val N=\"4\">4</val>\n    </a>\n"
                                        "    <b>7</b>\n  </Channel>"),
              std::string::npos)
        << read_text(new_file_);
}

// --- messages ---------------------------------------------------------------------------------------------------

TEST_F(Quorelxml, TellsWhatIsMissingOnlyInDebugMode) {
    const test::Report report;
    OpenDocument document{file(header_text("<a>1</a>")).c_str()}, foreign;
    const std::string from = ", from XML file " + folder_.file("header.xml");
    for (const bool debug : {false, true}) {
        document.setDebug(debug);
        foreign.setDebug(debug);
        double d = 0;
        float f = 0;
        std::int32_t i = 0;
        char text[8];
        char* const place = text;
        document.readInt(1, "Sec/i", &i, 1);
        document.readFloat(2, "f", &f, 1);
        document.readDouble(1, "d", &d, 1);
        document.readString(1, "s", &place, 1);
        std::vector<std::string> told;
        for (const auto& entry : report.entries())
            told.push_back(entry.kind + " " + entry.file + " " + entry.function + " " + entry.message);
        if (!debug) {
            EXPECT_THAT(told, testing::IsEmpty());
        } else {
            const std::string start = "WARNING quorelxml_v2 quorelxml::read";
            EXPECT_THAT(told, ElementsAre(start + "Int Cannot read int 'Sec/i' in channel 1" + from,
                                          start + "Float Cannot read float 'f' in channel 2" + from,
                                          start + "Double Cannot read double 'd' in channel 1" + from,
                                          start + "String Cannot read string 's' in channel 1" + from));
        }

        test::CapturedStderr captured;
        document.getNode(1, "Sec/a");
        document.getNode(4, "", 2);
        document.channelExists(-7);
        document.getNode(1, "a", 3);
        document.fieldExists(1, "b");
        foreign.initXmlFile(file("<Other/>").c_str());
        EXPECT_EQ(captured.text(),
                  !debug ? ""
                         : "File not recognized: /QuorelXmlDoc/Channel[@Number=\"1\"]/Sec/a does not exist\n"
                           "File not recognized: /QuorelXmlDoc/Channel[@Number=\"4\"] does not exist\n"
                           "File not recognized: /QuorelXmlDoc/Channel[@Number=\"-7\"] does not exist\n"
                           "File not recognized: /QuorelXmlDoc/NumberOfChannels does not exist\n"
                           "File not recognized: /QuorelXmlDoc/Description does not exist\n");
    }
}

}  // namespace
