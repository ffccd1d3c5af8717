// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_HEADER_DOCUMENT_H
#define QUO_HEADER_DOCUMENT_H

#include <algorithm>
#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <string_view>
#include <unordered_map>
#include <utility>
#include <vector>

#include "quorelxmllib/header_tree.h"

namespace quo {

class AtomicFile;

/** The child elements of a parent by name, in document order: a table without a block of memory for each name. */
class NameIndex {
public:
    /** The children that bear the name, and now and then others: see HeaderTree::is_named. */
    [[nodiscard]] std::span<const Node> find(const HeaderTree& tree, std::string_view name) const noexcept;
    void add(const HeaderTree& tree, Node child);
    /** Forgets a child that goes; false when the index cannot do that at once. */
    bool forget(const HeaderTree& tree, Node child) noexcept;

private:
    struct Slot {
        std::uint32_t hash;   // of the name; 0 while the slot is free
        std::uint32_t group;  // from 1 on, of those that bear the name, or 0
        Node only;            // the only one, or none
    };
    [[nodiscard]] std::size_t place_of(std::uint32_t hash) const noexcept;
    void grow();

    std::vector<Slot> slots_;                // a power of two, half of them free
    std::vector<std::vector<Node>> groups_;  // of names that several bear
    std::size_t used_ = 0;
    // Children are mostly looked for in their order, each several times. While no two bear one name, the one found
    // last and the one after it are looked at before the table, which no cache holds.
    mutable Node last_ = Node::none;
    bool repeats_ = false;
};

/** One header document: the tree, and the look-ups and changes that the field layout needs. Paths are walked name
 * by name and compared as data: nothing in them is an expression. */
class HeaderDocument {
public:
    /** Parses a header file. 0; 1 when there is none or it is no XML that we accept (see quorelxml_v2.h); 4 when
     * it is there but cannot be read, 7 when it does not fit into memory: then nothing may take its place, and
     * errno may tell why. `defect`, where it is given, tells what is no XML and on which line; empty where it all
     * is. */
    static int load(const char* file, std::shared_ptr<HeaderDocument>& document, std::string* defect = nullptr);
    /** As load(), but a fresh document takes the place of what is no header: 0. With 4 the fresh document only
     * stands in for one that cannot be read. Null with 7. */
    static int load_or_create(const char* file, std::shared_ptr<HeaderDocument>& document);
    /** A fresh document. One that stands in for a file that cannot be read answers
     * as any other, but is never saved: the file may be whole. */
    static std::shared_ptr<HeaderDocument> create(bool stands_in = false);

    HeaderDocument(HeaderTree tree, std::int64_t source_bytes) noexcept
        : tree_{std::move(tree)}, source_bytes_{source_bytes} {}

    [[nodiscard]] const HeaderTree& tree() const noexcept { return tree_; }
    [[nodiscard]] NodeText text(Node node) const { return {tree_, node}; }

    /** Saves the tree, indented and in UTF-8, replacing the file in one step. Nodes found before are not valid
     * afterwards. On failure errno may tell why. */
    [[nodiscard]] bool save(const char* file);
    /** The same into a file that the caller makes new, alone or with another that belongs to it. */
    [[nodiscard]] bool save(AtomicFile& file);

    /** Whether the document only stands in for a file that could not be read: what it lacks may be there. */
    [[nodiscard]] bool stands_in() const noexcept { return stands_in_; }
    /** Whether both `NumberOfChannels` and `Description` stand below the root `QuorelXmlDoc`. */
    [[nodiscard]] bool is_header() const noexcept {
        return find("NumberOfChannels") != Node::none && find("Description") != Node::none;
    }
    /** The element `NumberOfChannels` or `Description` below the root, or none. */
    [[nodiscard]] Node find(std::string_view name) const noexcept;
    /** The first element that a field path leads to, or none. The empty path leads to the channel. */
    [[nodiscard]] Node first(int channel, std::string_view path) const noexcept;
    /** The elements that a field path leads to, in document order, `most` at most. */
    [[nodiscard]] std::vector<Node> all(int channel, std::string_view path, std::size_t most) const;
    /** Calls `see(element)` for every element that a field path leads to, until it answers false. */
    template <typename See>
    void visit(int channel, std::string_view path, See see) const {
        for (Node node = first_channel(channel); node != Node::none;
             node = next_channel(tree_.next(node), channel))
            if (!visit_below(node, path, see)) return;
    }

