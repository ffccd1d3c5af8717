// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_HEADER_SCANNER_H
#define QUO_HEADER_SCANNER_H

#include "quorelxmllib/element_choice.h"
#include "quorelxmllib/header_source.h"
#include "quorelxmllib/header_tree.h"

namespace quo {

/** Reads a header file in the form in which headers are mostly written: UTF-8 with ASCII characters alone,
 * elements with at most one attribute that hold either elements or one text, nothing that is escaped. That takes a
 * fraction of what a parser for all of XML does, and no longer for many names. The tree is what parse_header()
 * makes of it.
 * @return 0; 1 for anything else, XML or not: what is in the tree then is not to be used, and what was handed to
 * the choice is the beginning of what parse_header() hands to it; 4 where the source cannot be read, 7 when memory
 * is short */
int scan_header(HeaderSource& source, HeaderTree& tree, ElementChoice* choice = nullptr);

}  // namespace quo

#endif
