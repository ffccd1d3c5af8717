// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_FACTS_H
#define QUO_TOOL_FACTS_H

#include <nlohmann/json.hpp>
#include <string>
#include <utility>
#include <vector>

#include "shown.h"

namespace tool {

/** What is known of something, in the order in which it is shown: as a line each to people, as JSON to programs.
 */
class Facts {
public:
    using Json = nlohmann::ordered_json;

    /** A fact without a name is for programs alone, one without a key for people alone. */
    void add(const char* name, const char* key, const std::string& text, Json value) {
        if (name) lines_.emplace_back(name, shown(text));
        if (key) json_[key] = std::move(value);
    }
    void add_text(const char* name, const char* key, const std::string& text) { add(name, key, text, text); }

    /** The lines, with the values behind a column of that width. */
    [[nodiscard]] std::string text(std::size_t width) const {
        std::string text;
        for (const auto& [name, value] : lines_) text += column(name, width) + value + "\n";
        return text;
    }
    [[nodiscard]] const Json& json() const { return json_; }

private:
    std::vector<std::pair<std::string, std::string>> lines_;
    Json json_ = Json::object();
};

}  // namespace tool

#endif
