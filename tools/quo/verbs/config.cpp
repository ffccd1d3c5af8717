// SPDX-License-Identifier: Apache-2.0
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <nlohmann/json.hpp>

#include "commands.h"
#include "document.h"
#include "field_check.h"
#include "output.h"
#include "quo_base/generalSAR_configuration.h"
#include "sarutillib/ground/letters.h"

namespace tool {
namespace {

using Record = GeneralSAR_ConfigurationRecord;
using Json = nlohmann::ordered_json;

constexpr int kConfigChannel = 1;
constexpr double kNoBound = 1e30;  // bounds of this size and above stand for none

struct ConfigOptions {
    std::vector<std::string> records;
    std::string file;
    bool json = false, replace = false;
};

// --- parameters -------------------------------------------------------------------------------------------------

using Parameters = std::vector<parElement>;

Parameters parameters_of(const Record& record) {
    Parameters parameters;
    for (int i = 0; i < record.elementCount(); ++i) parameters.push_back(*record.element(i));
    return parameters;
}

Parameters shared_parameters(GeneralSAR_BaseConfiguration& configuration) {
    Parameters parameters;
    for (int i = 0; i < GeneralSAR_BaseConfiguration::kSharedParameters; ++i)
        parameters.push_back(configuration.sharedParameter(i));
    return parameters;
}

std::unique_ptr<Record> record_of(const std::string& name) {
    if (auto record = Record::make(name)) return record;
    throw WrongUse(name + ": no record; there are " + quo::joined(Record::names()));
}

Json value_at(const parElement& element, int i) {
    return with_value(element, i, [](auto value) { return Json(value); });
}

Json values_of(const parElement& element) {
    if (element.count == 1) return value_at(element, 0);
    Json values = Json::array();
    for (int i = 0; i < element.count; ++i) values.push_back(value_at(element, i));
    return values;
}

// --- doc --------------------------------------------------------------------------------------------------------

std::string shown_type(const parElement& element) {
    constexpr const char* kNames[] = {"double", "float", "int", "text", "-"};
    const std::string name = kNames[element.type];
    return element.count == 1 ? name : name + " x " + std::to_string(element.count);
}

std::string bounds_of(const parElement& element) {
    const bool below = element.minimum > -kNoBound, above = element.maximum < kNoBound;
    if (element.minimum == 0.0 && element.maximum == 0.0) return "";
    if (element.type == parElement::typeInt && element.maximum == 2147483647.0)
        return "from " + exact(element.minimum);
    if (below && above) return exact(element.minimum) + " to " + exact(element.maximum);
    return below ? "from " + exact(element.minimum) : "";
}

/** A table in Markdown whose columns also line up on a terminal. */
class MarkdownTable {
public:
    using Row = std::vector<std::string>;
    explicit MarkdownTable(Row heading) : rows_{std::move(heading)} {}
    void add(Row row) { rows_.push_back(std::move(row)); }

