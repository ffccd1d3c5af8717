// SPDX-License-Identifier: Apache-2.0
#include "quorelxmllib/header_scanner.h"

#include <array>
#include <cstring>
#include <exception>
#include <string_view>
#include <vector>

#include "quo_base/api.h"

namespace quo {
namespace {

enum : std::uint8_t { kNameStart = 1, kNameCharacter = 2, kValueCharacter = 4, kTextCharacter = 8, kBlank = 16 };

/** What a byte may be part of. */
constexpr std::array<std::uint8_t, 256> kClasses = [] {
    std::array<std::uint8_t, 256> classes{};
    for (std::size_t c = ' '; c < 0x7F; ++c) {
        const bool letter = (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z') || c == '_';
        const bool in_name = letter || (c >= '0' && c <= '9') || c == '.' || c == '-';
        const bool markup = c == '<' || c == '>' || c == '&';
        classes[c] =
            static_cast<std::uint8_t>((letter ? kNameStart : 0) | (in_name ? kNameCharacter : 0) |
                                      (markup || c == '"' ? 0 : kValueCharacter) | (markup ? 0 : kTextCharacter));
    }
    for (const unsigned char blank : {' ', '\n', '\t'}) classes[blank] |= kBlank | kTextCharacter;
    return classes;
}();
bool is(std::uint8_t part, char c) noexcept { return (kClasses[static_cast<unsigned char>(c)] & part) != 0; }

/** The bytes of a source: as many as a tag or a text may take lie in one piece, a NUL ends them. */
class Window {
public:
    explicit Window(HeaderSource& source) : source_{source}, bytes_(kRoom + 1) { at = end_ = bytes_.data(); }

    /** Reads on where less than the longest piece is left. */
    void fill() {
        if (static_cast<std::size_t>(end_ - at) >= kLongest || complete_) return;
        char* const start = bytes_.data();
        std::memmove(start, at, static_cast<std::size_t>(end_ - at));
        end_ = start + (end_ - at);
        at = start;
        while (!complete_ && end_ - at < static_cast<std::ptrdiff_t>(kLongest)) {
            const int got = HeaderSource::read(&source_, end_, static_cast<int>(start + kRoom - end_));
            complete_ = got <= 0;
            if (got > 0) end_ += got;
        }
        *end_ = '\0';
    }
    [[nodiscard]] bool at_end() const noexcept { return complete_ && at == end_; }
    /** Passes what comes next, if it is this. */
    bool take(std::string_view text) noexcept {
        if (std::strncmp(at, text.data(), text.size()) != 0) return false;
        at += text.size();
        return true;
    }
    /** Passes the bytes of a kind. */
    std::string_view take_all(std::uint8_t part) noexcept {
        const char* const first = at;
        while (is(part, *at)) ++at;
        return {first, static_cast<std::size_t>(at - first)};
    }

    const char* at;

private:
    static constexpr std::size_t kRoom = 96U << 10U, kLongest = 32U << 10U;
    HeaderSource& source_;
    std::vector<char> bytes_;
    char* end_;
    bool complete_ = false;
};

class Scanner {
public:
    Scanner(HeaderSource& source, HeaderTree& tree, ElementChoice* choice)
        : in_{source}, tree_{tree}, filter_{tree, choice} {}

    /** Whether the source holds one document of that form. */
    bool run() {
        in_.fill();
        if (!in_.take("<?xml version=\"1.0\" encoding=\"UTF-8\"?>")) return false;
        in_.take_all(kBlank);
        if (!begin_element()) return false;
        while (!open_.empty())
            if (!go_on()) return false;
        do {
            in_.fill();
        } while (!in_.take_all(kBlank).empty());
        return in_.at_end();
    }

private:
    // Longer runs of blanks, deeper nesting and more names meet limits of the parser for all of XML.
    static constexpr std::size_t kMostBlanks = 200, kDeepest = 200, kMostNames = 10'000'000;

    /** Within an element: its text and its end, or what stands before its next child, and that child's tag. */
    bool go_on() {
        in_.fill();
        const auto [element, leaf] = open_.back();
        const char* const first = in_.at;
        const std::size_t blanks = in_.take_all(kBlank).size();
        if (blanks > kMostBlanks) return false;
        if (*in_.at == '<' && in_.at[1] != '/') return begin_element();
        in_.take_all(kTextCharacter);
        if (leaf && filter_.keeps())
            tree_.set_leaf_text(element, tree_.keep({first, static_cast<std::size_t>(in_.at - first)}));
        else if (!leaf && in_.at != first + blanks)
            return false;
        return end_element();
    }

    bool begin_element() {
        in_.fill();
        if (!in_.take("<") || !is(kNameStart, *in_.at) || open_.size() > kDeepest) return false;
        const std::string_view text = in_.take_all(kNameCharacter);
        if (text.size() > kLongestName) return false;
        const std::uint32_t before_name = tree_.text_bytes(), name = name_place(text);
        const Node parent = open_.empty() ? Node::none : open_.back().element;
        const Node element = tree_.append(parent, NodeKind::element, name);
        const std::uint32_t with_name = tree_.text_bytes();
        if (*in_.at == ' ' && !take_attribute(element)) return false;
        filter_.begin(element, before_name, with_name);
        if (!open_.empty()) open_.back().leaf = false;
        if (in_.take(">")) {
            open_.push_back({element, true});
            return true;
        }
        if (!in_.take("/>")) return false;
        filter_.end(element);
        return !open_.empty();
    }
    bool take_attribute(Node element) {
        const char* const first = in_.at++;
        if (!is(kNameStart, *in_.at)) return false;
        const std::string_view name = in_.take_all(kNameCharacter);
        kept_names_ += name.size();
        if (name == "xmlns" || name.size() > kLongestName || !in_.take("=\"")) return false;
        in_.take_all(kValueCharacter);
        if (!in_.take("\"")) return false;
        tree_.set_attributes(element, tree_.keep({first, static_cast<std::size_t>(in_.at - first)}));
        return true;
    }
    bool end_element() {
        const Node element = open_.back().element;
        if (!in_.take("</") || !in_.take(tree_.name(element)) || !in_.take(">")) return false;
        open_.pop_back();
        filter_.end(element);
        return kept_names_ <= kMostNames;
    }
    /** Most elements bear few names, which need to be kept only once. */
    std::uint32_t name_place(std::string_view name) {
        const auto byte = [&](std::size_t i) { return static_cast<unsigned char>(name[i]); };
        std::uint32_t& place = names_[(byte(0) * 7U + byte(name.size() - 1) * 31U + name.size()) % names_.size()];
        if (!tree_.keeps(place, name)) {
            place = tree_.keep(name);
            kept_names_ += name.size();
        }
        return place;
    }

    static constexpr std::size_t kLongestName = 50'000;  // that the parser takes

    struct Open {
        Node element;
        bool leaf;
    };

    Window in_;
    HeaderTree& tree_;
    TreeFilter filter_;
    std::vector<Open> open_;                  // outermost first
    std::array<std::uint32_t, 256> names_{};  // places of names kept
    std::size_t kept_names_ = 0;              // their bytes
};

}  // namespace

int scan_header(HeaderSource& source, HeaderTree& tree, ElementChoice* choice) {
    try {
        tree = HeaderTree{};
        const bool whole = Scanner{source, tree, choice}.run();
        const int failed = source.status();
        return failed || whole ? failed : static_cast<int>(QUO_REFUSED);
    } catch (const std::exception&) {  // of the choice, or no memory
        return QUO_NO_MEMORY;
    }
}

}  // namespace quo
