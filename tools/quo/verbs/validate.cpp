// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cmath>
#include <filesystem>
#include <nlohmann/json.hpp>
#include <numeric>

#include "commands.h"
#include "document.h"
#include "field_check.h"
#include "product.h"
#include "quo_base/derived_raster.h"
#include "quo_base/image_grid.h"
#include "raster.h"
#include "scene.h"

namespace tool {
namespace {

// What a satellite or an aircraft can do.
constexpr double kSlowest_m_s = 20.0, kFastest_m_s = 12000.0;
constexpr double kLowestRadius_m = 6.33e6, kHighestRadius_m = 6e7;
constexpr double kUnknown = -900.0;  // numbers below are marks of missing values

struct Finding {
    bool error;
    std::string object, field, reason;
};

/** Looks at a product from all sides and lists what does not fit. */
class Validation {
public:
    Validation(GeneralSAR& product, std::string header) : product_{product}, header_{std::move(header)} {}

    std::vector<Finding> run() {
        if (Document::in(header_)) check_structure();
        check_presence();
        check_values();
        check_description();
        check_raster();
        check_sampling();
        check_grid();
        check_region();
        check_orbit();
        check_corners();
        check_polynomials();
        return std::move(findings_);
    }

private:
    // One error for a field is enough.
    void error(const char* object, const char* field, const std::string& reason) {
        const auto same = [=](const Finding& finding) {
            return finding.error && finding.object == object && finding.field == field;
        };
        if (std::ranges::none_of(findings_, same)) findings_.push_back({true, object, field, reason});
    }
    void warn(const char* object, const char* field, const std::string& reason) {
        findings_.push_back({false, object, field, reason});
    }
    [[nodiscard]] bool has(GSObject object) const { return product_.GSexists(object); }

    void check_presence() {
        for (const GSObject object : {gsSamplingConstants, gsDataSetInfo, gsOrbit, gsBufferFile}) {
            const char* section = section_of(product_, object);
            const auto noted = [=](const Finding& finding) { return finding.object == section; };
            const bool there = has(object) || (object == gsBufferFile && described_raster(product_) != nullptr);
            if (!there && std::ranges::none_of(findings_, noted)) {
                warn(section, "-", "is missing");
            }
        }
    }

    // The document as it stands, before the objects make numbers of its texts.
    void check_structure() {
        Document document{header_};
        if (!document.has_channel()) return error("Channel", "-", "there is no channel 1");
        for (int i = gsRoi; i < GeneralSAR::kObjects; ++i) {
            const auto object = static_cast<GSObject>(i);
            if (object != gsStateVectors) check_section(document, object);  // the orbit's section
        }
    }
    void check_section(Document& document, GSObject object) {
        const char* section = section_of(product_, object);
        const int times = document.count(section);
        if (times < 1) return;
        if (times > 1) warn(section, "-", "stands " + std::to_string(times) + " times");
        const GeneralSAR_Base& elements = elements_of(product_, object);
        const GeneralSAR_Base& defaults = elements_of(fresh_, object);
        bool complete = true;
        for (int k = 0; k < elements.elementCount(); ++k) {
            const parElement& element = *elements.element(k);
            const std::string path = std::string{section} + "/" + element.name;
            if (document.has(path)) {
                check_texts(document, element, *defaults.element(k), path);
            } else if (element.mandatory) {
                error(section, element.name, "is missing");
                complete = false;
            }
        }
        if (!has(object) && complete) error(section, "-", why_not(object));
    }
    std::string why_not(GSObject object) const {
        if (object != gsOrbit) return "cannot be read";
        try {
            return Scene{header_}.findings().empty() ? "makes no orbit" : "makes no good orbit";
        } catch (const Failure& failure) {
            const std::string reason = failure.what();
            return reason.starts_with(header_ + ": ") ? reason.substr(header_.size() + 2) : reason;
        }
    }
    // The texts as they stand, of which reading takes what it can.
    void check_texts(Document& document, const parElement& element, const parElement& fresh,
                     const std::string& path) {
        const bool array = document.is_array(path);
        const bool listed = element.count > 1 && !array;  // "1.5, 2.5", the older form of arrays
        if (listed) return;
        if (!array && element.scalar && document.count(path) > 1)
            return error(element.section, element.name,
                         element.countDefect(static_cast<std::size_t>(document.count(path))));
        const std::string defect = values_defect(element, fresh, document.values(path));
        if (!defect.empty()) error(element.section, element.name, defect);
    }

