// SPDX-License-Identifier: Apache-2.0
#include "quorelxmllib/header_writer.h"

#include <algorithm>
#include <string>

namespace quo {
namespace {

constexpr int kDeepestIndent = 30;

/** Whether one of an element's children takes part in its text: then blanks put between them would change it. */
bool has_text(const HeaderTree& tree, Node parent) noexcept {
    for (Node node = tree.first(parent); node != Node::none; node = tree.next(node)) {
        const NodeKind kind = tree.kind(node);
        if (kind == NodeKind::text || kind == NodeKind::cdata || kind == NodeKind::reference) return true;
    }
    return false;
}

class Writer {
public:
    Writer(const HeaderTree& tree, const std::function<bool(std::string_view)>& take) : tree_{tree}, take_{take} {
        pending_.reserve(kPiece);
    }

    bool run() {
        put("<?xml version=\"", tree_.version, "\" encoding=\"UTF-8\"");
        if (!tree_.standalone.empty()) put(" standalone=\"", tree_.standalone, "\"");
        put("?>\n");
        for (Node node = tree_.first(Node::none); node != Node::none; node = tree_.next(node)) {
            write(node, 0, true);
            put("\n");
        }
        flush();
        return good_;
    }

private:
    static constexpr std::size_t kPiece = 256U << 10U;

    void write(Node node, int level, bool formatted) {
        const char* const content = tree_.content(node);
        switch (tree_.kind(node)) {
            case NodeKind::element:
                return write_element(node, level, formatted);
            case NodeKind::text:
                return put_escaped(content);
            case NodeKind::cdata:
                return write_cdata(content);
            case NodeKind::comment:
                return put("<!--", content, "-->");
            case NodeKind::instruction:
                return put("<?", tree_.name(node), *content ? " " : "", content, "?>");
            case NodeKind::reference:
                return put("&", tree_.name(node), ";");
            case NodeKind::doctype:
                return put(content);
            case NodeKind::document:
                break;
        }
    }
    void write_element(Node node, int level, bool formatted) {
        const char* const name = tree_.name(node);
        put("<", name, tree_.attributes(node));
        const bool holds_text = tree_.holds_text(node);
        if (!holds_text && tree_.first(node) == Node::none) return put("/>");
        put(">");
        if (holds_text)
            put_escaped(tree_.content(node));
        else
            write_children(node, level, formatted && !has_text(tree_, node));
        put("</", name, ">");
    }
    void write_children(Node parent, int level, bool formatted) {
        if (formatted) put("\n");
        for (Node node = tree_.first(parent); node != Node::none; node = tree_.next(node)) {
            if (formatted) indent(level + 1);
            write(node, level + 1, formatted);
            if (formatted) put("\n");
        }
        if (formatted) indent(level);
    }
    void indent(int level) {
        static constexpr std::string_view kBlanks = "                                                            ";
        static_assert(kBlanks.size() == 2 * kDeepestIndent);
        put(kBlanks.substr(0, 2 * static_cast<std::size_t>(std::min(level, kDeepestIndent))));
    }
    /** A text with what would end the section is spread over several. */
    void write_cdata(std::string_view text) {
        for (auto end = text.find("]]>"); end != text.npos; end = text.find("]]>")) {
            put("<![CDATA[", text.substr(0, end + 2), "]]>");
            text.remove_prefix(end + 2);
        }
        put("<![CDATA[", text, "]]>");
    }

    void put_escaped(std::string_view text) {
        for (auto place = text.find_first_of("<>&\r"); place != text.npos; place = text.find_first_of("<>&\r")) {
            put(text.substr(0, place), escaped(text[place]));
            text.remove_prefix(place + 1);
        }
        put(text);
    }
    static std::string_view escaped(char character) {
        if (character == '<') return "&lt;";
        if (character == '>') return "&gt;";
        return character == '&' ? "&amp;" : "&#13;";
    }

    template <typename... Texts>
    void put(const Texts&... texts) {
        (put_one(texts), ...);
    }
    void put_one(std::string_view text) {
        if (pending_.size() + text.size() > kPiece) flush();
        if (text.size() > kPiece)
            good_ = good_ && take_(text);
        else
            pending_ += text;  // within the reserved room: cannot throw
    }
    void flush() {
        if (!pending_.empty()) good_ = good_ && take_(pending_);
        pending_.clear();
    }

    const HeaderTree& tree_;
    const std::function<bool(std::string_view)>& take_;
    std::string pending_;
    bool good_ = true;
};

}  // namespace

bool write_indented(const HeaderTree& tree, const std::function<bool(std::string_view)>& take) {
    return Writer{tree, take}.run();
}

}  // namespace quo
