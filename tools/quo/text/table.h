// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_TABLE_H
#define QUO_TOOL_TABLE_H

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "input.h"

namespace tool {

/** Name of the column of azimuth times: seconds since 1985, or dates. All other columns that are computed with
 * hold numbers. */
inline constexpr const char* kAzimuthTime = "azimuth_time_s";

/** Reads the value in a field of the column `name`. Returns what is wrong with it, in words; `value` stays then.
 */
std::optional<std::string> read_value(std::string_view field, std::string_view name, double& value);

/** Takes a line of comma-separated values apart. The fields point into the line and keep their quotes.
 *
 * @return false where a quote is left open or something follows a closing quote; the rest of the line is then the
 * last field */
bool split_fields(std::string_view line, std::vector<std::string_view>& fields);

/** A row of a table, taken apart. */
class Row {
public:
    /** Takes a line apart, which stands as long as the row is asked. */
    void take(std::string_view line, std::int64_t number) {
        line_ = line;
        number_ = number;
        well_quoted_ = split_fields(line_, fields_);
    }
    /** The row's line as it stands, its number in the file, and its fields. */
    std::string_view line() const { return line_; }
    std::int64_t number() const { return number_; }
    const std::vector<std::string_view>& fields() const { return fields_; }
    bool well_quoted() const { return well_quoted_; }
    /** What is wrong with the shape of a row that should have so many columns, or nothing. */
    std::optional<std::string> defect(std::size_t columns) const;

private:
    std::string_view line_;
    std::int64_t number_ = 0;
    std::vector<std::string_view> fields_;
    bool well_quoted_ = true;
};

/** Whether a line of a table holds one of its rows. */
inline bool is_row(std::string_view line) { return !line.empty() && line.front() != '#'; }

/** Some lines of a table as they stand, to be taken apart by whoever works on them. */
struct Rows {
    std::string text;
    std::int64_t before, last;  ///< numbers in the file: of the line before them, and of the last
    std::int64_t bytes_read;    ///< of the input, up to the last of them

    /** As many as there are, or more. */
    std::size_t most() const { return static_cast<std::size_t>(last - before); }
    /** Calls visit(text, number in the file) for each line that is a row. */
    template <typename Visit>
    void each(Visit visit) const {
        std::string_view rest{text};
        for (std::int64_t number = before + 1; !rest.empty(); ++number) {
            const std::size_t end = std::min(rest.find('\n'), rest.size());
            std::string_view line = rest.substr(0, end);
            rest.remove_prefix(std::min(end + 1, rest.size()));
            if (line.ends_with('\r')) line.remove_suffix(1);
            if (is_row(line)) visit(line, number);
        }
    }
};

/** A table in text: comment lines (they begin with '#'), a line of column names, then one row per line, all of
 * comma-separated values. Values that hold a comma stand in double quotes; a row never spans lines. Empty lines
 * and comment lines are skipped wherever they stand; a byte order mark at the start is too. */
class Table {
public:
    /** Reads up to the column names. Throws Failure where there are none. */
    explicit Table(const std::string& name);

    const std::vector<std::string>& columns() const { return columns_; }
    /** The comments before the column names, without '#' and the blanks around. */
    const std::vector<std::string>& comments() const { return comments_; }
    /** Index of a column. Throws Failure where two columns have that name. */
    std::optional<std::size_t> find(std::string_view column) const;
    /** The same for a column that must be there; throws Failure where it is not. */
    std::size_t need(std::string_view column) const;

    /** Goes to the next row; false at the end. */
    bool next();
    const Row& row() const { return row_; }
    /** The rows of the next lines, so many at most; nothing at the end. row() stays behind. */
    std::optional<Rows> next_rows(std::size_t most);
    /** The row's values in some columns; throws Failure for a row with a defect, or that lacks one of them. */
    std::vector<double> numbers(std::span<const std::size_t> columns) const;
    /** "file: line 17", for messages about a row: the present one, unless told. */
    std::string place() const;
    std::string place(std::int64_t line_number) const;

    /** The same about the column names. */
    std::string place_of_names() const { return place(names_at_); }

    const LineReader& input() const { return input_; }

private:
    LineReader input_;
    std::vector<std::string> columns_, comments_;
    std::string line_;
    std::int64_t names_at_ = 0;
    Row row_;
};

}  // namespace tool

#endif