    // Every value must make sense by the rules of its field.
    void check_values() {
        for (int i = gsRoi; i < GeneralSAR::kObjects; ++i) {
            const auto object = static_cast<GSObject>(i);
            if (object == gsOrbit || !has(object)) continue;  // the state vectors are looked at once
            const GeneralSAR_Base& values = elements_of(product_, object);
            const GeneralSAR_Base& defaults = elements_of(fresh_, object);
            for (int k = 0; k < values.elementCount(); ++k)
                check_element(*values.element(k), *defaults.element(k));
        }
    }
    void check_element(const parElement& element, const parElement& fresh) {
        for (int i = 0; i < element.count; ++i) {
            const std::string defect = value_defect(element, fresh, i, value_text(element, i));
            if (!defect.empty()) return error(element.section, element.name, defect);
        }
    }

    // What the description says of the rest of the product.
    void check_description() {
        if (!has(gsDataSetInfo)) return;
        const DataSetInfo_Obj& info = product_.dataSetInfo;
        const std::string_view said = info.OrbitConfiguration;
        const char* flown = has(gsOrbit) ? direction() : nullptr;
        if (flown && (said == "ASCENDING" || said == "DESCENDING") && said != flown)
            error("DataSetInfo", "OrbitConfiguration", std::string{said} + ", but the state vectors are " + flown);
        const SamplingConstants_Obj& sampling = product_.samplingConstants;
        const double slant_s = sampling.Trg_s * info.RangeLooks;
        const bool both = has(gsRoi) && has(gsSamplingConstants) && sampling.Trg_s > 0.0;
        if (both && info.IsProjection(DataSetInfo_Obj::dsGroundRange) &&
            std::abs(product_.roi.Roi.FastTimeDelta - slant_s) <= kSame * slant_s)
            warn("DataSetInfo", "Projection",
                 "GROUND RANGE, but ROI/FastTimeDelta is the interval in slant range");
    }
    // In the middle of the scene, or where that is not known, at the first vector.
    [[nodiscard]] const char* direction() const {
        const GeneralSAROrbit& orbit = product_.orbit;
        const ROI_Obj& region = product_.roi.Roi;
        double vector = 0.0;
        if (has(gsRoi) && region.isNULL() == 0 && orbit.dtSV_s > 0.0)
            vector = (region.GetCenter().SlowTime - orbit.t0SV_s) / orbit.dtSV_s;
        if (!(vector >= 0.0 && vector <= orbit.nSV_n - 1)) vector = 0.0;
        const double up = orbit.vSV_mOs[3 * std::lround(vector) + 2];
        if (up == 0.0) return nullptr;
        return up > 0.0 ? "ASCENDING" : "DESCENDING";
    }

    // The raster is looked for beside its header only, under the header's own name.
    void check_raster() {
        const RasterDescription* raster = described_raster(product_);
        if (raster == nullptr) return;
        const std::int64_t size = raster->rasterSize();
        if (size < 0) return error("RasterInfo", "-", "describes no possible raster");
        const auto name = raster_of(header_);
        if (!name) return warn("RasterInfo", "-", "the header is not named like a raster's side file");
        std::error_code failed;
        const auto length = std::filesystem::file_size(*name, failed);
        if (failed) return error("RasterInfo", "-", *name + ": " + failed.message());
        if (length != static_cast<std::uintmax_t>(size)) {
            const std::string reason =
                *name + " has " + std::to_string(length) + " bytes, the description makes " + std::to_string(size);
            length < static_cast<std::uintmax_t>(size) ? error("RasterInfo", "-", reason)
                                                       : warn("RasterInfo", "-", reason);
        }
    }

