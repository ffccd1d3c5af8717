// SPDX-License-Identifier: Apache-2.0
#include "missions/orbit_file.h"

#include <algorithm>
#include <cmath>

#include "quo_base/generalSAR.h"

namespace quo {
namespace {

/** Vectors on either side of the image: the middle of a run of five is where the model is best. */
constexpr double kMargin_s = 40.0;

void fill(GeneralSAROrbit& orbit, const std::vector<MissionVector>& vectors) {
    for (std::size_t i = 0; i < vectors.size(); ++i) {
        std::copy_n(vectors[i].position_m, 3, orbit.pSV_m + 3 * i);
        std::copy_n(vectors[i].velocity_m_s, 3, orbit.vSV_mOs + 3 * i);
    }
}

void require(int status, const std::string& source, const char* what) {
    if (status != QUO_OK) throw MissionRefusal{status, source + ": " + what};
}

MissionVector vector_of(const MissionXml::Element& osv) {
    return {osv.time("UTC"),
            {osv.number("X"), osv.number("Y"), osv.number("Z")},
            {osv.number("VX"), osv.number("VY"), osv.number("VZ")}};
}

}  // namespace

void set_orbit(GeneralSAR& product, const std::vector<MissionVector>& vectors, const std::string& source) {
    constexpr double kSame_s = 1e-9;
    constexpr const char* kNone = "its state vectors make no orbit";
    if (vectors.size() < 5 || vectors.size() > 100000) throw MissionRefusal{QUO_REFUSED, source + ": " + kNone};
    const SplitTime first = vectors.front().time;
    const double step_s =
        (vectors.back().time.after(first.whole_s) - first.fraction_s) / static_cast<double>(vectors.size() - 1);
    std::vector<double> times;
    double off_s = 0.0;
    for (const MissionVector& vector : vectors) {
        const double on_raster_s = step_s * static_cast<double>(times.size());
        times.push_back(vector.time.after(first.whole_s) - first.fraction_s);
        off_s = std::max(off_s, std::abs(times.back() - on_raster_s));
    }
    if (off_s > 1e-3) throw MissionRefusal{QUO_REFUSED, source + ": its state vectors are not one spacing apart"};
    GeneralSAROrbit& orbit = product.orbit;
    require(orbit.SVCreate(first.seconds(), step_s, static_cast<int>(vectors.size())), source, kNone);
    fill(orbit, vectors);
    const int status =
        off_s < kSame_s ? orbit.computeApproximateSV() : orbit.SVResample(step_s * (1.0 + 1e-9), times.data());
    require(status, source, kNone);

    SAROrbitStateVectors_Obj& list = product.stateVectors;
    require(list.SVCreate(orbit.t0SV_s, orbit.dtSV_s, orbit.nSV_n), source, kNone);
    std::copy_n(orbit.pSV_m, 3 * orbit.nSV_n, list.pSV_m);
    std::copy_n(orbit.vSV_mOs, 3 * orbit.nSV_n, list.vSV_mOs);
    product.GSenable(gsOrbit);
    product.GSenable(gsStateVectors);
}

std::vector<MissionVector> read_orbit_file(const std::string& file, const std::string& satellite,
                                           const SplitTime& first, const SplitTime& last) {
    const MissionXml xml{file};
    const auto root = xml.root();
    const std::string mission = root.text("Earth_Explorer_Header/Fixed_Header/Mission");
    if (!mission.ends_with(satellite.substr(1)))
        throw MissionRefusal{QUO_REFUSED,
                             file + ": is an orbit of " + mission + ", the product is of " + satellite};
    if (root.text("Earth_Explorer_Header/Variable_Header/Ref_Frame") != "EARTH_FIXED")
        throw MissionRefusal{QUO_REFUSED, file + ": its vectors are not Earth-fixed"};

    const double epoch_s = first.whole_s, from_s = first.fraction_s - kMargin_s,
                 to_s = last.after(epoch_s) + kMargin_s;
    std::vector<MissionVector> vectors;
    for (const auto& osv : root.list("Data_Block/List_of_OSVs", "OSV")) {
        const double time_s = osv.time("UTC").after(epoch_s);
        if (time_s >= from_s && time_s <= to_s) vectors.push_back(vector_of(osv));
    }
    const bool covers = vectors.size() >= 5 && vectors.front().time.after(epoch_s) <= first.fraction_s &&
                        vectors.back().time.after(epoch_s) >= last.after(epoch_s);
    if (!covers)
        throw MissionRefusal{QUO_REFUSED, file + ": does not cover the product, from " +
                                              root.text("Earth_Explorer_Header/Fixed_Header/Validity_Period/"
                                                        "Validity_Start") +
                                              " to " +
                                              root.text("Earth_Explorer_Header/Fixed_Header/Validity_Period/"
                                                        "Validity_Stop")};
    return vectors;
}

void require_same_orbit(const std::vector<MissionVector>& vectors, GeneralSAROrbit& stated,
                        const std::string& source) {
    constexpr double kMost_m = 100.0;
    const double last_s = stated.t0SV_s + stated.dtSV_s * (stated.nSV_n - 1);
    double off_m = 0.0;
    for (const MissionVector& vector : vectors) {
        const double time_s = vector.time.seconds();
        double there[3];
        if (time_s < stated.t0SV_s || time_s > last_s || stated.SVGetPos(time_s, there) != QUO_OK) continue;
        off_m = std::max(off_m, std::hypot(there[0] - vector.position_m[0], there[1] - vector.position_m[1],
                                           there[2] - vector.position_m[2]));
    }
    if (off_m > kMost_m)
        throw MissionRefusal{QUO_REFUSED, source + ": its vectors are up to " +
                                              std::to_string(std::llround(off_m)) +
                                              " m off the annotation's; the most is 100 m"};
}

}  // namespace quo
