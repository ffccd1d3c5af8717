// The verbs on rasters, each against bytes made here.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <png.h>

#include <cmath>
#include <cstdlib>
#include <stdexcept>
#include <string>
#include <vector>

#include "raster_folder.h"

namespace {

using RasterVerbs = test::RasterFolder;

/** The samples of a grey picture. */
std::vector<unsigned char> grey_of(const std::string& name) {
    png_image image{};
    image.version = PNG_IMAGE_VERSION;
    if (png_image_begin_read_from_file(&image, name.c_str()) == 0) throw std::runtime_error{image.message};
    EXPECT_EQ(image.format, static_cast<png_uint_32>(PNG_FORMAT_GRAY));
    std::vector<unsigned char> pixels(PNG_IMAGE_SIZE(image));
    png_image_finish_read(&image, nullptr, pixels.data(), 0, nullptr);
    return pixels;
}

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
        return grey_of(picture);
    };
    EXPECT_THAT(grey("1x1"), testing::ElementsAre(100, 100, 200, 170, 0, 0, 255, 0));
    EXPECT_THAT(grey("1x2"), testing::ElementsAre(100, 190, 0, 255));  // 10 log10(6250) = 37.96
    EXPECT_THAT(grey("2x2"), testing::ElementsAre(85, 255));           // 10 log10(201 / 4) = 17.01
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