    // Two fields whose product is a constant.
    void check_product(const char* first_name, double first, const char* second_name, double second,
                       double expected) {
        if (first < kUnknown || second < kUnknown) return;
        const double off = std::abs(first * second / expected - 1.0);
        const std::string reason =
            std::string{"times "} + second_name + " is " + exact(first * second) + ", not " + exact(expected);
        if (!(off < 1e-3)) {
            error("SamplingConstants", first_name, reason);
        } else if (off > 1e-6) {
            warn("SamplingConstants", first_name, reason);
        }
    }
    // Two values that describe the same thing.
    void check_same(const char* object, const char* field, double value, const char* other, double expected) {
        if (value > kUnknown && expected > kUnknown && std::abs(value - expected) > kSame * std::abs(expected)) {
            warn(object, field, exact(value) + ", but " + other + " is " + exact(expected));
        }
    }
    void check_pulse(const SamplingConstants_Obj& sampling) {
        if (!has(gsPulse)) return;
        const SARPulse_Obj& pulse = product_.pulse;
        check_same("Pulse", "PulseSamplingRate", pulse.PulseSamplingRate, "SamplingConstants/frg_hz",
                   sampling.frg_hz);
        if (pulse.PulseKRate > kUnknown && pulse.PulseLength > 0.0) {
            check_same("Pulse", "PulseKRate", std::abs(pulse.PulseKRate) * pulse.PulseLength,
                       "times PulseLength, Bandwidth", pulse.Bandwidth);
        }
    }
    void check_sampling() {
        if (!has(gsSamplingConstants)) return;
        const SamplingConstants_Obj& s = product_.samplingConstants;
        check_product("lambda_m", s.lambda_m, "fc_hz", s.fc_hz, quo::kLightSpeed);
        check_product("pri_s", s.pri_s, "prf_hz", s.prf_hz, 1.0);
        check_product("Trg_s", s.Trg_s, "frg_hz", s.frg_hz, 1.0);
        check_pulse(s);
        if (s.Brg_hz > s.frg_hz && s.frg_hz > 0.0)
            error("SamplingConstants", "Brg_hz", "is larger than the sampling rate");
        if (s.Baz_hz > s.prf_hz && s.prf_hz > 0.0) warn("SamplingConstants", "Baz_hz", "is larger than the PRF");
    }

