// SPDX-License-Identifier: Apache-2.0
#include "quorelxmllib/header_tree.h"

#include <algorithm>
#include <cstring>
#include <utility>

namespace quo {
namespace {

/** One attribute as it is written: ` name="value"`, or with single quotes. */
struct Attribute {
    std::string_view name, value;
    std::size_t length = 0;
};

/** The attribute at the start of a text that is not empty. */
Attribute next_attribute(std::string_view text) noexcept {
    const auto equals = text.find('=');
    const auto end = text.find(text[equals + 1], equals + 2);
    return {text.substr(1, equals - 1), text.substr(equals + 2, end - equals - 2), end + 1};
}

bool is_blank(std::string_view text) noexcept { return text.find_first_not_of(" \t\r\n") == text.npos; }

}  // namespace

HeaderTree::HeaderTree() {
    texts_[texts_.extend(1)] = '\0';
    records_[records_.extend(1)] = {};
}

// --- looking ----------------------------------------------------------------------------------------------------

std::string_view HeaderTree::local_name(Node node) const noexcept {
    const std::string_view whole = name(node);
    return in_namespace(node) ? whole.substr(whole.find(':') + 1) : whole;
}

bool HeaderTree::is_named(Node node, std::string_view name) const noexcept {
    const Record& own = record(node);
    if (own.kind != NodeKind::element || own.in_namespace) return false;
    const char* const text = text_at(own.name);
    return std::strncmp(text, name.data(), name.size()) == 0 && text[name.size()] == '\0';
}

Node HeaderTree::root() const noexcept {
    Node node = first(Node::none);
    while (node != Node::none && !is_element(node)) node = next(node);
    return node;
}

std::string_view HeaderTree::attribute(Node node, std::string_view name) const noexcept {
    for (std::string_view rest = attributes(node); !rest.empty();) {
        const Attribute found = next_attribute(rest);
        if (found.name == name) return found.value;
        rest.remove_prefix(found.length);
    }
    return {};
}

bool HeaderTree::has_mixed_content(Node within) const noexcept {
    for (Node node = first(within); node != Node::none; node = next(node)) {
        if (is_element(node) && has_mixed_content(node)) return true;
        const bool text =
            kind(node) == NodeKind::text || kind(node) == NodeKind::cdata || kind(node) == NodeKind::reference;
        if (text && (node != first(within) || next(node) != Node::none)) return true;
    }
    return false;
}

// --- changing ---------------------------------------------------------------------------------------------------

std::uint32_t HeaderTree::keep(std::string_view text) {
    if (text.empty()) return 0;
    const std::uint32_t place = texts_.extend(text.size() + 1);
    text.copy(&texts_[place], text.size());
    texts_[place + static_cast<std::uint32_t>(text.size())] = '\0';
    return place;
}

Node HeaderTree::add(Node parent, NodeKind kind, std::uint32_t name, std::uint32_t content) {
    const auto node = static_cast<Node>(records_.extend(1));
    Record& added = record(node);
    added = {};
    added.name = name;
    added.content = content;
    added.next = node;
    added.parent = parent;
    added.kind = kind;
    return node;
}

Node HeaderTree::append(Node parent, NodeKind kind, std::uint32_t name, std::uint32_t content) {
    const Node node = add(parent, kind, name, content);
    const Node last = last_child(parent);
    if (last != Node::none) record(node).next = std::exchange(record(last).next, node);
    record(parent).content = static_cast<std::uint32_t>(node);
    return node;
}

void HeaderTree::set_leaf_text(Node element, std::uint32_t place) noexcept {
    record(element).content = place;
    record(element).holds_text = place != 0;
}

/** Blanks that were the whole text of an element would keep its new children from being indented: they go. Another
 * text gets a node of its own. */
void HeaderTree::make_room_for_child(Node parent) {
    const Node only = first(parent);
    if (holds_text(parent) && is_blank(content(parent))) {
        wasted_ += std::strlen(content(parent)) + 1;
        set_leaf_text(parent, 0);
    } else if (holds_text(parent)) {
        const std::uint32_t text = record(parent).content;
        const Node node = add(parent, NodeKind::text, 0, text);
        set_leaf_text(parent, 0);
        record(parent).content = static_cast<std::uint32_t>(node);
    } else if (only != Node::none && next(only) == Node::none && kind(only) == NodeKind::cdata &&
               is_blank(content(only))) {
        remove({&only, 1});
    }
}

Node HeaderTree::append_element(Node parent, std::string_view name) {
    make_room_for_child(parent);
    const Node last = last_child(parent);
    const bool as_before = last != Node::none && is_named(last, name);
    return append(parent, NodeKind::element, as_before ? record(last).name : keep(name));
}

void HeaderTree::prepend_instruction(std::string_view name, std::string_view content) {
    const std::uint32_t name_place = keep(name), content_place = keep(content);
    const Node before = last_child(Node::none);
    const Node node = append(Node::none, NodeKind::instruction, name_place, content_place);
    // The first child is the one after the last.
    if (before != Node::none) record(Node::none).content = static_cast<std::uint32_t>(before);
    (void)node;
}

void HeaderTree::set_text(Node element, std::string_view text) {
    Record& own = record(element);
    const std::size_t room = own.holds_text ? std::strlen(text_at(own.content)) : 0;
    const bool fits = !text.empty() && text.size() <= room;
    const std::uint32_t place = fits ? own.content : keep(text);
    if (fits) {
        text.copy(&texts_[place], text.size());
        texts_[place + static_cast<std::uint32_t>(text.size())] = '\0';
        wasted_ += room - text.size();
    } else if (own.holds_text) {
        wasted_ += room + 1;
    }
    for (Node child = first(element); child != Node::none; child = next(child)) count_waste(child);
    set_leaf_text(element, place);
}

void HeaderTree::set_attribute(Node element, std::string_view name, std::string_view value) {
    if (attribute(element, name) == value) return;
    std::string list;
    const auto put = [&](std::string_view text) { list += text; };
    const auto put_new = [&] {
        for (const std::string_view piece : {std::string_view{" "}, name, std::string_view{"=\""}, value})
            put(piece);
        put("\"");
    };
    bool replaced = false;
    for (std::string_view rest = attributes(element); !rest.empty();) {
        const Attribute found = next_attribute(rest);
        if (found.name == name)
            replaced = true, put_new();
        else
            put(rest.substr(0, found.length));
        rest.remove_prefix(found.length);
    }
    if (!replaced) put_new();
    const std::size_t before = std::strlen(attributes(element));
    record(element).attributes = keep(list);
    wasted_ += before;
}

void HeaderTree::remove(std::span<const Node> nodes) noexcept {
    for (const Node node : nodes) {
        record(node).removed = true;
        count_waste(node);
    }
    Node swept = Node::none;
    for (const Node node : nodes)
        if (swept == Node::none || parent(node) != swept) drop_removed_children(swept = parent(node));
}

void HeaderTree::drop_removed_children(Node parent) noexcept {
    Node kept = Node::none, first_kept = Node::none;
    Node after = Node::none;
    for (Node child = first(parent); child != Node::none; child = after) {
        after = next(child);  // before the child is linked to another
        if (record(child).removed) continue;
        (kept == Node::none ? first_kept : record(kept).next) = child;
        kept = child;
    }
    record(parent).content = static_cast<std::uint32_t>(kept);
    if (kept != Node::none) record(kept).next = first_kept;
}

// --- what was removed -------------------------------------------------------------------------------------------

void HeaderTree::count_waste(Node node) noexcept {
    wasted_ += sizeof(Record) + std::strlen(attributes(node)) + std::strlen(content(node));
    for (Node child = first(node); child != Node::none; child = next(child)) count_waste(child);
}

bool HeaderTree::is_wasteful() const noexcept {
    constexpr std::size_t kLittle = 1U << 20U;
    const std::size_t all = records_.size() * sizeof(Record) + texts_.size();
    return wasted_ > kLittle && wasted_ > all / 2;
}

void HeaderTree::forget_last(Node child, std::uint32_t text_bytes) noexcept {
    record(parent(child)).content = 0;
    records_.cut(static_cast<std::uint32_t>(child));
    texts_.cut(text_bytes);
}

void HeaderTree::copy_children(Node from, HeaderTree& to, Node parent) const {
    Node before = Node::none, copied = Node::none;
    for (Node child = first(from); child != Node::none; before = child, child = next(child)) {
        const Record& own = record(child);
        const bool same_name = before != Node::none && record(before).name == own.name;
        const std::uint32_t name_place = same_name ? to.record(copied).name : to.keep(name(child));
        copied = to.append(parent, own.kind, name_place, to.keep(content(child)));
        to.record(copied).attributes = to.keep(attributes(child));
        to.record(copied).holds_text = own.holds_text;
        to.record(copied).in_namespace = own.in_namespace;
        copy_children(child, to, copied);
    }
}

HeaderTree HeaderTree::tidied() const {
    HeaderTree copy;
    copy.version = version;
    copy.standalone = standalone;
    copy_children(Node::none, copy, Node::none);
    return copy;
}

// --- texts ------------------------------------------------------------------------------------------------------

namespace {

void append_texts(const HeaderTree& tree, Node parent, std::string& text) {
    if (tree.holds_text(parent)) text += tree.content(parent);
    for (Node node = tree.first(parent); node != Node::none; node = tree.next(node)) {
        const NodeKind kind = tree.kind(node);
        if (kind == NodeKind::text || kind == NodeKind::cdata) text += tree.content(node);
        if (kind == NodeKind::element) append_texts(tree, node, text);
    }
}

}  // namespace

NodeText::NodeText(const HeaderTree& tree, Node node) {
    if (tree.holds_text(node))
        in_place_ = tree.content(node);
    else
        append_texts(tree, node, copy_);
}

}  // namespace quo
