#include <filesystem>
#include <memory>
#include <nlohmann/json.hpp>
#include <vector>

#include "commands.h"
#include "failure.h"
#include "output.h"
#include "quo_base/quorelxml_v2.h"

namespace tool {
namespace {

struct FieldOptions {
    std::string header, field;
    std::vector<std::string> values;
    bool json = false, create = false;
};

constexpr int kChannel = 1;
constexpr std::size_t kTextRoom = 1024;

/** One field of a header file, as texts. */
class HeaderField : private quorelxml {
public:
    /** Throws Failure where the file is no header: a fresh document must not take its place. */
    HeaderField(const std::string& header, std::string field) : header_{header}, field_{std::move(field)} {
        std::error_code error;
        if (!std::filesystem::exists(header, error)) throw Failure(header + ": no such file");
        storeFileName(header.c_str());
        if (parse() != QUO_OK || !isRecognized()) throw Failure(header + ": is no header file");
        is_array_ = countNodes(kChannel, entries().c_str()) > 0;
    }

    [[nodiscard]] bool exists() const { return fieldExists(kChannel, field_.c_str()); }
    /** Whether the values stand in `val` children, or in several elements of the field's name. */
    [[nodiscard]] bool is_list() const { return is_array_ || countNodes(kChannel, field_.c_str()) > 1; }

    std::vector<std::string> read() {
        if (!exists()) throw Failure(header_ + ": has no field " + field_);
        const std::string path = is_array_ ? entries() : field_;
        const auto count = static_cast<std::size_t>(countNodes(kChannel, path.c_str()));
        std::vector<std::vector<char>> rooms(count, std::vector<char>(kTextRoom));
        std::vector<char*> texts;
        for (auto& room : rooms) texts.push_back(room.data());
        if (readString(kChannel, path.c_str(), texts.data(), static_cast<int>(count), kTextRoom) != QUO_OK) {
            throw Failure(header_ + ": cannot read " + field_);
        }
        return {texts.begin(), texts.end()};
    }

    /** Replaces the field in its own form; a single value becomes several only in the form of numeric arrays. */
    void write_values(const std::vector<std::string>& values) {
        const bool array = is_array_ || (values.size() > 1 && !is_list());
        const std::string path = array ? entries() : field_;
        const auto count = static_cast<int>(values.size());
        if (countNodes(kChannel, path.c_str()) > count) clearField(kChannel, path.c_str());
        if (array && !is_array_ && exists()) clear_text();
        std::vector<const char*> texts;
        for (const std::string& value : values) texts.push_back(value.c_str());
        if (writeString(kChannel, path.c_str(), texts.data(), count) != QUO_OK || write() != QUO_OK) {
            throw Failure(header_ + ": cannot be written");
        }
    }

private:
    [[nodiscard]] std::string entries() const { return field_ + "/val"; }
    void clear_text() {
        const char* empty = "";
        writeString(kChannel, field_.c_str(), &empty, 1);
    }

    std::string header_, field_;
    bool is_array_ = false;
};

int get_field(const FieldOptions& options) {
    HeaderField field{options.header, options.field};
    const std::vector<std::string> values = field.read();
    Output output{"-"};
    if (options.json) {
        const nlohmann::json value = field.is_list() ? nlohmann::json(values) : nlohmann::json(values.at(0));
        output.write(nlohmann::json{{"field", options.field}, {"value", value}}.dump(
                         2, ' ', false, nlohmann::json::error_handler_t::replace) +
                     "\n");
    } else {
        for (const std::string& value : values) output.write(value + "\n");
    }
    output.commit();
    return kFine;
}

int set_field(const FieldOptions& options) {
    for (const std::string& value : options.values) {
        if (value.size() >= kTextRoom) throw WrongUse("a value of " + std::to_string(value.size()) + " bytes");
    }
    HeaderField field{options.header, options.field};
    if (!field.exists() && !options.create) {
        throw Failure(options.header + ": has no field " + options.field + " (--create makes it)");
    }
    field.write_values(options.values);
    return kFine;
}

CLI::App* add_common(CLI::App& app, const char* name, const char* about, FieldOptions& options) {
    CLI::App* command = app.add_subcommand(name, about);
    command->add_option("HEADER", options.header, "XML header file")->required();
    command->add_option("FIELD", options.field, "Section/Field, such as SamplingConstants/prf_hz")->required();
    return command;
}

}  // namespace

void add_get(CLI::App& app, Job& job) {
    auto options = std::make_shared<FieldOptions>();
    CLI::App* command = add_common(app, "get", "Prints one field of a header, a line for each value", *options);
    command->add_flag("--json", options->json, "Print JSON");
    command->callback([options, &job] { job = [options] { return get_field(*options); }; });
}

void add_set(CLI::App& app, Job& job) {
    auto options = std::make_shared<FieldOptions>();
    CLI::App* command = add_common(app, "set", "Changes one field of a header; everything else stays", *options);
    command->add_option("VALUE", options->values, "The value, or the values of an array")->required();
    command->add_flag("--create", options->create, "Make the field where it is missing");
    command->callback([options, &job] { job = [options] { return set_field(*options); }; });
}

}  // namespace tool