    // Where the pixel grid places the raster.
    void check_grid() {
        const RasterDescription* raster = described_raster(product_);
        forget_system_error();
        const int status = read_image_grid(header_.c_str(), product_, grid_);
        if (status != QUO_OK) refuse_unread(header_, status);
        if (status != QUO_OK && status != QUO_REFUSED) return error("ImageGrid", "-", "makes no pixel grid");
        if (status != QUO_OK || raster == nullptr) return;
        if (grid_.getRegion(&placed_, raster->NrOfLinesPerImage, raster->NrOfPixelsPerLine) != QUO_OK)
            error("ImageGrid", grid_.Bursts > 0 ? "BurstStart_s" : "-",
                  "places no raster of " + std::to_string(raster->NrOfLinesPerImage) + " lines");
        if (!has(gsSwathInfo) || grid_.Bursts == 0) return;
        check_count("SwathInfo", "Bursts", product_.swathInfo.Bursts, "ImageGrid/Bursts is", grid_.Bursts);
        check_count("SwathInfo", "Lines_per_burst", product_.swathInfo.Lines_per_burst,
                    "ImageGrid/LinesPerBurst is", grid_.LinesPerBurst);
    }
    void check_count(const char* object, const char* field, int value, const char* other, int expected) {
        if (value != expected)
            warn(object, field, std::to_string(value) + ", but " + other + " " + std::to_string(expected));
    }
    void check_axis(const char* length_name, double length, double step, int count) {
        if (!(step > 0.0)) return error("ROI", length_name, "its interval " + exact(step) + " is not above 0");
        if (std::abs(length - step * count) > 0.5 * step) {
            error("ROI", length_name, exact(length) + " is not " + exact(step) + " x " + std::to_string(count));
        }
    }
    void check_start(const char* field, double start_s, double placed_s, double step_s) {
        if (std::abs(start_s - placed_s) > 0.5 * step_s)
            warn("ROI", field, exact(start_s) + ", but the pixel grid begins at " + exact(placed_s));
    }
    // The lines of bursts overlap: in time they are fewer than in the raster.
    void check_against_raster(const ROI_Obj& roi) {
        const RasterDescription* raster = described_raster(product_);
        if (raster == nullptr) return;
        check_count("ROI", "Samples", roi.Samples, "the raster has", raster->NrOfPixelsPerLine);
        const bool placed = placed_.isNULL() == 0;
        if (placed && grid_.Bursts > 0)
            check_count("ROI", "Lines", roi.Lines, "the raster's bursts cover", placed_.Lines);
        else
            check_count("ROI", "Lines", roi.Lines, "the raster has", raster->NrOfLinesPerImage);
        if (!placed) return;
        check_start("FastStartTime", roi.FastStartTime, placed_.FastStartTime, placed_.FastTimeDelta);
        check_start("SlowStartTime", roi.SlowStartTime, placed_.SlowStartTime, placed_.SlowTimeDelta);
    }
    void check_region() {
        if (!has(gsRoi)) return;
        const ROI_Obj& roi = product_.roi.Roi;
        if (roi.isNULL() != 0) return warn("ROI", "-", "is empty");
        check_axis("FastTimeLength", roi.FastTimeLength, roi.FastTimeDelta, roi.Samples);
        check_axis("SlowTimeLength", roi.SlowTimeLength, roi.SlowTimeDelta, roi.Lines);
        check_against_raster(roi);
        if (has(gsSamplingConstants) && product_.dataSetInfo.IsProjection(DataSetInfo_Obj::dsSlantRange) &&
            product_.dataSetInfo.RangeLooks == 1) {
            check_same("ROI", "FastTimeDelta", roi.FastTimeDelta, "SamplingConstants/Trg_s",
                       product_.samplingConstants.Trg_s);
        }
        if (!(roi.FastStartTime > 0.0))
            error("ROI", "FastStartTime", exact(roi.FastStartTime) + " is not above 0");
    }

    void check_orbit() {
        if (!has(gsOrbit)) return;
        const GeneralSAROrbit& orbit = product_.orbit;
        std::vector<SVFinding> found;
        if (orbit.SVCheck(found) == 0) {
            for (const SVFinding& finding : found) {
                // Some producers' velocities are not quite the derivative of their positions.
                const bool slight = finding.problem == SVFinding::kVelocity && finding.size < 1.0;
                findings_.push_back({!slight, "StateVectorData", slight ? "vSV_mOs" : "pSV_m", finding.text});
            }
        }
        for (std::ptrdiff_t i = 0; i < orbit.nSV_n; ++i) {
            const auto length = [i](const auto& v) { return std::hypot(v[3 * i], v[3 * i + 1], v[3 * i + 2]); };
            const double radius = length(orbit.pSV_m), speed = length(orbit.vSV_mOs);
            if (!(radius > kLowestRadius_m && radius < kHighestRadius_m)) {
                return error(
                    "StateVectorData", "pSV_m",
                    "vector " + std::to_string(i) + " is " + rough(radius) + " m from the Earth's centre");
            }
            if (!(speed > kSlowest_m_s && speed < kFastest_m_s)) {
                return error("StateVectorData", "vSV_mOs",
                             "vector " + std::to_string(i) + " moves at " + rough(speed) + " m/s");
            }
        }
        check_coverage(orbit);
    }
    void check_coverage(const GeneralSAROrbit& orbit) {
        const ROI_Obj& roi = product_.roi.Roi;
        if (!has(gsRoi) || roi.isNULL() != 0) return;
        const double before = roi.SlowStartTime - orbit.t0SV_s;
        const double after =
            orbit.t0SV_s + orbit.dtSV_s * (orbit.nSV_n - 1) - (roi.SlowStartTime + roi.SlowTimeLength);
        const double margin = std::min(before, after);
        if (margin < 0.0) {
            error("StateVectorData", "t0SV_s",
                  "the scene reaches " + rough(-margin) + " s beyond the state vectors");
        } else if (margin < orbit.dtSV_s) {
            warn("StateVectorData", "t0SV_s", "only " + rough(margin) + " s of orbit beyond the scene");
        }
    }

