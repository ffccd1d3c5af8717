// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cmath>
#include <cstdint>
#include <iterator>
#include <nlohmann/json.hpp>
#include <optional>

#include "commands.h"
#include "date.h"
#include "document.h"
#include "field_check.h"
#include "output.h"
#include "product.h"

namespace tool {
namespace {

struct FieldOptions {
    std::string header, field;
    std::vector<std::string> values;
    bool json = false, create = false;
};

void require_field(const std::string& field) {
    if (field.find('/') == std::string::npos) throw WrongUse("FIELD " + field + ": give it as Section/Field");
}

/** The unit of a field that an object registers; empty where it has none. */
std::string unit_of(const std::string& field) {
    const Fields fields;
    const parElement* const element = fields.at(field);
    return element ? element->unit : "";
}

// A field that no object registers may be anything.
bool is_number(const std::string& field) { return Fields{}.is_numeric(field); }

nlohmann::json as_json(const std::string& text, bool numeric) {
    const auto number = numeric ? finite_number(text) : std::nullopt;
    if (!number) return text;
    const bool whole = text.find_first_of(".eE") == std::string::npos && std::abs(*number) < 1e15;
    return whole ? nlohmann::json(static_cast<std::int64_t>(*number)) : nlohmann::json(*number);
}

std::string json_text(const nlohmann::json& value) {
    return shown(value.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace));
}

/** The values of a field, read without the document: headers can be far larger than one field of them. */
class FieldReader {
public:
    explicit FieldReader(const FieldOptions& options)
        : file_{options.header}, json_{options.json}, numeric_{options.json && is_number(options.field)} {
        require_header_file(file_);
        is_array_ = read(options.field + "/val");
        if (!is_array_ && !read(options.field))
            throw Failure(file_ + ": " + Fields{}.list_for(options.field, Document{file_}));
    }

    /** The values: in JSON those of an object's member, separated by commas, else lines. */
    [[nodiscard]] const std::string& text() const { return text_; }
    /** Whether they make a list in JSON. */
    [[nodiscard]] bool is_list() const { return count_ != 1 || is_array_; }

private:
    /** Whether any element has the path. */
    bool read(const std::string& path) {
        constexpr int kChannel = 1;
        forget_system_error();
        const int status = quorelxml::readTexts(file_.c_str(), kChannel, path.c_str(), [&](std::string_view text) {
            ++count_;  // a tree of all values would take many times the memory of their text
            if (json_)
                (text_ += count_ > 1 ? ",\n    " : "") += json_text(as_json(std::string{text}, numeric_));
            else
                (text_ += shown(text)) += '\n';
        });
        if (status != QUO_OK) refuse_header(file_, status, "is no header document");
        return count_ > 0;
    }

    std::string file_, text_;
    bool json_, numeric_, is_array_ = false;
    std::int64_t count_ = 0;
};

int get_field(const FieldOptions& options) {
    require_field(options.field);
    FieldReader reader{options};
    Output output{"-"};
    if (options.json) {
        const std::string unit = unit_of(options.field);
        output.write("{\n  \"field\": " + json_text(options.field) +
                     (unit.empty() ? "" : ",\n  \"unit\": " + json_text(unit)) +
                     ",\n  \"value\": " + (reader.is_list() ? "[\n    " : ""));
    }
    output.write(reader.text());
    if (options.json) output.write(reader.is_list() ? "\n  ]\n}\n" : "\n}\n");
    output.commit();
    return kFine;
}

// What would make the field say something that makes no sense. Fields that no object registers may hold anything
// but, where polynomials and corner points are meant, words.
std::string defect_of(const FieldOptions& options) {
    const Fields fields;
    if (const parElement* element = fields.at(options.field))
        return values_defect(*element, *element, options.values);
    if (!fields.is_numeric(options.field)) return "";
    for (const std::string& value : options.values)
        if (!finite_number(value)) return "\"" + value + "\" is no finite number";
    return "";
}

/** A date for a field of a time since 1985 becomes its seconds; any other value stays as it is. */
std::string in_seconds(const std::string& field, const std::string& value) {
    constexpr std::string_view kTimes[] = {"ROI/SlowStartTime", "SwathInfo/Acquisition_Start_Time",
                                           "StateVectorData/t0SV_s", "ImageGrid/Epoch_s"};
    const bool is_time = std::ranges::find(kTimes, field) != std::end(kTimes) ||
                         (field.starts_with("PolySAR/") && field.ends_with("/taz0_s"));
    if (!is_time || finite_number(value)) return value;
    const auto time_s = time_of(value);
    return time_s ? exact(*time_s) : value;
}

int set_field(const FieldOptions& given) {
    FieldOptions options = given;
    require_field(options.field);
    for (std::string& value : options.values) value = in_seconds(options.field, value);
    for (const std::string& value : options.values) {
        if (value.size() >= Document::kTextRoom) {
            throw WrongUse(options.header + ": " + options.field + ": a value of " + std::to_string(value.size()) +
                           " bytes; headers hold at most " + std::to_string(Document::kTextRoom - 1));
        }
    }
    const std::string defect = defect_of(options);
    if (!defect.empty()) throw WrongUse(options.header + ": " + options.field + ": " + defect);
    Document document{options.header};
    if (!document.has(options.field) && !options.create) {
        throw Failure(options.header + ": has no field " + options.field + " (--create makes it)");
    }
    document.replace(options.field, options.values);
    document.save();
    return kFine;
}

Verb<FieldOptions> add_field_verb(Command& program, const char* name, const char* about,
                                  int (*run)(const FieldOptions&)) {
    auto verb = add_verb(program, name, about, run);
    auto& [command, options] = verb;
    command.needs("HEADER", options.header, "XML header file");
    command.needs("FIELD", options.field, "Section/Field, such as SamplingConstants/prf_hz");
    return verb;
}

}  // namespace

void add_get(Command& program) {
    auto [command, options] =
        add_field_verb(program, "get", "Prints one field of a header, a line for each value", get_field);
    command.flag("--json", options.json, "Print JSON");
}

void add_set(Command& program) {
    auto [command, options] =
        add_field_verb(program, "set", "Changes one field of a header; everything else stays", set_field);
    command.needs("VALUE", options.values, "The value, or the values of an array");
    command.flag("--create", options.create, "Make the field where it is missing");
}

}  // namespace tool
