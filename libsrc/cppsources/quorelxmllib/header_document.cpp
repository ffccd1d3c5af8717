// SPDX-License-Identifier: Apache-2.0
#include "quorelxmllib/header_document.h"

#include <algorithm>
#include <cerrno>
#include <functional>
#include <limits>
#include <new>

#include "diagnosticslib/saved_in_place.h"
#include "quo_base/api.h"
#include "quorelxmllib/header_parser.h"
#include "quorelxmllib/header_source.h"
#include "quorelxmllib/header_writer.h"
#include "sarutillib/ground/file_io.h"
#include "sarutillib/ground/number_text.h"

namespace quo {
namespace {

constexpr const char* kRoot = "QuorelXmlDoc";
constexpr const char* kChannel = "Channel";
constexpr const char* kNumber = "Number";

}  // namespace

// --- reading ----------------------------------------------------------------------------------------------------

int HeaderDocument::load(const char* file, std::shared_ptr<HeaderDocument>& document, std::string* defect) {
    HeaderSource source;
    if (const int status = source.open(file)) return status;
    HeaderTree tree;
    const int status = parse_header(source, tree, defect);
    if (status == QUO_OK) document = std::make_shared<HeaderDocument>(std::move(tree), source.bytes());
    return status;
}

int HeaderDocument::load_or_create(const char* file, std::shared_ptr<HeaderDocument>& document) {
    const int status = load(file, document);
    if (status == QUO_NO_MEMORY || (document && document->is_header())) return status;
    const int error = errno;
    const bool unreadable = status == QUO_READ_FAILED;
    document = create(unreadable);
    errno = error;
    return unreadable ? status : QUO_OK;
}

std::shared_ptr<HeaderDocument> HeaderDocument::create(bool stands_in) {
    HeaderTree tree;
    const Node root = tree.append_element(Node::none, kRoot);
    for (const auto& [name, text] : {std::pair{"NumberOfChannels", "0"}, {"Description", "My description"}})
        tree.set_text(tree.append_element(root, name), text);
    auto document = std::make_shared<HeaderDocument>(std::move(tree), -1);
    document->stands_in_ = stands_in;
    return document;
}

// --- saving -----------------------------------------------------------------------------------------------------

bool HeaderDocument::save(const char* file) {
    AtomicFile target{file};
    const bool saved = save(target) && target.commit();
    if (saved) warn_if_in_place(target, "HeaderDocument::save", "quorelxml_v2");
    return saved;
}

bool HeaderDocument::save(AtomicFile& file) {
    if (stands_in_) return false;
    // Saving, loading without blank text nodes and saving again is how headers are written. It changes nothing
    // unless there are texts beside elements: some of the blanks among them are dropped by loading.
    if (tree_.has_mixed_content()) {
        std::string text;
        const auto take = [&](std::string_view piece) { return text.append(piece), true; };
        HeaderTree again;
        if (!write_indented(tree_, take) || parse_header(text, again) != QUO_OK) return false;
        indices_.clear();
        tree_ = std::move(again);
    }
    return write_indented(tree_, [&](std::string_view piece) { return file.write(piece); }) && file.good();
}

// --- looking up -------------------------------------------------------------------------------------------------

Node HeaderDocument::root() const noexcept {
    const Node node = tree_.root();
    return node != Node::none && tree_.is_named(node, kRoot) ? node : Node::none;
}

Node HeaderDocument::find(std::string_view name) const noexcept {
    const Node parent = root();
    Node node = parent == Node::none ? parent : tree_.first(parent);
    while (node != Node::none && !tree_.is_named(node, name)) node = tree_.next(node);
    return node;
}

Node HeaderDocument::next_channel(Node node, int channel) const noexcept {
    const NumberText text = format_int(channel);
    const std::string_view number = text;
    while (node != Node::none && !(tree_.is_named(node, kChannel) && tree_.attribute(node, kNumber) == number))
        node = tree_.next(node);
    return node;
}

Node HeaderDocument::first_channel(int channel) const noexcept {
    const Node parent = root();
    return parent == Node::none ? parent : next_channel(tree_.first(parent), channel);
}

Node HeaderDocument::first(int channel, std::string_view path) const noexcept {
    Node found = Node::none;
    visit(channel, path, [&](Node node) {
        found = node;
        return false;
    });
    return found;
}

std::vector<Node> HeaderDocument::all(int channel, std::string_view path, std::size_t most) const {
    std::vector<Node> found;
    if (most > 0)
        visit(channel, path, [&](Node node) {
            found.push_back(node);
            return found.size() < most;
        });
    return found;
}

bool HeaderDocument::can_hold(std::int64_t count) const noexcept {
    if (count < 0) return false;
    return source_bytes_ < 0 || count <= source_bytes_ / 2 + written_values_;
}

// --- the index of names -----------------------------------------------------------------------------------------

namespace {

std::uint32_t hash_of(std::string_view name) noexcept {
    return static_cast<std::uint32_t>(std::hash<std::string_view>{}(name)) | 1U;
}
bool can_be_found(const HeaderTree& tree, Node node) noexcept {
    return tree.is_element(node) && !tree.in_namespace(node);
}

}  // namespace

/** The slot of a hash, or the free one that it would get. */
std::size_t NameIndex::place_of(std::uint32_t hash) const noexcept {
    std::size_t place = (hash >> 1U) & (slots_.size() - 1);
    while (slots_[place].hash != 0 && slots_[place].hash != hash) place = (place + 1) & (slots_.size() - 1);
    return place;
}

std::span<const Node> NameIndex::find(const HeaderTree& tree, std::string_view name) const noexcept {
    if (slots_.empty()) return {};
    if (!repeats_ && last_ != Node::none) {
        const Node next = tree.next(last_);
        if (!tree.is_named(last_, name) && next != Node::none) last_ = next;
        if (tree.is_named(last_, name)) return {&last_, 1U};
    }
    const Slot& slot = slots_[place_of(hash_of(name))];
    last_ = slot.only;
    if (slot.group != 0) return groups_[slot.group - 1];
    return {&slot.only, slot.only == Node::none ? 0U : 1U};
}

void NameIndex::grow() {
    std::vector<Slot> before(std::max<std::size_t>(64, 2 * slots_.size()));
    before.swap(slots_);
    for (const Slot& slot : before)
        if (slot.hash != 0) slots_[place_of(slot.hash)] = slot;
}

void NameIndex::add(const HeaderTree& tree, Node child) {
    if (!can_be_found(tree, child)) return;
    if (2 * used_ >= slots_.size()) grow();
    const std::uint32_t hash = hash_of(tree.name(child));
    Slot& slot = slots_[place_of(hash)];
    if (slot.group == 0 && slot.only != Node::none) {
        groups_.push_back({slot.only});
        slot.group = static_cast<std::uint32_t>(groups_.size());
    }
    if (slot.group != 0) {
        std::vector<Node>& group = groups_[slot.group - 1];
        const auto bears_it = [&](Node other) { return tree.is_named(other, tree.name(child)); };
        repeats_ = repeats_ || std::ranges::any_of(group, bears_it);
        return group.push_back(child);
    }
    used_ += slot.hash == 0 ? 1 : 0;
    slot = {hash, 0, child};
}

bool NameIndex::forget(const HeaderTree& tree, Node child) noexcept {
    if (!can_be_found(tree, child)) return true;
    if (slots_.empty()) return false;
    Slot& slot = slots_[place_of(hash_of(tree.name(child)))];
    // With several of the name the search for one would cost.
    if (slot.group != 0 || slot.only != child) return false;
    slot.only = Node::none;
    last_ = Node::none;
    return true;
}

const NameIndex* HeaderDocument::index_of(Node parent) const noexcept {
    if (indices_.empty()) return nullptr;
    const auto found = indices_.find(parent);
    return found == indices_.end() ? nullptr : &found->second;
}

void HeaderDocument::note_walk(Node parent, std::int64_t passed) const noexcept {
    constexpr std::int64_t kLongWalk = 64, kMostInVain = 4096;
    passed_in_vain_ += passed;
    if (passed < kLongWalk || passed_in_vain_ < kMostInVain) return;
    try {
        const auto [index, made] = indices_.try_emplace(parent);
        for (Node child = tree_.first(parent); made && child != Node::none; child = tree_.next(child))
            index->second.add(tree_, child);
    } catch (const std::bad_alloc&) {
        indices_.erase(parent);  // the children are walked as before
    }
}

void HeaderDocument::note_appended(Node parent, Node node) noexcept {
    const auto index = indices_.find(parent);
    if (index == indices_.end()) return;
    try {
        index->second.add(tree_, node);
    } catch (const std::bad_alloc&) {
        indices_.erase(index);
    }
}

/** Forgets the indices of an element that goes, and of all below it. */
void HeaderDocument::forget_indices(Node node) noexcept {
    if (indices_.empty() || !tree_.is_element(node)) return;
    indices_.erase(node);
    for (Node child = tree_.first(node); child != Node::none; child = tree_.next(child)) forget_indices(child);
}

// --- changing ---------------------------------------------------------------------------------------------------

Node HeaderDocument::append(Node parent, std::string_view name) {
    const Node node = tree_.append_element(parent, name);
    note_appended(parent, node);
    return node;
}

void HeaderDocument::append_channel(int channel) {
    const Node node = append(root(), kChannel);
    try {
        set_number(node, kNumber, channel);
    } catch (const std::bad_alloc&) {
        remove({&node, 1});
        throw;
    }
}

Node HeaderDocument::ensure(int channel, std::string_view path) {
    const Node found = first(channel, path);
    if (found != Node::none || path.empty()) return found;
    const auto slash = path.rfind('/');
    const bool top = slash == std::string_view::npos;
    const Node parent = ensure(channel, top ? std::string_view{} : path.substr(0, slash));
    return parent == Node::none ? parent : append(parent, top ? path : path.substr(slash + 1));
}

void HeaderDocument::set_text(Node node, std::string_view text) {
    forget_indices(node);
    tree_.set_text(node, text);
}

void HeaderDocument::set_number(Node node, const char* name, std::int64_t number) {
    tree_.set_attribute(node, name, format_int(number));
}

void HeaderDocument::insert_instruction(const char* name, const char* content) {
    const Node root = tree_.root();
    if (root != Node::none && root == tree_.first(Node::none)) tree_.prepend_instruction(name, content);
}

void HeaderDocument::remove_all(int channel, std::string_view path) {
    // The elements of one path never lie inside one another, so all can be found before the first goes.
    remove(all(channel, path, std::numeric_limits<std::size_t>::max()));
}

void HeaderDocument::remove(std::span<const Node> nodes) noexcept {
    for (const Node node : nodes) {
        forget_indices(node);
        const auto index = indices_.find(tree_.parent(node));
        if (index != indices_.end() && !index->second.forget(tree_, node)) indices_.erase(index);
    }
    tree_.remove(nodes);
}

void HeaderDocument::tidy() noexcept {
    if (!tree_.is_wasteful()) return;
    try {
        HeaderTree tidied = tree_.tidied();
        indices_.clear();
        tree_ = std::move(tidied);
    } catch (const std::bad_alloc&) {
        return;  // the room stays taken
    }
}

}  // namespace quo
