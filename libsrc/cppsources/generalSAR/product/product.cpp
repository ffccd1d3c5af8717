// SPDX-License-Identifier: Apache-2.0
#include "quo_base/product.h"

#include <unistd.h>

#include <algorithm>
#include <array>
#include <cstdint>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>
#include <vector>

#include "datafilelib/raster_region.h"
#include "datafilelib/sample_kernels.h"
#include "diagnosticslib/call_frame.h"
#include "quo_base/derived_raster.h"
#include "quo_base/generalSAR.h"
#include "quo_base/image_grid.h"
#include "quorelxmllib/element_path.h"
#include "quorelxmllib/guarded.h"
#include "quorelxmllib/header_session.h"
#include "sarutillib/ground/array_extents.h"
#include "sarutillib/ground/bounded_text.h"
#include "sarutillib/ground/checked_size.h"
#include "sarutillib/ground/handle_table.h"

namespace {

constexpr const char* kSource = "product";
constexpr const char* kNotOpen = "The handle is none of an open product";
constexpr const char* kNull = "An argument is null";
constexpr const char* kNoRoom = "There is no room for the values";

/** What a handle stands for; nothing in it changes while it is held. */
struct OpenProduct {
    GeneralSAR header;
    DataFile raster;  // its name and description; without a name where the product has none
    ImageGrid_Obj grid;
    int grid_status = QUO_REFUSED;  // 0 where there is a grid
};

using OpenProducts = quo::HandleTable<quo_product, const OpenProduct>;
OpenProducts& open_products() {
    // Never destroyed: objects that outlive this file's statics may still ask for their products.
    static OpenProducts& table = *new OpenProducts{0x9D0D'0000'0001};
    return table;
}

/** One call on a product: `use(frame, product)` gives its status. */
template <typename Use>
int with_product(const quo::SharedCall& function, const quo_product* handle, Use use) noexcept {
    quo::CallFrame frame{function, kSource};
    const auto product = open_products().find(handle);
    return product ? use(frame, *product) : frame.fail(QUO_REFUSED, kNotOpen);
}

// --- Opening ----------------------------------------------------------------------------------------------------

/** Takes over the raster that the header describes, if it does. */
int take_described_raster(OpenProduct& product) {
    const RasterDescription* const described = described_raster(product.header);
    const char* const name = product.header.dataFile.File.FileName;  // of the header's name, in any form
    if (!described || *name == '\0') return QUO_OK;
    product.raster.copyDescription(*described);
    return product.raster.setFilename(name);
}

bool has_raster(const OpenProduct& product) { return product.raster.FileName[0] != '\0'; }

bool holds_something(const OpenProduct& product) {
    for (int object = gsRoi; object < GeneralSAR::kObjects; ++object)
        if (product.header.GSexists(static_cast<GSObject>(object))) return true;
    return has_raster(product);
}

// --- Values -----------------------------------------------------------------------------------------------------

/** The element of a polynomial at a path such as "PolySAR/DopplerCentroid-0/pol". */
const parElement* polynomial_element(const polySAR& polynomials, std::string_view field) {
    const parElement* const counts = polynomials.element(0);
    const std::string_view section = counts ? counts->section : "";
    if (!field.starts_with(section) || !field.substr(section.size()).starts_with('/')) return nullptr;
    const std::string_view path = field.substr(section.size() + 1);
    const std::size_t slash = std::min(path.find('/'), path.size());
    const poly* const polynomial = polynomials.polynomial(path.substr(0, slash));
    for (int i = 0; polynomial && i < polynomial->elementCount(); ++i)
        if (path.substr(std::min(slash + 1, path.size())) == polynomial->element(i)->name)
            return polynomial->element(i);
    return nullptr;
}

const parElement* element_at(const OpenProduct& product, std::string_view field) {
    const GeneralSAR& header = product.header;
    for (int i = gsRoi; i < GeneralSAR::kObjects; ++i) {
        const auto object = static_cast<GSObject>(i);
        if (!header.GSexists(object)) continue;
        if (const parElement* const element = header.GSelement(object, field)) return element;
    }
    if (product.grid_status == QUO_OK)
        if (const parElement* const element = quo::element_at(product.grid, field)) return element;
    return header.GSexists(gsPolySAR) ? polynomial_element(header.polynomials, field) : nullptr;
}

int refuse_field(quo::CallerFrame frame, std::string_view field) {
    char message[256];
    quo::format_bounded(message, sizeof message, "The product has no such field: %.*s",
                        static_cast<int>(std::min<std::size_t>(field.size(), sizeof message)), field.data());
    return frame.fail(QUO_REFUSED, message);
}

/** One call on a field: `use(frame, element)` gives its status. */
template <typename Use>
int with_field(const quo::SharedCall& function, const quo_product* handle, const char* field, Use use) noexcept {
    return with_product(function, handle, [&](quo::CallFrame& frame, const OpenProduct& product) {
        if (!field) return frame.fail(QUO_REFUSED, kNull);
        const parElement* const element = element_at(product, field);
        return element ? use(frame, *element) : refuse_field(frame, field);
    });
}

std::size_t length_of(const parElement& element) {
    return static_cast<std::size_t>(std::max<std::int32_t>(element.count, 0));
}

/** Writes an element's values as numbers; false where they are none. */
bool copy_numbers(const parElement& element, double* to) {
    return element.withValues([to]<typename T>(std::span<T> values) {
        if constexpr (std::is_arithmetic_v<T>) std::ranges::copy(values, to);
        return std::is_arithmetic_v<T>;
    });
}

// --- Geolocation ------------------------------------------------------------------------------------------------

/** The reason why an orbit's calls would work with guesses of their own, or null. */
const char* missing_geometry(const GeneralSAR& header, bool uses_look_side, bool uses_wavelength) {
    if (uses_look_side && !header.GSexists(gsDataSetInfo)) return "The product does not tell the look side";
    const bool known = header.GSexists(gsSamplingConstants) && header.samplingConstants.lambda_m > 0.0;
    return uses_wavelength && !known ? "The product does not tell the wavelength" : nullptr;
}

int see_ground(quo::CallFrame& frame, const OpenProduct& product, const OrbitSamples& samples,
               const OrbitGround& ground) {
    if (const char* missing = missing_geometry(product.header, true, samples.doppler_hz || ground.fm_rate_hz_s))
        return frame.fail(QUO_REFUSED, missing);
    return quo::pass_on(frame, product.header.orbit.sat2earth(samples, ground));
}

// --- Pixels -----------------------------------------------------------------------------------------------------

/** The arrays of a call on pixels. */
struct PixelArrays {
    std::size_t count;
    std::span<const double* const> inputs;
    std::span<double* const> outputs;
    const std::int32_t* status;
};

/** One call on the pixels of a product: `use(frame, product)` gives its status. */
template <typename Use>
int with_pixels(const quo::SharedCall& function, const quo_product* handle, const PixelArrays& arrays,
                Use use) noexcept {
    return with_product(function, handle, [&](quo::CallFrame& frame, const OpenProduct& product) {
        if (product.grid_status != QUO_OK)
            return frame.fail(product.grid_status, "The product does not place its pixels");
        if (!quo::lie_well(arrays.inputs, arrays.outputs, arrays.status, arrays.count))
            return frame.fail(QUO_REFUSED, "Arrays overlap, or no memory can hold them");
        return quo::guarded(frame, [&] { return use(frame, product); });
    });
}

/** Azimuth and range times between pixels and the ground. */
struct Times {
    explicit Times(std::size_t count) : azimuth_s(count), range_s(count) {}
    std::vector<double> azimuth_s, range_s;
};

// --- The raster -------------------------------------------------------------------------------------------------

/** A rectangle of a raster. */
struct Block {
    std::int32_t first_line, lines, first_sample, samples;

