// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_HEADER_WRITER_H
#define QUO_HEADER_WRITER_H

#include <functional>
#include <string_view>

#include "quorelxmllib/header_tree.h"

namespace quo {

/** Hands over a document, in pieces, as a file of UTF-8 has it: nodes that no text stands beside on lines of their
 * own, indented by two blanks a level, up to 30 levels. False when `take` answers so. */
bool write_indented(const HeaderTree& tree, const std::function<bool(std::string_view)>& take);

}  // namespace quo

#endif
