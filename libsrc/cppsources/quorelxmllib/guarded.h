// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_GUARDED_H
#define QUO_GUARDED_H

#include <exception>

#include "diagnosticslib/call_frame.h"

namespace quo {

/** Runs an operation whose only exception of the language is a failed allocation, which becomes the reported
 * status 7. A quorelException, which is none of these, passes. */
template <typename Operation>
int guarded(CallerFrame frame, Operation operation) {
    try {
        return operation();
    } catch (const std::exception&) {
        CallFrame::drop_errno();
        return frame.fail(QUO_NO_MEMORY, "Memory allocation failure");
    }
}

/** Ends a call with the status of its last step, which has reported its own failure. */
inline int pass_on(CallerFrame frame, int status) {
    return status == QUO_OK ? frame.success() : frame.callee(status);
}

}  // namespace quo

#endif