    [[nodiscard]] bool lies_in(const RasterDescription& raster) const {
        return std::min({first_line, lines, first_sample, samples}) >= 0 &&
               std::int64_t{first_line} + lines <= raster.NrOfLinesPerImage &&
               std::int64_t{first_sample} + samples <= raster.NrOfPixelsPerLine;
    }
    [[nodiscard]] std::optional<std::int64_t> bytes(int cell_type) const {
        return (quo::Checked<std::int64_t>{lines} * samples * quo::sample_size(cell_type)).value();
    }
};

/** The status of reading a block that has samples. */
int read_block(const DataFile& raster, const Block& block, int cell_type, void* to) {
    const auto region =
        quo::region_of_samples(raster, block.first_line, block.lines, block.first_sample, block.samples);
    if (!region) return QUO_REFUSED;
    quo::RasterStream stream;
    if (!stream.open(raster.FileName, quo::RasterStream::Mode::kRead)) return QUO_NOT_OPENED;
    const auto row = block.samples * static_cast<std::int64_t>(quo::sample_size(cell_type));
    const auto kernel = quo::find_kernel(quo::SampleAccess::kAnyRead, raster.CellType, cell_type);
    return quo::read_region(stream, *region, {kernel, block.samples, row, row, raster.ByteOrder == 1},
                            static_cast<char*>(to));
}

/** What is said of a file that no product is in. */
std::string without_object(const char* header) {
    const std::string defect = quorelxml::xmlDefect(header);
    return std::string{header} + ": holds no object of a product" + (defect.empty() ? "" : "; as XML: " + defect);
}

}  // namespace

