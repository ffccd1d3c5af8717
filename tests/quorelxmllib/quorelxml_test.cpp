#include "header_files.h"
#include "quo_base/quorelxml_v2.h"

namespace {

using test::header_text;
using test::OpenDocument;
using test::read_text;
using test::replaced;
using test::write_text;
using testing::ElementsAre;

std::string golden(const char* name) { return read_text(std::string{QUO_TEST_DATA} + "/headers/" + name); }

class Quorelxml : public testing::Test {
protected:
    std::string file(const std::string& content) {
        write_text(file_, content);
        return file_;
    }
    test::TemporaryFolder folder_;
    const std::string new_file_ = folder_.file("new.xml"), file_ = folder_.file("header.xml");
};

TEST_F(Quorelxml, MakesAFreshDocumentInMemoryForAMissingFile) {
    const test::Report report;
    OpenDocument document{new_file_.c_str()};
    EXPECT_TRUE(document.isRecognized() && document.numberOfChannels() == 0);
    EXPECT_EQ(read_text(new_file_), "");
    EXPECT_EQ(document.write(), 0);
    EXPECT_EQ(read_text(new_file_), golden("fresh.xml"));
    EXPECT_THAT(report.entries(), testing::IsEmpty()) << "a missing file is no error";
    EXPECT_EQ(document.initXmlFile(folder_.path().c_str()), 0) << "it stands in";
    EXPECT_EQ(document.write(), 1);
    EXPECT_THAT(report.messages("ERROR"), testing::Contains("File writing failed!"));
}

// The name of another file must never be written to, so a name that does not fit is not cut.
TEST_F(Quorelxml, IsEmptyWithoutAFileAndAfterCleaning) {
    const std::string longest = folder_.file(std::string(250, 'n')) + "/" + std::string(600, 'n');
    OpenDocument document;
    double value = -17.3;
    for (int round = 0; round < 2; ++round) {
        EXPECT_FALSE(document.isRecognized() || document.channelExists(1) || document.fieldExists(1, "a"));
        EXPECT_EQ(document.countNodes(1, "a") + document.clearField(1, "a"), 0);
        EXPECT_EQ(document.readDouble(1, "a", &value, 1) + document.initXmlFile(longest.c_str()), 2);
        EXPECT_EQ(document.fileName(), "");
        EXPECT_EQ(document.write() + document.setDescription(longest.c_str(), "New"), 2);
        EXPECT_FALSE(document.loaded());  // a document without a file once stayed behind
        EXPECT_EQ(document.initXmlFile(file(header_text("<a>2.5</a>")).c_str()), 0);
        EXPECT_TRUE(document.fieldExists(1, "a"));
        EXPECT_EQ(document.clean() + document.clean(), 0);
    }
    EXPECT_EQ(value, -17.3);
    EXPECT_EQ(document.initXmlFile(nullptr), 0);
    EXPECT_EQ(document.write(), 1);
}

TEST_F(Quorelxml, WritesItsLayout) {
    quorelxml document{new_file_.c_str()};
    const std::int32_t count = -3, ints[] = {7, 8}, four[] = {1, 2, 3, 4};
    const double scalar = 1.0 / 3.0, doubles[] = {1e300, 0.1, -17.25};
    const float narrow = 0.1F;
    const char *one[] = {"H/H & <V/V>"}, *two[] = {"first", ""};
    int status = document.writeInt(1, "Sec/count", &count, 1) + document.writeDouble(1, "Sec/Arr", doubles, 3) +
                 document.writeDouble(1, "Sec/scalar", &scalar, 1) +
                 document.writeFloat(1, "Sec/narrow", &narrow, 1) + document.writeString(1, "Sec/one", one, 1) +
                 document.writeString(1, "Sec/two", two, 2);
    // What is written over leaves no second index, and what is not reached stays.
    status += document.writeInt(3, "Other/deep/ints", four, 4) + document.writeInt(3, "Other/deep/ints", ints, 2) +
              document.writeInt(3, "Other/b", ints, 2) + document.writeInt(3, "Other/b", &count, 1) +
              document.writeInt(3, "Other/b", ints, 0) + document.writeInt(3, "Other/none", ints, 0);
    EXPECT_EQ(status + document.write(), 0);
    EXPECT_EQ(read_text(new_file_), golden("layout.xml"));
}

TEST_F(Quorelxml, SetsTheDescriptionOnDisk) {
    OpenDocument document;
    const std::string text = header_text("    <a>1</a>\n"), endless(3000, 'd');
    EXPECT_EQ(document.setDescription(file(text).c_str(), "Pass <2> & more"), 0);
    EXPECT_FALSE(document.loaded());
    EXPECT_EQ(document.description(), "Pass <2> & more");
    EXPECT_EQ(read_text(file_), replaced(text, "A scene", "Pass &lt;2&gt; &amp; more"));

    EXPECT_EQ(document.setDescription(new_file_.c_str(), endless.c_str()), 0);
    EXPECT_EQ(document.setDescription(new_file_.c_str(), "\x07"), 1);
    EXPECT_EQ(document.initXmlFile(new_file_.c_str()), 0);
    EXPECT_EQ(document.description(), std::string(2047, 'd')) << "the copy is cut, the document is not";
    EXPECT_NE(read_text(new_file_).find(endless), std::string::npos);
}

TEST_F(Quorelxml, AddsTheStyleSheetOnce) {
    const std::string commented = "<!-- first -->" + header_text("").substr(39);
    for (int round = 0; round < 2; ++round) {
        quorelxmlPi document;
        for (int twice = 0; twice < 2; ++twice)
            EXPECT_EQ(document.initXmlFile(new_file_.c_str(), "view/\"a\"?>.xsl"), 0);
        EXPECT_EQ(document.write(), 0);
        EXPECT_EQ(read_text(new_file_),
                  replaced(golden("fresh.xml"), "<QuorelXmlDoc>",
                           "<?xml-stylesheet type=\"text/xsl\" href=\"view/&quot;a&quot;?&gt;.xsl\"?>\n"
                           "<QuorelXmlDoc>"));
        EXPECT_EQ(document.initXmlFile(file(commented).c_str(), "a.xsl") + document.write(), 0);
        EXPECT_EQ(read_text(file_).find("xml-stylesheet"), std::string::npos);
    }
}

// The choice of all documents, and that of one, which rules where it was made.
TEST_F(Quorelxml, ReadsFifteenDigitsBackOrAllOfThem) {
    using Limits = std::numeric_limits<double>;
    const double values[] = {1.0 / 3.0, 803457.318291746, -0.0, 5e-324, Limits::max(), Limits::infinity()};
    for (const bool all : {false, true})
        for (const int own : {-1, 0, 1}) {
            quorelxml::setExactNumbers(all);
            quorelxml document{new_file_.c_str()};
            if (own >= 0) document.useExactNumbers(own == 1);
            double back[6] = {};
            EXPECT_EQ(document.writeDouble(1, "a", values, 6) + document.write(), 0);
            EXPECT_EQ(quorelxml{new_file_.c_str()}.readDouble(1, "a", back, 6), 0);
            for (int i = 0; i < 6; ++i) {
                char rounded[40];
                std::snprintf(rounded, sizeof rounded, "%.15g", values[i]);
                EXPECT_EQ(back[i], own == 1 || (own < 0 && all) ? values[i] : std::strtod(rounded, nullptr));
                EXPECT_EQ(std::signbit(back[i]), std::signbit(values[i]));
            }
        }
    quorelxml::setExactNumbers(false);
}

template <typename Number>
using Reader = int (quorelxml::*)(int channel, const char* field, Number* values, int count) noexcept;

/** The statuses of reading one, three and no values added up, the one and the three. */
template <typename Number>
std::vector<double> read_back(quorelxml& document, Reader<Number> read, int channel, const char* field) {
    Number one{9}, three[] = {9, 9, 9};
    const int status = (document.*read)(channel, field, &one, 1) + (document.*read)(channel, field, three, 3) +
                       (document.*read)(channel, field, &one, 0);
    const auto wide = [](Number number) { return static_cast<double>(number); };
    return {static_cast<double>(status), wide(one), wide(three[0]), wide(three[1]), wide(three[2])};
}

TEST_F(Quorelxml, ConvertsTextsAsFarAsTheyAreNumbersAndLeavesTheRest) {
    quorelxml document{file(header_text("<a>  -12abc</a><b>2.5, 3.5</b><c/><d><![CDATA[7]]>.5<!-- , -->0</d>"
                                        "<e><val N=\"1\">1</val><other/><val N=\"2\">2.5</val></e>"))
                           .c_str()};
    const struct {
        int channel;
        const char* field;
        std::vector<double> ints, reals;
    } rows[] = {
        {1, "a", {0, -12, -12, 9, 9}, {0, -12, -12, 9, 9}}, {1, "b", {0, 2, 2, 9, 9}, {0, 2.5, 2.5, 3.5, 9}},
        {1, "c", {0, 0, 9, 9, 9}, {0, 0, 9, 9, 9}},         {1, "d", {0, 7, 7, 9, 9}, {0, 7.5, 7.5, 9, 9}},
        {1, "e", {0, 12, 1, 2, 9}, {0, 12.5, 1, 2.5, 9}},   {2, "a", {3, 9, 9, 9, 9}, {3, 9, 9, 9, 9}}};
    for (const auto& [channel, field, ints, reals] : rows) {
        EXPECT_EQ(read_back<std::int32_t>(document, &quorelxml::readInt, channel, field), ints);
        EXPECT_EQ(read_back<float>(document, &quorelxml::readFloat, channel, field), reals);
        EXPECT_EQ(read_back<double>(document, &quorelxml::readDouble, channel, field), reals);
    }
}

TEST_F(Quorelxml, KeepsEveryTextThatXmlCanHold) {
    std::vector<std::string> texts{"", " ", "  blanks around  ", "a\rb\nc\td", "]]>&amp;<x/>", "\xE2\x82\xAC"};
    for (int code = 1; code < 128; ++code)
        if (code >= 32 || std::strchr("\t\n\r", code)) texts.emplace_back(3, static_cast<char>(code));
    std::vector<const char*> places;
    for (const std::string& text : texts) places.push_back(text.c_str());
    std::vector<std::array<char, 64>> room(texts.size());
    std::vector<char*> buffers;
    for (auto& buffer : room) buffers.push_back(buffer.data());
    const int count = static_cast<int>(texts.size());
    quorelxml document{new_file_.c_str()};
    EXPECT_EQ(document.writeString(1, "Sec/t", places.data(), count) + document.write(), 0);
    quorelxml back{new_file_.c_str()};
    EXPECT_EQ(back.readString(1, "Sec/t", buffers.data(), count + 1), 1) << "texts are all there or not read";
    EXPECT_EQ(back.readString(1, "Sec/t", buffers.data(), 3, 3), 0);
    EXPECT_STREQ(buffers[2], "  ");
    EXPECT_EQ(back.readString(1, "Sec/t", buffers.data(), count), 0);
    EXPECT_EQ((std::vector<std::string>{buffers.begin(), buffers.end()}), texts);
}

TEST_F(Quorelxml, RefusesTextsAndNamesThatXmlCannotHold) {
    const test::Report report;
    const std::string text = header_text("    <a>1</a>\n");
    quorelxml document{file(text).c_str()};
    const char* bad[] = {"fine", "\x01"};
    const double value = 1.5;
    EXPECT_EQ(document.writeString(1, "t", bad, 2), 1);
    for (const char* name : {"", "a b", "val[1]", static_cast<const char*>(nullptr)})
        EXPECT_EQ(document.writeDouble(1, name, &value, 1), 1);
    EXPECT_EQ(document.writeDouble(1, "a", nullptr, 1) + document.readDouble(1, "a", nullptr, 1), 2);
    EXPECT_GE(report.entries("ERROR").size(), 7U);
    EXPECT_EQ(document.write(), 0);
    EXPECT_EQ(read_text(file_), text);
}

TEST_F(Quorelxml, TellsWhatIsMissingOnlyInDebugMode) {
    for (const bool debug : {false, true}) {
        const test::Report report;
        test::CapturedStderr captured;
        OpenDocument document{file(header_text("<a>1</a>")).c_str()}, foreign;
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
        document.getNode(1, "Sec/a");
        document.getNode(4, "", 2);
        document.channelExists(-7);
        document.getNode(1, "a", 3);
        document.fieldExists(1, "b");
        foreign.initXmlFile(file("<Other/>").c_str());
        std::string told;
        for (const auto& e : report.entries())
            told += e.kind + " " + e.file + " " + e.function + " " +
                    replaced(e.message, folder_.path().string(), "") + "\n";
        EXPECT_EQ(told + captured.text(), debug ? golden("debug.txt") : "");
    }
}

}  // namespace
