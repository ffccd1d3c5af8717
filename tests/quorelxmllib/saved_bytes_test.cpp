// SPDX-License-Identifier: Apache-2.0
#include "header_files.h"
#include "shelf.h"
#include "xml_header_property.h"

namespace {

using property::Document;

std::string repeated(std::string_view part, int times) {
    std::string text;
    while (times-- > 0) text += part;
    return text;
}

/** Writes and removals in places that the document has, or not: texts, blank ones too, and arrays take the places
 * of each other. */
void edit_at_random(Document& document, std::mt19937& random) {
    constexpr const char* kPaths[] = {"Sec", "Sec/Arr", "Sec/one", "Sec/texts", "Sec/b", "Blank", "List", "Only"};
    const char* texts[] = {" ", "", "a\r\n\t<&>\"'\xC3\xA8", "last"};
    const double values[] = {1.5, 2.5, 1e-300};
    for (auto edits = random() % 6; edits > 0; --edits) {
        const char* const path = kPaths[random() % std::size(kPaths)];
        const int count = 1 + static_cast<int>(random() % 3), channel = random() % 8 == 0 ? 2 : 1;
        switch (random() % 4) {
            case 0:
                document.clearField(channel, path);
                break;
            case 1:
                document.writeString(channel, path, texts + random() % 2, count);
                break;
            default:
                document.writeDouble(channel, path, values, count);
        }
    }
}

/** Content of an element: blanks, texts, comments, elements that the edits know and others, in any order. */
std::string random_content(std::mt19937& random, int depth) {
    static const auto kLeaves = test::read_table("headers/leaves.txt", '\t');
    constexpr const char* kNames[] = {"Sec", "Arr", "one", "texts", "Blank", "List", "b"};
    std::string content;
    for (auto pieces = random() % 5; pieces > 0; --pieces) {
        if (depth == 0 || random() % 2 == 0) {
            content += kLeaves[random() % kLeaves.size()][0];
            continue;
        }
        const std::string name = kNames[random() % std::size(kNames)];
        const char* const attribute = random() % 8 == 0 ? " xml:space=\"preserve\"" : "";
        content.append("<").append(name).append(attribute).append(">");
        content.append(random_content(random, depth - 1)).append("</").append(name).append(">");
    }
    return content;
}

// The property that the fuzzer drives too, over documents of every shape with every kind of change.
TEST(SavedBytes, AreThoseOfSavingTwice) {
    std::mt19937 random{20120717};
    for (int round = 0; round < 250 && !testing::Test::HasFailure(); ++round) {
        const std::string inside = round == 0 ? "" : random_content(random, 5);
        const std::string text = test::header_text("<S/><x:S xmlns:x=\"urn:x\"/>" + inside);
        SCOPED_TRACE(text);
        EXPECT_NO_THROW(check_saved(property::MemoryFile{text, "header"}, text,
                                    [&](Document& document) { edit_at_random(document, random); }));
    }
}

// What stands outside the root, odd names and references: each as libxml2 writes it, and read all the same.
TEST(SavedBytes, KeepWhatTheLayoutDoesNotKnow) {
    const std::string whole = test::Shelf::text(), root = whole.substr(whole.find("<QuorelXmlDoc>"));
    const auto inside = [&](const std::string& part) {
        return std::string{whole}.insert(whole.find("<width>"), part);
    };
    for (const std::string& text :
         {"<?xml version=\"1.1\" standalone=\"yes\"?>" + root,
          "<?xml version='1.0' encoding='ISO-8859-1' standalone='no'?><!-- a \xE8 -->\n<?pi x?>" + root +
              "<?end?>\n<!-- -->",
          "<!DOCTYPE QuorelXmlDoc [ <!-- none --><?p?> ]>" + root, "<!DOCTYPE a PUBLIC \"x\" 'y\"z'>" + root,
          "<!DOCTYPE a SYSTEM 'http://localhost:1/x'>" +
              inside("&odd;<a b=\"&odd;\">&odd;</a>").substr(whole.find("<QuorelXmlDoc>")),
          inside("<q:a xmlns:q='urn:\"q' q:N=\"1\" N='2 &lt;&quot;&#9;&#10;&#13;>'/><u:v/><u:v/>"),
          inside("<a><![CDATA[x]]]]><![CDATA[>y]]></a><a xml:id=\"i\">1</a><a xml:id=\"i\"/>"),
          inside("<a xml:space=\"preserve\"> <b/> </a><a xml:space=\"default\"> <b/> </a>&#13;\r\n"),
          inside(repeated("<d>", 200) + "x" + repeated("</d>", 200)),
          inside(repeated("<!-- -->", 3000) + repeated("<d/>", 3000))}) {
        SCOPED_TRACE(text.substr(0, 200));
        EXPECT_NO_THROW(property::check(text));
        EXPECT_TRUE(test::Shelf{}.readAuxiliaryFile(property::MemoryFile{text, "header"}.name(), 1, "Shelf"));
    }
}

}  // namespace
