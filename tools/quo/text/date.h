#ifndef QUO_TOOL_DATE_H
#define QUO_TOOL_DATE_H

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

/** The ISO 8601 text of such a time, to the microsecond; empty where there is none. */
std::string iso_text(double seconds);

/** Seconds since 1985 of a date text or an ISO 8601 text; nothing for another. */
std::optional<double> date_of(std::string_view text);

/** Seconds since 1985 of a number, a date text or an ISO 8601 text. Throws WrongUse where the text is neither. */
double seconds_of(const std::string& text);

}  // namespace tool

#endif
