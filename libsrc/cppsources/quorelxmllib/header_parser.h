// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_HEADER_PARSER_H
#define QUO_HEADER_PARSER_H

#include <string>
#include <string_view>

#include "quorelxmllib/element_choice.h"
#include "quorelxmllib/header_source.h"
#include "quorelxmllib/header_tree.h"

namespace quo {

/** Parses a header file. 0; 1 for what is no XML, with the reason in `defect` where that is asked for; 4 for XML
 * that declares what we do not follow or nests deeper than 256 elements (errno is ENOTSUP), and for a source that
 * cannot be read; 7 when memory is short. With a choice only one chosen element at a time is in the tree. */
int parse_header(HeaderSource& source, HeaderTree& tree, std::string* defect = nullptr,
                 ElementChoice* choice = nullptr);
/** The same for a text in memory. */
int parse_header(std::string_view text, HeaderTree& tree);

}  // namespace quo

#endif
