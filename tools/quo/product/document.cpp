// SPDX-License-Identifier: Apache-2.0
#include "document.h"

#include <cerrno>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <string_view>
#include <system_error>

#include "failure.h"

namespace tool {
namespace {

constexpr const char* kDoesNotFit = ": does not fit into memory";

/** What is no XML in a file, and on which line, where XML is what it means to be, else `cause`. */
std::string xml_defect_or(const std::string& file, const std::string& cause) {
    char first = '\0';
    std::ifstream{file} >> first;  // the first that is no blank
    const std::string defect = first == '<' ? quorelxml::xmlDefect(file.c_str()) : "";
    return defect.empty() ? cause : "is no XML, " + defect;
}

}  // namespace

void require_regular_file(const std::string& file) {
    std::error_code error;
    const auto kind = std::filesystem::status(file, error).type();
    if (error) throw Failure(file + ": " + error.message());
    if (kind != std::filesystem::file_type::regular) throw Failure(file + ": not a regular file");
}

void require_header_file(const std::string& file) {
    static_assert(quorelxml::kMostFileBytes == 1LL << 30);
    require_regular_file(file);
    if (!std::ifstream{file}) throw Failure(file + ": " + system_cause());
    std::error_code error;
    if (std::filesystem::file_size(file, error) > static_cast<std::uintmax_t>(quorelxml::kMostFileBytes))
        throw Failure(file + ": is larger than 1 GiB, the limit of a header");
}

void refuse_unread(const std::string& file, int status) {
    const int error = quo_take_system_error();
    if (status == QUO_NO_MEMORY || error == ENOMEM) throw Failure(file + kDoesNotFit);
    if (error != 0) throw Failure(file + ": cannot be read: " + std::generic_category().message(error));
}

void refuse_header(const std::string& file, int status, const std::string& cause) {
    try {
        refuse_unread(file, status);
    } catch (const Failure& failure) {
        // A text that libxml2 finds too long looks like a lack of memory: the document's defect says more.
        if (status == QUO_NO_MEMORY || failure.what() != file + kDoesNotFit) throw;
        throw Failure(file + ": " + xml_defect_or(file, kDoesNotFit + 2));
    }
    throw Failure(file + ": " + xml_defect_or(file, cause));
}

Document::Document(const std::string& file) : file_{file} {
    require_header_file(file);
    storeFileName(file.c_str());
    forget_system_error();
    const int status = parse();
    if (status != QUO_OK || !isRecognized()) refuse_header(file, status, "is no header document");
}

bool Document::in(const std::string& file) {
    Document document;
    document.storeFileName(file.c_str());
    return document.parse() == QUO_OK && document.isRecognized();
}

void require_document(const std::string& file, bool may_be_missing) {
    std::error_code error;
    if (may_be_missing && std::filesystem::status(file, error).type() == std::filesystem::file_type::not_found)
        return;
    forget_system_error();
    if (!Document::in(file)) refuse_header(file, QUO_REFUSED, "is no header document");
}

std::vector<std::string> Document::values(const std::string& field) {
    const std::string path = is_array(field) ? field + "/val" : field;
    std::vector<std::string> texts;
    const int status = readTexts(kChannel, path.c_str(), [&](std::string_view text) { texts.emplace_back(text); });
    if (status != QUO_OK) throw Failure(file_ + ": cannot read " + field);
    if (texts.empty()) throw Failure(file_ + ": has no field " + field);
    return texts;
}

void Document::replace(const std::string& field, const std::vector<std::string>& values) {
    const bool was_array = is_array(field);
    const bool array = was_array || (values.size() > 1 && count(field) < 2);
    const std::string path = array ? field + "/val" : field;
    const auto number = static_cast<int>(values.size());
    if (count(path) > number) clearField(kChannel, path.c_str());
    if (array && !was_array && has(field)) {
        const char* empty = "";  // the single value makes room for the array
        writeString(kChannel, field.c_str(), &empty, 1);
    }
    std::vector<const char*> texts;
    texts.reserve(values.size());
    for (const std::string& value : values) texts.push_back(value.c_str());
    if (writeString(kChannel, path.c_str(), texts.data(), number) != QUO_OK) {
        throw Failure(file_ + ": " + field + " cannot hold these values");
    }
}

void Document::save() {
    require_done(file_, "cannot be written", [this] { return write(); });
}

}  // namespace tool
