// SPDX-License-Identifier: Apache-2.0

// Builds a whole product on the header of a real scene, as a processor would: all fourteen header objects and a
// raster that shows where the meridians and parallels run. Then reads it back and compares every value. Usage:
// example_complete_product SCENE.xml RASTER
#include <cmath>
#include <cstdio>
#include <cstring>
#include <numbers>
#include <string>
#include <vector>

#include "common/session.h"

namespace {

constexpr int kFirstLine = 6000, kFirstSample = 9000, kLines = 500, kSamples = 1000;  // what is taken of the scene

using example::require;

// --- The header -----------------------------------------------------------------------------------------------

// Orbit, sampling and description come from the scene, the region is a part of the scene's.
void take_over(GeneralSAR& scene, GeneralSAR& product) {
    require(scene.GSclone(&product), "the scene cannot be copied");
    ROI_Coords part;
    part.FirstLine = kFirstLine;
    part.FirstSample = kFirstSample;
    part.Lines = kLines;
    part.Samples = kSamples;
    require(part.GetROI(&scene.roi.Roi, &product.roi.Roi), "the scene has no region");

    DataSetInfo_Obj& info = product.dataSetInfo;
    info.SetUnitType(DataSetInfo_Obj::dsVoltComplex);
    info.fillQUOREL();
    std::snprintf(info.ProcessingSoftware, sizeof info.ProcessingSoftware, "examples/complete_product");
}

void describe_instrument(GeneralSAR& product) {
    SamplingConstants_Obj& sampling = product.samplingConstants;
    sampling.Brg_hz = 56.5e6;
    sampling.Baz_hz = 327.0;

    SARPulse_Obj& pulse = product.pulse;
    pulse.PulseLength = 52.4e-6;
    pulse.Bandwidth = sampling.Brg_hz;
    pulse.PulseKRate = pulse.Bandwidth / pulse.PulseLength;
    pulse.PulseEnergy = 1.0;
    pulse.PulseSamplingRate = sampling.frg_hz;

    SensorAttitude_Obj& attitude = product.sensorAttitude;
    const ROI_Time middle = product.roi.Roi.GetCenter();
    require(product.orbit.SVGetSatSpeed(middle.SlowTime, middle.FastTime, &attitude.Eq_speed), "no speed");
    attitude.Eq_distance = middle.FastTime * quo::kLightSpeed / 2.0;
    attitude.Mean_DC = 0.0;
    attitude.SquintAngle = 0.0;
    attitude.AntennaLength = 12.3;
    attitude.Temperature = 17.5;

    SpectralWindows_Obj& windows = product.spectralWindows;
    std::snprintf(windows.AzMatchedFilterType, sizeof windows.AzMatchedFilterType, "HAMMING");
    std::snprintf(windows.RgMatchedFilterType, sizeof windows.RgMatchedFilterType, "HAMMING");
    windows.AzMatchedFilterCoef = windows.RgMatchedFilterCoef = 0.75;
    windows.RgLookBandwidth = sampling.Brg_hz;
    windows.AzLookBandwidth = sampling.Baz_hz;

    SwathInfo& swath = product.swathInfo;
    swath.Rank = 9;
    swath.Rgate_bias = 0.0;
    swath.Echoes_per_burst = swath.Lines_per_burst = kLines;
    swath.Bursts = 1;
    swath.Order = 0;
    swath.Acquisition_Start_Time = product.roi.Roi.SlowStartTime;
    swath.Swst_changes = 0;
    swath.NoisePower = swath.ChirpPower = 1.0;
}

// Doppler, FM rate, ground range and angles over the region, and its corners, all from the orbit.
void derive_geometry(GeneralSAR& product) {
    const ROI_Obj& region = product.roi.Roi;
    polySAR& set = product.polynomials;
    require(set.CreatePolys(2, 1, 1, 1, 1, 1), "no memory");
    for (int i = 0; i < 2; ++i) {  // at the beginning and at the end: the image is at zero Doppler
        set.DC[i].trg0 = region.FastStartTime;
        set.DC[i].taz0 = region.SlowStartTime + i * region.SlowTimeLength;
    }
    const polyDC& dc = set.DC[0];
    require(product.orbit.SVGetFRpoly(&region, &dc, &set.FR[0]), "no FM rate");
    require(product.orbit.SVGetGroundToTimePolys(&region, &dc, &set.SL2GR[0], &set.GR2SL[0]), "no ground range");
    require(product.orbit.SVGetTimeToAnglesPolys(&region, &dc, &set.SL2THETA[0], &set.SL2PHI[0]), "no angles");
    require(product.orbit.SVGetGeoCoords(&product.geoCoords, &product.roi), "no corners");
    product.geoCoords.EastingGridSize = product.geoCoords.NorthingGridSize = 30.0;

    // One gain for every sample, between the look angles of the region's ends.
    const geopoint &near = product.geoCoords.SouthWest, &far = product.geoCoords.SouthEast;
    product.antennaPattern.PatternSamples = kSamples;
    product.antennaPattern.StartAngle = near.LookAngle;
    product.antennaPattern.DeltaAngle = (far.LookAngle - near.LookAngle) / (kSamples - 1);
}

void describe_raster(GeneralSAR& product) {
    for (RasterDescription* raster : {static_cast<RasterDescription*>(&product.bufferFile),
                                      static_cast<RasterDescription*>(&product.dataFile.File)}) {
        raster->NrOfLinesPerImage = kLines;
        raster->NrOfPixelsPerLine = kSamples;
        raster->CellType = SHORT_COMPLEX;
        raster->ByteOrder = 1;
    }
}

// --- The raster -----------------------------------------------------------------------------------------------

bool near_a_line_of_the_map(double degrees) {
    constexpr double kStep_deg = 0.01, kWidth = 0.02;
    const double steps = degrees / kStep_deg;
    return std::abs(steps - std::round(steps)) < kWidth;
}

// Bright where a meridian or a parallel runs, with the phase of the way there and back, in whole numbers.
std::vector<fcomplex> make_image(GeneralSAR& product) {
    const ROI_Obj& region = product.roi.Roi;
    std::vector<fcomplex> image;
    image.reserve(std::size_t{kLines} * kSamples);
    for (int line = 0; line < kLines; ++line) {
        for (int sample = 0; sample < kSamples; ++sample) {
            const double range = region.FastStartTime + sample * region.FastTimeDelta;
            double latitude = 0.0, longitude = 0.0;
            require(product.orbit.SVGetLatLon(region.SlowStartTime + line * region.SlowTimeDelta, range, &latitude,
                                              &longitude),
                    "a sample sees no ground");
            const double amplitude =
                near_a_line_of_the_map(latitude) || near_a_line_of_the_map(longitude) ? 3000 : 300;
            const double phase = -2.0 * std::numbers::pi * std::fmod(range * product.samplingConstants.fc_hz, 1.0);
            image.emplace_back(static_cast<float>(std::round(amplitude * std::cos(phase))),
                               static_cast<float>(std::round(amplitude * std::sin(phase))));
        }
    }
    return image;
}

// --- Comparing ------------------------------------------------------------------------------------------------

struct Comparison {
    int values = 0, different = 0;

