// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <array>
#include <climits>
#include <cstdint>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <nlohmann/json.hpp>

#include "commands.h"
#include "quo_base/debugIO.h"

namespace tool {
namespace {

using Json = nlohmann::ordered_json;

struct DumpOptions {
    std::string file;
    int values = 8;
    bool json = false;
};

// What the elements of each type code hold by use; the format itself tells only their size.
constexpr std::array kTypes{"FLOAT32", "FLOAT64", "FLOAT_COMPLEX", "DOUBLE_COMPLEX", "INT16", "INT8"};

template <typename T>
T taken(const char* bytes) {
    T value;
    std::memcpy(&value, bytes, sizeof value);
    return value;
}

Json complex_value(double real, double imaginary) { return Json::array({real, imaginary}); }

Json value_of(int type, const char* bytes) {
    switch (type) {
        case 0:
            return as_written(taken<float>(bytes));
        case 1:
            return taken<double>(bytes);
        case 2:
            return complex_value(as_written(taken<float>(bytes)), as_written(taken<float>(bytes + sizeof(float))));
        case 3:
            return complex_value(taken<double>(bytes), taken<double>(bytes + sizeof(double)));
        case 4:
            return taken<std::int16_t>(bytes);
        default:
            return taken<std::int8_t>(bytes);
    }
}

/** A dump: its header words, compared with the file's length before anything is taken from it. */
class Dump {
public:
    static constexpr std::int64_t kHeader = 12;

    explicit Dump(const std::string& file) : file_{file}, stream_{file, std::ios::binary} {
        std::error_code error;
        if (!std::filesystem::is_regular_file(file, error) && !error) throw Failure(file + ": not a regular file");
        length_ = static_cast<std::int64_t>(std::filesystem::file_size(file, error));
        if (error) throw Failure(file + ": " + error.message());
        std::array<std::int32_t, 3> words{};
        if (length_ < kHeader || !stream_.read(reinterpret_cast<char*>(words.data()), sizeof words))
            throw Failure(file + ": has " + std::to_string(length_) + " bytes, less than the header of a dump");
        type_ = words[0];
        first_ = words[1];
        second_ = words[2];
        size_ = static_cast<std::int64_t>(debug_element_size(type_));
        if (size_ == 0) throw Failure(file + ": is no dump, its type code is " + std::to_string(type_));
        if (first_ < 0 || second_ < 0)
            throw Failure(file + ": is no dump, its dimensions are " + std::to_string(first_) + " and " +
                          std::to_string(second_));
    }

    [[nodiscard]] int type() const { return type_; }
    [[nodiscard]] int first() const { return first_; }
    [[nodiscard]] int second() const { return second_; }
    [[nodiscard]] std::int64_t element_bytes() const { return size_; }
    [[nodiscard]] std::int64_t elements() const { return std::int64_t{first_} * second_; }
    [[nodiscard]] std::int64_t elements_in_file() const { return (length_ - kHeader) / size_; }
    /** What is wrong with the file's length, or nothing. */
    [[nodiscard]] std::string defect() const {
        if (elements() > elements_in_file())
            return "holds " + std::to_string(elements_in_file()) + " of " + std::to_string(elements()) +
                   " elements";
        const std::int64_t beyond = length_ - kHeader - elements() * size_;
        return beyond == 0 ? "" : "goes on for " + std::to_string(beyond) + " bytes after the last element";
    }

    /** The first values, `most` of them or as many as there are. */
    std::vector<Json> read(int most) {
        const std::int64_t count = std::min({std::int64_t{most}, elements(), elements_in_file()});
        std::vector<char> bytes(static_cast<std::size_t>(count * size_));
        if (!stream_.read(bytes.data(), static_cast<std::streamsize>(bytes.size())))
            throw Failure(file_ + ": " + system_cause());
        std::vector<Json> values;
        for (std::int64_t i = 0; i < count; ++i) values.push_back(value_of(type_, bytes.data() + i * size_));
        return values;
    }

private:
    std::string file_;
    std::ifstream stream_;
    std::int64_t length_ = 0, size_ = 0;
    std::int32_t type_ = 0, first_ = 0, second_ = 0;
};

std::string as_text(const Dump& dump, const std::vector<Json>& values) {
    std::string text =
        "type code           " + std::to_string(dump.type()) + ", " + std::to_string(dump.element_bytes()) +
        " bytes, shown as " + kTypes[static_cast<std::size_t>(dump.type())] + "\nfirst dimension     " +
        std::to_string(dump.first()) + "\nsecond dimension    " + std::to_string(dump.second()) + "\n";
    for (std::size_t i = 0; i < values.size(); ++i) {
        const auto second = static_cast<std::size_t>(dump.second());
        text +=
            column(std::to_string(i / second) + "," + std::to_string(i % second), 20) + text_of(values[i]) + "\n";
    }
    return text;
}

Json as_json(const Dump& dump, const std::vector<Json>& values) {
    return Json{{"type_code", dump.type()},
                {"element_bytes", dump.element_bytes()},
                {"shown_as", kTypes[static_cast<std::size_t>(dump.type())]},
                {"first", dump.first()},
                {"second", dump.second()},
                {"values", values}};
}

int show_dump(const DumpOptions& options) {
    Dump dump{options.file};
    const std::vector<Json> values = dump.read(options.values);
    options.json ? print_json(as_json(dump, values)) : print(as_text(dump, values));
    const std::string defect = dump.defect();
    if (defect.empty()) return kFine;
    complain(options.file + ": " + defect);
    return kFindings;
}

}  // namespace

void add_debug_dump(Command& program) {
    auto [command, options] =
        add_verb(program, "debug-dump", "Prints the header words and the first values of a debug dump", show_dump);
    command.needs("FILE", options.file, "Dump written by write_debug");
    command.takes("--values", options.values, "How many values",
                  {.shows_default = true, .within = {{0, INT_MAX}}});
    command.flag("--json", options.json, "Print JSON");
}

}  // namespace tool
