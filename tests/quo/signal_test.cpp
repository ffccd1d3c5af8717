// SPDX-License-Identifier: Apache-2.0

// The verbs on signals: what they measure and make must be what was put in.
#include <gtest/gtest.h>

#include <cmath>
#include <nlohmann/json.hpp>
#include <numbers>
#include <random>

#include "picture_reader.h"
#include "quo_base/fft.h"
#include "raster_folder.h"

namespace {

class SignalVerbs : public test::RasterFolder {
protected:
    /** Writes a raster whose real and imaginary parts are those of value(line, sample). */
    template <typename Value>
    std::string make_of(const char* name, int lines, int samples, int type, Value value) {
        std::string raster = make(name, lines, samples, type, 1);
        std::string bytes;
        for (int line = 0; line < lines; ++line)
            for (int sample = 0; sample < samples; ++sample) {
                const dcomplex z = value(line, sample);
                test::append_part(bytes, type, z.real(), true);
                if (type % 2 == 0) test::append_part(bytes, type, z.imag(), true);
            }
        test::write_text(raster, bytes);
        return raster;
    }

    /** Noise that fills a part of the band: shares of it, and where it is centred, in cycles per sample. */
    std::string make_noise(int lines, int samples, double range, double azimuth, double doppler) {
        std::vector<fcomplex> noise(static_cast<std::size_t>(lines * samples));
        std::mt19937 generator{17};
        std::normal_distribution<float> normal;
        const auto fills = [](int k, int n, double centre, double width) {
            const double f = static_cast<double>(k) / n - centre;
            return std::abs(f - std::round(f)) <= 0.5 * width;
        };
        for (std::size_t k = 0; k < noise.size(); ++k) {
            const fcomplex bin{normal(generator), normal(generator)};
            const int sample = static_cast<int>(k) % samples, line = static_cast<int>(k) / samples;
            if (fills(sample, samples, 0.0, range) && fills(line, lines, doppler, azimuth)) noise[k] = bin;
        }
        EXPECT_EQ(fft_c(samples, samples, lines, lines, -2, -2, noise.data(), noise.data()), 0);
        return make_of("noise.raw", lines, samples, FLOAT_COMPLEX, [&](int line, int sample) {
            return dcomplex{noise[static_cast<std::size_t>(line * samples + sample)]};
        });
    }
};

TEST_F(SignalVerbs, SpectrumMeasuresTheBandsThatAreThere) {
    const std::string in = make_noise(1300, 150, 0.72, 0.55, -0.31), plot = file("plot.png");
    const auto measured = [&](std::vector<std::string> more) {
        more.insert(more.begin(), {"spectrum", in, plot, "--json"});
        const test::Finished finished = test::quo(more);
        EXPECT_EQ(finished.exit_status, 0) << finished.err;
        return nlohmann::json::parse(finished.out);
    };
    const auto cycles = measured({});
    EXPECT_EQ(cycles["segments"], 2);
    EXPECT_NEAR(cycles["range_centre"], 0.0, 0.005);
    EXPECT_NEAR(cycles["range_bandwidth"], 0.72, 0.02);
    EXPECT_NEAR(cycles["doppler_centroid"], -0.31, 0.005);
    EXPECT_NEAR(cycles["azimuth_bandwidth"], 0.55, 0.01);
    // Red lines mark what lies within 3 dB; 896 columns from 74 on are the band, the second panel begins at row
    // 422.
    const test::SeenPicture picture{plot};
    const auto red_columns = [&](int first_row) {
        std::vector<int> columns;
        for (int x = 0; x < picture.width; ++x)
            for (int y = first_row; y < first_row + 300; ++y)
                if (picture.at(x, y) > 180 && picture.at(x, y, 1) < 60 && picture.at(x, y, 2) < 40) {
                    columns.push_back(x);
                    break;
                }
        return columns;
    };
    const std::vector<int> range = red_columns(98), azimuth = red_columns(458);
    EXPECT_NEAR(range.front(), 74 + (0.5 - 0.36) * 896, 8);
    EXPECT_NEAR(range.back(), 74 + (0.5 + 0.36) * 896, 8);
    EXPECT_NEAR(static_cast<double>(range.size()), 0.72 * 896, 16);
    EXPECT_LE(azimuth.front(), 76);  // from -0.585 to -0.035 around the end of the band
    EXPECT_GE(azimuth.back(), 966);

    const auto hertz = measured({"--header", test::scene_file("s1a_iw1_slc_20220104_asc.xml")});
    EXPECT_EQ(hertz["unit"], "Hz");
    // Lines of bursts follow each other more slowly than the pulses that they are made of.
    constexpr double kRange = 64345238.12571428, kLines = 1.0 / 0.002055556299999998;
    // Transforms may be planned anew, and so be rounded otherwise.
    EXPECT_NEAR(hertz["range_bandwidth"], cycles["range_bandwidth"].get<double>() * kRange, 0.01 * kRange);
    EXPECT_NEAR(hertz["doppler_centroid"], cycles["doppler_centroid"].get<double>() * kLines, 1e-5 * kLines);
    EXPECT_NE(test::quo({"spectrum", in, plot}).out.find("\nrange_bandwidth,0.7"), std::string::npos);
}

/** A signal within a tenth of the band either way, known between its samples: periods per line and per column. */
dcomplex signal(double x, double y) {
    const auto tone = [](double cycles) { return std::polar(1.0, 2.0 * std::numbers::pi * cycles); };
    return 40.0 * tone(2.0 * x) * tone(-y) + 30.0 * tone(-x + 0.1) + dcomplex{20.0, 5.0};
}

TEST_F(SignalVerbs, ResampleMeetsTheSignalBetweenItsSamples) {
    constexpr int kLines = 26, kSamples = 31;
    for (const int type : {FLOAT_COMPLEX, FLOAT32, SHORT_COMPLEX})
        for (const auto& [lines, samples] :
             {std::pair{kLines, 64}, {kLines, 12}, {77, kSamples}, {11, kSamples}}) {
            SCOPED_TRACE(testing::Message() << type << " " << lines << " x " << samples);
            const bool down = lines != kLines, is_real = type == FLOAT32;
            const double tolerance = type == SHORT_COMPLEX ? 2.5 : 1e-4;  // integers are cut, then rounded
            const double centre = is_real ? 0.0 : 0.4;  // a band that reaches around the end of the spectrum
            const auto value = [&](double line, double sample) {
                return signal(sample / kSamples, line / kLines) *
                       std::polar(1.0, 2.0 * std::numbers::pi * centre * (down ? line : sample));
            };
            const std::string in = make_of("in.raw", kLines, kSamples, type, value), out = file("out.raw");
            const test::Finished finished =
                test::quo({"resample", in, out, down ? "--lines" : "--samples",
                           std::to_string(down ? lines : samples), "--centre", std::to_string(centre)});
            ASSERT_EQ(finished.exit_status, 0) << finished.err;
            BufferFile raster{out.c_str()};
            ASSERT_EQ(raster.readhdr(), 0);
            ASSERT_TRUE(raster.NrOfLinesPerImage == lines && raster.NrOfPixelsPerLine == samples &&
                        raster.CellType == type);
            raster.open(BufferFile::READ);
            std::vector<double> real(static_cast<std::size_t>(lines * samples));
            std::vector<dcomplex> all(real.size());
            raster.readbuffer(real.data(), 0, lines, 0, 0);
            raster.readbuffer(all.data(), 0, lines, 0, 0);
            for (std::size_t k = 0; k < all.size(); ++k) {
                const int line = static_cast<int>(k) / samples, sample = static_cast<int>(k) % samples;
                const dcomplex z = value(line * double{kLines} / lines, sample * double{kSamples} / samples);
                ASSERT_LE(is_real ? std::abs(real[k] - z.real()) : std::abs(all[k] - z), tolerance) << k;
            }
        }
}

// So many lines that columns go in strips: sixteen of the 17 at once, the second strip overlapping the first.
TEST_F(SignalVerbs, ResampleCoversWideImagesStripByStrip) {
    constexpr int kLines = 1 << 18;
    const std::string in = make("in.raw", kLines, 17, INT8, 0), out = file("out.raw");
    ASSERT_EQ(test::quo({"resample", in, out, "--lines", std::to_string(kLines)}).exit_status, 0);
    EXPECT_TRUE(test::read_text(out) == test::read_text(in));
}

}  // namespace
