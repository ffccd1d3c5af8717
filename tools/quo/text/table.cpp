// SPDX-License-Identifier: Apache-2.0
#include "table.h"

#include <algorithm>

#include "date.h"
#include "failure.h"
#include "number.h"

namespace tool {
namespace {

/** A field without the quotes around it. Quotes inside stay as they are: no column that is looked for has any. */
std::string_view unquoted(std::string_view field) {
    field = trimmed(field);
    const bool quoted = field.size() >= 2 && field.front() == '"' && field.back() == '"';
    return quoted ? field.substr(1, field.size() - 2) : field;
}

/** Length of the quoted field at the start of `text`, quotes included; npos where the quote is left open. */
std::size_t quoted_length(std::string_view text) {
    for (std::size_t i = 1; i < text.size(); ++i) {
        if (text[i] != '"') continue;
        if (i + 1 == text.size() || text[i + 1] != '"') return i + 1;
        ++i;
    }
    return std::string_view::npos;
}

}  // namespace

std::optional<std::string> read_value(std::string_view field, std::string_view name, double& value) {
    const bool time = name == kAzimuthTime;
    const auto found = time ? time_of(unquoted(field)) : finite_number(field);
    if (found) {
        value = *found;
        return std::nullopt;
    }
    return std::string{name} + " is \"" + std::string{field} + "\", " +
           (time ? "neither a number nor a date such as 2022-01-04T17:05:58.5Z" : "not a number");
}

bool split_fields(std::string_view line, std::vector<std::string_view>& fields) {
    fields.clear();
    while (true) {
        const bool quoted = !line.empty() && line.front() == '"';
        const std::size_t end = quoted ? quoted_length(line) : std::min(line.find(','), line.size());
        if (end == std::string_view::npos || (end < line.size() && line[end] != ',')) {
            fields.push_back(line);
            return false;
        }
        fields.push_back(line.substr(0, end));
        if (end == line.size()) return true;
        line.remove_prefix(end + 1);
    }
}

Table::Table(const std::string& name) : input_{name} {
    constexpr std::string_view kByteOrderMark = "\xEF\xBB\xBF";
    while (input_.next(line_)) {
        if (input_.line_number() == 1 && line_.starts_with(kByteOrderMark)) line_.erase(0, kByteOrderMark.size());
        if (line_.empty()) continue;
        if (line_.front() != '#') break;
        comments_.emplace_back(trimmed(std::string_view{line_}.substr(1)));
    }
    if (line_.empty() || line_.front() == '#')
        throw Failure(input_.name() + ": no line of column names; put one first");
    names_at_ = input_.line_number();
    row_.take(line_, input_.line_number());
    if (!row_.well_quoted()) throw Failure(place() + ": " + *row_.defect(0));
    for (const std::string_view field : row_.fields()) columns_.emplace_back(unquoted(field));
}

std::optional<std::size_t> Table::find(std::string_view column) const {
    const auto found = std::find(columns_.begin(), columns_.end(), column);
    if (found == columns_.end()) return std::nullopt;
    if (std::find(found + 1, columns_.end(), column) != columns_.end())
        throw Failure(place_of_names() + ": two columns are named " + std::string{column} + "; rename one");
    return static_cast<std::size_t>(found - columns_.begin());
}

std::size_t Table::need(std::string_view column) const {
    if (const auto index = find(column)) return *index;
    throw Failure(place_of_names() + ": no column " + std::string{column} + " among the names");
}

bool Table::next() {
    while (input_.next(line_)) {
        if (!is_row(line_)) continue;
        row_.take(line_, input_.line_number());
        return true;
    }
    return false;
}

std::optional<Rows> Table::next_rows(std::size_t most) {
    const std::int64_t before = input_.line_number();
    Rows rows{input_.next_lines(most), before, input_.line_number(), input_.bytes_read()};
    if (rows.text.empty()) return std::nullopt;
    return rows;
}

std::optional<std::string> Row::defect(std::size_t columns) const {
    if (!well_quoted_) return "a quote is not closed; those inside a value are doubled";
    if (fields_.size() != columns)
        return std::to_string(fields_.size()) + " values for " + std::to_string(columns) + " columns";
    return std::nullopt;
}

std::vector<double> Table::numbers(std::span<const std::size_t> columns) const {
    if (const auto wrong = row_.defect(columns_.size())) throw Failure(place() + ": " + *wrong);
    std::vector<double> values;
    for (const std::size_t column : columns)
        if (const auto wrong = read_value(row_.fields()[column], columns_[column], values.emplace_back()))
            throw Failure(place() + ": " + *wrong);
    return values;
}

std::string Table::place() const { return place(input_.line_number()); }

std::string Table::place(std::int64_t line_number) const {
    return input_.name() + ": line " + std::to_string(line_number);
}

}  // namespace tool
