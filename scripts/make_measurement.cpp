// SPDX-License-Identifier: Apache-2.0

// Makes the measurement that belongs to the annotation of a Sentinel-1 SLC: a TIFF of the size and place that
// the annotation tells, with a made landscape in place of the samples. Parallels and meridians at every tenth of a
// degree run through it, so that pictures tell whether they lie right. Usage: make_measurement
// FOLDER.SAFE/annotation/NAME.xml

#include <algorithm>
#include <array>
#include <cmath>
#include <complex>
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <random>
#include <stdexcept>
#include <string>
#include <vector>

#include "quo_base/derived_raster.h"
#include "quo_base/generalSAR.h"
#include "quo_base/image_grid.h"
#include "quo_base/mission_import.h"

namespace {

namespace fs = std::filesystem;

constexpr std::uint32_t kSamplesAt = 256;  // in the file

/** The number in an element of the annotation, such as <numberOfLines>. */
std::uint32_t count_in(const std::string& annotation, const std::string& element) {
    const auto at = annotation.find("<" + element + ">");
    if (at == annotation.npos) throw std::runtime_error{"no " + element};
    return static_cast<std::uint32_t>(std::stoul(annotation.substr(at + element.size() + 2, 12)));
}

/** An empty TIFF in one strip, of complex samples of twice 16 bits. */
void make_tiff(const fs::path& name, std::uint32_t lines, std::uint32_t samples) {
    const std::uint64_t all = std::uint64_t{lines} * samples;
    if (all > (UINT32_MAX - kSamplesAt) / 4U) throw std::runtime_error{"more samples than a TIFF has room for"};
    const auto bytes = static_cast<std::uint32_t>(all * 4U);
    const std::array<std::array<std::uint32_t, 2>, 10> entries{{{256, samples},
                                                                {257, lines},
                                                                {258, 32},
                                                                {259, 1},
                                                                {262, 1},
                                                                {273, kSamplesAt},
                                                                {277, 1},
                                                                {278, lines},
                                                                {279, bytes},
                                                                {339, 5}}};
    std::string head{"II*\0\10\0\0\0", 8};
    const auto append = [&](std::uint32_t value, int size) {
        for (int byte = 0; byte < size; ++byte) head += static_cast<char>(value >> 8 * byte & 0xFFU);
    };
    append(entries.size(), 2);
    for (const auto& [tag, value] : entries) {
        append(tag, 2);
        append(4, 2);  // a word of 32 bits
        append(1, 4);
        append(value, 4);
    }
    std::ofstream{name, std::ios::binary} << head;
    fs::resize_file(name, std::uintmax_t{kSamplesAt} + bytes);
}

/** A landscape: levels in cells of a map, from octaves of smoothed noise, with land, water and the map's lines. */
class Landscape {
public:
    Landscape() : amplitudes_(std::size_t{kCells} * kCells) {
        std::mt19937 random{17};
        std::vector<float> heights(amplitudes_.size());
        for (int cells = kCells / 2; cells >= 8; cells /= 2) add_octave(heights, cells, random);
        std::vector<float> sorted = heights;
        const auto shore = sorted.begin() + static_cast<std::ptrdiff_t>(sorted.size() * 3 / 10);
        std::nth_element(sorted.begin(), shore, sorted.end());
        for (std::size_t i = 0; i < heights.size(); ++i) {
            const float above = (heights[i] - *shore) / kCells;
            amplitudes_[i] = above < 0.0F ? 12.0F : 60.0F + 900.0F * above;
        }
    }
    /** The amplitude at a place; the landscape repeats itself every two degrees. */
    [[nodiscard]] float at(float latitude_deg, float longitude_deg) const {
        const auto near_a_line = [](float degrees) {
            const float tenths = 10.0F * degrees;
            return std::abs(tenths - std::round(tenths)) < 0.012F;
        };
        if (near_a_line(latitude_deg) || near_a_line(longitude_deg)) return 420.0F;
        const auto cell = [](float degrees) {
            return static_cast<unsigned>(static_cast<int>(degrees * (kCells / 2.0F))) % kCells;
        };
        return amplitudes_[cell(latitude_deg) * kCells + cell(longitude_deg)];
    }

private:
    static constexpr unsigned kCells = 2048;

