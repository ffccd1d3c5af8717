// SPDX-License-Identifier: Apache-2.0
#include "quorelxmllib/header_parser.h"

#include <libxml/SAX2.h>
#include <libxml/parser.h>
#include <libxml/parserInternals.h>

#include <array>
#include <cerrno>
#include <cstdint>
#include <exception>
#include <memory>
#include <utility>
#include <vector>

#include "quo_base/api.h"
#include "quorelxmllib/header_scanner.h"

namespace quo {
namespace {

std::string_view view(const xmlChar* text) { return text ? reinterpret_cast<const char*>(text) : ""; }

/** A document begins as a node does. */
xmlNode* as_node(xmlDoc* document) { return reinterpret_cast<xmlNode*>(document); }

/** What libxml2 itself writes for a node. */
std::string dumped(xmlDoc* document, xmlNode* node) {
    const std::unique_ptr<xmlBuffer, decltype(&xmlBufferFree)> buffer{xmlBufferCreate(), &xmlBufferFree};
    if (!buffer || xmlNodeDump(buffer.get(), document, node, 0, 1) < 0) throw std::bad_alloc{};
    return std::string{view(xmlBufferContent(buffer.get()))};
}

bool needs_escape(std::string_view text) { return text.find_first_of("<>&\"\r\n\t") != text.npos; }

/** The attributes and namespace declarations of an element as they are written. */
std::string attributes_of(xmlNode* element) {
    std::string list;
    for (xmlNs* space = element->nsDef; space; space = space->next)
        list += dumped(element->doc, reinterpret_cast<xmlNode*>(space));
    for (xmlAttr* own = element->properties; own; own = own->next) {
        const xmlNode* const value = own->children;
        const bool plain = !own->ns && value && !value->next && value->type == XML_TEXT_NODE;
        if (plain && !needs_escape(view(value->content)))
            (((list += ' ') += view(own->name)) += "=\"").append(view(value->content)) += '"';
        else
            list += dumped(element->doc, reinterpret_cast<xmlNode*>(own));
    }
    return list;
}

/** Moves what libxml2 reads into a HeaderTree, element by element. The parser's own tree, which it needs to tell
 * blanks between elements from text, keeps only the open elements and the first and last child of each. */
class Builder {
public:
    Builder(HeaderTree& tree, ElementChoice* choice) : tree_{tree}, filter_{tree, choice} {
        open_.push_back(Node::none);
    }

    void begin(xmlParserCtxt& parser) {
        xmlNode* const element = parser.node;
        element->_private = this;  // taken
        open_.push_back(append(*element));
        xmlFreePropList(std::exchange(element->properties, nullptr));
    }
    /** Takes what stands in the parser's element, or in the document outside the root, since this was called last.
     */
    void take_texts(xmlNode* parent) {
        xmlNode* fresh = parent->last;
        while (fresh && !fresh->_private) fresh = fresh->prev;
        fresh = fresh ? fresh->next : parent->children;
        for (; fresh; fresh = fresh->next) take(fresh);
        for (xmlNode* node = parent->last ? parent->last->prev : nullptr; node && can_go(*node);
             node = parent->last->prev) {
            xmlUnlinkNode(node);
            xmlFreeNode(node);
        }
    }
    /** Before the parser leaves its element. */
    void end(xmlNode* element) {
        const Node node = open_.back();
        const xmlNode* const only = element->children;
        if (filter_.keeps() && only && !only->next && only->type == XML_TEXT_NODE && !only->_private)
            tree_.set_leaf_text(node, tree_.keep(view(only->content)));
        else
            take_texts(element);
        xmlFreeNodeList(std::exchange(element->children, nullptr));
        element->last = nullptr;
        open_.pop_back();
        filter_.end(node);
    }

    /** Runs a step of a parser's callback, through which nothing may be thrown. */
    template <typename Step>
    static void guarded(void* context, Step step) noexcept {
        auto* const parser = static_cast<xmlParserCtxt*>(context);
        auto& self = *static_cast<Builder*>(parser->_private);
        if (self.failed_) return;
        try {
            step(self, *parser);
        } catch (const std::exception&) {
            self.failed_ = true;
            xmlStopParser(parser);
        }
    }
    [[nodiscard]] bool failed() const noexcept { return failed_; }
    /** Whether a declaration or the depth of nesting ended the parsing. */
    [[nodiscard]] bool refused(const xmlParserCtxt& parser) const noexcept {
        return declared_ ||
               (parser.errNo == XML_ERR_INTERNAL_ERROR && level() >= static_cast<int>(xmlParserMaxDepth));
    }
    void refuse_declaration() noexcept { declared_ = true; }

private:
    /** How deep the next element will lie; the root at 0. */
    [[nodiscard]] int level() const noexcept { return static_cast<int>(open_.size()) - 1; }

