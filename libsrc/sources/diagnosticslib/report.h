#ifndef QUO_REPORT_H
#define QUO_REPORT_H

namespace quo {

/** Sets the levels of report and log to 0 without closing a file. */
void silence_report_and_log() noexcept;

}  // namespace quo

#endif