    // Every value that the objects register.
    void add(const char* object, const GeneralSAR_Base& written, const GeneralSAR_Base& read) {
        for (int k = 0; k < written.elementCount(); ++k) {
            const parElement &a = *written.element(k), &b = *read.element(k);
            values += a.count;
            if (a.count == b.count && same(a, b)) continue;
            ++different;
            std::printf("%s/%s differs\n", object, a.name);
        }
    }

private:
    static bool same(const parElement& a, const parElement& b) {
        if (a.type == parElement::typeString)
            return std::strcmp(static_cast<const char*>(a.pointer), static_cast<const char*>(b.pointer)) == 0;
        return a.withValues([&](auto values) {
            return values.empty() || std::memcmp(values.data(), b.pointer, values.size_bytes()) == 0;
        });
    }
};

void compare_polynomials(const polySAR& written, const polySAR& read, Comparison& comparison) {
    if (comparison.different > 0) return;  // the lists may be of other lengths
    for (int i = 0; i < written.ndc; ++i) comparison.add("DC", written.DC[i], read.DC[i]);
    comparison.add("FR", written.FR[0], read.FR[0]);
    comparison.add("SL2GR", written.SL2GR[0], read.SL2GR[0]);
    comparison.add("GR2SL", written.GR2SL[0], read.GR2SL[0]);
    comparison.add("SL2THETA", written.SL2THETA[0], read.SL2THETA[0]);
    comparison.add("SL2PHI", written.SL2PHI[0], read.SL2PHI[0]);
}

Comparison compare(GeneralSAR& written, GeneralSAR& read) {
    Comparison comparison;
    for (int i = 0; i < GeneralSAR::kObjects; ++i) {
        const auto object = static_cast<GSObject>(i);
        require(read.GSexists(object) ? QUO_OK : QUO_REFUSED, "an object is lost");
        comparison.add(std::to_string(i).c_str(), *written.GSget(object), *read.GSget(object));
    }
    comparison.add("ROI", written.roi.Roi, read.roi.Roi);
    comparison.add("DataFile", written.dataFile.File, read.dataFile.File);
    compare_polynomials(written.polynomials, read.polynomials, comparison);
    for (const auto corner : {&geoCoords_Obj::NorthWest, &geoCoords_Obj::NorthEast, &geoCoords_Obj::SouthWest,
                              &geoCoords_Obj::SouthEast, &geoCoords_Obj::Center}) {
        comparison.add("corner", written.geoCoords.*corner, read.geoCoords.*corner);
    }
    return comparison;
}

// --- The job --------------------------------------------------------------------------------------------------

void write(GeneralSAR& product, const std::vector<fcomplex>& image, const std::string& raster) {
    BufferFile& file = product.bufferFile;
    file.setFilename(raster.c_str());
    file.open(BufferFile::WRITE);
    file.writebuffer(image.data(), 0, kLines, 0, 0);
    file.close();
    for (int object = 0; object < GeneralSAR::kObjects; ++object) product.GSenable(static_cast<GSObject>(object));
    quorelxml::setExactNumbers(true);  // "%.15g" would cost the last digits
    product.GSwrite((raster + ".hdr").c_str());
}

void run(const std::string& scene_header, const std::string& raster) {
    GeneralSAR scene, product;
    require(scene.GSread(scene_header.c_str()), "the scene cannot be read");
    take_over(scene, product);
    describe_instrument(product);
    derive_geometry(product);
    describe_raster(product);
    const std::vector<fcomplex> image = make_image(product);
    write(product, image, raster);

    GeneralSAR read;
    require(read.GSread((raster + ".hdr").c_str()), "the product cannot be read");
    const Comparison comparison = compare(product, read);
    std::vector<fcomplex> samples(image.size());
    read.bufferFile.open(BufferFile::READ);  // named by its header
    read.bufferFile.readbuffer(samples.data(), 0, kLines, 0, 0);
    std::size_t different = 0;
    for (std::size_t i = 0; i < image.size(); ++i) different += samples[i] == image[i] ? 0U : 1U;
    std::printf("%d objects: %d values written, %d differ when read; %zu samples, %zu differ\n",
                GeneralSAR::kObjects, comparison.values, comparison.different, image.size(), different);
    if (comparison.different != 0 || different != 0) throw example::Failure{"the product was not read as it was"};
}

}  // namespace

int main(int argc, char** argv) {
    if (argc != 3) {
        std::fputs("Usage: example_complete_product SCENE.xml RASTER\n", stderr);
        return 2;
    }
    const std::string scene = argv[1], raster = argv[2];
    return example::run_program("complete_product", {{scene}, {raster, raster + ".hdr"}}, "", "", 0,
                                [&] { run(scene, raster); });
}
