// SPDX-License-Identifier: Apache-2.0
#include <nlohmann/json.hpp>

#include "commands.h"
#include "date.h"

namespace tool {
namespace {

struct TimeOptions {
    std::vector<std::string> times;
    bool json = false, iso = false;
};

int convert_times(const TimeOptions& options) {
    int result = kFine;
    nlohmann::json list = nlohmann::json::array();
    std::string text;
    for (const std::string& time : options.times) {
        const double seconds = seconds_of(time);
        const auto date = date_text(seconds, options.iso ? DateForm::kIso : DateForm::kHeader);
        if (!date) {
            complain(time + ": date texts reach from 1985 to 9999");
            result = kFindings;
        }
        list.push_back({{"seconds", seconds}, {"date", date ? nlohmann::json(*date) : nlohmann::json()}});
        text += exact(seconds) + "  " + date.value_or("-") + "\n";
    }
    options.json ? print_json(list) : print(text);
    return result;
}

}  // namespace

void add_time(Command& program) {
    auto [command, options] =
        add_verb(program, "time", "Seconds since 1985 to date texts, and back", convert_times);
    command.needs("TIME", options.times,
                  "Seconds, or a date such as \"04-JAN-2022 17:05:58.5\" or \"2022-01-04T17:05:58.5Z\"");
    command.flag("--iso", options.iso, "Write dates as ISO 8601");
    command.flag("--json", options.json, "Print JSON");
}

}  // namespace tool
