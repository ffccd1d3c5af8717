// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_NUMBER_H
#define QUO_TOOL_NUMBER_H

#include <optional>
#include <string>
#include <string_view>
#include <utility>

namespace tool {

/** Appends the shortest text that reads back to the same double; locale-independent. */
void append_exact(std::string& text, double value);
std::string exact(double value);

/** The double whose shortest text is that of the float: 0.8 and not 0.800000011920929. */
double as_written(float value);

/** The value with a fixed number of decimals. */
std::string fixed(double value, int decimals);

/** The value with three significant digits, for people. */
std::string rough(double value);
/** The value with ten significant digits, for people who compare. */
std::string handy(double value);

/** The text without the blanks and tabs around it. */
std::string_view trimmed(std::string_view text);

/** The number that the whole text is, blanks around it and a leading plus sign allowed. Nothing for anything else,
 * and for infinity and not-a-number, which no computation here can use. */
std::optional<double> finite_number(std::string_view text);

/** The same; throws WrongUse with the option's name for another text. */
double finite_number(std::string_view text, const char* option);
/** The whole number that the whole text is; nothing for anything else, and beyond an int. */
std::optional<int> whole_number(std::string_view text);

/** The two numbers of a text such as "4x1", with a separator in between; nothing for anything else. */
std::optional<std::pair<double, double>> number_pair(std::string_view text, char separator);

}  // namespace tool

#endif
