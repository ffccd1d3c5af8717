// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <array>
#include <cmath>
#include <nlohmann/json.hpp>

#include "commands.h"
#include "date.h"
#include "document.h"
#include "product.h"
#include "quo_base/SARpolynomials.h"
#include "quo_base/quorelxml_v2.h"
#include "sarutillib/ground/residuals.h"
#include "scene.h"

namespace tool {
namespace {

struct DeriveOptions {
    std::string header;
    std::vector<std::string> region;  // range start and length, azimuth start and length
    std::vector<std::string> what;
    bool in_both_times = false, replace = false, json = false;
};

/** What can be derived, in the order of a product's lists. */
enum Quantity : std::uint8_t { kRate, kGround, kSlant, kIncidence, kLook, kQuantities };
struct About {
    const char *group, *name, *unit;
};
constexpr std::array<About, kQuantities> kAbouts{{{"fr", "DopplerRate", "Hz/s"},
                                                  {"ground", "SlantToGround", "m"},
                                                  {"ground", "GroundToSlant", "m"},
                                                  {"angles", "SlantToTheta", "deg"},
                                                  {"angles", "SlantToPhi", "deg"}}};

/** The polynomials of one product, new or not. */
struct Derived {
    polyFR rate;
    polySL2GR ground;
    polyGR2SL slant;
    polySL2THETA incidence;
    polySL2PHI look;

