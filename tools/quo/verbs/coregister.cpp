// SPDX-License-Identifier: Apache-2.0
#include <array>
#include <cmath>
#include <nlohmann/json.hpp>

#include "commands.h"
#include "document.h"
#include "product.h"
#include "quo_base/Coregist.h"
#include "quo_base/MatrixAlgebraANSI.h"
#include "quo_base/derived_raster.h"
#include "sarutillib/ground/residuals.h"
#include "scene.h"

namespace tool {
namespace {

struct CoregisterOptions {
    std::string master, slave, output;
    bool json = false;
};

/** Where an image shows a ground point. Lines are those of the region: of bursts, whose lines follow each other in
 * the raster without regard to time, as if there were none. */
struct Place {
    double range_s = 0.0, azimuth_s = 0.0, sample = 0.0, line = 0.0;
};

/** One of the two images. */
struct Image {
    Scene scene;
    ROI_Obj region;  // that the grid covers
    int lines = 0, samples = 0;

    explicit Image(const std::string& header) : scene{header} {
        scene.require_look_side();
        scene.take_grid();
        GeneralSAR product;
        read_product(header, product);
        const RasterDescription* const raster = described_raster(product);
        lines = raster ? raster->NrOfLinesPerImage : product.roi.Roi.Lines;
        samples = raster ? raster->NrOfPixelsPerLine : product.roi.Roi.Samples;
        if (scene.grid().getRegion(&region, lines, samples) != QUO_OK)
            throw Failure(header + ": " + std::to_string(lines) + " x " + std::to_string(samples) +
                          " pixels are none of its grid's");
    }
    /** Completes a place from its times; whether it is in the raster. */
    bool holds(Place& place) const {
        double raster_line = 0.0;
        std::int32_t status = QUO_OK;
        const int refused = scene.grid().timePixels({1, &place.azimuth_s, &place.range_s},
                                                    {&raster_line, nullptr, &place.sample, &status});
        place.line = (place.azimuth_s - region.SlowStartTime) / region.SlowTimeDelta;
        return refused == QUO_OK && status == QUO_OK && raster_line >= 0.0 && raster_line < lines &&
               place.sample >= 0.0 && place.sample < samples;
    }
    bool is_ground_range() const { return scene.grid().GroundStep_m > 0.0; }
};

/** A ground point in both images. */
struct Match {
    Place master, slave;
};

/** 40 by 25 points of the master that lie in the slave too. */
std::vector<Match> find_matches(Image& master, Image& slave) {
    constexpr int kRanges = 40;
    constexpr int kAzimuths = 25;
    const ROI_Obj& region = master.region;
    std::vector<Match> matches;
    for (int j = 0; j < kAzimuths; ++j) {
        for (int i = 0; i < kRanges; ++i) {
            Match match;
            auto& [at, found] = match;
            at.range_s = region.FastStartTime + region.FastTimeLength * i / (kRanges - 1);
            at.azimuth_s = region.SlowStartTime + region.SlowTimeLength * j / (kAzimuths - 1);
            (void)master.holds(at);  // the region's end is a step behind its last pixel
            std::array<double, 3> ground{};
            const bool seen = std::isfinite(at.sample) && master.scene.covers(at.azimuth_s) &&
                              master.scene.orbit().sat2earth(at.azimuth_s, at.range_s, ground.data()) == 0 &&
                              slave.scene.orbit().earth2sat(ground.data(), &found.azimuth_s, &found.range_s) == 0;
            if (seen && slave.holds(found)) matches.push_back(match);
        }
    }
    return matches;
}

/** The two coordinates of the master that a polynomial takes, the place around which it stands, and how far the
 * image reaches from there. */
struct Variables {
    double Place::*across, Place::*along;
    double across_0, along_0, across_scale, along_scale;
};

/** Fits a polynomial to one of the slave's coordinates. */
void fit(const std::vector<Match>& matches, const Variables& of, double Place::*to, double (&c)[4]) {
    const double offset = matches.front().slave.*to;
    std::vector<double> design;
    std::vector<double> right;
    for (const Match& match : matches) {
        const double u = (match.master.*of.across - of.across_0) / of.across_scale;
        const double v = (match.master.*of.along - of.along_0) / of.along_scale;
        design.insert(design.end(), {u * u, u, v, 1.0});
        right.push_back(match.slave.*to - offset);
    }
    std::array<double, 4> x{};
    LsqSummary summary{};
    const int status = lsq_fit(design.data(), static_cast<int>(right.size()), 4, right.data(), x.data(), &summary);
    if (status != 0 || summary.rank < 4) throw Failure("the images share too little ground for a mapping");
    c[0] = x[0] / (of.across_scale * of.across_scale);
    c[1] = x[1] / of.across_scale;
    c[2] = x[2] / of.along_scale;
    c[3] = x[3] + offset;
}

void fit_times(const std::vector<Match>& matches, const ROI_Obj& region, Coregist& mapping) {
    mapping.trg0 = region.GetCenter().FastTime;
    mapping.taz0 = region.GetCenter().SlowTime;
    const Variables times{&Place::range_s, &Place::azimuth_s,           mapping.trg0,
                          mapping.taz0,    0.5 * region.FastTimeLength, 0.5 * region.SlowTimeLength};
    fit(matches, times, &Place::range_s, mapping.RgFit);
    fit(matches, times, &Place::azimuth_s, mapping.AzFit);
    mapping.init();
}

/** Samples in ground range are not evenly spaced in time: they have a fit of their own. */
void fit_samples(const std::vector<Match>& matches, const Image& master, const Image& slave, Coregist& mapping) {
    if (!master.is_ground_range() && !slave.is_ground_range()) {
        if (const int status = mapping.Time2Samples(&master.region, &slave.region))
            throw Failure("no sample form, status " + status_text(status));
        return;
    }
    mapping.Rg_Samples_Origin = master.samples / 2;
    mapping.Az_Samples_Origin = master.region.Lines / 2;
    const Variables pixels{&Place::sample,
                           &Place::line,
                           static_cast<double>(mapping.Rg_Samples_Origin),
                           static_cast<double>(mapping.Az_Samples_Origin),
                           0.5 * master.samples,
                           0.5 * master.region.Lines};
    fit(matches, pixels, &Place::sample, mapping.Rg_Fit_Coeff);
    fit(matches, pixels, &Place::line, mapping.Az_Fit_Coeff);
}

struct Agreement {
    quo::Residuals range_samples, azimuth_lines, back_samples, back_lines;
};

Agreement judge(const std::vector<Match>& matches, const Coregist& mapping, const Image& master,
                const Image& slave) {
    Agreement agreement;
    for (const auto& [at, found] : matches) {
        double range_s = 0.0;
        double azimuth_s = 0.0;
        mapping.evaluateSLtime(at.range_s, at.azimuth_s, &range_s, &azimuth_s);
        agreement.range_samples.add((range_s - found.range_s) / slave.region.FastTimeDelta);
        agreement.azimuth_lines.add((azimuth_s - found.azimuth_s) / slave.region.SlowTimeDelta);
        if (mapping.evaluateMAtime(found.range_s, found.azimuth_s, &range_s, &azimuth_s) != 0)
            throw Failure("the mapping has no inverse");
        agreement.back_samples.add((range_s - at.range_s) / master.region.FastTimeDelta);
        agreement.back_lines.add((azimuth_s - at.azimuth_s) / master.region.SlowTimeDelta);
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
                      options.master + " (quo footprint tells where each of them lies)");
    Coregist mapping;
    fit_times(matches, master.region, mapping);
    fit_samples(matches, master, slave, mapping);
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
    command.needs("-o,--output", options.output,
                  "Header document to hold the section REGIST; may be MASTER or SLAVE");
    command.flag("--json", options.json, "Print JSON");
}

}  // namespace tool
