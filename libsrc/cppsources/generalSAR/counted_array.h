#ifndef QUO_COUNTED_ARRAY_H
#define QUO_COUNTED_ARRAY_H

#include <cstdint>
#include <vector>

#include "diagnosticslib/call_frame.h"
#include "quorelxmllib/field_table.h"

namespace quo {

/** Makes the array for a count that a header states: zeros, none for a count below 1. Returns 0, or a reported
 * failure when there are more than `highest` or memory is short; the array is then empty. */
template <typename T>
int create_counted_array(CallerFrame frame, std::vector<T>& array, std::int32_t count, std::int32_t highest,
                         const char* too_many) {
    release_array(array);
    if (count > highest) return frame.fail(QUO_REFUSED, too_many);
    if (count > 0 && !allocate_array(array, static_cast<std::size_t>(count)))
        return frame.fail(QUO_NO_MEMORY, "Memory allocation failure");
    return QUO_OK;
}

}  // namespace quo

#endif
