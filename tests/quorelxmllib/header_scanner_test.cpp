// SPDX-License-Identifier: Apache-2.0
#include "quorelxmllib/header_scanner.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <string>

#include "header_files.h"
#include "quorelxmllib/header_parser.h"
#include "shelf.h"

namespace {

/** A document with all that is kept of it, as text. */
std::string told(const quo::HeaderTree& tree, quo::Node parent = quo::Node::none) {
    std::string all = parent == quo::Node::none ? tree.version + tree.standalone : "";
    for (quo::Node node = tree.first(parent); node != quo::Node::none; node = tree.next(node)) {
        all += '(' + std::to_string(static_cast<int>(tree.kind(node))) + tree.name(node) + tree.attributes(node);
        all +=
            (tree.in_namespace(node) ? " in " : " ") + std::to_string(tree.holds_text(node)) + tree.content(node);
        all += told(tree, node) + ')';
    }
    return all;
}

class HeaderScanner : public testing::Test {
protected:
    /** Reads a text as a file, which may go by the short way, and by libxml2 alone: whether the short way did. */
    bool expect_as_libxml2(const std::string& text) {
        test::write_text(file_, text);
        quo::HeaderSource source;
        EXPECT_EQ(source.open(file_.c_str()), 0);
        quo::HeaderTree read, parsed;
        std::string defect = "before";
        const int status = quo::parse_header(source, read, &defect);
        EXPECT_EQ(status, quo::parse_header(text, parsed)) << text;
        EXPECT_TRUE(status != 0 || told(read) == told(parsed)) << text;
        EXPECT_TRUE(status != 0 || source.bytes() == static_cast<std::int64_t>(text.size()));
        EXPECT_TRUE(source.rewind());
        const bool scanned = quo::scan_header(source, read) == 0;
        EXPECT_EQ(status, scanned ? 0 : status);
        EXPECT_TRUE(!scanned || defect.empty()) << defect;
        return scanned;
    }
    const test::TemporaryFolder folder_;
    const std::string file_ = folder_.file("header.xml");
};

// A header cut anywhere, and with every byte changed to some of those that mean something.
TEST_F(HeaderScanner, ReadsWhatAParserForAllOfXmlReads) {
    const std::string good = test::header_text("    <a>\n      <val N=\"1\"> x]\"'</val>\n      <b/>\n    </a>\n");
    EXPECT_TRUE(expect_as_libxml2(good) && expect_as_libxml2(test::Shelf::text()));
    for (std::size_t place = 0; place < good.size(); ++place) {
        expect_as_libxml2(good.substr(0, place));
        for (std::size_t i = 0; i < 5; ++i) {
            std::string changed = good;
            changed[place] = "<>&/\"'= \t\n\rx:]\0\x80"[(5 * place + i) % 16];
            expect_as_libxml2(changed);
        }
    }
}

TEST_F(HeaderScanner, LeavesOtherFormsToThatParser) {
    const auto nested = [](std::size_t depth) {
        std::string text;
        for (std::size_t i = 0; i < depth; ++i) text += "<a>";
        for (std::size_t i = 0; i < depth; ++i) text += "</a>";
        return text;
    };
    const auto run = [](std::size_t count, char c) { return std::string(count, c); };
    const struct {
        bool scanned;
        std::string inside;
    } rows[] = {{false, "<a\n/>"},
                {true, "<a></a><a> </a><a> 1 \n</a><b-._9 N_=\"\"/>"},
                {true, "<a>" + run(30000, 'x') + "</a>" + run(190, ' ') + "<b/>"},
                {true, nested(150)},
                {false, nested(230)},
                {false, nested(300)},
                {false, "<a>" + run(120000, 'x') + "</a>"},
                {false, "<a>" + run(600, ' ') + "</a>" + run(900, '\n') + "<b/>"},
                {false, "<a>1<b/></a>"},
                {false, "<a><b/>1</a>"},
                {false, "<a N=\"1\" M=\"2\"/>"},
                {false, "<a N=\"1\" N=\"2\"/>"},
                {false, "<a N='1'/>"},
                {false, "<a N=\"&lt;\"/>"},
                {false, "<a N=\"1\" >1</a >"},
                {false, "<a xmlns=\"u\"/>"},
                {false, "<a xml:space=\"preserve\"> <b/> </a>"},
                {false, "<x:a xmlns:x=\"u\"/>"},
                {false, "<!-- --><a/><?p i?>"},
                {false, "<a><![CDATA[1]]></a>"},
                {false, "<a>&amp;]]&gt;</a>"},
                {false, "<a>\xC3\xA9</a>"},
                {false, "<\xC3\xA9/>"},
                {false, "<a>1\r\n</a>"}};
    for (const auto& [scanned, inside] : rows)
        EXPECT_EQ(expect_as_libxml2(test::header_text(inside)), scanned) << inside.substr(0, 60);
    for (const char* around : {"<!-- -->", "<a/>", "x", "\n \t\n", "\xEF\xBB\xBF"}) {
        expect_as_libxml2(test::header_text("") + around);
        expect_as_libxml2(around + test::header_text(""));
    }
}

// Pieces of the file end anywhere within it; more names than those that are looked for first.
TEST_F(HeaderScanner, ReadsLongFiles) {
    for (const int blanks : {0, 1, 7, 30}) {
        std::string inside;
        for (int i = 0; i < 9000; ++i) {
            const std::string number = std::to_string(i), name = "n" + std::to_string(i % 3000);
            inside += std::string(static_cast<std::size_t>(blanks), ' ') + "<val N=\"" + number + "\">" + number +
                      ".5</val><" + name + "/>";
        }
        EXPECT_TRUE(expect_as_libxml2(test::header_text(inside)));
    }
}

/** Counts the elements of one name, and the most that the tree held when one was complete. */
struct Values : quo::ElementChoice {
    void starts() override { count = 0; }
    bool begins(const quo::HeaderTree& tree, quo::Node element, int) override {
        return tree.is_named(element, "val");
    }
    void ends(int) override {}
    void take(const quo::HeaderTree& tree, quo::Node element) override {
        most_bytes = std::max(most_bytes, tree.text_bytes());
        most_nodes = std::max(most_nodes, static_cast<std::uint32_t>(element));
        ++count;
    }
    std::uint32_t count = 0, most_bytes = 0, most_nodes = 0;
};

// By either way, beside a thousand names that share no place.
TEST_F(HeaderScanner, KeepsNoMoreOfALongFileThanWasChosen) {
    std::string inside;
    for (int i = 0; i < 9000; ++i)
        inside += "<val N=\"1\">17.3</val><name_of_many_letters_" + std::to_string(i) +
                  " M=\"2\">x</name_of_many_letters_" + std::to_string(i) + ">";
    for (const char* last : {"<b/>", "<b></b >"}) {
        test::write_text(file_, test::header_text(inside + last));
        quo::HeaderSource source;
        quo::HeaderTree tree;
        Values values;
        EXPECT_EQ(source.open(file_.c_str()), 0);
        EXPECT_EQ(quo::parse_header(source, tree, nullptr, &values), 0);
        EXPECT_TRUE(values.count == 9000 && values.most_bytes < 70000 && values.most_nodes < 8)
            << values.most_bytes;
    }
}

}  // namespace
