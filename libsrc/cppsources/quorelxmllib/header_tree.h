// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_HEADER_TREE_H
#define QUO_HEADER_TREE_H

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <limits>
#include <memory>
#include <new>
#include <span>
#include <string>
#include <string_view>
#include <type_traits>

namespace quo {

/** A growing array of plain values, numbered with 32 bits. Large ones grow in place, as the C library's realloc
 * does: there is never a second copy in memory. */
template <typename T>
class PlainArray {
    static_assert(std::is_trivially_copyable_v<T>);

public:
    [[nodiscard]] T& operator[](std::uint32_t place) noexcept { return data_.get()[place]; }
    [[nodiscard]] const T& operator[](std::uint32_t place) const noexcept { return data_.get()[place]; }
    [[nodiscard]] std::size_t size() const noexcept { return size_; }
    /** Makes room for `count` more and returns the place of the first. Throws std::bad_alloc. */
    std::uint32_t extend(std::size_t count) {
        constexpr std::size_t kMost = std::numeric_limits<std::uint32_t>::max();
        if (count > kMost - size_) throw std::bad_alloc{};
        if (size_ + count > room_) grow(size_ + count);
        const std::size_t place = size_;
        size_ += count;
        return static_cast<std::uint32_t>(place);
    }

    /** Forgets what stands behind the first `count`. */
    void cut(std::size_t count) noexcept { size_ = count; }

private:
    struct Free {
        void operator()(T* data) const noexcept { std::free(data); }
    };
    void grow(std::size_t least) {
        constexpr std::size_t kFirst = 1024 / sizeof(T), kLarge = 1U << 20U;
        const std::size_t more = size_ < kLarge ? 2 * size_ : size_ + size_ / 4;
        const std::size_t room = least > more ? least + kFirst : more;
        void* data = std::realloc(data_.get(), room * sizeof(T));
        if (!data) throw std::bad_alloc{};
        (void)data_.release();
        data_.reset(static_cast<T*>(data));
        room_ = room;
    }

    std::unique_ptr<T, Free> data_;
    std::size_t size_ = 0, room_ = 0;
};

/** A node of a HeaderTree. It holds until the tree is tidied or replaced. */
enum class Node : std::uint32_t {
    none = 0,  // also the document itself, the parent of the root: no look-up answers it
};

enum class NodeKind : std::uint8_t { document, element, text, cdata, comment, instruction, reference, doctype };

/** An XML document in little memory: 24 bytes a node, and its texts. Names are as they stand in the file, with
 * their prefix; attributes and namespace declarations are kept as they are written, behind the name. An element
 * that holds one text and nothing else has no node for the text. What needs memory throws std::bad_alloc and
 * leaves the tree usable. */
class HeaderTree {
public:
    HeaderTree();

    // Looking
    [[nodiscard]] NodeKind kind(Node node) const noexcept { return record(node).kind; }
    [[nodiscard]] bool is_element(Node node) const noexcept { return kind(node) == NodeKind::element; }
    [[nodiscard]] bool in_namespace(Node node) const noexcept { return record(node).in_namespace; }
    [[nodiscard]] const char* name(Node node) const noexcept { return text_at(record(node).name); }
    /** The name without its prefix. */
    [[nodiscard]] std::string_view local_name(Node node) const noexcept;
    /** Whether a node is an element with this name, in no namespace. */
    [[nodiscard]] bool is_named(Node node, std::string_view name) const noexcept;
    [[nodiscard]] Node parent(Node node) const noexcept { return record(node).parent; }
    [[nodiscard]] Node first(Node parent) const noexcept {
        const Node last = last_child(parent);
        return last == Node::none ? last : record(last).next;
    }
    [[nodiscard]] Node next(Node node) const noexcept {
        const Record& own = record(node);
        return node == last_child(own.parent) ? Node::none : own.next;
    }
    /** The element that all others lie in. */
    [[nodiscard]] Node root() const noexcept;
    /** Whether an element holds one text and nothing else, which then is its content. */
    [[nodiscard]] bool holds_text(Node node) const noexcept { return record(node).holds_text; }
    /** The text of a leaf or of a node that is no element; NUL-terminated, never null. */
    [[nodiscard]] const char* content(Node node) const noexcept {
        return record(node).has_children() ? "" : text_at(record(node).content);
    }
    /** The attributes and namespace declarations as they are written, each after a blank. */
    [[nodiscard]] const char* attributes(Node node) const noexcept { return text_at(record(node).attributes); }
    /** Whether a text stands beside anything else in one of the elements. */
    [[nodiscard]] bool has_mixed_content(Node within = Node::none) const noexcept;
    /** The value of an attribute in no namespace as it is written; empty when there is none. */
    [[nodiscard]] std::string_view attribute(Node node, std::string_view name) const noexcept;
    /** A handle for those who may only compare it. */
    [[nodiscard]] const void* address(Node node) const noexcept { return &record(node); }