    [[nodiscard]] std::string text() const {
        std::vector<std::size_t> widths(rows_[0].size(), 3);
        for (const Row& row : rows_)
            for (std::size_t i = 0; i < row.size(); ++i) widths[i] = std::max(widths[i], row[i].size());
        std::string text = line(rows_[0], widths), rule = "|";
        for (const std::size_t width : widths) rule += std::string(width + 2, '-') + "|";
        text += rule + "\n";
        for (std::size_t i = 1; i < rows_.size(); ++i) text += line(rows_[i], widths);
        return text;
    }

private:
    static std::string line(const Row& row, const std::vector<std::size_t>& widths) {
        std::string text = "|";
        for (std::size_t i = 0; i < row.size(); ++i)
            text += " " + row[i] + std::string(widths[i] - row[i].size(), ' ') + " |";
        return text + "\n";
    }
    std::vector<Row> rows_;
};

std::string described(const std::string& heading, const Parameters& parameters) {
    MarkdownTable table{{"parameter", "type", "unit", "bounds", "default", "meaning"}};
    for (const parElement& element : parameters)
        table.add({element.name, shown_type(element), element.unit, bounds_of(element),
                   text_of(values_of(element)), element.meaning});
    return "### " + heading + "\n\n" + table.text();
}

int document(const std::vector<std::string>& names) {
    std::string text;
    for (const std::string& name : names) {
        text += (text.empty() ? "" : "\n") + described(name, parameters_of(*record_of(name)));
    }
    if (names.empty()) {
        GeneralSAR_BaseConfiguration shared;
        text = described("Shared by all records", shared_parameters(shared));
        for (const char* name : Record::names()) text += "\n" + described(name, parameters_of(*record_of(name)));
    }
    print(text);
    return kFine;
}

// --- new --------------------------------------------------------------------------------------------------------

/** A file in the folder of temporary files that goes with the object. */
class ScratchFile {
public:
    /** For the new content of a file, which failures name: the user never sees this one. */
    explicit ScratchFile(std::string file) : file_{std::move(file)} {
        std::error_code error;
        folder_ = (std::filesystem::temp_directory_path(error) / "quo_config_XXXXXX").string();
        if (error) fail(error.message());
        name_.reserve(folder_.size() + std::size(kName));  // nothing must fail between the folder and its end
        if (!mkdtemp(folder_.data())) fail(system_cause());
        name_.append(folder_).append(kName);
    }
    ~ScratchFile() {
        (void)unlink(name_.c_str());
        (void)rmdir(folder_.c_str());
    }
    ScratchFile(const ScratchFile&) = delete;
    ScratchFile& operator=(const ScratchFile&) = delete;

    [[nodiscard]] const std::string& name() const { return name_; }
    void take_file() const {
        std::error_code error;
        std::filesystem::copy_file(file_, name(), error);
        if (error) fail(error.message());
    }
    [[nodiscard]] std::string text() const {
        std::ifstream stream{name(), std::ios::binary};
        // What cannot be opened would look empty, and take the place of the file that records are added to.
        if (!stream) fail(system_cause());
        return {std::istreambuf_iterator<char>{stream}, {}};
    }

private:
    [[noreturn]] void fail(const std::string& cause) const {
        throw Failure(file_ + ": cannot be prepared among the temporary files: " + cause);
    }

    static constexpr char kName[] = "/configuration.xml";

    std::string file_, folder_, name_;
};

ConfigurationReview review_of(const std::string& file) {
    require_header_file(file);
    ConfigurationReview review;
    forget_system_error();
    const int status = reviewConfiguration(file.c_str(), kConfigChannel, review);
    if (status != QUO_OK) refuse_header(file, status, "is no configuration file");
    return review;
}

bool names_section(const ConfigurationReview& review, const std::string& name) {
    return std::ranges::find(review.records, name) != review.records.end();
}

void keep_what_is_there(const ConfigOptions& options, const ScratchFile& scratch) {
    if (!std::filesystem::exists(options.file)) return;
    const ConfigurationReview review = review_of(options.file);
    for (const std::string& name : options.records) {
        if (names_section(review, name) && !options.replace)
            throw Failure(options.file + ": has a record " + name + " (--replace writes its defaults)");
    }
    scratch.take_file();
}

int write_new(const ConfigOptions& options) {
    std::vector<std::unique_ptr<Record>> records;
    for (const std::string& name : options.records) records.push_back(record_of(name));
    const ScratchFile scratch{options.file};
    if (options.file != "-") keep_what_is_there(options, scratch);
    for (const auto& record : records) record->writepar(scratch.name().c_str(), kConfigChannel);
    write_output(options.file, scratch.text());
    return kFine;
}

// --- show and check ---------------------------------------------------------------------------------------------

/** What a file says, section by section, with what differs from the defaults. */
class Listing {
public:
    void add(const std::string& section, const Parameters& values, const Parameters& defaults) {
        text_ += (text_.empty() ? "[" : "\n[") + section + "]\n";
        for (std::size_t i = 0; i < values.size(); ++i) add_value(section, values[i], defaults[i]);
    }
    [[nodiscard]] std::string text() const { return text_; }
    [[nodiscard]] const Json& json() const { return json_; }

private:
    void add_value(const std::string& section, const parElement& parameter, const parElement& fresh) {
        constexpr std::size_t kColumn = 32;
        const Json value = values_of(parameter), usual = values_of(fresh);
        const std::string name = parameter.name;
        json_[section][name] = value;
        text_ += column(name, kColumn) + text_of(value);
        if (*parameter.unit != '\0') text_ += std::string{" "} + parameter.unit;
        if (value != usual) text_ += "  (default " + text_of(usual) + ")";
        text_ += '\n';
    }

