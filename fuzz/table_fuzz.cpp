// SPDX-License-Identifier: Apache-2.0
/* Tables of any bytes: the rows one by one are those of the blocks, and fields joined are the line again. */

#include "bytes.h"
#include "failure.h"
#include "number.h"
#include "table.h"

namespace {

using property::require;

/** The rows of a table as lines with their numbers, read one by one or in blocks; nothing where it is refused. */
std::vector<std::string> rows_of(const std::string& file, std::size_t block) {
    std::vector<std::string> rows;
    const auto add = [&](std::string_view line, std::int64_t number) {
        rows.push_back(std::to_string(number) + ":" + std::string{line});
    };
    try {
        tool::Table table{file};
        if (block == 0)
            while (table.next()) add(table.row().line(), table.row().number());
        else
            while (const auto some = table.next_rows(block)) some->each(add);
    } catch (const tool::Failure&) {
        rows.emplace_back("refused");
    }
    return rows;
}

void check_fields(std::string_view line) {
    std::vector<std::string_view> fields;
    const bool closed = tool::split_fields(line, fields);
    std::string joined;
    for (const std::string_view field : fields)
        joined.append(joined.empty() && field.data() == line.data() ? "" : ",").append(field);
    require(joined == line, "fields joined are the line");
    require(closed || line.find('"') != line.npos, "only quotes can be left open");
    for (const std::string_view field : fields) tool::finite_number(field);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string_view content{reinterpret_cast<const char*>(data), size};
    const property::MemoryFile file{content, "table"};
    require(rows_of(file.name(), 0) == rows_of(file.name(), 3), "rows in blocks are the rows");
    check_fields(content.substr(0, content.find('\n')));
    return 0;
}
