#include "document.h"

#include <filesystem>
#include <fstream>

#include "failure.h"

namespace tool {

Document::Document(const std::string& file) : file_{file} {
    std::error_code error;
    const auto kind = std::filesystem::status(file, error).type();
    if (kind == std::filesystem::file_type::not_found) throw Failure(file + ": no such file");
    if (kind != std::filesystem::file_type::regular) throw Failure(file + ": not a regular file");
    storeFileName(file.c_str());
    if (parse() != QUO_OK || !isRecognized())
        throw Failure(file + ": " + or_xml_defect(file, "is no header document"));
}

std::string Document::or_xml_defect(const std::string& file, const std::string& cause) {
    char first = '\0';
    std::ifstream{file} >> first;  // the first that is no blank
    const std::string defect = first == '<' ? xmlDefect(file.c_str()) : "";
    return defect.empty() ? cause : "is no XML, " + defect;
}

bool Document::in(const std::string& file) {
    Document document;
    document.storeFileName(file.c_str());
    return document.parse() == QUO_OK && document.isRecognized();
}

std::vector<std::string> Document::values(const std::string& field) {
    const std::string path = is_array(field) ? field + "/val" : field;
    const int number = count(path);
    if (number < 1) throw Failure(file_ + ": has no field " + field);
    std::vector<std::vector<char>> rooms(static_cast<std::size_t>(number), std::vector<char>(kTextRoom));
    std::vector<char*> texts;
    texts.reserve(rooms.size());
    for (auto& room : rooms) texts.push_back(room.data());
    if (readString(kChannel, path.c_str(), texts.data(), number, kTextRoom) != QUO_OK) {
        throw Failure(file_ + ": cannot read " + field);
    }
    return {texts.begin(), texts.end()};
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