    /** Whether the parser does without a node that is not the last of its parent: it still looks at the first, and
     * at what stands beside the root. */
    static bool can_go(const xmlNode& node) {
        return node.prev && node.type != XML_DTD_NODE &&
               !(node.type == XML_ELEMENT_NODE && is_document(*node.parent));
    }
    static bool is_document(const xmlNode& node) { return node.type == XML_DOCUMENT_NODE; }
    Node append(xmlNode& element) {
        const std::uint32_t before_name = tree_.text_bytes();
        const Node node = tree_.append(open_.back(), NodeKind::element, name_place(element));
        if (element.ns) tree_.set_in_namespace(node);
        const std::uint32_t with_name = tree_.text_bytes();
        if (element.nsDef || element.properties) tree_.set_attributes(node, tree_.keep(attributes_of(&element)));
        filter_.begin(node, before_name, with_name);
        return node;
    }
    void take(xmlNode* node) {
        node->_private = this;
        if (!filter_.keeps()) return;
        const auto append = [&](NodeKind kind, std::string_view content) {
            const bool named = kind == NodeKind::instruction || kind == NodeKind::reference;
            const std::uint32_t name = named ? tree_.keep(view(node->name)) : 0;
            tree_.append(open_.back(), kind, name, tree_.keep(content));
        };
        switch (node->type) {
            case XML_TEXT_NODE:
                return append(NodeKind::text, view(node->content));
            case XML_CDATA_SECTION_NODE:
                return append(NodeKind::cdata, view(node->content));
            case XML_COMMENT_NODE:
                return append(NodeKind::comment, view(node->content));
            case XML_PI_NODE:
                return append(NodeKind::instruction, view(node->content));
            case XML_ENTITY_REF_NODE:
                return append(NodeKind::reference, "");
            case XML_DTD_NODE:
                return append(NodeKind::doctype, dumped(node->doc, node));
            default:
                break;
        }
    }
    /** Most elements of a header bear few names, which need to be kept only once. The parser mostly has one place
     * for a name. */
    std::uint32_t name_place(const xmlNode& element) {
        const xmlChar* const prefix = element.ns ? element.ns->prefix : nullptr;
        std::string with_prefix;
        if (prefix) with_prefix.append(view(prefix)).append(":").append(view(element.name));
        const std::string_view whole = prefix ? with_prefix : view(element.name);
        std::uint32_t& place = names_[reinterpret_cast<std::uintptr_t>(element.name) / 8 % names_.size()];
        if (!tree_.keeps(place, whole)) place = tree_.keep(whole);
        return place;
    }

