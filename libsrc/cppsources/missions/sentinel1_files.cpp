// SPDX-License-Identifier: Apache-2.0
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <set>
#include <string>
#include <system_error>
#include <vector>

#include "missions/mission_xml.h"
#include "missions/sentinel1.h"
#include "sarutillib/ground/letters.h"

namespace quo {
namespace {

namespace fs = std::filesystem;

/** The parts of an annotation's name: s1a-iw1-slc-vv-... */
std::vector<std::string> parts_of(const fs::path& annotation) {
    std::vector<std::string> parts{""};
    for (const char c : annotation.stem().string()) {
        if (c == '-')
            parts.emplace_back();
        else
            parts.back() += c;
    }
    return parts;
}

bool is_annotation(const fs::path& file) {
    const auto parts = parts_of(file);
    return file.extension() == ".xml" && parts.size() > 4 && parts[0].starts_with("s1");
}

std::vector<fs::path> annotations_in(const fs::path& folder) {
    std::vector<fs::path> found;
    std::error_code error;
    for (fs::directory_iterator at{folder, error}, end; !error && at != end; at.increment(error))
        if (is_annotation(at->path())) found.push_back(at->path());
    std::ranges::sort(found);
    return found;
}

fs::path choose(const std::vector<fs::path>& all, const std::string& source, const std::string& swath,
                const std::string& polarization) {
    std::vector<fs::path> fitting;
    std::set<std::string> offered, left;
    for (const fs::path& file : all) {
        const auto parts = parts_of(file);
        offered.insert(parts[1] + " " + parts[3]);
        if ((!swath.empty() && parts[1] != lower(swath)) ||
            (!polarization.empty() && parts[3] != lower(polarization)))
            continue;
        fitting.push_back(file);
        left.insert(parts[1] + " " + parts[3]);
    }
    if (all.empty())
        throw MissionRefusal{
            QUO_REFUSED,
            source + ": holds no annotation of Sentinel-1; name a folder *.SAFE, its manifest or an annotation"};
    if (fitting.empty())
        throw MissionRefusal{QUO_REFUSED,
                             source + ": no such swath and polarization; there are " + joined(offered)};
    if (left.size() > 1)
        throw MissionRefusal{QUO_REFUSED, source + ": choose a swath and a polarization of " + joined(left) +
                                              ", or name the annotation"};
    if (fitting.size() > 1)  // vignettes
        throw MissionRefusal{QUO_REFUSED, source + ": holds " + std::to_string(fitting.size()) +
                                              " annotations of this swath and polarization; name one of them"};
    return fitting.front();
}

}  // namespace

MissionFiles find_sentinel1_files(const std::string& source, const std::string& swath,
                                  const std::string& polarization) {
    std::error_code error;
    fs::path path{source};
    if (access(source.c_str(), F_OK) != 0) refuse_opening(source);
    if (path.filename() == "manifest.safe") path = path.parent_path().empty() ? fs::path{"."} : path.parent_path();
    if (!fs::is_directory(path, error) && !is_annotation(path))
        throw MissionRefusal{QUO_REFUSED,
                             source + ": is neither a product's folder, its manifest nor an annotation"};
    const fs::path annotation = fs::is_directory(path, error)
                                    ? choose(annotations_in(path / "annotation"), source, swath, polarization)
                                    : choose({path}, source, swath, polarization);
    const fs::path folder = annotation.parent_path();
    const fs::path product = folder.empty()             ? fs::path{".."}
                             : folder.has_parent_path() ? folder.parent_path()
                                                        : fs::path{"."};
    MissionFiles files{annotation.string(), "", ""};
    for (const char* const ending : {".tiff", ".tif"}) {
        const fs::path measurement = product / "measurement" / (annotation.stem().string() + ending);
        if (files.measurement.empty() && fs::exists(measurement, error)) files.measurement = measurement.string();
    }
    if (files.measurement.empty())
        throw MissionRefusal{QUO_NOT_OPENED, files.annotation + ": its measurement ../measurement/" +
                                                 annotation.stem().string() + ".tiff is missing"};
    const fs::path manifest = product / "manifest.safe";
    if (fs::exists(manifest, error)) files.manifest = manifest.string();
    return files;
}

}  // namespace quo