    // Corners are geolocated on the ellipsoid; the ground's height shifts them by a few kilometres at most.
    void check_corners() {
        constexpr double kFar_m = 2e4;
        const std::vector<Corner> grid = grid_corners(product_), orbit = orbit_corners(header_, product_);
        if (grid.empty() || orbit.empty()) return;
        for (const Corner& corner : grid) {
            const quo::Vec3 place = quo::from_geodetic({corner.latitude_deg, corner.longitude_deg, 0.0});
            const auto distance_m = [&](const Corner& other) {
                return norm(quo::from_geodetic({other.latitude_deg, other.longitude_deg, 0.0}) - place);
            };
            const double nearest_m = distance_m(*std::ranges::min_element(orbit, {}, distance_m));
            if (nearest_m > kFar_m) {
                return warn(
                    "GroundCornersPoints", "-",
                    "a corner lies " + rough(nearest_m / 1e3) + " km from where the orbit sees the region's");
            }
        }
    }

    template <typename P>
    void check_order(const char* name, const P& list, int count) {
        for (int i = 0; i < count; ++i) {
            const double sum =
                std::accumulate(std::begin(list[i].pol), std::end(list[i].pol), list[i].trg0 + list[i].taz0);
            if (!std::isfinite(sum))
                return error("PolySAR", name, "polynomial " + std::to_string(i) + " is not finite");
        }
        for (int i = 1; i < count; ++i) {
            if (!(list[i].taz0 > list[i - 1].taz0)) {
                return error("PolySAR", name,
                             "reference times do not increase at polynomial " + std::to_string(i));
            }
        }
    }
    void check_polynomials() {
        if (!has(gsPolySAR)) return;
        const polySAR& set = product_.polynomials;
        check_order("DopplerCentroid", set.DC, set.ndc);
        check_order("DopplerRate", set.FR, set.nfr);
        check_order("SlantToGround", set.SL2GR, set.nsl2gr);
        check_order("GroundToSlant", set.GR2SL, set.ngr2sl);
        check_order("SlantToTheta", set.SL2THETA, set.nsl2theta);
        check_order("SlantToPhi", set.SL2PHI, set.nsl2phi);
    }

    static constexpr double kSame = 1e-3;  // of a value: two that differ by less say the same

    GeneralSAR& product_;
    GeneralSAR fresh_;  // what a new product holds
    ImageGrid_Obj grid_;
    ROI_Obj placed_;  // what the grid makes of the raster; empty where it makes nothing
    std::string header_;
    std::vector<Finding> findings_;
};

struct ValidateOptions {
    std::string header;
    bool json = false;
};

int validate(const ValidateOptions& options) {
    GeneralSAR product;
    read_product(options.header, product);
    const std::vector<Finding> findings = Validation{product, options.header}.run();
    nlohmann::ordered_json list = nlohmann::json::array();
    std::string text;
    int errors = 0;
    for (const Finding& finding : findings) {
        const char* kind = finding.error ? "error" : "warning";
        errors += finding.error ? 1 : 0;
        list.push_back(
            {{"kind", kind}, {"object", finding.object}, {"field", finding.field}, {"reason", finding.reason}});
        text +=
            shown(std::string{kind} + "  " + finding.object + "/" + finding.field + "  " + finding.reason) + "\n";
    }
    const auto count = [](int number, const char* what) {
        return std::to_string(number) + " " + what + (number == 1 ? "" : "s");
    };
    text += count(errors, "error") + ", " + count(static_cast<int>(findings.size()) - errors, "warning") + "\n";
    options.json ? print_json(list) : print(text);
    return errors == 0 ? kFine : kFindings;
}

}  // namespace

void add_validate(Command& program) {
    auto [command, options] =
        add_verb(program, "validate", "Checks a product: bounds, and what does not fit together", validate);
    command.needs("HEADER", options.header, "Product header");
    command.flag("--json", options.json, "Print JSON");
}

}  // namespace tool
