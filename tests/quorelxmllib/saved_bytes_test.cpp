#include <gtest/gtest.h>
#include <libxml/parser.h>
#include <libxml/tree.h>

#include <iterator>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "header_files.h"

namespace {

using test::header_text;
using test::OpenDocument;
using test::read_text;
using test::write_text;

using Tree = std::unique_ptr<xmlDoc, decltype(&xmlFreeDoc)>;

void save(xmlDoc* tree, const std::string& file) {
    ASSERT_GT(xmlSaveFormatFileEnc(file.c_str(), tree, "UTF-8", 1), 0);
}

/** The way of writing that saving in one go must equal: save, load without blank text nodes, save again. */
std::string saved_twice(xmlDoc* tree, const std::string& file) {
    save(tree, file);
    const int before = xmlKeepBlanksDefault(0);
    const Tree again{xmlParseFile(file.c_str()), &xmlFreeDoc};
    xmlKeepBlanksDefault(before);
    if (!again) return "not parsed";
    save(again.get(), file);
    return read_text(file);
}

void nothing(quorelxml&) {}
void add_values(quorelxml& document) {
    const double doubles[] = {1.5, 2.5, 1e-300};
    const std::int32_t one = 7;
    const char* texts[] = {"", " ", "a\r\n\t<&>\"'\xC3\xA8", "last"};
    document.writeDouble(1, "Sec/Arr", doubles, 3);
    document.writeInt(1, "Sec/one", &one, 1);
    document.writeString(1, "Sec/texts", texts, 4);
    document.writeString(1, "Sec/empty", texts, 1);
    document.writeString(2, "blank", texts + 1, 1);
}
void add_under_blank_text(quorelxml& document) {
    const char* blank = "  ";
    const std::int32_t values[] = {1, 2};
    document.writeString(1, "Sec/b", &blank, 1);
    document.writeInt(1, "Sec/b", values, 2);
    document.writeInt(1, "Blank", values, 2);
}
void add_beside_text(quorelxml& document) {
    const std::int32_t values[] = {1, 2, 3};
    document.writeInt(1, "List", values, 3);
}
void replace_array_by_text(quorelxml& document) {
    const char* text = "now a text";
    add_values(document);
    document.writeString(1, "Sec/Arr", &text, 1);
    document.writeString(1, "Mixed", &text, 1);
}
void remove_section(quorelxml& document) {
    auto& open = static_cast<OpenDocument&>(document);
    open.clearField(1, "Sec");
    open.clearField(1, "Blank");
    open.clearField(1, "Only");
}

struct Edit {
    const char* name;
    void (*apply)(quorelxml&);
};
constexpr Edit kEdits[] = {{"Nothing", nothing},
                           {"Values", add_values},
                           {"UnderBlankText", add_under_blank_text},
                           {"BesideText", add_beside_text},
                           {"TextForArray", replace_array_by_text},
                           {"Removal", remove_section}};

/** Content of an element: blanks, texts, comments, elements that the edits know and others, in any order. */
std::string random_content(std::mt19937& random, int depth) {
    constexpr const char* kLeaves[] = {" ",
                                       "\n  ",
                                       "text",
                                       " 1, 2 ",
                                       "<!-- c -->",
                                       "<?p i?>",
                                       "<![CDATA[ x ]]>",
                                       "<![CDATA[]]>",
                                       "&#32;",
                                       "&lt;&amp;",
                                       "&#13;",
                                       "<e/>",
                                       "<e></e>",
                                       "<e> </e>",
                                       "&#xE8;<Only a=\"&#10;&quot;\"/>",
                                       "<Only xmlns=\"urn:y\"> </Only>"};
    constexpr const char* kNames[] = {"Sec", "Arr", "one", "texts", "Blank", "List", "b"};
    std::string content;
    for (auto pieces = random() % 5; pieces > 0; --pieces) {
        if (depth == 0 || random() % 2 == 0) {
            content += kLeaves[random() % std::size(kLeaves)];
            continue;
        }
        const std::string name = kNames[random() % std::size(kNames)];
        const char* const attribute = random() % 8 == 0 ? " xml:space=\"preserve\"" : "";
        content.append("<").append(name).append(attribute).append(">");
        content.append(random_content(random, depth - 1)).append("</").append(name).append(">");
    }
    return content;
}

// One save must put on the disk what saving, loading and saving again would put there.
void expect_saved_as_if_twice(const std::string& inside, const Edit& edit) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("header.xml"), literal = folder.file("literal.xml");
    const std::string text = header_text("<S/><x:S xmlns:x=\"urn:x\"/>" + inside);
    SCOPED_TRACE(edit.name + text);
    write_text(file, text);
    OpenDocument document{file.c_str()};
    ASSERT_TRUE(document.fieldExists(1, "S"));
    edit.apply(document);
    const std::string expected = saved_twice(static_cast<xmlNode*>(document.getNode(1, ""))->doc, literal);
    EXPECT_EQ(document.write(), 0);
    EXPECT_EQ(read_text(file), expected);
    EXPECT_EQ(document.write(), 0) << "the document in memory is still whole";
    const Tree again{xmlReadFile(file.c_str(), nullptr, XML_PARSE_NOBLANKS), &xmlFreeDoc};
    EXPECT_EQ(saved_twice(again.get(), literal), expected) << "the file must not change by being opened and saved";
}

TEST(SavedBytes, AreThoseOfSavingTwice) {
    for (const Edit& edit : kEdits) expect_saved_as_if_twice("", edit);
    std::mt19937 random{20120717};
    for (int round = 0; round < 250 && !testing::Test::HasFailure(); ++round) {
        const std::string inside = random_content(random, 5);
        expect_saved_as_if_twice(inside, kEdits[random() % std::size(kEdits)]);
    }
}

}  // namespace