    static void add_octave(std::vector<float>& heights, int cells, std::mt19937& random) {
        const auto count = static_cast<unsigned>(cells), times = kCells / count;
        std::uniform_real_distribution<float> any{-0.5F * static_cast<float>(times),
                                                  0.5F * static_cast<float>(times)};
        std::vector<float> nodes(std::size_t{count} * count);
        for (float& node : nodes) node = any(random);
        const auto smooth = [](float x) { return x * x * (3.0F - 2.0F * x); };
        for (unsigned y = 0; y < kCells; ++y)
            for (unsigned x = 0; x < kCells; ++x) {
                const unsigned row = y / times * count, below = (y / times + 1) % count * count,
                               column = x / times, beside = (column + 1) % count;
                const float v = smooth(static_cast<float>(y % times) / static_cast<float>(times)),
                            u = smooth(static_cast<float>(x % times) / static_cast<float>(times));
                heights[y * kCells + x] += (nodes[row + column] * (1 - u) + nodes[row + beside] * u) * (1 - v) +
                                           (nodes[below + column] * (1 - u) + nodes[below + beside] * u) * v;
            }
    }

    std::vector<float> amplitudes_;
};

/** Where pixels lie: exact at every 256th sample of every 64th line of a burst, straight in between. */
class Places {
public:
    Places(const std::string& header, int lines, int samples) : samples_{samples} {
        if (product_.GSread(header.c_str()) != QUO_OK ||
            read_image_grid(header.c_str(), product_, grid_) != QUO_OK)
            throw std::runtime_error{header + ": cannot be read"};
        lines_per_burst_ = grid_.Bursts > 0 ? grid_.LinesPerBurst : lines;
    }
    struct Place {
        float latitude_deg, longitude_deg;
    };
    [[nodiscard]] int line_in_burst(int line) const { return line % lines_per_burst_; }
    [[nodiscard]] int lines_per_burst() const { return lines_per_burst_; }
    [[nodiscard]] bool has_bursts() const { return grid_.Bursts > 0; }

    /** The places of a line's samples at every kAcross. */
    static constexpr int kAcross = 256;
    std::vector<Place> line(int line) {
        constexpr int kDown = 64;
        const int burst_first = line - line_in_burst(line);
        const int first = burst_first + line_in_burst(line) / kDown * kDown;
        const int last = std::min(first + kDown, burst_first + lines_per_burst_ - 1);
        if (first != first_) {
            above_ = exact(first);
            below_ = first == last ? above_ : exact(last);
            first_ = first;
        }
        const float share =
            first == last ? 0.0F : static_cast<float>(line - first) / static_cast<float>(last - first);
        std::vector<Place> places(above_.size());
        for (std::size_t i = 0; i < places.size(); ++i)
            places[i] = {std::lerp(above_[i].latitude_deg, below_[i].latitude_deg, share),
                         std::lerp(above_[i].longitude_deg, below_[i].longitude_deg, share)};
        return places;
    }

private:
    std::vector<Place> exact(int line) {
        std::vector<Place> places;
        for (int sample = 0; sample < samples_ + kAcross; sample += kAcross) {
            const double at_line = line, at_sample = sample;
            double azimuth_s = 0.0, range_s = 0.0, latitude_deg = 0.0, longitude_deg = 0.0;
            std::int32_t status = 0;
            grid_.pixelTimes({1, &at_line, &at_sample}, {&azimuth_s, &range_s, &status});
            if (status != QUO_OK ||
                product_.orbit.SVGetLatLon(azimuth_s, range_s, &latitude_deg, &longitude_deg) != 0)
                throw std::runtime_error{"a pixel without a place"};
            places.push_back({static_cast<float>(latitude_deg), static_cast<float>(longitude_deg)});
        }
        return places;
    }

