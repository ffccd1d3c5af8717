// SPDX-License-Identifier: Apache-2.0
#include "targets.h"

#include <cerrno>
#include <fstream>
#include <map>
#include <sstream>
#include <utility>

#include "session.h"

namespace example {

namespace {

Target parse_target(const std::string& line, const std::string& where) {
    Target target{};
    std::istringstream cells{line};
    char comma[3];
    std::getline(cells, target.name, ',');
    GeodeticPoint& place = target.place;
    cells >> place.latitude_deg >> comma[0] >> place.longitude_deg >> comma[1] >> place.height_m >> comma[2] >>
        target.strength;
    const bool separated = comma[0] == ',' && comma[1] == ',' && comma[2] == ',';
    if (cells.fail() || !separated) throw Failure{where + "\"" + line + "\" is no target"};
    return target;
}

}  // namespace

std::vector<Target> read_targets(const std::string& file) {
    std::ifstream stream{file};
    if (!stream) throw Failure{file + ": cannot be read"};
    std::vector<Target> targets;
    std::map<std::string, int> lines;  // in which the names stand
    bool names_passed = false;
    int number = 0;
    for (std::string line; std::getline(stream, line);) {
        ++number;
        if (line.empty() || line[0] == '#') continue;
        if (std::exchange(names_passed, true)) {
            const std::string where = file + ": line " + std::to_string(number) + ": ";
            Target target = parse_target(line, where);
            const auto& [named, is_new] = lines.try_emplace(target.name, number);
            if (!is_new)
                throw Failure{where + target.name + " is the name of the target in line " +
                              std::to_string(named->second) + "; give each its own"};
            targets.push_back(std::move(target));
        }
    }
    if (targets.empty()) throw Failure{file + ": no targets"};
    errno = 0;  // what the stream left would count as an error of the next function of the library
    return targets;
}

}  // namespace example
