#ifndef QUO_HEADER_DOCUMENT_H
#define QUO_HEADER_DOCUMENT_H

#include <libxml/tree.h>

#include <algorithm>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

namespace quo {

class AtomicFile;

struct FreeXml {
    void operator()(xmlDoc* tree) const noexcept { xmlFreeDoc(tree); }
    void operator()(xmlChar* text) const noexcept { xmlFree(text); }
};

using XmlTree = std::unique_ptr<xmlDoc, FreeXml>;

/** Text of an element and of all below it: in place where it is one piece, else a copy, for which memory may be
 * short (std::bad_alloc). */
class NodeText {
public:
    explicit NodeText(const xmlNode* node);
    /** NUL-terminated; never null. */
    [[nodiscard]] const char* c_str() const noexcept { return in_place_ ? in_place_ : copy_.c_str(); }
    operator std::string_view() const noexcept { return c_str(); }

private:
    std::string copy_;
    const char* in_place_ = nullptr;
};

/** Whether a node is an element with this name, in no namespace. */
bool is_named(const xmlNode* node, std::string_view name) noexcept;

/** The child elements of a parent by name, in document order. */
class NameIndex {
public:
    /** The children that bear the name, or null. */
    [[nodiscard]] const std::vector<xmlNode*>* find(std::string_view name) const noexcept;
    void add(xmlNode* child);
    /** Forgets a child that goes; false when the index cannot do that at once. */
    bool forget(const xmlNode* child) noexcept;

private:
    std::unordered_map<std::string_view, std::vector<xmlNode*>> children_;  // the names are the nodes' own
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
    /** A fresh document, or null when memory is short. One that stands in for a file that cannot be read answers
     * as any other, but is never saved: the file may be whole. */
    static std::shared_ptr<HeaderDocument> create(bool stands_in = false);

    HeaderDocument(xmlDoc* tree, std::int64_t source_bytes) noexcept : tree_{tree}, source_bytes_{source_bytes} {}

    /** Saves the tree, indented and in UTF-8, replacing the file in one step. Nodes found before are not valid
     * afterwards. On failure errno may tell why. */
    [[nodiscard]] bool save(const char* file);
    /** The same into a file that the caller makes new, alone or with another that belongs to it. */
    [[nodiscard]] bool save(AtomicFile& file);

    /** Whether the document only stands in for a file that could not be read: what it lacks may be there. */
    [[nodiscard]] bool stands_in() const noexcept { return stands_in_; }
    /** Whether both `NumberOfChannels` and `Description` stand below the root `QuorelXmlDoc`. */
    [[nodiscard]] bool is_header() const noexcept { return find("NumberOfChannels") && find("Description"); }
    /** The element `NumberOfChannels` or `Description` below the root, or null. */
    [[nodiscard]] xmlNode* find(std::string_view name) const noexcept;
    /** The first element that a field path leads to, or null. The empty path leads to the channel. */
    [[nodiscard]] xmlNode* first(int channel, std::string_view path) const noexcept;
    /** The elements that a field path leads to, in document order, `most` at most. */
    [[nodiscard]] std::vector<xmlNode*> all(int channel, std::string_view path, std::size_t most) const;
    /** Calls `see(element)` for every element that a field path leads to, until it answers false. */
    template <typename See>
    void visit(int channel, std::string_view path, See see) const {
        for (xmlNode* node = first_channel(channel); node; node = next_channel(node->next, channel))
            if (!visit_below(node, path, see)) return;
    }

    /** Appends a channel and returns it, or null when memory is short. */
    xmlNode* append_channel(int channel);
    /** The first element of a path, made (with its parents, below an existing channel) where it is missing. Null
     * when memory is short. */
    xmlNode* ensure(int channel, std::string_view path);
    /** Appends an empty element; null when memory is short. */
    xmlNode* append(xmlNode* parent, std::string_view name);
    /** Replaces the content of an element by a text. False when memory is short. */
    bool set_text(xmlNode* node, std::string_view text);
    /** Removes an element with all it holds. */
    void remove(xmlNode* node) noexcept;
    /** Inserts a processing instruction before the root element, unless something stands there already. */
    bool insert_instruction(const char* name, const char* content);

    /** Whether the document can hold `count` values: those it was read with, of which even the shortest list form
     * takes two bytes each, and those written since. */
    [[nodiscard]] bool can_hold(std::int64_t count) const noexcept;
    void count_written(std::int64_t values) noexcept { written_values_ += values; }

private:
    template <typename See>
    bool visit_below(xmlNode* parent, std::string_view path, See& see) const {
        if (path.empty()) return see(parent);
        const auto slash = path.find('/');
        const std::string_view name = path.substr(0, slash);
        const bool last = slash == std::string_view::npos;
        const std::string_view rest = last ? std::string_view{} : path.substr(slash + 1);
        if (!last && rest.empty()) return true;  // a path that ends with a slash leads nowhere
        const auto go_on = [&](xmlNode* node) { return last ? see(node) : visit_below(node, rest, see); };
        if (const NameIndex* index = index_of(parent)) {
            const std::vector<xmlNode*>* named = index->find(name);
            return !named || std::ranges::all_of(*named, go_on);
        }
        std::int64_t passed = 0;
        xmlNode* node = parent->children;
        for (; node; node = node->next) {
            if (!is_named(node, name))
                ++passed;
            else if (!go_on(node))
                break;
        }
        note_walk(parent, passed);
        return node == nullptr;
    }
    [[nodiscard]] const NameIndex* index_of(const xmlNode* parent) const noexcept;
    void note_walk(xmlNode* parent, std::int64_t passed) const noexcept;
    void note_appended(const xmlNode* parent, xmlNode* node) noexcept;
    void forget_indices(const xmlNode* node) noexcept;
    [[nodiscard]] xmlNode* root() const noexcept;
    [[nodiscard]] xmlNode* first_channel(int channel) const noexcept;
    [[nodiscard]] static xmlNode* next_channel(xmlNode* node, int channel) noexcept;

    XmlTree tree_;
    std::int64_t source_bytes_;  // -1: made in memory
    std::int64_t written_values_ = 0;
    bool stands_in_ = false;
    // Look-ups walk the children of each parent, until so many have been passed in vain that an index of a parent
    // with many children pays: without one, n polynomials would take n * n steps.
    mutable std::unordered_map<const xmlNode*, NameIndex> indices_;
    mutable std::int64_t passed_in_vain_ = 0;
};

/** Gives an element an attribute with a text, replacing an older one. False when memory is short. */
bool set_attribute(xmlNode* node, const char* name, const char* value) noexcept;

}  // namespace quo

#endif
