// SPDX-License-Identifier: Apache-2.0
#include <libxml/parser.h>
#include <libxml/xpath.h>

#include "header_files.h"
#include "support/fields.h"

namespace {

using test::OpenDocument;
using test::read_text;
using test::write_text;

/** A document with every shape that a path can meet: repeated channels and sections, a section without the field,
 * namespaces, comments, elements inside values. */
const char* const kShapes = R"(<QuorelXmlDoc xmlns:x="urn:x">
  <NumberOfChannels>3</NumberOfChannels><Description/>
  <Channel Number="1"><Sec><a>1</a><!-- a --><a>2<b>3</b></a></Sec><x:Sec><a>4</a></x:Sec><Other/></Channel>
  <Group><Channel Number="1"><Sec><a>5</a></Sec></Channel></Group>
  <Channel Number="01"><Sec><a>6</a></Sec></Channel>
  <Channel x:Number="1"><Sec><a>7</a></Sec></Channel>
  <Channel Number="2"/>
  <Channel Number="1"><Sec xmlns="urn:y"><a>8</a></Sec><Sec/><Sec><c><a>9</a></c><a>10</a><x:a>11</x:a></Sec></Channel>
  <Channel Number="-5"><Sec><a><val N="1">12</val><val>13</val></a></Sec></Channel>
</QuorelXmlDoc>)";

class QuorelxmlLayout : public testing::Test {
protected:
    OpenDocument& load(const std::string& text) {
        write_text(file_, text);
        document_.initXmlFile(file_.c_str());
        return document_;
    }
    test::TemporaryFolder folder_;
    const std::string file_ = folder_.file("header.xml");
    OpenDocument document_;
};

/** The texts of the nodes that libxml2's own evaluation of an expression finds. */
std::vector<std::string> evaluated(const std::string& expression) {
    const std::unique_ptr<xmlDoc, decltype(&xmlFreeDoc)> tree{
        xmlReadMemory(kShapes, static_cast<int>(std::strlen(kShapes)), nullptr, nullptr, XML_PARSE_NOBLANKS),
        &xmlFreeDoc};
    const std::unique_ptr<xmlXPathContext, decltype(&xmlXPathFreeContext)> context{xmlXPathNewContext(tree.get()),
                                                                                   &xmlXPathFreeContext};
    const std::unique_ptr<xmlXPathObject, decltype(&xmlXPathFreeObject)> result{
        xmlXPathEvalExpression(reinterpret_cast<const xmlChar*>(expression.c_str()), context.get()),
        &xmlXPathFreeObject};
    std::vector<std::string> texts;
    for (int i = 0; result && result->nodesetval && i < result->nodesetval->nodeNr; ++i) {
        const std::unique_ptr<xmlChar, decltype(xmlFree)> text{xmlNodeGetContent(result->nodesetval->nodeTab[i]),
                                                               xmlFree};
        texts.emplace_back(reinterpret_cast<const char*>(text.get()));
    }
    return texts;
}

// Messages tell look-ups as XPath expressions: walking must find the same nodes in the same order.
TEST_F(QuorelxmlLayout, FindsWhatTheExpressionFinds) {
    OpenDocument& document = load(kShapes);
    int found = 0;
    for (const int channel : {1, 2, 3, -5})
        for (const char* field :
             {"", "Sec", "Sec/a", "Sec/a/b", "Sec/a/val", "Sec/c", "Sec/c/a", "Other", "a", "x"}) {
            std::string expression;
            OpenDocument::setXpathExpression(channel, field, expression);
            SCOPED_TRACE(expression);
            const auto expected = evaluated(expression);
            const int count = static_cast<int>(expected.size());
            std::vector<std::string> texts;
            document.readTexts(channel, field, [&](std::string_view text) { texts.emplace_back(text); });
            EXPECT_EQ(texts, expected);
            EXPECT_EQ(document.countNodes(channel, field), count);
            std::set<void*> nodes;
            for (int i = 0; i < count; ++i) nodes.insert(document.getNode(channel, field, i));
            EXPECT_TRUE(std::ssize(nodes) == count && !nodes.contains(nullptr));
            EXPECT_TRUE(!document.getNode(channel, field, count) && !document.getNode(channel, field, -1));
            EXPECT_EQ(document.getNode(channel, field), document.getNode(channel, field, 0));
            EXPECT_EQ(document.fieldExists(channel, field), count > 0);
            EXPECT_TRUE(document.fieldHasCount(channel, field, count) &&
                        !document.fieldHasCount(channel, field, count + 1));
            found += count;
        }
    EXPECT_EQ(found, 18);
    EXPECT_TRUE(document.channelExists(2) && !document.channelExists(3));
    // As part of an expression these would find the description, every section or somebody else's channel.
    for (const char* name : {"..", "*", "../Description", "Sec[1]", "Sec/*", "@Number", "Sec//a", "//a", "/Sec/a",
                             "Sec/a/", "Sec/a/text()", "Sec|Other", "x:Sec", "\"]|//*[\"", ".", "Sec/./a"})
        EXPECT_EQ(document.countNodes(1, name), 0) << name;
}

// The children of one element, as the document has them and as a list of names and numbers in the order of the
// file. There are children and look-ups in vain enough that the document answers from its index; an element with
// children may become one with a text, which takes what was below it; texts beside elements make a save load the
// tree once more.
TEST(ManyChildren, AreFoundWhateverCameAndWent) {
    const char* text = "text";
    for (unsigned seed = 1; seed < 6; ++seed) {
        std::mt19937 random{seed};
        const test::TemporaryFolder folder;
        test::OpenDocument document{folder.file("header.xml").c_str()};
        std::vector<std::pair<std::string, int>> model;
        for (int step = 0; step < 4000; ++step) {
            const auto choice = random() % 1000;
            const std::string name = "child" + std::to_string(random() % 300), path = "Set/" + name;
            const auto named = [&name](const auto& child) { return child.first == name; };
            auto present = static_cast<int>(std::ranges::count_if(model, named));
            int status = 0;
            if (choice < 300) {
                const auto value = static_cast<std::int32_t>(random() % 1000000);
                status = document.writeInt(1, path.c_str(), &value, 1);
                if (present == 0) model.emplace_back(name, value);
                std::ranges::find_if(model, named)->second = value;
            } else if (choice < 340 && seed % 2 == 0) {  // else no two bear one name
                status = document.createField(1, path.c_str(), present + 2);
                model.insert(model.end(), 2, {name, 0});
            } else if (choice < 440) {
                status = document.clearField(1, path.c_str());
                std::erase_if(model, named);
            } else if (choice < 443) {
                if (choice == 442) status = document.writeString(1, "Set", &text, 1);
                status += document.clearField(1, "Set");
                model.clear();
            } else if (choice < 446) {
                status = document.writeString(1, "Mixed", &text, 1) + document.createField(1, "Mixed/element") +
                         document.write();
            }
            ASSERT_EQ(status, 0);
            std::int32_t value = -1;
            present = static_cast<int>(std::ranges::count_if(model, named));
            ASSERT_EQ(document.readInt(1, path.c_str(), &value, 1), present > 0 ? 0 : 1) << step;
            ASSERT_EQ(value, present > 0 ? std::ranges::find_if(model, named)->second : -1) << step;
            ASSERT_EQ(document.countNodes(1, path.c_str()), present) << step;
        }
    }
}

}  // namespace
