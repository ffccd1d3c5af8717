#include <array>
#include <nlohmann/json.hpp>

#include "commands.h"
#include "document.h"
#include "product.h"
#include "quo_base/Coregist.h"
#include "quo_base/MatrixAlgebraANSI.h"
#include "sarutillib/ground/residuals.h"
#include "scene.h"

namespace tool {
namespace {

struct CoregisterOptions {
    std::string master, slave, output;
    bool json = false;
};

/** One of the two images. */
struct Image {
    Scene scene;
    ROI_Obj region;

    explicit Image(const std::string& header) : scene{header} {
        scene.require_look_side();
        read_region(header, region);
        if (region.FastTimeDelta == 0.0 || region.SlowTimeDelta == 0.0)
            throw Failure(header + ": the region has no sampling intervals");
    }
    bool holds(double range_s, double azimuth_s) const {
        const double x = (range_s - region.FastStartTime) / region.FastTimeDelta;
        const double y = (azimuth_s - region.SlowStartTime) / region.SlowTimeDelta;
        return x >= 0.0 && x < region.Samples && y >= 0.0 && y < region.Lines;
    }
};

/** A ground point in both images. */
struct Match {
    double range_s, azimuth_s, slave_range_s, slave_azimuth_s;
};

/** 40 by 25 points of the master that lie in the slave too. */
std::vector<Match> find_matches(Image& master, Image& slave) {
    constexpr int kRanges = 40;
    constexpr int kAzimuths = 25;
    const ROI_Obj& region = master.region;
    std::vector<Match> matches;
    for (int j = 0; j < kAzimuths; ++j) {
        for (int i = 0; i < kRanges; ++i) {
            Match match{.range_s = region.FastStartTime + region.FastTimeLength * i / (kRanges - 1),
                        .azimuth_s = region.SlowStartTime + region.SlowTimeLength * j / (kAzimuths - 1),
                        .slave_range_s = 0.0,
                        .slave_azimuth_s = 0.0};
            std::array<double, 3> ground{};
            const bool seen =
                master.scene.covers(match.azimuth_s) &&
                master.scene.orbit().sat2earth(match.azimuth_s, match.range_s, ground.data()) == 0 &&
                slave.scene.orbit().earth2sat(ground.data(), &match.slave_azimuth_s, &match.slave_range_s) == 0;
            if (seen && slave.holds(match.slave_range_s, match.slave_azimuth_s)) matches.push_back(match);
        }
    }
    return matches;
}

/** Fits the polynomial of the time form, around the mapping's origin, to one of the slave's times. */
void fit(const std::vector<Match>& matches, double Match::*time, const ROI_Obj& region, const Coregist& mapping,
         double (&c)[4]) {
    const double range_scale = 0.5 * region.FastTimeLength;
    const double azimuth_scale = 0.5 * region.SlowTimeLength;
    const double offset = matches.front().*time;
    std::vector<double> design;
    std::vector<double> right;
    for (const Match& match : matches) {
        const double u = (match.range_s - mapping.trg0) / range_scale;
        const double v = (match.azimuth_s - mapping.taz0) / azimuth_scale;
        design.insert(design.end(), {u * u, u, v, 1.0});
        right.push_back(match.*time - offset);
    }
    std::array<double, 4> x{};
    LsqSummary summary{};
    const int status = lsq_fit(design.data(), static_cast<int>(right.size()), 4, right.data(), x.data(), &summary);
    if (status != 0 || summary.rank < 4) throw Failure("the images share too little ground for a mapping");
    c[0] = x[0] / (range_scale * range_scale);
    c[1] = x[1] / range_scale;
    c[2] = x[2] / azimuth_scale;
    c[3] = x[3] + offset;
}

struct Agreement {
    quo::Residuals range_samples, azimuth_lines, back_samples, back_lines;
};

Agreement judge(const std::vector<Match>& matches, const Coregist& mapping, const Image& master,
                const Image& slave) {
    Agreement agreement;
    for (const Match& match : matches) {
        double range_s = 0.0;
        double azimuth_s = 0.0;
        mapping.evaluateSLtime(match.range_s, match.azimuth_s, &range_s, &azimuth_s);
        agreement.range_samples.add((range_s - match.slave_range_s) / slave.region.FastTimeDelta);
        agreement.azimuth_lines.add((azimuth_s - match.slave_azimuth_s) / slave.region.SlowTimeDelta);
        if (mapping.evaluateMAtime(match.slave_range_s, match.slave_azimuth_s, &range_s, &azimuth_s) != 0)
            throw Failure("the mapping has no inverse");
        agreement.back_samples.add((range_s - match.range_s) / master.region.FastTimeDelta);
        agreement.back_lines.add((azimuth_s - match.azimuth_s) / master.region.SlowTimeDelta);
    }
    return agreement;
}

struct Row {
    const char *direction, *axis, *unit;
    const quo::Residuals& residuals;
};
std::array<Row, 4> rows_of(const Agreement& agreement) {
    return {{{"master to slave", "range", "samples", agreement.range_samples},
             {"master to slave", "azimuth", "lines", agreement.azimuth_lines},
             {"slave to master", "range", "samples", agreement.back_samples},
             {"slave to master", "azimuth", "lines", agreement.back_lines}}};
}

void print_agreement(const Agreement& agreement, const Coregist& mapping, bool json) {
    auto residuals = nlohmann::ordered_json::array();
    std::string text = "# points " + std::to_string(agreement.range_samples.count()) +
                       "\ndirection,axis,unit,largest_residual,rms_residual\n";
    for (const auto& [direction, axis, unit, residual] : rows_of(agreement)) {
        text += std::string{direction} + "," + axis + "," + unit + "," + rough(residual.largest()) + "," +
                rough(residual.rms()) + "\n";
        residuals.push_back({{"direction", direction},
                             {"axis", axis},
                             {"unit", unit},
                             {"largest", residual.largest()},
                             {"rms", residual.rms()}});
    }
    if (!json) return print(text);
    print_json({{"points", agreement.range_samples.count()},
                {"residuals", residuals},
                {"trg0_s", mapping.trg0},
                {"taz0_s", mapping.taz0},
                {"RgFit", mapping.RgFit},
                {"AzFit", mapping.AzFit},
                {"Rg_Fit_Coeff", mapping.Rg_Fit_Coeff},
                {"Az_Fit_Coeff", mapping.Az_Fit_Coeff},
                {"Rg_Samples_Origin", mapping.Rg_Samples_Origin},
                {"Az_Samples_Origin", mapping.Az_Samples_Origin}});
}

void write_mapping(const std::string& file, Coregist& mapping) {
    quorelxml::setExactNumbers(true);
    require_done(file, "cannot be written", [&] { return mapping.writeAuxiliaryFile(file.c_str(), 1, "REGIST"); });
}

int coregister(const CoregisterOptions& options) {
    require_document(options.output, true);
    Image master{options.master};
    Image slave{options.slave};
    const std::vector<Match> matches = find_matches(master, slave);
    constexpr std::size_t kFewest = 20;
    if (matches.size() < kFewest)
        throw Failure(options.slave + ": shares " + std::to_string(matches.size()) + " of 1000 points with " +
                      options.master);
    Coregist mapping;
    mapping.trg0 = master.region.GetCenter().FastTime;
    mapping.taz0 = master.region.GetCenter().SlowTime;
    fit(matches, &Match::slave_range_s, master.region, mapping, mapping.RgFit);
    fit(matches, &Match::slave_azimuth_s, master.region, mapping, mapping.AzFit);
    mapping.init();
    if (const int status = mapping.Time2Samples(&master.region, &slave.region))
        throw Failure("no sample form, status " + status_text(status));
    const Agreement agreement = judge(matches, mapping, master, slave);
    write_mapping(options.output, mapping);
    print_agreement(agreement, mapping, options.json);
    return kFine;
}

constexpr const char* kAbout = "Maps one image onto another of the same ground, from their orbits alone";
constexpr const char* kDetails =
    "1000 points of the master's region are brought to the ellipsoid and from there into the slave, both at zero\n"
    "Doppler; section REGIST receives the mapping in times and in samples. Prints what the mapping leaves over.\n";

}  // namespace

void add_coregister(Command& program) {
    auto [command, options] = add_verb(program, "coregister", kAbout, coregister);
    command.details(kDetails);
    command.needs("MASTER", options.master, "Header of the master image");
    command.needs("SLAVE", options.slave, "Header of the slave image");
    command.needs("-o,--output", options.output, "Header document to hold the section REGIST");
    command.flag("--json", options.json, "Print JSON");
}

}  // namespace tool