extern "C" {

int quo_product_open(const char* header, const char* raster, quo_product** product) noexcept {
    quo::CallFrame frame{"quo_product_open", kSource};
    if (!header || !product) return frame.fail(QUO_REFUSED, kNull);
    return quo::guarded(frame, [&] {
        auto made = std::make_shared<OpenProduct>();
        const quo::HeaderSession session{header};  // the pixel grid is read from the same document
        if (access(header, R_OK) != 0)
            return frame.fail(QUO_NOT_OPENED, (std::string{header} + ": cannot be opened").c_str());
        if (const int status = made->header.GSread(header)) return frame.callee(status);
        const int status = raster ? made->raster.read_hdr(raster) : take_described_raster(*made);
        if (status != QUO_OK) return frame.callee(status);
        made->grid_status = read_image_grid(header, made->header, made->grid);
        if (made->grid_status == QUO_NO_MEMORY) return frame.callee(QUO_NO_MEMORY);
        if (!holds_something(*made)) return frame.fail(QUO_REFUSED, without_object(header).c_str());
        *product = open_products().hold(std::move(made));
        return frame.success();
    });
}

int quo_product_close(quo_product* product) noexcept {
    quo::CallFrame frame{"quo_product_close", kSource};
    return open_products().release(product) ? frame.success() : frame.fail(QUO_REFUSED, kNotOpen);
}

int quo_product_length(const quo_product* product, const char* field, std::size_t* length) noexcept {
    return with_field("quo_product_length", product, field, [&](quo::CallFrame& frame, const parElement& element) {
        if (!length) return frame.fail(QUO_REFUSED, kNull);
        *length = length_of(element);
        return frame.success();
    });
}

int quo_product_number(const quo_product* product, const char* field, double* number) noexcept {
    return with_field("quo_product_number", product, field, [&](quo::CallFrame& frame, const parElement& element) {
        if (!number) return frame.fail(QUO_REFUSED, kNull);
        if (element.count != 1 || !copy_numbers(element, number))
            return frame.fail(QUO_REFUSED, "The field does not hold one number");
        return frame.success();
    });
}

int quo_product_numbers(const quo_product* product, const char* field, double* numbers,
                        std::size_t room) noexcept {
    return with_field("quo_product_numbers", product, field,
                      [&](quo::CallFrame& frame, const parElement& element) {
                          if (length_of(element) > room) return frame.fail(QUO_REFUSED, kNoRoom);
                          if (!numbers && element.count > 0) return frame.fail(QUO_REFUSED, kNull);
                          if (!copy_numbers(element, numbers))
                              return frame.fail(QUO_REFUSED, "The field holds a text");
                          return frame.success();
                      });
}

int quo_product_text(const quo_product* product, const char* field, char* text, std::size_t room) noexcept {
    return with_field("quo_product_text", product, field, [&](quo::CallFrame& frame, const parElement& element) {
        if (!text) return frame.fail(QUO_REFUSED, kNull);
        if (element.type != parElement::typeString || element.text_array)
            return frame.fail(QUO_REFUSED, "The field does not hold a text");
        const std::string_view held = static_cast<const char*>(element.pointer);
        if (held.size() >= room) return frame.fail(QUO_REFUSED, kNoRoom);
        quo::copy_bounded(text, room, held);
        return frame.success();
    });
}

int quo_product_to_ground(const quo_product* product, std::size_t count, const double* azimuth_s,
                          const double* range_s, const double* doppler_hz, const double* height_m,
                          double* latitude_deg, double* longitude_deg, double* ground_height_m, double* x_m,
                          double* y_m, double* z_m, double* incidence_deg, double* look_deg, double* fm_rate_hz_s,
                          double* speed_m_s, std::int32_t* status) noexcept {
    const OrbitSamples samples{count, azimuth_s, range_s, doppler_hz, height_m};
    OrbitGround ground;
    ground.latitude_deg = latitude_deg;
    ground.longitude_deg = longitude_deg;
    ground.height_m = ground_height_m;
    ground.x_m = x_m;
    ground.y_m = y_m;
    ground.z_m = z_m;
    ground.incidence_deg = incidence_deg;
    ground.look_deg = look_deg;
    ground.fm_rate_hz_s = fm_rate_hz_s;
    ground.speed_m_s = speed_m_s;
    ground.status = status;
    return with_product("quo_product_to_ground", product, [&](quo::CallFrame& frame, const OpenProduct& open) {
        return see_ground(frame, open, samples, ground);
    });
}

int quo_product_to_radar(const quo_product* product, std::size_t count, const double* latitude_deg,
                         const double* longitude_deg, const double* height_m, const double* x_m, const double* y_m,
                         const double* z_m, const double* doppler_hz, double* azimuth_s, double* range_s,
                         std::int32_t* status) noexcept {
    const OrbitTargets targets{.count = count,
                               .latitude_deg = latitude_deg,
                               .longitude_deg = longitude_deg,
                               .height_m = height_m,
                               .x_m = x_m,
                               .y_m = y_m,
                               .z_m = z_m,
                               .doppler_hz = doppler_hz};
    OrbitSightings seen;
    seen.azimuth_s = azimuth_s;
    seen.range_s = range_s;
    seen.status = status;
    return with_product("quo_product_to_radar", product, [&](quo::CallFrame& frame, const OpenProduct& open) {
        if (const char* missing = missing_geometry(open.header, false, doppler_hz != nullptr))
            return frame.fail(QUO_REFUSED, missing);
        return quo::pass_on(frame, open.header.orbit.earth2sat(targets, seen));
    });
}

int quo_product_pixels_to_times(const quo_product* product, std::size_t count, const double* line,
                                const double* sample, double* azimuth_s, double* range_s,
                                std::int32_t* status) noexcept {
    const std::array inputs{line, sample};
    const std::array outputs{azimuth_s, range_s};
    return with_pixels(
        "quo_product_pixels_to_times", product, {count, inputs, outputs, status},
        [&](quo::CallFrame& frame, const OpenProduct& open) {
            return quo::pass_on(frame, open.grid.pixelTimes({count, line, sample}, {azimuth_s, range_s, status}));
        });
}

int quo_product_times_to_pixels(const quo_product* product, std::size_t count, const double* azimuth_s,
                                const double* range_s, double* line, double* later_line, double* sample,
                                std::int32_t* status) noexcept {
    const std::array inputs{azimuth_s, range_s};
    const std::array outputs{line, later_line, sample};
    return with_pixels("quo_product_times_to_pixels", product, {count, inputs, outputs, status},
                       [&](quo::CallFrame& frame, const OpenProduct& open) {
                           return quo::pass_on(frame, open.grid.timePixels({count, azimuth_s, range_s},
                                                                           {line, later_line, sample, status}));
                       });
}

int quo_product_pixels_to_ground(const quo_product* product, std::size_t count, const double* line,
                                 const double* sample, const double* height_m, double* latitude_deg,
                                 double* longitude_deg, double* ground_height_m, double* x_m, double* y_m,
                                 double* z_m, double* incidence_deg, double* look_deg,
                                 std::int32_t* status) noexcept {
    const std::array inputs{line, sample, height_m};
    const std::array outputs{latitude_deg, longitude_deg, ground_height_m, x_m, y_m, z_m, incidence_deg, look_deg};
    OrbitGround ground;
    ground.latitude_deg = latitude_deg;
    ground.longitude_deg = longitude_deg;
    ground.height_m = ground_height_m;
    ground.x_m = x_m;
    ground.y_m = y_m;
    ground.z_m = z_m;
    ground.incidence_deg = incidence_deg;
    ground.look_deg = look_deg;
    ground.status = status;
    return with_pixels(
        "quo_product_pixels_to_ground", product, {count, inputs, outputs, status},
        [&](quo::CallFrame& frame, const OpenProduct& open) {
            Times times{count};
            const int failed =
                open.grid.pixelTimes({count, line, sample}, {times.azimuth_s.data(), times.range_s.data()});
            if (failed) return frame.callee(failed);
            return see_ground(frame, open,
                              {count, times.azimuth_s.data(), times.range_s.data(), nullptr, height_m}, ground);
        });
}

int quo_product_ground_to_pixels(const quo_product* product, std::size_t count, const double* latitude_deg,
                                 const double* longitude_deg, const double* height_m, const double* x_m,
                                 const double* y_m, const double* z_m, double* line, double* later_line,
                                 double* sample, std::int32_t* status) noexcept {
    const std::array inputs{latitude_deg, longitude_deg, height_m, x_m, y_m, z_m};
    const std::array outputs{line, later_line, sample};
    const OrbitTargets targets{.count = count,
                               .latitude_deg = latitude_deg,
                               .longitude_deg = longitude_deg,
                               .height_m = height_m,
                               .x_m = x_m,
                               .y_m = y_m,
                               .z_m = z_m};
    return with_pixels("quo_product_ground_to_pixels", product, {count, inputs, outputs, status},
                       [&](quo::CallFrame& frame, const OpenProduct& open) {
                           Times times{count};
                           std::vector<std::int32_t> seen(count);
                           const int failed = open.header.orbit.earth2sat(
                               targets, {times.azimuth_s.data(), times.range_s.data(), seen.data()});
                           if (failed) return frame.callee(failed);
                           const int placed =
                               open.grid.timePixels({count, times.azimuth_s.data(), times.range_s.data()},
                                                    {line, later_line, sample, status});
                           for (std::size_t i = 0; status && i < count; ++i)
                               if (seen[i] != QUO_OK) status[i] = seen[i];
                           return quo::pass_on(frame, placed);
                       });
}

int quo_product_raster(const quo_product* product, std::int32_t* lines, std::int32_t* samples,
                       std::int32_t* cell_type) noexcept {
    return with_product("quo_product_raster", product, [&](quo::CallFrame& frame, const OpenProduct& open) {
        if (lines) *lines = open.raster.NrOfLinesPerImage;
        if (samples) *samples = open.raster.NrOfPixelsPerLine;
        if (cell_type) *cell_type = has_raster(open) ? open.raster.CellType : CELL_NOT_SET;
        return frame.success();
    });
}

int quo_product_read(const quo_product* product, std::int32_t first_line, std::int32_t lines,
                     std::int32_t first_sample, std::int32_t samples, std::int32_t cell_type, void* block,
                     std::size_t room) noexcept {
    return with_product("quo_product_read", product, [&](quo::CallFrame& frame, const OpenProduct& open) {
        if (!has_raster(open)) return frame.fail(QUO_REFUSED, "The product has no raster");
        const Block wanted{first_line, lines, first_sample, samples};
        if (!wanted.lies_in(open.raster)) return frame.fail(QUO_REFUSED, "The block is not within the raster");
        if (!quo::find_kernel(quo::SampleAccess::kAnyRead, open.raster.CellType, cell_type))
            return frame.fail(QUO_REFUSED, "The raster's samples cannot be read as this type");
        const auto bytes = wanted.bytes(cell_type);
        if (!bytes || std::cmp_greater(*bytes, room)) return frame.fail(QUO_REFUSED, kNoRoom);
        if (*bytes == 0) return frame.success();
        if (!block) return frame.fail(QUO_REFUSED, kNull);
        const int failed = read_block(open.raster, wanted, cell_type, block);
        if (!failed) return frame.success();
        char message[768];
        quo::format_bounded(message, sizeof message, "%s: %s", open.raster.FileName, quo::raster_failure(failed));
        return frame.fail(failed, message);
    });
}

}  // extern "C"