    HeaderTree& tree_;
    TreeFilter filter_;
    std::vector<Node> open_;                   // the open elements, outermost first; before them the document
    std::array<std::uint32_t, 1024> names_{};  // places of names kept
    bool failed_ = false, declared_ = false;
};

/** A run of texts ends: what follows is no text. */
void end_texts(void* context) {
    Builder::guarded(context, [](Builder& builder, const xmlParserCtxt& in) {
        const bool in_doctype = in.inSubset != 0;
        if (!in_doctype) builder.take_texts(in.node ? in.node : as_node(in.myDoc));
    });
}

void begin_element(void* context, const xmlChar* name, const xmlChar* prefix, const xmlChar* uri, int spaces,
                   const xmlChar** space_list, int attributes, int defaulted, const xmlChar** list) {
    auto* const parser = static_cast<xmlParserCtxt*>(context);
    end_texts(context);
    const xmlNode* const parent = parser->node;
    xmlSAX2StartElementNs(context, name, prefix, uri, spaces, space_list, attributes, defaulted, list);
    if (parser->node == parent) return;  // without memory, or nested too deep: the parser stops
    Builder::guarded(context, [](Builder& builder, xmlParserCtxt& in) { builder.begin(in); });
}

void end_element(void* context, const xmlChar* name, const xmlChar* prefix, const xmlChar* uri) {
    Builder::guarded(context, [](Builder& builder, xmlParserCtxt& in) {
        if (in.node) builder.end(in.node);
    });
    xmlSAX2EndElementNs(context, name, prefix, uri);
}

void add_comment(void* context, const xmlChar* text) {
    end_texts(context);
    xmlSAX2Comment(context, text);
}

void add_instruction(void* context, const xmlChar* target, const xmlChar* text) {
    end_texts(context);
    xmlSAX2ProcessingInstruction(context, target, text);
}

void refuse(void* context) {
    auto* const parser = static_cast<xmlParserCtxt*>(context);
    static_cast<Builder*>(parser->_private)->refuse_declaration();
    xmlStopParser(parser);
}

using Parser = std::unique_ptr<xmlParserCtxt, decltype(&xmlFreeParserCtxt)>;

/** A parser that feeds a builder and stops at the first declaration in a DTD: entities declared there could grow
 * without bound. */
Parser make_parser(Builder& builder) {
    xmlParserCtxt* parser = xmlNewParserCtxt();
    if (parser) {
        parser->_private = &builder;
        xmlSAXHandler& events = *parser->sax;
        events.startElementNs = begin_element;
        events.endElementNs = end_element;
        events.comment = add_comment;
        events.processingInstruction = add_instruction;
        events.entityDecl = [](void* context, auto...) { refuse(context); };
        events.notationDecl = [](void* context, auto...) { refuse(context); };
        events.attributeDecl = [](void* context, const xmlChar*, const xmlChar*, int, int, const xmlChar*,
                                  xmlEnumeration* values) {
            xmlFreeEnumeration(values);
            refuse(context);
        };
        events.elementDecl = [](void* context, auto...) { refuse(context); };
        events.unparsedEntityDecl = [](void* context, auto...) { refuse(context); };
    }
    return {parser, &xmlFreeParserCtxt};
}

struct FreeTree {
    void operator()(xmlDoc* tree) const noexcept { xmlFreeDoc(tree); }
};

/** Takes what stands outside the root, and what the XML declaration says. */
void take_document(Builder& builder, xmlDoc* document, HeaderTree& tree) {
    builder.take_texts(as_node(document));
    tree.version = view(document->version);
    if (document->standalone == 0 || document->standalone == 1)
        tree.standalone = document->standalone ? "yes" : "no";
}

/** Parses with `read(parser)`. */
template <typename Read>
int parse(HeaderTree& tree, ElementChoice* choice, Read read, std::string* defect = nullptr) {
    const XmlErrors errors;
    tree = HeaderTree{};
    Builder builder{tree, choice};
    const Parser parser = make_parser(builder);
    if (!parser) return QUO_NO_MEMORY;
    errno = 0;
    const std::unique_ptr<xmlDoc, FreeTree> document{read(parser.get())};
    if (defect) *defect = errors.first();
    // A text that is too long counts as a lack of memory too; what fails without an error never got to parse.
    const bool unexplained = !document && parser->errNo == XML_ERR_OK;
    if (builder.failed() || errors.out_of_memory() || unexplained) return QUO_NO_MEMORY;
    if (builder.refused(*parser)) {
        errno = ENOTSUP;
        return QUO_READ_FAILED;
    }
    // A parser that was stopped hands over the part that it has and calls it well-formed.
    if (document && !parser->disableSAX) {
        if (!choice) take_document(builder, document.get(), tree);
        return QUO_OK;
    }
    // The dictionary of names says nothing when it cannot grow: the parser takes the name for a missing one.
    const bool names_do_not_fit = xmlDictGetUsage(parser->dict) > XML_MAX_DICTIONARY_LIMIT;
    return errno == ENOMEM || names_do_not_fit ? QUO_NO_MEMORY : QUO_REFUSED;
}

int parse_file(HeaderSource& source, HeaderTree& tree, ElementChoice* choice, std::string* defect) {
    const auto read = [&](xmlParserCtxt* parser) {
        return xmlCtxtReadIO(parser, HeaderSource::read, nullptr, &source, nullptr, nullptr, kHeaderOptions);
    };
    const int status = parse(tree, choice, read, defect);
    const int failed = source.status();
    return failed ? failed : status;
}

/** libxml2's read call for a text, of which it takes the next piece. */
int read_text(void* context, char* buffer, int length) {
    auto& text = *static_cast<std::string_view*>(context);
    const std::size_t taken = text.copy(buffer, static_cast<std::size_t>(length));
    text.remove_prefix(taken);
    return static_cast<int>(taken);
}

}  // namespace

int parse_header(HeaderSource& source, HeaderTree& tree, std::string* defect, ElementChoice* choice) {
    if (source.rewind()) {
        const int status = scan_header(source, tree, choice);
        if (defect) defect->clear();
        if (status != QUO_REFUSED || !source.rewind()) return status;
    }
    return parse_file(source, tree, choice, defect);
}

int parse_header(std::string_view text, HeaderTree& tree) {
    return parse(tree, nullptr, [&](xmlParserCtxt* parser) {
        return xmlCtxtReadIO(parser, read_text, nullptr, &text, nullptr, nullptr, kHeaderOptions);
    });
}

}  // namespace quo
