// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_REPORT_H
#define QUO_REPORT_H

#include "diagnosticslib/call_stack.h"

namespace quo {

/** Sets the levels of report and log to 0 without closing a file. */
void silence_report_and_log() noexcept;

/** While it lives, this thread adds nothing to the report: for functions that tell of their failures in another
 * way, but call some that report. */
class MutedReport {
public:
    MutedReport() noexcept { ++call_stack().muted; }
    ~MutedReport() { --call_stack().muted; }
    MutedReport(const MutedReport&) = delete;
    MutedReport& operator=(const MutedReport&) = delete;
};

}  // namespace quo

#endif
