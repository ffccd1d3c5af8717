// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_READABLE_FILE_H
#define QUO_READABLE_FILE_H

#include <cstdio>
#include <string_view>

#include "diagnosticslib/call_frame.h"
#include "sarutillib/ground/bounded_text.h"
#include "sarutillib/ground/file_io.h"

namespace quo {

/** 0 when the file can be opened for reading; else the reported status 1, one entry with the file's name. */
inline int refuse_missing_file(CallerFrame frame, const char* file) {
    if (file && Stream{std::fopen(file, "rb")}) return QUO_OK;
    CallFrame::drop_errno();  // the entry says it all
    char message[2048];
    const std::string_view name = text_or_empty(file);
    format_bounded(message, sizeof message, "File : %.*s DOES NOT EXIST!", static_cast<int>(name.size()),
                   name.data());
    return frame.fail(QUO_REFUSED, message);
}

}  // namespace quo

#endif
