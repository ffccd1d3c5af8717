// SPDX-License-Identifier: Apache-2.0

// Responses at known pixels of images of every kind of grid: the targets lie where the orbit takes the pixels'
// times.
#include "point_targets/measure.h"

#include <cmath>
#include <cstring>
#include <fstream>
#include <numbers>

#include "common/session.h"
#include "quo_base/acquisition.h"
#include "quo_base/image_grid.h"
#include "quo_base/roi.h"
#include "support/diagnostics.h"
#include "support/scenes.h"

namespace {

constexpr int kLines = 300, kSamples = 200;
constexpr double kBand = 0.7, kLine = 185.25, kSample = 100.4;  // of the sampling; of the target

double sinc(double x) { return x == 0.0 ? 1.0 : std::sin(std::numbers::pi * x) / (std::numbers::pi * x); }

std::string response() {
    std::vector<float> values;
    for (int line = 0; line < kLines; ++line)
        for (int sample = 0; sample < kSamples; ++sample)
            values.push_back(static_cast<float>(sinc(kBand * (line - kLine)) * sinc(kBand * (sample - kSample))));
    return {reinterpret_cast<const char*>(values.data()), values.size() * sizeof values[0]};
}

/** Where the target stands in seconds after the grid's first line and as range time, and a sample's length there.
 */
struct Seen {
    double azimuth_s, range_s, step_s;
};

// The second burst begins 40 lines before the end of the first, so that both see line 35.25 of the second.
Seen set_bursts(ImageGrid_Obj& grid) {
    grid.Bursts = 2;
    grid.LinesPerBurst = kLines / 2;
    EXPECT_EQ(grid.createBuffers(), 0);
    grid.BurstStart_s = {grid.FirstLine_s, grid.FirstLine_s + 110.0 * grid.LineStep_s};
    return {145.25 * grid.LineStep_s, grid.FirstSample_s + kSample * grid.SampleStep_s, grid.SampleStep_s};
}
Seen set_ground_range(ImageGrid_Obj& grid) {
    constexpr double kToTime = 2.0 / quo::kLightSpeed, kNear_m = 803457.3, kSlope = 0.61, kBend = 1.7e-5;
    grid.SampleStep_s = 0.0;
    grid.GroundStep_m = 10.0;
    grid.GroundLists = 1;
    EXPECT_EQ(grid.createBuffers(), 0);
    grid.GroundTime_s = {grid.FirstLine_s};
    grid.GroundToSlant[0] = kNear_m;
    grid.GroundToSlant[1] = kSlope;
    grid.GroundToSlant[2] = kBend;
    const double ground_m = kSample * grid.GroundStep_m;
    return {kLine * grid.LineStep_s, kToTime * (kNear_m + (kSlope + kBend * ground_m) * ground_m),
            kToTime * (kSlope + 2.0 * kBend * ground_m) * grid.GroundStep_m};
}

TEST(Measure, FindsTargetsOfBurstsAndInGroundRange) {
    for (const auto set : {set_bursts, set_ground_range}) {
        const test::TemporaryFolder folder;
        const std::string image = folder.file("image"), header = image + ".hdr";
        test::write_text(header, test::read_text(test::kScenes[0].path(".xml")));
        test::write_text(image, response());
        DataFile raster;
        raster.setFilename(image.c_str());
        raster.NrOfLinesPerImage = kLines;
        raster.NrOfPixelsPerLine = kSamples;
        raster.CellType = FLOAT32;
        ROI_Obj region;
        ImageGrid_Obj grid;
        SamplingConstants_Obj sampling;
        ASSERT_TRUE(raster.write_hdr() == 0 && region.read_roi(header.c_str(), "ROI") == 0);
        ASSERT_TRUE(grid.setRegion(region) == 0 && sampling.readhdr(header.c_str()) == 0);
        const Seen seen = set(grid);
        sampling.Baz_hz = kBand / grid.LineStep_s;
        sampling.Brg_hz = kBand / seen.step_s;
        ASSERT_TRUE(grid.writehdr(header.c_str()) == 0 && sampling.writehdr(header.c_str()) == 0);

        GeneralSAROrbit orbit;
        test::load_orbit(test::kScenes[0], orbit);
        example::Target target{"target", {}, 1.0};
        ASSERT_EQ(orbit.SVGetLatLon(grid.Epoch_s + grid.FirstLine_s + seen.azimuth_s, seen.range_s,
                                    &target.place.latitude_deg, &target.place.longitude_deg),
                  0);
        const auto found = example::measure(image, {target});
        ASSERT_EQ(found.size(), 1U);
        for (const example::Response& response : {found[0].azimuth, found[0].range}) {
            EXPECT_NEAR(response.shift, 0.0, 0.01);
            EXPECT_NEAR(response.resolution / response.theory, 1.0, 0.02);
        }
        EXPECT_LT(found[0].ground_m, 0.1);
        EXPECT_TRUE(example::within_bounds(found[0]));
    }
}

TEST(Targets, HaveNamesOfTheirOwn) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("targets.csv");
    test::write_text(
        file, "name,latitude_deg,longitude_deg,height_m,strength\n# here\na,1,2,3,4\nb,1,2,3,4\na,5,6,7,8\n");
    try {
        example::read_targets(file);
        FAIL();
    } catch (const example::Failure& failure) {
        EXPECT_EQ(failure.what(), file + ": line 5: a is the name of the target in line 3; give each its own");
    }
}

// A folder cannot be replaced, and nothing is left beside it.
TEST(WriteFile, LeavesWhatItCannotReplace) {
    const test::TemporaryFolder folder;
    const std::string old = folder.file("old"), taken = folder.file("taken");
    test::write_text(old, "old");
    std::filesystem::create_directories(taken + "/full");
    EXPECT_THROW(example::write_file(taken, "new"), example::Failure);
    EXPECT_FALSE(std::filesystem::exists(taken + ".part"));
    std::filesystem::create_directory(old + ".part");  // nothing can be written beside it
    EXPECT_THROW(example::write_file(old, "new"), example::Failure);
    EXPECT_EQ(test::read_text(old), "old");
    std::filesystem::remove(old + ".part");
    std::filesystem::create_symlink(old, taken + "/link");
    example::write_file(taken + "/link", "new");
    EXPECT_EQ(test::read_text(old), "new");
}

}  // namespace
