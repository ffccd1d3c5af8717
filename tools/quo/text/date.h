// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_DATE_H
#define QUO_TOOL_DATE_H

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace tool {

/** The long date text of a time in seconds since 1985, or nothing where there is none (before 1985, after 9999).
 *
 * The text is cut to microseconds, except where the time is the double closest to a whole microsecond: then it
 * shows that microsecond. The double of ...16.781409 lies a little below it, and a plain cut would show
 * ...16.781408. */
std::optional<std::string> date_text(double seconds);

/** How a verb writes dates. */
enum class DateForm : std::uint8_t { kHeader, kIso };
/** The date of such a time: the text above, or as ISO 8601 to the microsecond with the Z of UTC behind it. */
std::optional<std::string> date_text(double seconds, DateForm form);
/** The time as a date in ISO 8601, or as the number where it has none. */
std::string iso_or_number(double seconds);

/** The ISO 8601 text of such a time, to the microsecond; empty where there is none. */
std::string iso_text(double seconds);

/** Seconds since 1985 of a number, a date text or an ISO 8601 text; nothing for another. */
std::optional<double> time_of(std::string_view text);
/** The same; throws WrongUse for another. */
double seconds_of(const std::string& text);

}  // namespace tool

#endif
