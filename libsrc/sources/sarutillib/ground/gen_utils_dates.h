// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_GEN_UTILS_DATES_H
#define QUO_GEN_UTILS_DATES_H

namespace quo {

/** Seconds from the second date text to the first, both read by date2str. Returns 0, or the code of the first text
 * that cannot be read, and then leaves `seconds_out` alone. */
int date_difference_seconds(const char* first, const char* second, double* seconds_out) noexcept;

}  // namespace quo

#endif
