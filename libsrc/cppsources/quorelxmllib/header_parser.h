#ifndef QUO_HEADER_PARSER_H
#define QUO_HEADER_PARSER_H

#include <libxml/tree.h>

#include <string>
#include <string_view>

#include "quorelxmllib/header_source.h"
#include "quorelxmllib/header_tree.h"

namespace quo {

/** Chooses the elements of a document that are kept, one after the other. */
class ElementChoice {
public:
    virtual ~ElementChoice() = default;
    /** An element begins so many levels below the root; whether it is kept, with all it holds. */
    virtual bool begins(const xmlNode& element, int level) = 0;
    /** An element that was not kept ends. */
    virtual void ends(int level) = 0;
    /** An element that was kept is complete. It is forgotten afterwards. */
    virtual void take(const HeaderTree& tree, Node element) = 0;
};

/** Parses a header file. 0; 1 for what is no XML, with the reason in `defect` where that is asked for; 4 for XML
 * that declares what we do not follow or nests deeper than 256 elements (errno is ENOTSUP), and for a source that
 * cannot be read; 7 when memory is short. */
int parse_header(HeaderSource& source, HeaderTree& tree, std::string* defect = nullptr);
/** The same, element by chosen element: the document itself is never in memory. */
int parse_header(HeaderSource& source, ElementChoice& choice);
/** The same for a text in memory. */
int parse_header(std::string_view text, HeaderTree& tree);

}  // namespace quo

#endif