    // Building and changing
    /** Appends a node. `name` and `content` are places that keep() has given. */
    Node append(Node parent, NodeKind kind, std::uint32_t name, std::uint32_t content = 0);
    /** Appends an element without content. */
    Node append_element(Node parent, std::string_view name);
    /** Puts an instruction before everything else in the document. */
    void prepend_instruction(std::string_view name, std::string_view content);
    /** Replaces what an element holds by a text; an empty one leaves nothing. */
    void set_text(Node element, std::string_view text);
    /** Gives an element an attribute, replacing an older one. The value has no character that must be escaped. */
    void set_attribute(Node element, std::string_view name, std::string_view value);
    /** Removes nodes with all they hold. They lie beside, not inside one another. */
    void remove(std::span<const Node> nodes) noexcept;

    /** Keeps a text and returns its place. */
    std::uint32_t keep(std::string_view text);
    [[nodiscard]] std::string_view kept(std::uint32_t place) const noexcept { return text_at(place); }
    void set_leaf_text(Node element, std::uint32_t place) noexcept;
    void set_attributes(Node element, std::uint32_t place) noexcept { record(element).attributes = place; }
    void set_in_namespace(Node element) noexcept { record(element).in_namespace = true; }

    /** How many bytes of texts are kept. */
    [[nodiscard]] std::uint32_t text_bytes() const noexcept { return static_cast<std::uint32_t>(texts_.size()); }
    /** Forgets the only child of its parent, all that was appended since, and the texts behind the first bytes. */
    void forget_last(Node child, std::uint32_t text_bytes) noexcept;
    /** Whether a place, which may have been forgotten since, holds this text. */
    [[nodiscard]] bool keeps(std::uint32_t place, std::string_view text) const noexcept {
        return place < texts_.size() && kept(place) == text;
    }
    /** Whether what was removed and replaced takes more room than the rest. */
    [[nodiscard]] bool is_wasteful() const noexcept;
    /** The same document without what was removed and replaced; nodes are other ones in it. */
    [[nodiscard]] HeaderTree tidied() const;

    /** What the XML declaration says: the version, and "yes", "no" or nothing about other files. */
    std::string version = "1.0", standalone;

private:
    struct Record {
        std::uint32_t name, attributes;  // places in texts_
        std::uint32_t content;           // a place in texts_, or the last child
        Node next, parent;               // next: of the last child, the first one
        NodeKind kind;
        bool holds_text, in_namespace, removed;

        [[nodiscard]] bool has_children() const noexcept {
            return kind == NodeKind::document || (kind == NodeKind::element && !holds_text);
        }
    };
    static_assert(sizeof(Record) == 24);

    [[nodiscard]] Record& record(Node node) noexcept { return records_[static_cast<std::uint32_t>(node)]; }
    [[nodiscard]] const Record& record(Node node) const noexcept {
        return records_[static_cast<std::uint32_t>(node)];
    }
    [[nodiscard]] const char* text_at(std::uint32_t place) const noexcept { return &texts_[place]; }
    [[nodiscard]] Node last_child(Node parent) const noexcept {
        const Record& own = record(parent);
        return own.has_children() ? static_cast<Node>(own.content) : Node::none;
    }
    Node add(Node parent, NodeKind kind, std::uint32_t name, std::uint32_t content);
    void make_room_for_child(Node parent);
    void drop_removed_children(Node parent) noexcept;
    void count_waste(Node node) noexcept;
    void copy_children(Node from, HeaderTree& to, Node parent) const;

    PlainArray<Record> records_;
    PlainArray<char> texts_;  // each NUL-terminated; the first is empty
    std::size_t wasted_ = 0;  // bytes of records and texts that nothing leads to
};

/** Text of an element and of all below it: in place where it is one piece, else a copy. */
class NodeText {
public:
    NodeText(const HeaderTree& tree, Node node);
    /** NUL-terminated; never null. */
    [[nodiscard]] const char* c_str() const noexcept { return in_place_ ? in_place_ : copy_.c_str(); }
    operator std::string_view() const noexcept { return c_str(); }

private:
    std::string copy_;
    const char* in_place_ = nullptr;
};

}  // namespace quo

#endif
