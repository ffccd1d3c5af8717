#include "quorelxmllib/header_document.h"

#include <libxml/parser.h>
#include <libxml/parserInternals.h>
#include <libxml/xmlsave.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <new>
#include <utility>

#include "diagnosticslib/saved_in_place.h"
#include "quo_base/api.h"
#include "quorelxmllib/header_source.h"
#include "sarutillib/file_io.h"
#include "sarutillib/number_text.h"

namespace quo {
namespace {

constexpr const char* kRoot = "QuorelXmlDoc";
constexpr const char* kChannel = "Channel";
constexpr const char* kNumber = "Number";

const xmlChar* xml(const char* text) { return reinterpret_cast<const xmlChar*>(text); }

/** An element without content, rather than with an empty one: an empty text node would be written as <a></a> and
 * stop the indentation. Null when memory is short, also for the name alone. */
xmlNode* new_element(xmlDoc* tree, const char* name) {
    xmlNode* node = xmlNewDocNode(tree, nullptr, xml(name), nullptr);
    if (node && node->name) return node;
    xmlFreeNode(node);
    return nullptr;
}

// --- reading ----------------------------------------------------------------------------------------------------

void stop(void* parser) { xmlStopParser(static_cast<xmlParserCtxt*>(parser)); }

/** A parser that stops at the first declaration in a DTD: entities declared there could grow without bound. */
std::unique_ptr<xmlParserCtxt, decltype(&xmlFreeParserCtxt)> make_parser() {
    xmlParserCtxt* parser = xmlNewParserCtxt();
    if (parser) {
        xmlSAXHandler& events = *parser->sax;
        events.entityDecl = [](void* context, auto...) { stop(context); };
        events.notationDecl = [](void* context, auto...) { stop(context); };
        events.attributeDecl = [](void* context, const xmlChar*, const xmlChar*, int, int, const xmlChar*,
                                  xmlEnumeration* values) {
            xmlFreeEnumeration(values);
            stop(context);
        };
        events.elementDecl = [](void* context, auto...) { stop(context); };
        events.unparsedEntityDecl = [](void* context, auto...) { stop(context); };
    }
    return {parser, &xmlFreeParserCtxt};
}

/** Parses with `read(parser)`. 0, 1 for what is no XML that we accept, with the reason in `defect` where that is
 * asked for, or 7. */
template <typename Read>
int parse(XmlTree& tree, Read read, std::string* defect = nullptr) {
    const XmlErrors errors;
    const auto parser = make_parser();
    if (!parser) return QUO_NO_MEMORY;
    errno = 0;
    tree.reset(read(parser.get()));
    if (defect) *defect = errors.first();
    // A text that is too long counts as a lack of memory too; what fails without an error never got to parse.
    const bool unexplained = !tree && parser->errNo == XML_ERR_OK;
    if (errors.out_of_memory() || unexplained) return QUO_NO_MEMORY;
    // A parser that was stopped hands over the part that it has and calls it well-formed.
    if (tree && !parser->disableSAX) return QUO_OK;
    // The dictionary of names says nothing when it cannot grow: the parser takes the name for a missing one.
    const bool names_do_not_fit = xmlDictGetUsage(parser->dict) > XML_MAX_DICTIONARY_LIMIT;
    return errno == ENOMEM || names_do_not_fit ? QUO_NO_MEMORY : QUO_REFUSED;
}

}  // namespace

int HeaderDocument::load(const char* file, std::shared_ptr<HeaderDocument>& document, std::string* defect) {
    HeaderSource source;
    if (const int status = source.open(file)) return status;
    XmlTree tree;
    const auto read = [&](xmlParserCtxt* parser) {
        return xmlCtxtReadIO(parser, HeaderSource::read, nullptr, &source, nullptr, nullptr, kHeaderOptions);
    };
    const int status = parse(tree, read, defect);
    if (const int failed = source.status()) return failed;
    if (status != QUO_OK) return status;
    document = std::make_shared<HeaderDocument>(tree.get(), source.bytes());
    (void)tree.release();
    return QUO_OK;
}

int HeaderDocument::load_or_create(const char* file, std::shared_ptr<HeaderDocument>& document) {
    const int status = load(file, document);
    if (status == QUO_NO_MEMORY || (document && document->is_header())) return status;
    const int error = errno;
    const bool unreadable = status == QUO_READ_FAILED;
    document = create(unreadable);
    errno = error;
    if (!document) return QUO_NO_MEMORY;
    return unreadable ? status : QUO_OK;
}

std::shared_ptr<HeaderDocument> HeaderDocument::create(bool stands_in) {
    XmlTree tree{xmlNewDoc(xml("1.0"))};
    xmlNode* root = tree ? new_element(tree.get(), kRoot) : nullptr;
    if (!root) return nullptr;
    xmlDocSetRootElement(tree.get(), root);
    auto document = std::make_shared<HeaderDocument>(tree.get(), -1);
    (void)tree.release();
    document->stands_in_ = stands_in;
    for (const auto& [name, text] : {std::pair{"NumberOfChannels", "0"}, {"Description", "My description"}}) {
        xmlNode* element = document->append(root, name);
        if (!element || !document->set_text(element, text)) return nullptr;
    }
    return document;
}

// --- saving -----------------------------------------------------------------------------------------------------

namespace {

/** Collects the serializer's small pieces into large writes. */
class Sink {
public:
    explicit Sink(AtomicFile& file) : file_{file} { pending_.reserve(kPiece); }

