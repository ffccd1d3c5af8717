// SPDX-License-Identifier: Apache-2.0
#include "missions/sentinel1.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <functional>
#include <numeric>
#include <set>
#include <span>
#include <vector>

#include "generalSAR/derived_raster/corner_points.h"
#include "missions/mission_xml.h"
#include "missions/orbit_file.h"
#include "quo_base/MatrixAlgebraANSI.h"
#include "quo_base/gen_utils.h"
#include "quo_base/geometry.h"
#include "sarutillib/ground/bounded_text.h"
#include "sarutillib/ground/letters.h"

namespace quo {
namespace {

using Element = MissionXml::Element;

template <std::size_t N>
void put(char (&field)[N], const std::string& text) {
    copy_bounded(field, text.empty() ? "NOT_AVAILABLE" : text);
}

std::string date_text(const SplitTime& time) {
    char text[32] = "";
    if (sec852myascii(time.seconds(), text) != 0) return {};
    return text;
}

/** The annotation as one product's: where its parts stand, and what they have in common. */
class Annotation {
public:
    explicit Annotation(const Element& whole)
        : root{whole},
          header{whole.at("adsHeader")},
          general{whole.at("generalAnnotation")},
          info{whole.at("imageAnnotation/imageInformation")},
          processing{whole.at("imageAnnotation/processingInformation")},
          first_line{info.time("productFirstLineUtcTime")},
          last_line{info.time("productLastLineUtcTime")},
          range_rate_hz{general.number("productInformation/rangeSamplingRate")},
          near_s{info.number("slantRangeTime")},
          lines{info.integer("numberOfLines")},
          samples{info.integer("numberOfSamples")},
          swath{header.text("swath")},
          mode{header.text("mode")} {
        const std::string type = header.text("productType");
        if (type != "SLC" && type != "GRD") root.refuse("the product type " + type + " is neither SLC nor GRD");
        const std::string mission = header.text("missionId");
        if (mission.size() != 3 || !mission.starts_with("S1") || mission[2] < 'A' || mission[2] > 'D')
            root.refuse("the mission " + mission + " is not Sentinel-1");
        if (lines < 1 || samples < 1 || !(range_rate_hz > 0.0)) root.refuse("the image has no size");
        detected = type == "GRD";
    }

    /** The processing parameters of the swath: of merged ones the first's. */
    [[nodiscard]] Element parameters() const {
        return of_swath("swathProcParamsList", "swathProcParams", processing);
    }
    [[nodiscard]] Element downlink() const {
        return of_swath("downlinkInformationList", "downlinkInformation", general).at("downlinkValues");
    }
    [[nodiscard]] std::vector<Element> bursts() const { return root.list("swathTiming/burstList", "burst"); }