    GeneralSAR product_;
    ImageGrid_Obj grid_;
    int samples_, lines_per_burst_ = 0, first_ = -1;
    std::vector<Place> above_, below_;
};

/** Speckle: a store of it that every line begins to take from at another place. */
class Speckle {
public:
    Speckle() : store_(1U << 18U) {
        std::normal_distribution<float> normal{0.0F, std::sqrt(0.5F)};
        for (auto& value : store_) value = {normal(random_), normal(random_)};
    }
    void start() { next_ = random_(); }
    std::complex<float> next() { return store_[next_++ % store_.size()]; }

private:
    std::mt19937 random_{5};
    std::vector<std::complex<float>> store_;
    std::size_t next_ = 0;
};

void paint(const fs::path& tiff, Places& places, int lines, int samples) {
    constexpr int kDarkLines = 20;  // at either end of a burst, which has no samples there
    const Landscape landscape;
    Speckle speckle;
    std::fstream out{tiff, std::ios::binary | std::ios::in | std::ios::out};
    out.seekp(kSamplesAt);
    std::vector<std::int16_t> values;
    for (int line = 0; line < lines; ++line) {
        values.clear();
        speckle.start();
        const int in_burst = places.line_in_burst(line);
        const bool dark =
            places.has_bursts() && (in_burst < kDarkLines || in_burst >= places.lines_per_burst() - kDarkLines);
        const auto nodes = places.line(line);
        for (int sample = 0; sample < samples; ++sample) {
            const auto node = static_cast<std::size_t>(sample / Places::kAcross);
            const float share = static_cast<float>(sample % Places::kAcross) / Places::kAcross;
            const auto &a = nodes[node], &b = nodes[node + 1];
            const std::complex<float> value = (dark ? 0.0F : 1.0F) * speckle.next() *
                                              landscape.at(std::lerp(a.latitude_deg, b.latitude_deg, share),
                                                           std::lerp(a.longitude_deg, b.longitude_deg, share));
            values.push_back(static_cast<std::int16_t>(value.real()));
            values.push_back(static_cast<std::int16_t>(value.imag()));
        }
        out.write(reinterpret_cast<const char*>(values.data()),
                  static_cast<std::streamsize>(values.size() * sizeof values[0]));
    }
    if (!out.flush()) throw std::runtime_error{tiff.string() + ": cannot be written"};
}

void make(const fs::path& annotation) {
    std::ifstream file{annotation};
    const std::string text{std::istreambuf_iterator{file}, {}};
    const std::uint32_t lines = count_in(text, "numberOfLines"), samples = count_in(text, "numberOfSamples");
    const fs::path folder = annotation.parent_path().parent_path() / "measurement";
    fs::create_directories(folder);
    const fs::path tiff = folder / (annotation.stem().string() + ".tiff"), work = folder / "geometry";
    make_tiff(tiff, lines, samples);

    // The import tells where the pixels lie.
    const std::string source = annotation.string(), raster = (work / "raster").string();
    fs::create_directories(work);
    quo_import_request request{};
    request.source = source.c_str();
    request.raster = raster.c_str();
    request.swath = request.polarization = request.orbit_file = "";
    request.link = 1;
    quo_import_result result{};
    if (quo_import_sentinel1(&request, &result) != QUO_OK) throw std::runtime_error{result.message};
    Places places{raster + ".hdr", static_cast<int>(lines), static_cast<int>(samples)};
    fs::remove_all(work);
    paint(tiff, places, static_cast<int>(lines), static_cast<int>(samples));
}

}  // namespace

int main(int argc, char** argv) {
    try {
        if (argc != 2) throw std::runtime_error{"Usage: make_measurement ANNOTATION.xml"};
        make(argv[1]);
    } catch (const std::exception& failure) {
        std::fprintf(stderr, "make_measurement: %s\n", failure.what());
        return 1;
    }
}
