// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_HEADER_STREAM_H
#define QUO_HEADER_STREAM_H

#include <functional>
#include <string_view>

namespace quo {

/** Calls `see` for the text of every element that a field path leads to, in document order, while the file is
 * being read: no document is kept. What was seen counts only when 0 comes back.
 * @return as HeaderDocument::load(), and 1 for what is no header document */
int stream_texts(const char* file, int channel, std::string_view field,
                 const std::function<void(std::string_view)>& see);

}  // namespace quo

#endif