    Element root, header, general, info, processing;
    SplitTime first_line, last_line;
    double range_rate_hz, near_s;
    std::int32_t lines, samples;
    std::string swath, mode;
    bool detected = false;

private:
    [[nodiscard]] Element of_swath(const char* list, const char* name, const Element& in) const {
        const auto all = in.list(list, name);
        if (all.empty()) in.refuse("no element " + std::string{list} + "/" + name);
        const auto own = std::ranges::find_if(
            all, [&](const Element& e) { return e.find("swath") && e.text("swath") == swath; });
        return own == all.end() ? all.front() : *own;
    }
};

// --- What was recorded ------------------------------------------------------------------------------------------

void set_sampling(const Annotation& a, GeneralSAR& product) {
    SamplingConstants_Obj& sampling = product.samplingConstants;
    const Element range = a.parameters().at("rangeProcessing"), azimuth = a.parameters().at("azimuthProcessing");
    const Element downlink = a.downlink();
    sampling.fc_hz = a.general.number("productInformation/radarFrequency");
    if (!(sampling.fc_hz > 0.0)) a.general.refuse("the radar frequency is not above 0");
    sampling.lambda_m = kLightSpeed / sampling.fc_hz;
    sampling.frg_hz = a.range_rate_hz;
    sampling.Trg_s = 1.0 / a.range_rate_hz;
    sampling.Brg_hz = range.number("processingBandwidth");
    sampling.Baz_hz = azimuth.number("processingBandwidth");
    sampling.pri_s = downlink.number("pri");
    if (!(sampling.pri_s > 0.0)) a.general.refuse("the pulse repetition interval is not above 0");
    sampling.prf_hz = 1.0 / sampling.pri_s;
    const auto bursts = a.bursts();
    if (bursts.size() > 1) {
        const double first_s = a.first_line.whole_s;
        sampling.bri_s = (bursts.back().time("azimuthTime").after(first_s) -
                          bursts.front().time("azimuthTime").after(first_s)) /
                         static_cast<double>(bursts.size() - 1);
        if (!(sampling.bri_s > 0.0)) a.general.refuse("the bursts do not follow each other");
        sampling.brf_hz = 1.0 / sampling.bri_s;
    }
    product.orbit.setLambda(sampling.lambda_m);
    product.GSenable(gsSamplingConstants);

    SARPulse_Obj& pulse = product.pulse;
    pulse.PulseLength = downlink.number("txPulseLength");
    pulse.PulseKRate = downlink.number("txPulseRampRate");
    pulse.Bandwidth = pulse.PulseLength * std::abs(pulse.PulseKRate);
    pulse.PulseSamplingRate = a.range_rate_hz;
    product.GSenable(gsPulse);

    SpectralWindows_Obj& windows = product.spectralWindows;
    put(windows.AzMatchedFilterType, azimuth.text("windowType"));
    put(windows.RgMatchedFilterType, range.text("windowType"));
    windows.AzMatchedFilterCoef = azimuth.number("windowCoefficient");
    windows.RgMatchedFilterCoef = range.number("windowCoefficient");
    windows.AzLookBandwidth = azimuth.number("lookBandwidth");
    windows.RgLookBandwidth = range.number("lookBandwidth");
    product.GSenable(gsSpectralWindows);
}

void set_swath(const Annotation& a, GeneralSAR& product) {
    SwathInfo& swath = product.swathInfo;
    const Element downlink = a.downlink();
    swath.Rank = downlink.integer("rank");
    swath.Bursts = static_cast<std::int32_t>(a.bursts().size());
    swath.Lines_per_burst = swath.Bursts > 0 ? a.root.integer("swathTiming/linesPerBurst") : 0;
    const char number = a.swath.empty() ? '\0' : a.swath.back();  // of merged swaths a letter
    if (number >= '1' && number <= '9') swath.Order = number - '0';
    swath.Acquisition_Start_Time = a.first_line.seconds();
    swath.ProcessorGain = a.parameters().number("processorScalingFactor");
    swath.Swst_changes = std::max(0, static_cast<std::int32_t>(downlink.list("swstList", "swst").size()) - 1);
    product.GSenable(gsSwathInfo);

    DataSetInfo_Obj& info = product.dataSetInfo;
    for (const Element& swst : downlink.list("swstList", "swst")) {
        const double value_s = swst.number("value");
        info.SWST_MIN = info.SWST_MIN == -999.0 ? value_s : std::min(info.SWST_MIN, value_s);
        info.SWST_MAX = std::max(info.SWST_MAX, value_s);
    }
}

// --- What the product is ----------------------------------------------------------------------------------------

/** The element of a name that comes first in a manifest, at any depth. */
std::optional<Element> first_of(const Element& above, std::string_view name, int depth = 0) {
    constexpr int kDeepest = 12;
    if (depth > kDeepest) return std::nullopt;
    for (const char* const on_the_way : {"metadataSection", "metadataObject", "metadataWrap", "xmlData",
                                         "processing", "facility", "orbitReference"}) {
        for (const Element& child : above.list("", on_the_way)) {
            if (const auto found = child.find(name)) return found;
            if (const auto found = first_of(child, name, depth + 1)) return found;
        }
    }
    return std::nullopt;
}

void describe_processing(const std::string& manifest, DataSetInfo_Obj& info) {
    const MissionXml xml{manifest};
    const Element root = xml.root();
    if (const auto track = first_of(root, "relativeOrbitNumber")) put(info.Track, track->text());
    if (const auto software = first_of(root, "software"))
        put(info.ProcessingSoftware, software->attribute("name") + " " + software->attribute("version"));
    if (const auto facility = first_of(root, "processing/facility"))
        put(info.ProcessingCenter, facility->attribute("name"));
    if (const auto processing = first_of(root, "processing"))
        if (const auto stop = split_time(processing->attribute("stop")))
            put(info.ProcessingDate, date_text(*stop));
}

void set_data_set(const Annotation& a, const MissionFiles& files, GeneralSAR& product) {
    DataSetInfo_Obj& info = product.dataSetInfo;
    const std::string mission = a.header.text("missionId"), polarization = a.header.text("polarisation");
    if (!std::set<std::string>{"HH", "HV", "VH", "VV"}.contains(polarization))
        a.header.refuse("the polarization " + polarization + " is none");
    const std::string pass = upper(a.general.text("productInformation/pass"));
    if (pass != (product.orbit.isAscending() ? "ASCENDING" : "DESCENDING"))
        a.general.refuse("the pass " + pass + " is not that of the state vectors");
    put(info.OrbitNumber, std::to_string(a.header.integer("absoluteOrbitNumber")));
    put(info.SenseDate, date_text(a.first_line));
    const auto slash = files.annotation.rfind('/') + 1;
    put(info.SceneID, files.annotation.substr(slash, files.annotation.rfind('.') - slash));
    put(info.Description, "Sentinel-1 " + a.mode + " " + a.header.text("productType"));
    put(info.OrbitConfiguration, pass);
    put(info.Polarization, polarization.substr(0, 1) + "/" + polarization.substr(1));
    put(info.Swath, a.swath);
    put(info.SensorName, "SENTINEL-" + mission.substr(1));
    info.SceneHeading = a.general.number("productInformation/platformHeading");
    info.RO_REF = a.processing.number("referenceRange");
    info.RangeLooks = a.parameters().integer("rangeProcessing/numberOfLooks");
    const auto all = a.processing.list("swathProcParamsList", "swathProcParams");
    for (std::size_t i = 0; i < std::min(all.size(), std::size(info.RangeBandwidth)); ++i)
        info.RangeBandwidth[i] = all[i].number("rangeProcessing/processingBandwidth");
    info.SetAcqMode(a.mode == "IW" || a.mode == "EW" ? DataSetInfo_Obj::dsScansar : DataSetInfo_Obj::dsStripmap);
    info.SetImageType(a.detected ? DataSetInfo_Obj::dsMultilook : DataSetInfo_Obj::dsAzimuthFocused);
    info.SetProjection(a.detected ? DataSetInfo_Obj::dsGroundRange : DataSetInfo_Obj::dsSlantRange);
    info.SetUnitType(a.detected ? DataSetInfo_Obj::dsVolt : DataSetInfo_Obj::dsVoltComplex);
    info.SetRefSys(DataSetInfo_Obj::dsWgs84);
    info.RGAntenna_flag = a.processing.truth("antennaElevationPatternApplied") ? 1 : 0;
    info.AZAntenna_flag = a.processing.truth("antennaAzimuthPatternApplied") ? 1 : 0;
    info.SpreadLoss_flag = a.processing.truth("rangeSpreadingLossCompensationApplied") ? 1 : 0;
    info.NoiseCorr_flag = a.processing.truth("thermalNoiseCorrectionPerformed") ? 1 : 0;
    info.LookDirection = 1;  // the mission looks to the right, always
    product.orbit.setLookSign(1);
    if (!files.manifest.empty()) describe_processing(files.manifest, info);
    product.GSenable(gsDataSetInfo);
}

/** Bursts follow each other, and the last of their lines is the image's. */
void require_in_order(const Annotation& a, const ImageGrid_Obj& grid) {
    const auto& starts = grid.BurstStart_s;
    if (starts.empty()) return;
    const double end_s = starts.back() + (grid.LinesPerBurst - 1) * grid.LineStep_s;
    if (std::ranges::adjacent_find(starts, std::greater_equal{}) != starts.end() ||
        !(std::abs(starts.front() - grid.FirstLine_s) < grid.LineStep_s) ||
        !(std::abs(end_s - a.last_line.after(grid.Epoch_s)) < grid.LineStep_s))
        a.root.refuse("the bursts' times are not in order, or not those of the first and last line");
}

// --- Where the pixels stand -------------------------------------------------------------------------------------

void set_grid(const Annotation& a, ImageGrid_Obj& grid) {
    grid.Epoch_s = a.first_line.whole_s;
    grid.FirstLine_s = a.first_line.fraction_s;
    grid.LineStep_s = a.info.number("azimuthTimeInterval");
    grid.FirstSample_s = a.near_s;
    const auto bursts = a.bursts();
    const auto lists = a.detected
                           ? a.root.list("coordinateConversion/coordinateConversionList", "coordinateConversion")
                           : std::vector<Element>{};
    constexpr std::size_t kMost = 100000;
    if (bursts.size() > kMost || lists.size() > kMost)
        a.root.refuse("more bursts or conversions than are believed");
    if (a.detected && lists.empty()) a.root.refuse("no list from ground to slant range");
    grid.Bursts = a.detected ? 0 : static_cast<std::int32_t>(bursts.size());
    grid.GroundLists = static_cast<std::int32_t>(lists.size());
    if (const int status = grid.createBuffers()) a.root.refuse("no memory for the image's grid", status);
    if (grid.Bursts > 0) grid.LinesPerBurst = a.root.integer("swathTiming/linesPerBurst");
    for (std::size_t i = 0; i < grid.BurstStart_s.size(); ++i)
        grid.BurstStart_s[i] = bursts[i].time("azimuthTime").after(grid.Epoch_s);
    if (!a.detected) grid.SampleStep_s = 1.0 / a.range_rate_hz;
    if (a.detected) grid.GroundStep_m = a.info.number("rangePixelSpacing");
    for (std::size_t i = 0; i < lists.size(); ++i) {
        grid.GroundTime_s[i] = lists[i].time("azimuthTime").after(grid.Epoch_s);
        const auto terms = lists[i].numbers("grsrCoefficients");
        if (terms.size() > static_cast<std::size_t>(ImageGrid_Obj::kTerms) || lists[i].number("gr0") != 0.0)
            lists[i].refuse("the conversion to slant range has more terms than are known, or another origin");
        std::ranges::copy(terms,
                          grid.GroundToSlant.begin() + static_cast<std::ptrdiff_t>(i) * ImageGrid_Obj::kTerms);
    }
    if (!grid.isComplete()) a.root.refuse("line and sample times make no image");
    if (grid.Bursts > 0 && grid.LinesPerBurst * std::int64_t{grid.Bursts} != a.lines)
        a.root.refuse("the bursts' lines are not the image's");
    require_in_order(a, grid);
}

/** Range time of the last sample, at the first line. */
double far_time(const Annotation& a, const ImageGrid_Obj& grid) {
    const double line = 0.0, sample = a.samples - 1;
    double far_s = 0.0, azimuth_s = 0.0;
    (void)grid.pixelTimes({1, &line, &sample}, {&azimuth_s, &far_s});
    return far_s;
}

void set_region(const Annotation& a, const ImageGrid_Obj& grid, GeneralSAR& product) {
    ROI_Obj& region = product.roi.Roi;
    const double length_s = a.last_line.after(grid.Epoch_s) - grid.FirstLine_s;
    const double lines = std::round(length_s / grid.LineStep_s) + 1.0;
    constexpr double kMostLines = 1e9;
    if (!(lines >= 1.0 && lines < kMostLines)) a.root.refuse("first and last line make no image");
    region.SetSlowAxe(a.first_line.seconds(), grid.LineStep_s, static_cast<int>(lines));
    const double step_s =
        a.detected ? (far_time(a, grid) - a.near_s) / std::max(1, a.samples - 1) : grid.SampleStep_s;
    if (!(step_s > 0.0 || a.samples == 1)) a.root.refuse("near and far range make no image");
    region.SetFastAxe(a.near_s, step_s, a.samples);
    product.GSenable(gsRoi);
    if (place_corners(grid, a.lines, a.samples, product) != QUO_OK)
        a.root.refuse("the orbit does not see the image's corners");
    product.GSenable(gsGeoCoords);
}

// --- Polynomials ------------------------------------------------------------------------------------------------

/** Where 1, x, x^2, x^3 and x^4 stand in a polynomial of a header. */
constexpr std::array<std::size_t, 5> kPowers{0, 1, 4, 5, 6};

/** Takes over a polynomial in range time, whose terms stand in ascending powers. */
void take_terms(const Element& list, const SplitTime& time, double t0_s, const std::vector<double>& terms,
                poly& polynomial) {
    if (terms.empty() || terms.size() > kPowers.size()) list.refuse("a polynomial with more terms than are known");
    for (std::size_t i = 0; i < terms.size(); ++i) polynomial.pol[kPowers[i]] = terms[i];
    polynomial.trg0 = t0_s;
    polynomial.taz0 = time.seconds();
}

/** Fits y over x - x0 with a polynomial of degree 4 in the terms of `polynomial`. 0 or the fit's status. */
int fit_terms(std::span<const double> x, std::span<const double> y, double x0, poly& polynomial) {
    constexpr int kTerms = std::ssize(kPowers);
    const double scale = 1.0 / (x.back() - x0);
    std::vector<double> rows;
    for (const double at : x) {
        double power = 1.0;
        for (int i = 0; i < kTerms; ++i, power *= (at - x0) * scale) rows.push_back(power);
    }
    double terms[kTerms];
    if (const int status = lsq_fit(rows.data(), static_cast<int>(x.size()), kTerms, y.data(), terms, nullptr))
        return status;
    double power = 1.0;
    for (std::size_t i = 0; i < kPowers.size(); ++i, power *= scale) polynomial.pol[kPowers[i]] = terms[i] * power;
    return QUO_OK;
}

void set_ground_polynomials(const Annotation& a, const ImageGrid_Obj& grid, polySAR& set) {
    constexpr int kNodes = 200;
    for (std::int32_t k = 0; k < grid.GroundLists; ++k) {
        std::vector<double> range_s, ground_m, delay_s;
        for (int i = 0; i <= kNodes; ++i) {
            ground_m.push_back(grid.GroundStep_m * (a.samples - 1) * i / kNodes);
            double slant_m = 0.0;
            const auto first = grid.GroundToSlant.begin() + std::ptrdiff_t{k} * ImageGrid_Obj::kTerms;
            for (int term = ImageGrid_Obj::kTerms; term-- > 0;) slant_m = slant_m * ground_m.back() + first[term];
            range_s.push_back(2.0 * slant_m / kLightSpeed);
            delay_s.push_back(range_s.back() - range_s.front());
        }
        int status = fit_terms(range_s, ground_m, range_s.front(), set.SL2GR[k]);
        if (status == QUO_OK) status = fit_terms(ground_m, delay_s, 0.0, set.GR2SL[k]);
        if (status != QUO_OK) a.root.refuse("the conversion between slant and ground range has no fit", status);
        for (poly* polynomial : {static_cast<poly*>(&set.SL2GR[k]), static_cast<poly*>(&set.GR2SL[k])}) {
            polynomial->trg0 = range_s.front();
            polynomial->taz0 = grid.Epoch_s + grid.GroundTime_s[static_cast<std::size_t>(k)];
        }
    }
}

/** Processors before version 2.43 state the three coefficients one by one. */
std::vector<double> fm_rate_terms(const Element& rate) {
    if (rate.find("azimuthFmRatePolynomial")) return rate.numbers("azimuthFmRatePolynomial");
    return {rate.number("c0"), rate.number("c1"), rate.number("c2")};
}

void set_polynomials(const Annotation& a, const ImageGrid_Obj& grid, GeneralSAR& product) {
    const auto centroids = a.root.list("dopplerCentroid/dcEstimateList", "dcEstimate");
    const auto rates = a.general.list("azimuthFmRateList", "azimuthFmRate");
    constexpr std::size_t kMost = 100000;
    if (centroids.size() > kMost || rates.size() > kMost) a.root.refuse("more polynomials than are believed");
    polySAR& set = product.polynomials;
    if (const int status = set.CreatePolys(static_cast<int>(centroids.size()), static_cast<int>(rates.size()),
                                           grid.GroundLists, grid.GroundLists, 1, 1))
        a.root.refuse("no memory for the polynomials", status);
    const bool from_data = a.processing.text("dcMethod") != "Geometry Analysis";
    const char* const terms = from_data ? "dataDcPolynomial" : "geometryDcPolynomial";
    for (std::size_t i = 0; i < centroids.size(); ++i)
        take_terms(centroids[i], centroids[i].time("azimuthTime"), centroids[i].number("t0"),
                   centroids[i].numbers(terms), set.DC[i]);
    for (std::size_t i = 0; i < rates.size(); ++i)
        take_terms(rates[i], rates[i].time("azimuthTime"), rates[i].number("t0"), fm_rate_terms(rates[i]),
                   set.FR[i]);
    set_ground_polynomials(a, grid, set);
    const polyDC broadside{};
    if (product.orbit.SVGetSlantToAnglesPolys(&product.roi.Roi, &broadside, &set.SL2THETA[0], &set.SL2PHI[0]))
        a.root.refuse("the orbit gives no incidence and look angles over the image");
    product.GSenable(gsPolySAR);
}

/** What the middle of the image tells of the flight. */
void set_attitude(const Annotation& a, const ImageGrid_Obj& grid, GeneralSAR& product) {
    SensorAttitude_Obj& attitude = product.sensorAttitude;
    const double line = 0.5 * (a.lines - 1), sample = 0.5 * (a.samples - 1);
    double azimuth_s = 0.0, range_s = 0.0;
    GrPtGeometry at{};
    if (grid.pixelTimes({1, &line, &sample}, {&azimuth_s, &range_s}) != QUO_OK ||
        product.orbit.SVGetGeometry(azimuth_s, range_s, 0.0, &at) != QUO_OK)
        a.root.refuse("the orbit does not see the image's middle");
    const double distance_m = 0.5 * kLightSpeed * range_s, lambda_m = product.samplingConstants.lambda_m;
    attitude.Eq_distance = distance_m;
    attitude.Eq_speed = std::sqrt(0.5 * std::abs(at.fm_rate_hz_s) * lambda_m * distance_m);
    if (product.polynomials.ndc > 0) {
        attitude.Mean_DC = product.polynomials.EvaluateDC(range_s, azimuth_s);
        attitude.SquintAngle =
            std::asin(std::clamp(0.5 * lambda_m * attitude.Mean_DC / at.speed_m_s, -1.0, 1.0)) * kDegPerRad;
    }
    product.GSenable(gsSensorAttitude);
}

/** The elevation pattern of the image's middle, of an image of one swath: amplitudes at equal steps of the angle.
 */
void set_pattern(const Annotation& a, const ImageGrid_Obj& grid, AntennaPattern_Obj& pattern) {
    const auto all = a.root.list("antennaPattern/antennaPatternList", "antennaPattern");
    if (a.detected || all.empty()) return;
    const double middle_s = grid.FirstLine_s + 0.5 * (a.last_line.after(grid.Epoch_s) - grid.FirstLine_s);
    const auto off_middle = [&](const Element& e) {
        return std::abs(e.time("azimuthTime").after(grid.Epoch_s) - middle_s);
    };
    const Element nearest = *std::ranges::min_element(all, {}, off_middle);
    const auto angles = nearest.numbers("elevationAngle"), parts = nearest.numbers("elevationPattern");
    if (angles.size() < 2 || parts.size() != 2 * angles.size() ||
        std::ranges::adjacent_find(angles, std::greater_equal{}) != angles.end() ||
        angles.size() > static_cast<std::size_t>(AntennaPattern_Obj::kMaxPatternSamples))
        nearest.refuse("the antenna pattern has no real and imaginary part for every angle, or too many");
    pattern.PatternSamples = static_cast<std::int32_t>(angles.size());
    pattern.StartAngle = angles.front();
    pattern.DeltaAngle = (angles.back() - angles.front()) / static_cast<double>(angles.size() - 1);
    if (const int status = pattern.createBuffers()) a.root.refuse("no memory for the antenna pattern", status);
    for (std::size_t i = 0; i < angles.size(); ++i) {
        const double angle = pattern.StartAngle + static_cast<double>(i) * pattern.DeltaAngle;
        const auto above = std::clamp<std::ptrdiff_t>(std::ranges::upper_bound(angles, angle) - angles.begin(), 1,
                                                      std::ssize(angles) - 1);
        const auto k = static_cast<std::size_t>(above);
        const double share = (angle - angles[k - 1]) / (angles[k] - angles[k - 1]);
        const auto amplitude = [&](std::size_t j) { return std::hypot(parts[2 * j], parts[2 * j + 1]); };
        pattern.Pattern[i] = static_cast<float>(std::lerp(amplitude(k - 1), amplitude(k), share));
    }
}

// --- Tie points -------------------------------------------------------------------------------------------------

TiePoints stated_ties(const Annotation& a) {
    TiePoints ties;
    for (const Element& point : a.root.list("geolocationGrid/geolocationGridPointList", "geolocationGridPoint")) {
        ties.line.push_back(point.number("line"));
        ties.sample.push_back(point.number("pixel"));
        ties.latitude.push_back(point.number("latitude"));
        ties.longitude.push_back(point.number("longitude"));
        ties.height_m.push_back(point.number("height"));
    }
    return ties;
}

/** The image's lines are a part of the two-way delay off their zero-Doppler times; the annotation does not tell
 * the range time at which it is nothing, the tie points do. */
void find_delay(const TiePoints& ties, ImageGrid_Obj& grid) {
    std::vector<double> line_s(ties.count()), range_s(ties.count());
    if (ties.count() == 0 ||
        grid.pixelTimes({ties.count(), ties.line.data(), ties.sample.data()}, {line_s.data(), range_s.data()}))
        return;
    constexpr double kShare = 0.5;
    std::vector<double> references_s;  // of which a few may be wrong, and then far off the median
    for (std::size_t i = 0; i < ties.count(); ++i) {
        const double reference_s = ties.range_s[i] - (ties.azimuth_s[i] - line_s[i]) / kShare;
        if (std::isfinite(reference_s)) references_s.push_back(reference_s);  // else in no burst, or not seen
    }
    if (references_s.empty()) return;
    const auto middle = references_s.begin() + std::ssize(references_s) / 2;
    std::ranges::nth_element(references_s, middle);
    grid.DelayShare = kShare;
    const double off_s = grid.LineStep_s / kShare, median_s = *middle;
    std::erase_if(references_s, [&](double reference_s) { return std::abs(reference_s - median_s) > off_s; });
    grid.DelayReference_s =
        std::reduce(references_s.begin(), references_s.end()) / static_cast<double>(references_s.size());
}

std::vector<MissionVector> stated_vectors(const Annotation& a) {
    std::vector<MissionVector> vectors;
    for (const Element& orbit : a.general.list("orbitList", "orbit"))
        vectors.push_back({orbit.time("time"),
                           {orbit.number("position/x"), orbit.number("position/y"), orbit.number("position/z")},
                           {orbit.number("velocity/x"), orbit.number("velocity/y"), orbit.number("velocity/z")}});
    return vectors;
}

}  // namespace

void describe_sentinel1(const MissionFiles& files, const std::string& orbit_file, MissionProduct& product) {
    const MissionXml xml{files.annotation};
    const Annotation a{xml.root()};
    GeneralSAR& header = product.header;
    product.lines = a.lines;
    product.samples = a.samples;
    product.is_complex = !a.detected;
    set_orbit(header, stated_vectors(a), files.annotation);
    set_sampling(a, header);
    set_swath(a, header);
    set_data_set(a, files, header);
    set_grid(a, product.grid);
    TiePoints ties = stated_ties(a);
    const auto stated = static_cast<std::int32_t>(ties.count());
    if (ties.find_times(header.orbit)) {
        find_delay(ties, product.grid);
        ties.drop_wrong(product.grid, header.orbit, files.annotation);
    }
    // The tie points are of the annotation's own orbit: by another one the delay would take up what that one
    // mends.
    if (!orbit_file.empty()) {
        const auto vectors = read_orbit_file(orbit_file, a.header.text("missionId"), a.first_line, a.last_line);
        require_same_orbit(vectors, header.orbit, orbit_file);
        set_orbit(header, vectors, orbit_file);
    }
    if (ties.find_times(header.orbit)) product.ties = ties.compare(product.grid, header.orbit);
    product.ties.stated = stated;
    set_region(a, product.grid, header);
    set_polynomials(a, product.grid, header);
    set_attitude(a, product.grid, header);
    set_pattern(a, product.grid, header.antennaPattern);
}

}  // namespace quo