    const poly& operator[](Quantity quantity) const {
        const std::array<const poly*, kQuantities> all{&rate, &ground, &slant, &incidence, &look};
        return *all.at(quantity);
    }
};

struct Result {
    std::array<bool, kQuantities> wanted{}, kept{};
    Derived polynomials;
    std::array<quo::Residuals, kQuantities> residuals;
};

std::array<std::int32_t, kQuantities> counts_of(const polySAR& set) {
    return {set.nfr, set.nsl2gr, set.ngr2sl, set.nsl2theta, set.nsl2phi};
}

/** The header's polynomials; none where it has no such section. */
void read_polynomials(const std::string& header, polySAR& set) {
    double ignored = 0.0;
    quorelxml document{header.c_str()};
    const bool there = document.readDouble(1, "PolySAR/ndc", &ignored, 1) == QUO_OK;
    if (set.readhdr(header.c_str()) != QUO_OK && there) throw Failure(header + ": cannot read section PolySAR");
}

/** The Doppler in the middle of the region: as the header says, else 0. */
void doppler_of(const polySAR& set, const ROI_Obj& region, polyDC& dc) {
    dc.trg0 = region.FastStartTime;
    dc.taz0 = region.SlowStartTime;
    const double middle_s = region.GetCenter().SlowTime;
    int index = 0;
    if (set.ndc < 1 || set.getDCnum(middle_s, &index) != QUO_OK || set.getDCpoly(middle_s, dc.pol) != QUO_OK)
        return;
    dc.trg0 = set.DC[static_cast<std::size_t>(index)].trg0;
    dc.taz0 = set.DC[static_cast<std::size_t>(index)].taz0;
}

ROI_Obj& region_of(const DeriveOptions& options, ROI_Obj& region) {
    if (options.region.empty()) {
        read_region(options.header, region);
        return region;
    }
    constexpr const char* kOption = "--region";
    region.FastStartTime = finite_number(options.region[0], kOption);
    region.FastTimeLength = finite_number(options.region[1], kOption);
    region.SlowStartTime = seconds_of(options.region[2]);
    region.SlowTimeLength = finite_number(options.region[3], kOption);
    const bool positive = region.FastStartTime > 0.0 && region.FastTimeLength > 0.0 && region.SlowTimeLength > 0.0;
    if (!positive || !std::isfinite(region.GetDownRight().FastTime + region.GetDownRight().SlowTime))
        throw WrongUse("a region needs a range start and lengths above 0");
    return region;
}

/** What is to be made: what is asked for, else all that the header lacks. */
void choose(const DeriveOptions& options, const polySAR& set, Result& result) {
    const auto counts = counts_of(set);
    for (std::size_t q = 0; q < kQuantities; ++q) {
        const auto& what = options.what;
        const bool named = std::find(what.begin(), what.end(), kAbouts[q].group) != what.end();
        const bool asked = what.empty() || named;
        if (named && counts[q] > 0 && !options.replace)
            throw Failure(options.header + ": has " + std::to_string(counts[q]) + " polynomials " +
                          kAbouts[q].name + "; --replace takes their place");
        result.wanted[q] = asked && (counts[q] == 0 || options.replace);
        result.kept[q] = asked && !result.wanted[q];
    }
}

int derive_all(GeneralSAROrbit& orbit, const ROI_Obj& region, const polyDC& dc, bool in_both_times, Result& r) {
    const auto pick = [&](Quantity q, auto& polynomial) { return r.wanted[q] ? &polynomial : nullptr; };
    Derived& made = r.polynomials;
    auto* incidence = pick(kIncidence, made.incidence);
    auto* look = pick(kLook, made.look);
    auto* ground = pick(kGround, made.ground);
    auto* slant = pick(kSlant, made.slant);
    int status = orbit.SVGetFRpoly(&region, &dc, pick(kRate, made.rate));
    if (status == 0 && (incidence || look))
        status = in_both_times ? orbit.SVGetTimeToAnglesPolys(&region, &dc, incidence, look)
                               : orbit.SVGetSlantToAnglesPolys(&region, &dc, incidence, look);
    if (status == 0 && (ground || slant))
        status = in_both_times ? orbit.SVGetGroundToTimePolys(&region, &dc, ground, slant)
                               : orbit.SVGetGroundToSlantPolys(&region, &dc, ground, slant);
    return status;
}

/** One place of the region, with the geometry there. */
struct Place {
    double azimuth_s, range_s, doppler_hz, ground_m;
};

int compare(GeneralSAROrbit& orbit, const Place& at, Result& result) {
    std::array<double, kQuantities> truth{};
    truth[kGround] = at.ground_m;
    int status = orbit.SVGetFR(at.azimuth_s, at.range_s, at.doppler_hz, &truth[kRate]);
    if (status == 0)
        status = orbit.SVGetAngles(at.azimuth_s, at.range_s, at.doppler_hz, &truth[kIncidence], &truth[kLook]);
    if (status != 0) return status;
    for (std::size_t q = 0; q < kQuantities; ++q) {
        if (!result.wanted[q]) continue;
        const poly& polynomial = result.polynomials[static_cast<Quantity>(q)];
        double value = 0.0;
        if (q == kSlant) {  // takes ground range, gives range time after its reference
            polynomial.EvaluatePoly(polynomial.trg0 + at.ground_m, at.azimuth_s, &value);
            value = 0.5 * quo::kLightSpeed * (polynomial.trg0 + value - at.range_s);
        } else {
            polynomial.EvaluatePoly(at.range_s, at.azimuth_s, &value);
        }
        result.residuals[q].add(value - truth[q]);
    }
    return 0;
}

/** Compares the polynomials with the geometry all over the region. */
int compare_all(GeneralSAROrbit& orbit, const ROI_Obj& region, const polyDC& dc, Result& result) {
    constexpr int kAzimuths = 11;
    constexpr int kChords = 400;
    constexpr int kEvery = 20;
    for (int j = 0; j < kAzimuths; ++j) {
        Place at{.azimuth_s = region.SlowStartTime + region.SlowTimeLength * j / (kAzimuths - 1),
                 .range_s = 0.0,
                 .doppler_hz = 0.0,
                 .ground_m = 0.0};
        quo::Vec3 before{};
        for (int i = 0; i <= kChords; ++i) {
            double point[3] = {};
            at.range_s = region.FastStartTime + region.FastTimeLength * i / kChords;
            dc.EvaluatePoly(at.range_s, at.azimuth_s, &at.doppler_hz);
            int status = orbit.sat2earth(at.azimuth_s, at.range_s, at.doppler_hz, point);
            if (i > 0) at.ground_m += norm(quo::load(point) - before);
            before = quo::load(point);
            if (status == 0 && i % kEvery == 0) status = compare(orbit, at, result);
            if (status != 0) return status;
        }
    }
    return 0;
}

template <typename P>
void put(bool wanted, const P& polynomial, std::unique_ptr<P[]>& list, std::int32_t& count) {
    if (!wanted) return;
    list = std::make_unique<P[]>(1);
    count = 1;
    polynomial.clone(&list[0]);
}

void store(const std::string& header, const Result& result, polySAR& set) {
    const Derived& made = result.polynomials;
    put(result.wanted[kRate], made.rate, set.FR, set.nfr);
    put(result.wanted[kGround], made.ground, set.SL2GR, set.nsl2gr);
    put(result.wanted[kSlant], made.slant, set.GR2SL, set.ngr2sl);
    put(result.wanted[kIncidence], made.incidence, set.SL2THETA, set.nsl2theta);
    put(result.wanted[kLook], made.look, set.SL2PHI, set.nsl2phi);
    quorelxml::setExactNumbers(true);
    require_done(header, "cannot be written", [&] { return set.writehdr(header.c_str()); });
}

void print_result(const Result& result, bool json) {
    std::string kept_text;
    std::string text = "quantity,unit,largest_residual,rms_residual,trg0_s,taz0_s,c0,c1,c2,c3,c4,c5,c6\n";
    auto derived = nlohmann::ordered_json::array();
    auto kept = nlohmann::ordered_json::array();
    for (std::size_t q = 0; q < kQuantities; ++q) {
        const auto& [group, name, unit] = kAbouts[q];
        if (result.kept[q]) {
            kept_text += std::string{"# kept "} + name + "\n";
            kept.push_back(name);
        }
        if (!result.wanted[q]) continue;
        const poly& p = result.polynomials[static_cast<Quantity>(q)];
        const double largest = result.residuals[q].largest(), rms = result.residuals[q].rms();
        text += std::string{name} + "," + unit + "," + rough(largest) + "," + rough(rms) + "," + exact(p.trg0) +
                "," + exact(p.taz0);
        for (const double c : p.pol) text += "," + exact(c);
        text += "\n";
        derived.push_back({{"quantity", name},
                           {"unit", unit},
                           {"largest_residual", largest},
                           {"rms_residual", rms},
                           {"trg0_s", p.trg0},
                           {"taz0_s", p.taz0},
                           {"pol", p.pol}});
    }
    json ? print_json({{"derived", derived}, {"kept", kept}}) : print(kept_text + text);
}

int derive(const DeriveOptions& options) {
    Scene scene{options.header};
    require_document(options.header, false);
    scene.require_wavelength();
    scene.require_look_side();
    ROI_Obj room;
    const ROI_Obj& region = region_of(options, room);
    if (!scene.covers(region.GetUpLeft().SlowTime) || !scene.covers(region.GetDownRight().SlowTime))
        throw Failure(options.header + ": the region lies outside the state vectors");
    polySAR set;
    read_polynomials(options.header, set);
    polyDC dc;
    doppler_of(set, region, dc);

    Result result;
    choose(options, set, result);
    int status = derive_all(scene.orbit(), region, dc, options.in_both_times, result);
    if (status == 0) status = compare_all(scene.orbit(), region, dc, result);
    if (status != 0)
        throw Failure(options.header + ": the region cannot be derived from, status " + status_text(status));
    const bool anything = std::find(result.wanted.begin(), result.wanted.end(), true) != result.wanted.end();
    if (anything) store(options.header, result, set);
    print_result(result, options.json);
    return kFine;
}

}  // namespace

void add_derive(Command& program) {
    auto [command, options] =
        add_verb(program, "derive", "Adds polynomials derived from the orbit to a header", derive);
    command.details(
        "Derives what the header's section PolySAR lacks: azimuth FM rate (fr), "
        "incidence and look angle (angles), slant\n"
        "to ground range and back (ground). The Doppler is the header's, else 0. "
        "Prints how far the polynomials are from\n"
        "the geometry over the region. Everything else in the header stays.\n");
    command.needs("HEADER", options.header, "Product header, which is changed");
    command.takes(
        "--region", options.region,
        "Range start and length, azimuth start (a time or a date) and length in s, else the header's section ROI",
        {.values = 4});
    command.takes("--what", options.what, "What to derive, else all that is missing",
                  {.one_of = {"fr", "angles", "ground"}});
    command.flag("--grid", options.in_both_times, "Angles and ground range in both times");
    command.flag("--replace", options.replace, "Also replace polynomials that are there");
    command.flag("--json", options.json, "Print JSON");
}

}  // namespace tool
