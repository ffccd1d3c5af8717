// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_SAVED_IN_PLACE_H
#define QUO_SAVED_IN_PLACE_H

#include "quo_base/ckerr.h"
#include "sarutillib/ground/file_io.h"

namespace quo {

/** Notes in the report that a file had to be written in place, where a failure could have left a mixture. */
inline void warn_if_in_place(const AtomicFile& saved, const char* function, const char* source,
                             int line = __builtin_LINE()) noexcept {
    if (saved.in_place())
        quo_add_report("Written in place: no other file can be put there", QUO_WARNING, line, function, source);
}

}  // namespace quo

#endif
