// SPDX-License-Identifier: Apache-2.0

// Makes the product header of a scene from its facts, with the library's own writers.
// Usage: make_scene_header SCENE_facts.json SCENE.xml

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <exception>
#include <fstream>
#include <nlohmann/json.hpp>
#include <stdexcept>
#include <string>
#include <vector>

#include "quo_base/acquisition.h"
#include "quo_base/dataset_info.h"
#include "quo_base/generalSARorbit.h"
#include "quo_base/roi.h"

namespace {

using Facts = nlohmann::json;

void require(int status, const char* what) {
    if (status != 0) throw std::runtime_error(std::string{what} + " gives status " + std::to_string(status));
}

void copy_text(const Facts& facts, const char* key, char (&member)[512]) {
    const std::string text = facts.at(key);
    if (text.size() >= sizeof member) throw std::runtime_error(std::string{key} + " is too long");
    std::copy_n(text.c_str(), text.size() + 1, member);
}

/** The equally spaced times that fit the stamps best. Stamps are whole microseconds, cut or rounded, so the
 * spacing is one too; the first time lies in the middle of what the single stamps ask for. */
struct Grid {
    double first_s, spacing_s;
};

Grid grid_of(const std::vector<double>& stamps_s) {
    std::vector<long long> offsets_us;
    offsets_us.reserve(stamps_s.size());
    for (const double stamp_s : stamps_s) offsets_us.push_back(std::llround((stamp_s - stamps_s.front()) * 1e6));
    const auto steps = static_cast<double>(stamps_s.size() - 1);
    const auto spacing_us = std::llround(static_cast<double>(offsets_us.back()) / steps);
    for (std::size_t i = 0; i < offsets_us.size(); ++i) offsets_us[i] -= static_cast<long long>(i) * spacing_us;
    const auto [least, most] = std::minmax_element(offsets_us.begin(), offsets_us.end());
    return {stamps_s.front() + static_cast<double>(*least + *most) / 2e6, static_cast<double>(spacing_us) / 1e6};
}

void write_orbit(const Facts& facts, const char* header) {
    const Facts& vectors = facts.at("state_vectors");
    std::vector<double> stamps_s;
    for (const Facts& vector : vectors) stamps_s.push_back(vector.at(0));
    const Grid grid = grid_of(stamps_s);

    GeneralSAROrbit orbit;
    require(orbit.SVCreate(grid.first_s, grid.spacing_s, static_cast<int>(vectors.size())), "SVCreate");
    for (std::size_t i = 0; i < vectors.size(); ++i) {
        for (std::size_t axis = 0; axis < 3; ++axis) {
            orbit.pSV_m[3 * i + axis] = vectors[i].at(1 + axis);
            orbit.vSV_mOs[3 * i + axis] = vectors[i].at(4 + axis);
        }
    }
    require(orbit.writehdr(header), "writing the orbit");
}

void write_sampling(const Facts& facts, const char* header) {
    SamplingConstants_Obj sampling;
    sampling.fc_hz = facts.at("radar_frequency_hz");
    sampling.frg_hz = facts.at("range_sampling_rate_hz");
    sampling.Trg_s = 1.0 / sampling.frg_hz;
    sampling.prf_hz = facts.at("prf_hz");
    sampling.pri_s = 1.0 / sampling.prf_hz;
    sampling.lambda_m = facts.at("wavelength_m");
    require(sampling.writehdr(header), "writing the sampling constants");
}

void write_region(const Facts& facts, const char* header) {
    const Facts& region = facts.at("region");
    ROI_Obj roi;
    roi.SetFastAxe(region.at("fast_start_s"), region.at("fast_delta_s"), region.at("samples"));
    roi.SetSlowAxe(region.at("slow_start_s"), region.at("slow_delta_s"), region.at("lines"));
    require(roi.write_roi(header, "ROI"), "writing the region");
}

void write_data_set(const Facts& facts, const char* header) {
    const Facts& known = facts.at("data_set");
    DataSetInfo_Obj info;
    struct Text {
        const char* key;
        char (&member)[512];
    };
    const Text texts[] = {{"OrbitNumber", info.OrbitNumber},
                          {"SenseDate", info.SenseDate},
                          {"SceneID", info.SceneID},
                          {"OrbitConfiguration", info.OrbitConfiguration},
                          {"Polarization", info.Polarization},
                          {"Swath", info.Swath},
                          {"Projection", info.Projection},
                          {"ImageType", info.ImageType},
                          {"AcquisitionMode", info.AcquisitionMode},
                          {"SensorName", info.SensorName}};
    for (const Text& text : texts)
        if (known.contains(text.key)) copy_text(known, text.key, text.member);
    const Facts description{{"text", std::string{facts.at("mission")} + ", " + std::string{facts.at("mode")}}};
    copy_text(description, "text", info.Description);
    info.SetRefSys(DataSetInfo_Obj::dsWgs84);
    info.LookDirection = facts.at("look_side") == "left" ? -1 : 1;
    require(info.writehdr(header), "writing the data set");
}

void write_description(const Facts& facts, const char* header) {
    const std::string text = std::string{facts.at("mission")} + ", " + std::string{facts.at("mode")} + ", " +
                             std::string{facts.at("acquired_utc")} + ". From " +
                             std::string{facts.at("source").at("repo")} + ". " + std::string{facts.at("license")};
    quorelxml document;
    require(document.setDescription(header, text.c_str()), "writing the description");
}

void make_header(const char* facts_name, const char* header) {
    std::ifstream stream{facts_name};
    const Facts facts = Facts::parse(stream);
    std::remove(header);
    quorelxml::setExactNumbers(true);
    write_description(facts, header);
    write_data_set(facts, header);
    write_orbit(facts, header);
    write_sampling(facts, header);
    write_region(facts, header);
}

}  // namespace

int main(int argc, char** argv) {
    if (argc != 3) {
        std::fputs("Usage: make_scene_header SCENE_facts.json SCENE.xml\n", stderr);
        return 2;
    }
    try {
        make_header(argv[1], argv[2]);
        return 0;
    } catch (const std::exception& failure) {
        std::fprintf(stderr, "make_scene_header: %s: %s\n", argv[1], failure.what());
        return 1;
    }
}
