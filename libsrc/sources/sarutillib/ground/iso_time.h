// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_ISO_TIME_H
#define QUO_ISO_TIME_H

#include <optional>
#include <string_view>

namespace quo {

/** A moment to the microsecond: a double of seconds since 1985 alone would round it to a quarter of one. */
struct SplitTime {
    double whole_s = 0.0;     ///< whole seconds since 1985
    double fraction_s = 0.0;  ///< the rest, from 0 to below 1

    [[nodiscard]] double seconds() const { return whole_s + fraction_s; }
    [[nodiscard]] double after(double epoch_s) const { return (whole_s - epoch_s) + fraction_s; }
};

/** Of "2022-01-04T17:05:58.268589", with or without "UTC=" before and "Z" behind it; nothing for other texts. */
std::optional<SplitTime> split_time(std::string_view text);

}  // namespace quo

#endif