    // Where memory is short for a change std::bad_alloc is thrown, and the document stays usable.
    /** Appends a channel. */
    void append_channel(int channel);
    /** The first element of a path, made (with its parents, below an existing channel) where it is missing; none
     * where there is no such channel. */
    Node ensure(int channel, std::string_view path);
    /** Appends an empty element. */
    Node append(Node parent, std::string_view name);
    /** Replaces the content of an element by a text. */
    void set_text(Node node, std::string_view text);
    /** Gives an element an attribute with a number, replacing an older one. */
    void set_number(Node node, const char* name, std::int64_t number);
    /** Removes the elements that a field path leads to, with all they hold. */
    void remove_all(int channel, std::string_view path);
    /** Inserts a processing instruction before the root element, unless something stands there already. */
    void insert_instruction(const char* name, const char* content);
    /** Gives back the room of what was removed and replaced, where that is much. Nodes found before are not valid
     * afterwards. */
    void tidy() noexcept;

    /** Whether the document can hold `count` values: those it was read with, of which even the shortest list form
     * takes two bytes each, and those written since. */
    [[nodiscard]] bool can_hold(std::int64_t count) const noexcept;
    void count_written(std::int64_t values) noexcept { written_values_ += values; }

private:
    template <typename See>
    bool visit_below(Node parent, std::string_view path, See& see) const {
        if (path.empty()) return see(parent);
        const auto slash = path.find('/');
        const std::string_view name = path.substr(0, slash);
        const bool last = slash == std::string_view::npos;
        const std::string_view rest = last ? std::string_view{} : path.substr(slash + 1);
        if (!last && rest.empty()) return true;  // a path that ends with a slash leads nowhere
        const auto go_on = [&](Node node) { return last ? see(node) : visit_below(node, rest, see); };
        const auto go_on_if_named = [&](Node node) { return !tree_.is_named(node, name) || go_on(node); };
        if (const NameIndex* index = index_of(parent))
            return std::ranges::all_of(index->find(tree_, name), go_on_if_named);
        std::int64_t passed = 0;
        Node node = tree_.first(parent);
        for (; node != Node::none; node = tree_.next(node)) {
            if (!tree_.is_named(node, name))
                ++passed;
            else if (!go_on(node))
                break;
        }
        note_walk(parent, passed);
        return node == Node::none;
    }
    [[nodiscard]] const NameIndex* index_of(Node parent) const noexcept;
    void note_walk(Node parent, std::int64_t passed) const noexcept;
    void note_appended(Node parent, Node node) noexcept;
    void forget_indices(Node node) noexcept;
    void remove(std::span<const Node> nodes) noexcept;
    [[nodiscard]] Node root() const noexcept;
    [[nodiscard]] Node first_channel(int channel) const noexcept;
    [[nodiscard]] Node next_channel(Node node, int channel) const noexcept;

    HeaderTree tree_;
    std::int64_t source_bytes_;  // -1: made in memory
    std::int64_t written_values_ = 0;
    bool stands_in_ = false;
    // Look-ups walk the children of each parent, until so many have been passed in vain that an index of a parent
    // with many children pays: without one, n polynomials would take n * n steps.
    mutable std::unordered_map<Node, NameIndex> indices_;
    mutable std::int64_t passed_in_vain_ = 0;
};

}  // namespace quo

#endif
