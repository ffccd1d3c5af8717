#include "table.h"

#include <algorithm>

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
    if (line_.empty() || line_.front() == '#') throw Failure(input_.name() + ": no line of column names");
    if (!split_fields(line_, fields_)) throw Failure(place() + ": a quote is not closed");
    for (const std::string_view field : fields_) columns_.emplace_back(unquoted(field));
}

std::optional<std::size_t> Table::find(std::string_view column) const {
    const auto found = std::find(columns_.begin(), columns_.end(), column);
    if (found == columns_.end()) return std::nullopt;
    if (std::find(found + 1, columns_.end(), column) != columns_.end())
        throw Failure(input_.name() + ": two columns are named " + std::string{column});
    return static_cast<std::size_t>(found - columns_.begin());
}

std::size_t Table::need(std::string_view column) const {
    if (const auto index = find(column)) return *index;
    throw Failure(input_.name() + ": no column " + std::string{column});
}

bool Table::next() {
    while (input_.next(line_)) {
        if (line_.empty() || line_.front() == '#') continue;
        well_quoted_ = split_fields(line_, fields_);
        return true;
    }
    return false;
}

std::optional<std::string> Table::defect() const {
    if (!well_quoted_) return "a quote is not closed";
    if (fields_.size() != columns_.size())
        return std::to_string(fields_.size()) + " values for " + std::to_string(columns_.size()) + " columns";
    return std::nullopt;
}

std::vector<double> Table::numbers(std::span<const std::size_t> columns) const {
    if (const auto wrong = defect()) throw Failure(place() + ": " + *wrong);
    std::vector<double> values;
    for (const std::size_t column : columns) {
        const auto number = finite_number(fields_[column]);
        if (!number)
            throw Failure(place() + ": " + columns_[column] + " is \"" + std::string{fields_[column]} +
                          "\", not a number");
        values.push_back(*number);
    }
    return values;
}

std::string Table::place() const { return input_.name() + ": line " + std::to_string(input_.line_number()); }

}  // namespace tool