    bool take(std::string_view bytes) {
        if (pending_.size() + bytes.size() > kPiece) flush();
        if (bytes.size() > kPiece) return file_.write(bytes);
        pending_ += bytes;  // within the reserved room: cannot throw
        return file_.good();
    }
    /** Hands over what is still held. */
    bool commit() {
        flush();
        return file_.good();
    }
    [[nodiscard]] bool good() const { return file_.good(); }

private:
    static constexpr std::size_t kPiece = 256U << 10U;

    void flush() {
        if (!pending_.empty()) file_.write(pending_);
        pending_.clear();
    }

    AtomicFile& file_;
    std::string pending_;
};

int write_sink(void* context, const char* bytes, int length) {
    return static_cast<Sink*>(context)->take({bytes, static_cast<std::size_t>(length)}) ? length : -1;
}

/** Whether a text stands beside anything else in an element. */
bool has_mixed_content(const xmlNode* parent) {
    for (const xmlNode* node = parent->children; node; node = node->next) {
        const bool element = node->type == XML_ELEMENT_NODE;
        const bool text = !element && node->type != XML_COMMENT_NODE && node->type != XML_PI_NODE;
        if (text && (node->prev || node->next)) return true;
        if (element && has_mixed_content(node)) return true;
    }
    return false;
}

/** The tree as it comes back from a file; null when it does not. */
XmlTree reloaded(xmlDoc* tree) {
    xmlChar* text = nullptr;
    int size = 0;
    xmlDocDumpFormatMemoryEnc(tree, &text, &size, "UTF-8", 1);
    const std::unique_ptr<xmlChar, FreeXml> owned{text};
    XmlTree again;
    const int status = parse(again, [&](xmlParserCtxt* parser) -> xmlDoc* {
        return text ? xmlCtxtReadMemory(parser, reinterpret_cast<const char*>(text), size, nullptr, nullptr,
                                        kHeaderOptions)
                    : nullptr;
    });
    return status == QUO_OK ? std::move(again) : nullptr;
}

}  // namespace

bool HeaderDocument::save(const char* file) {
    AtomicFile target{file};
    const bool saved = save(target) && target.commit();
    if (saved) warn_if_in_place(target, "HeaderDocument::save", "quorelxml_v2");
    return saved;
}

bool HeaderDocument::save(AtomicFile& file) {
    if (stands_in_) return false;
    const XmlErrors errors;
    Sink sink{file};
    if (!sink.good()) return false;
    // Saving, loading without blank text nodes and saving again is how headers are written. It changes nothing
    // unless there are texts beside elements: some of the blanks among them are dropped by loading.
    const xmlNode* top = xmlDocGetRootElement(tree_.get());
    if (top && has_mixed_content(top)) {
        XmlTree again = reloaded(tree_.get());
        if (!again) return false;
        indices_.clear();
        tree_ = std::move(again);
    }
    // Without an encoder the text, which is UTF-8 in memory, is written as it stands: the bytes are those of
    // xmlSaveFormatFileEnc.
    xmlOutputBuffer* output = xmlOutputBufferCreateIO(write_sink, nullptr, &sink, nullptr);
    if (!output) return false;
    // The serializer goes on, without the bytes that did not fit into its buffer, when memory runs out.
    const bool written = xmlSaveFormatFileTo(output, tree_.get(), "UTF-8", 1) >= 0 && !errors.out_of_memory();
    return written && sink.commit();
}

// --- looking up -------------------------------------------------------------------------------------------------

namespace {

bool is_text(const xmlNode* node) { return node->type == XML_TEXT_NODE || node->type == XML_CDATA_SECTION_NODE; }

void append_texts(const xmlNode* parent, std::string& text) {
    for (const xmlNode* node = parent->children; node; node = node->next) {
        if (is_text(node) && node->content) text += reinterpret_cast<const char*>(node->content);
        if (node->type == XML_ELEMENT_NODE) append_texts(node, text);
    }
}

}  // namespace

NodeText::NodeText(const xmlNode* node) {
    const xmlNode* child = node->children;
    if (child && is_text(child) && !child->next)
        in_place_ = reinterpret_cast<const char*>(child->content);
    else
        append_texts(node, copy_);
}

bool is_named(const xmlNode* node, std::string_view name) noexcept {
    if (node->type != XML_ELEMENT_NODE || node->ns) return false;
    const char* own = reinterpret_cast<const char*>(node->name);
    return std::strncmp(own, name.data(), name.size()) == 0 && own[name.size()] == '\0';
}

namespace {

void unlink(xmlNode* node) noexcept {
    xmlUnlinkNode(node);
    xmlFreeNode(node);
}

/** Value of an attribute, empty when there is none. It is one piece of text: entities are not declared here. */
std::string_view attribute(const xmlNode* node, const char* name) {
    const xmlAttr* found = xmlHasNsProp(node, xml(name), nullptr);
    const bool has_text = found && found->children && found->children->content;
    return has_text ? reinterpret_cast<const char*>(found->children->content) : std::string_view{};
}

}  // namespace

xmlNode* HeaderDocument::root() const noexcept {
    xmlNode* node = xmlDocGetRootElement(tree_.get());
    return node && is_named(node, kRoot) ? node : nullptr;
}

xmlNode* HeaderDocument::find(std::string_view name) const noexcept {
    const xmlNode* parent = root();
    if (!parent) return nullptr;
    xmlNode* node = parent->children;
    while (node && !is_named(node, name)) node = node->next;
    return node;
}

xmlNode* HeaderDocument::next_channel(xmlNode* node, int channel) noexcept {
    const NumberText number = format_int(channel);
    while (node && !(is_named(node, kChannel) && attribute(node, kNumber) == std::string_view{number}))
        node = node->next;
    return node;
}

xmlNode* HeaderDocument::first_channel(int channel) const noexcept {
    const xmlNode* parent = root();
    return parent ? next_channel(parent->children, channel) : nullptr;
}

xmlNode* HeaderDocument::first(int channel, std::string_view path) const noexcept {
    xmlNode* found = nullptr;
    visit(channel, path, [&](xmlNode* node) {
        found = node;
        return false;
    });
    return found;
}

std::vector<xmlNode*> HeaderDocument::all(int channel, std::string_view path, std::size_t most) const {
    std::vector<xmlNode*> found;
    if (most > 0)
        visit(channel, path, [&](xmlNode* node) {
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

const std::vector<xmlNode*>* NameIndex::find(std::string_view name) const noexcept {
    const auto found = children_.find(name);
    return found == children_.end() ? nullptr : &found->second;
}

void NameIndex::add(xmlNode* child) {
    if (child->type != XML_ELEMENT_NODE || child->ns) return;
    children_[reinterpret_cast<const char*>(child->name)].push_back(child);
}

bool NameIndex::forget(const xmlNode* child) noexcept {
    if (child->type != XML_ELEMENT_NODE || child->ns) return true;
    const auto found = children_.find(reinterpret_cast<const char*>(child->name));
    if (found == children_.end()) return false;
    // With several of the name the search for one would cost, and the name itself may be the child's own.
    if (found->second.size() > 1) return false;
    children_.erase(found);
    return true;
}

const NameIndex* HeaderDocument::index_of(const xmlNode* parent) const noexcept {
    if (indices_.empty()) return nullptr;
    const auto found = indices_.find(parent);
    return found == indices_.end() ? nullptr : &found->second;
}

void HeaderDocument::note_walk(xmlNode* parent, std::int64_t passed) const noexcept {
    constexpr std::int64_t kLongWalk = 64, kMostInVain = 4096;
    passed_in_vain_ += passed;
    if (passed < kLongWalk || passed_in_vain_ < kMostInVain) return;
    try {
        const auto [index, made] = indices_.try_emplace(parent);
        for (xmlNode* child = parent->children; made && child; child = child->next) index->second.add(child);
    } catch (const std::bad_alloc&) {
        indices_.erase(parent);  // the children are walked as before
    }
}

void HeaderDocument::note_appended(const xmlNode* parent, xmlNode* node) noexcept {
    const auto index = indices_.find(parent);
    if (index == indices_.end()) return;
    try {
        index->second.add(node);
    } catch (const std::bad_alloc&) {
        indices_.erase(index);
    }
}

/** Forgets the indices of an element that goes, and of all below it. */
void HeaderDocument::forget_indices(const xmlNode* node) noexcept {
    if (indices_.empty() || node->type != XML_ELEMENT_NODE) return;
    indices_.erase(node);
    for (const xmlNode* child = node->children; child; child = child->next) forget_indices(child);
}

// --- changing ---------------------------------------------------------------------------------------------------

xmlNode* HeaderDocument::append(xmlNode* parent, std::string_view name) {
    // Blanks that were the whole text of an element would keep its new children from being indented.
    if (parent->children && parent->children == parent->last && xmlIsBlankNode(parent->children))
        unlink(parent->children);
    xmlNode* node = new_element(tree_.get(), std::string{name}.c_str());
    if (!node) return nullptr;
    xmlAddChild(parent, node);
    note_appended(parent, node);
    return node;
}

xmlNode* HeaderDocument::append_channel(int channel) {
    xmlNode* node = append(root(), kChannel);
    if (!node || set_attribute(node, kNumber, format_int(channel).data)) return node;
    remove(node);
    return nullptr;
}

xmlNode* HeaderDocument::ensure(int channel, std::string_view path) {
    if (xmlNode* found = first(channel, path)) return found;
    if (path.empty()) return nullptr;
    const auto slash = path.rfind('/');
    const bool top = slash == std::string_view::npos;
    xmlNode* parent = ensure(channel, top ? std::string_view{} : path.substr(0, slash));
    return parent ? append(parent, top ? path : path.substr(slash + 1)) : nullptr;
}

bool HeaderDocument::set_text(xmlNode* node, std::string_view text) {
    xmlNode* content = nullptr;
    if (!text.empty()) {
        content = xmlNewDocTextLen(tree_.get(), xml(text.data()), static_cast<int>(text.size()));
        if (!content) return false;
        if (!content->content) {
            xmlFreeNode(content);
            return false;
        }
    }
    for (const xmlNode* child = node->children; child; child = child->next) forget_indices(child);
    indices_.erase(node);
    xmlFreeNodeList(node->children);
    node->children = node->last = nullptr;
    if (content) xmlAddChild(node, content);
    return true;
}

bool HeaderDocument::insert_instruction(const char* name, const char* content) {
    xmlNode* before = xmlDocGetRootElement(tree_.get());
    if (!before || before->prev) return true;
    xmlNode* instruction = xmlNewDocPI(tree_.get(), xml(name), xml(content));
    if (!instruction || !instruction->name || !instruction->content) {
        xmlFreeNode(instruction);
        return false;
    }
    xmlAddPrevSibling(before, instruction);
    return true;
}

void HeaderDocument::remove(xmlNode* node) noexcept {
    forget_indices(node);
    const auto index = indices_.find(node->parent);
    if (index != indices_.end() && !index->second.forget(node)) indices_.erase(index);
    unlink(node);
}

bool set_attribute(xmlNode* node, const char* name, const char* value) noexcept {
    xmlAttr* set = xmlSetNsProp(node, nullptr, xml(name), xml(value));
    const bool whole = set && set->name && set->children && set->children->content;
    if (set && !whole) xmlRemoveProp(set);
    return whole;
}

}  // namespace quo