    std::string text_;
    Json json_ = Json::object();
};

int show(const ConfigOptions& options) {
    const ConfigurationReview review = review_of(options.file);
    if (review.records.empty()) throw Failure(options.file + ": holds no record");
    Listing listing;
    GeneralSAR_BaseConfiguration shared, fresh_shared;
    forget_system_error();
    shared.readConf(options.file.c_str(), kConfigChannel, shared.sharedParameter(0).section);
    refuse_unread(options.file, QUO_OK);  // the call itself tells nothing
    listing.add("shared", shared_parameters(shared), shared_parameters(fresh_shared));
    int status = kFine;
    for (const std::string& name : review.records) {
        const auto record = record_of(name), fresh = record_of(name);
        forget_system_error();
        try {
            record->readpar(options.file.c_str(), kConfigChannel);
            listing.add(name, parameters_of(*record), parameters_of(*fresh));
        } catch (const quorelException&) {
            refuse_unread(options.file, QUO_OK);
            complain(options.file + ": " + name + " is incomplete; quo config check tells what is missing");
            status = kFindings;
        }
    }
    options.json ? print_json(listing.json()) : print(listing.text());
    return status;
}

int check(const ConfigOptions& options) {
    const ConfigurationReview review = review_of(options.file);
    if (review.records.empty() && review.findings.empty()) throw Failure(options.file + ": holds no record");
    Json list = Json::array();
    std::string text;
    for (const auto& [section, name, reason] : review.findings) {
        list.push_back({{"section", section}, {"name", name}, {"reason", reason}});
        std::string place = section;
        if (!name.empty()) place.append("/").append(name);
        text.append(shown(place.append("  ").append(reason))).append("\n");
    }
    text += std::to_string(review.findings.size()) + (review.findings.size() == 1 ? " error in " : " errors in ") +
            std::to_string(review.records.size()) + (review.records.size() == 1 ? " record\n" : " records\n");
    options.json ? print_json(list) : print(text);
    return review.findings.empty() ? kFine : kFindings;
}

// quorelException is no std::exception: nothing above main() would know it.
command_line::Job guarded(int (*verb)(const ConfigOptions&), std::shared_ptr<ConfigOptions> options) {
    return [verb, options = std::move(options)] {
        try {
            return verb(*options);
        } catch (const quorelException& failure) {
            throw Failure(options->file + ": " + failure.what());
        }
    };
}

}  // namespace

void add_config(Command& program) {
    Command config = program.verb("config", "Writes, shows and checks the processors' configuration files");
    auto options = std::make_shared<ConfigOptions>();
    const auto add = [&](const char* name, const char* about, int (*run)(const ConfigOptions&)) {
        return config.verb(name, about, guarded(run, options));
    };

    Command command = add("new", "Writes records with their defaults", write_new);
    const auto names = Record::names();
    const command_line::Rules known{.offers = {std::begin(names), std::end(names)}};
    command.needs("RECORD", options->records, "Records, such as AzimuthConf", known);
    command.needs("-o,--output", options->file, "File to write or to add to, - for standard output");
    command.flag("--replace", options->replace, "Write records anew that FILE has already");

    command = add("show", "Prints the values of a file and what differs from the defaults", show);
    command.needs("FILE", options->file, "Configuration file");
    command.flag("--json", options->json, "Print JSON");

    command = add("check", "Lists what in a file does not fit the records", check);
    command.needs("FILE", options->file, "Configuration file");
    command.flag("--json", options->json, "Print JSON");

    command = add("doc", "Prints every parameter: type, unit, bounds, default, meaning",
                  [](const ConfigOptions& chosen) { return document(chosen.records); });
    command.takes("RECORD", options->records, "Records to describe; all where none is named", known);
}

}  // namespace tool
