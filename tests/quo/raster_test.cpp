// SPDX-License-Identifier: Apache-2.0

// The verbs on rasters, each against bytes made here.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <cstdlib>
#include <numeric>
#include <sstream>
#include <string>
#include <vector>

#include "picture_reader.h"
#include "quo_base/acquisition.h"
#include "quo_base/dataset_info.h"
#include "quo_base/generalSARorbit.h"
#include "quo_base/image_grid.h"
#include "quo_base/roi.h"
#include "raster_folder.h"

namespace {

using RasterVerbs = test::RasterFolder;

// 10 log10 of the mean power of the looks, 0 to 51 dB over 0 to 255: 5 a dB.
TEST_F(RasterVerbs, QuicklookShowsThePowerInDecibels) {
    const std::vector<float> parts = {
        10, 0, 0, 10, 0,    100, 30,  -40,  // 20 dB and 40 dB; 34 dB in the second pair
        1,  0, 0, 0,  1e9F, 0,   NAN, 1};
    std::string bytes;
    for (const float part : parts) test::append_bytes(bytes, part, true);
    const std::string in = make("in.raw", 2, 4, FLOAT_COMPLEX, 1), picture = file("picture.png");
    test::write_text(in, bytes);
    const auto grey = [&](const char* looks) {
        EXPECT_EQ(test::quo({"quicklook", in, picture, "--db", "0:51", "--looks", looks}).exit_status, 0);
        return test::SeenPicture{picture}.values;
    };
    EXPECT_THAT(grey("1x1"), testing::ElementsAre(100, 100, 200, 170, 0, 0, 255, 0));
    EXPECT_THAT(grey("1x2"), testing::ElementsAre(100, 190, 0, 255));  // 10 log10(6250) = 37.96
    EXPECT_THAT(grey("2x2"), testing::ElementsAre(85, 255));           // 10 log10(201 / 4) = 17.01
}

// Of scenes of one level, whatever that is, every pixel lies 6 of 15 dB above black; next to a border 60 dB below,
// 32 of 35.
TEST_F(RasterVerbs, QuicklookKeepsEvenScenesDarkAndBordersFromTheContrast) {
    const auto seen = [&](float border, float level) {
        const std::string in = make("in.raw", 64, 64, FLOAT32, 0), picture = file("picture.png");
        std::string bytes;
        for (int i = 0; i < 64 * 64; ++i) test::append_bytes(bytes, i < 4 * 64 ? border : level, false);
        test::write_text(in, bytes);
        EXPECT_EQ(test::quo({"quicklook", in, picture}).exit_status, 0);
        const test::SeenPicture shown{picture};
        return std::pair{shown.at(9, 0), shown.at(9, 40)};
    };
    EXPECT_EQ(seen(1.0F, 1.0F), std::pair(102, 102));
    EXPECT_EQ(seen(3e4F, 3e4F), std::pair(102, 102));
    EXPECT_EQ(seen(0.0F, 7.0F), std::pair(0, 102));
    EXPECT_EQ(seen(0.01F, 10.0F), std::pair(0, 233));
}

/** Turns a header's orbit by rotations that exchange the axes, so that its track runs another way elsewhere. */
void turn_orbit(const std::string& header, int rotations) {
    SAROrbitStateVectors_Obj vectors;
    ASSERT_EQ(vectors.readhdr(header.c_str()), 0);
    for (double* const values : {vectors.pSV_m, vectors.vSV_mOs})
        for (int k = 0; k < vectors.nSV_n; ++k)
            std::rotate(values + 3 * k, values + 3 * k + 3 - rotations, values + 3 * k + 3);
    ASSERT_EQ(vectors.writehdr(header.c_str()), 0);
}

// A bright patch must lie where the geolocation says, through the world file of a picture with north at the top:
// tracks to the north, west and south-east, either look side.
TEST_F(RasterVerbs, QuicklookLiesOnTheMapWhicheverWayTheTrackRuns) {
    const std::string in = make_sparse("in.raw", 300, 900, INT8), header = in + ".hdr";
    std::string bytes(300 * 900, '\1');
    for (int line = 30; line < 60; ++line) bytes.replace(static_cast<std::size_t>(line * 900 + 90), 90, 90, 'd');
    test::write_text(in, bytes);
    DataFile raster;
    ASSERT_EQ(raster.read_hdr(in.c_str()), 0);
    for (const int rotations : {0, 1, 2})
        for (const int look : {1, -1}) {
            SCOPED_TRACE(testing::Message() << rotations << " " << look);
            test::write_text(header, test::read_text(test::scene_file("s1a_iw1_slc_20220104_asc.xml")));
            ASSERT_EQ(raster.write_hdr(), 0);
            ASSERT_EQ(test::quo({"set", header, "ROI/Lines", "300"}).exit_status, 0);
            ASSERT_EQ(test::quo({"set", header, "ROI/Samples", "900"}).exit_status, 0);
            turn_orbit(header, rotations);
            DataSetInfo_Obj info;
            ASSERT_EQ(info.readhdr(header.c_str()), 0);
            info.LookDirection = look;
            ASSERT_EQ(info.writehdr(header.c_str()), 0);

            const test::Finished finished =
                test::quo({"quicklook", in, file("out.png"), "--north-up", "--world", "--db", "0:40"});
            ASSERT_EQ(finished.exit_status, 0) << finished.err;
            EXPECT_THAT(finished.out,
                        testing::ContainsRegex("lines run .* north is .*\n.*out.pgw: .* m at most\n"));
            double right_deg, right_lat, down_deg, down_lat, longitude, latitude;
            std::istringstream{test::read_text(file("out.pgw"))} >> right_deg >> right_lat >> down_deg >>
                down_lat >> longitude >> latitude;
            EXPECT_GT(right_deg, 0.0);
            EXPECT_LT(down_lat, -std::abs(right_lat));

            const test::SeenPicture picture{file("out.png")};
            EXPECT_EQ(std::pair(picture.width, picture.height), std::pair(300, 300));
            double column = 0.0, row = 0.0, bright = 0.0;
            for (int y = 0; y < picture.height; ++y)
                for (int x = 0; x < picture.width; ++x)
                    if (picture.at(x, y) > 128) column += x, row += y, ++bright;
            EXPECT_EQ(bright, 30 * 30);
            const auto truth = test::numbers_in(
                test::quo({"geolocate", header, "--to", "ground"}, "line,sample\n44.5,134.5\n").out);
            ASSERT_EQ(truth.size(), 1U);
            column /= bright, row /= bright;
            constexpr double kOff = 1.2e-5;  // degrees: a third of a sample
            EXPECT_NEAR(latitude + column * right_lat + row * down_lat, truth[0][5], kOff);
            EXPECT_NEAR(longitude + column * right_deg + row * down_deg, truth[0][6], 2.0 * kOff);
        }
}

// Of two bursts the second goes back over most of the first: no affine map has a line at two places.
TEST_F(RasterVerbs, QuicklookOfOverlappingBurstsIsNoMap) {
    const std::string in = make("in.raw", 300, 900, INT8, 0), header = in + ".hdr";
    test::write_text(header, test::read_text(test::scene_file("s1a_iw1_slc_20220104_asc.xml")));
    DataFile raster;
    raster.setFilename(in.c_str());
    raster.NrOfLinesPerImage = 300;
    raster.NrOfPixelsPerLine = 900;
    raster.CellType = INT8;
    ASSERT_EQ(raster.write_hdr(), 0);
    ROI_Obj region;
    ImageGrid_Obj grid;
    ASSERT_EQ(region.read_roi(header.c_str(), "ROI"), 0);
    ASSERT_EQ(grid.setRegion(region), 0);
    grid.Bursts = 2;
    grid.LinesPerBurst = 150;
    ASSERT_EQ(grid.createBuffers(), 0);
    for (const int back : {0, 130}) {
        grid.BurstStart_s = {grid.FirstLine_s, grid.FirstLine_s + (150 - back) * grid.LineStep_s};
        ASSERT_EQ(grid.writehdr(header.c_str()), 0);
        const test::Finished finished = test::quo({"quicklook", in, file("out.png"), "--world"});
        EXPECT_EQ(finished.exit_status, back == 0 ? 0 : 1);
        EXPECT_THAT(finished.err, testing::HasSubstr(back == 0 ? "" : "off any affine map"));
        EXPECT_EQ(files().contains("out.pgw"), back == 0);
        std::filesystem::remove(file("out.pgw"));
        std::filesystem::remove(file("out.png"));
        std::filesystem::create_directory(file("out.pgw"));  // where no world file can be, there is no picture
        EXPECT_EQ(test::quo({"quicklook", in, file("out.png"), "--world"}).exit_status, 1);
        EXPECT_FALSE(files().contains("out.png"));
        std::filesystem::remove(file("out.pgw"));
    }
}

// The picture itself is what it is without a frame, which runs around it in black; beside it the bar of decibels.
TEST_F(RasterVerbs, QuicklookInAFrame) {
    const std::string in = make("in.raw", 200, 400, INT8, 0), plain = file("plain.png"),
                      framed = file("framed.png");
    ASSERT_EQ(test::quo({"quicklook", in, plain}).exit_status, 0);
    ASSERT_EQ(test::quo({"quicklook", in, framed, "--frame", "--title", "Na\u00efve \x9b"}).exit_status, 0);
    const test::SeenPicture bare{plain}, whole{framed};
    constexpr int kLeft = 74, kTop = 66;
    ASSERT_EQ(whole.channels, 1);
    ASSERT_GT(whole.width, kLeft + bare.width + 60);
    int different = 0, dark_above = 0;
    for (int y = 1; y < bare.height; ++y)
        for (int x = 1; x < bare.width; ++x) different += whole.at(kLeft + x, kTop + y) != bare.at(x, y);
    EXPECT_EQ(different, 0);
    for (int x = 1; x < bare.width; ++x) EXPECT_EQ(whole.at(kLeft + x, kTop) + whole.at(kLeft + x, 266), 0) << x;
    for (int i = 0; i < whole.width * 30; ++i) dark_above += whole.values[static_cast<std::size_t>(i)] < 128;
    EXPECT_GT(dark_above, 200);  // letters of the title
    const int bar = kLeft + bare.width + 33;
    EXPECT_GT(whole.at(bar, kTop + 4), 245);
    EXPECT_LT(whole.at(bar, kTop + 172), 32);
}

// GDAL is the judge of the virtual rasters: it must see the very samples. It has no type of signed bytes
// before 3.7, only their mark, so that their bytes are compared.
TEST_F(RasterVerbs, VrtIsReadByGdal) {
    if (std::system("gdal_translate --version > /dev/null 2>&1") != 0) GTEST_SKIP() << "GDAL is not installed";
    for (const int type : {0, 1, 2, 3, 4, 5, 6, 7, 9}) {
        SCOPED_TRACE(type);
        const std::string in = make("a&b.raw", 6, 5, type, type % 3 == 0 ? 0 : 1, 3 + type, 50),
                          out = file("out.bin");
        ASSERT_EQ(test::quo({"vrt", in}).exit_status, 0);
        const std::string same = type == INT8 ? "" : (type % 2 == 0 ? "-ot CFloat64 " : "-ot Float64 ");
        const std::string command =
            "gdal_translate -q -of ENVI " + same + "'" + in + ".vrt' '" + out + "' > /dev/null 2>&1";
        ASSERT_EQ(std::system(command.c_str()), 0);
        std::string expected;
        for (int i = 0; i < 30; ++i)
            for (int part = 0; part <= 1 - type % 2; ++part)
                test::append_part(expected, type == INT8 ? INT8 : FLOAT64, test::part_value(i / 5, i % 5, part),
                                  false);
        EXPECT_TRUE(test::read_text(out) == expected);
    }
}

}  // namespace
