#include "targets.h"

#include <cerrno>
#include <fstream>
#include <sstream>

#include "session.h"

namespace example {

namespace {

Target parse_target(const std::string& line) {
    Target target{};
    std::istringstream cells{line};
    char comma[3];
    std::getline(cells, target.name, ',');
    GeodeticPoint& place = target.place;
    cells >> place.latitude_deg >> comma[0] >> place.longitude_deg >> comma[1] >> place.height_m >> comma[2] >>
        target.strength;
    const bool separated = comma[0] == ',' && comma[1] == ',' && comma[2] == ',';
    if (cells.fail() || !separated) throw Failure{"\"" + line + "\": no target"};
    return target;
}

}  // namespace

std::vector<Target> read_targets(const std::string& file) {
    std::ifstream stream{file};
    if (!stream) throw Failure{file + ": cannot be read"};
    std::vector<Target> targets;
    bool names_passed = false;
    for (std::string line; std::getline(stream, line);) {
        if (line.empty() || line[0] == '#') continue;
        if (names_passed) targets.push_back(parse_target(line));
        names_passed = true;
    }
    if (targets.empty()) throw Failure{file + ": no targets"};
    errno = 0;  // what the stream left would count as an error of the next function of the library
    return targets;
}

}  // namespace example
