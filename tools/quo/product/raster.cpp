// SPDX-License-Identifier: Apache-2.0
#include "raster.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <complex>
#include <filesystem>
#include <optional>
#include <system_error>
#include <type_traits>

#include "document.h"
#include "failure.h"
#include "interrupt.h"
#include "number.h"
#include "sarutillib/ground/letters.h"

namespace tool {
namespace {

constexpr std::array<std::string_view, 10> kNames{"FLOAT_COMPLEX", "FLOAT32", "DOUBLE_COMPLEX", "FLOAT64",
                                                  "INT32_COMPLEX", "INT32",   "SHORT_COMPLEX",  "INT16",
                                                  "INT8_COMPLEX",  "INT8"};

template <typename T>
constexpr bool kIsComplex = std::is_same_v<T, fcomplex> || std::is_same_v<T, dcomplex>;

std::optional<int> index_of(std::string_view text, int otherwise) {
    return text.empty() ? otherwise : whole_number(text);
}

// 8-bit samples, which the library's typed access leaves to its callers; they have no byte order.
double widened(char part) { return static_cast<signed char>(part); }
template <typename T>
void widen(const std::vector<char>& from, T* to) {
    std::ranges::transform(from, to, [](char part) { return static_cast<T>(widened(part)); });
}
template <typename T>
void widen(const std::vector<char>& from, std::complex<T>* to) {
    widen(from, reinterpret_cast<T*>(to));
}

char narrowed(double value) {
    return static_cast<char>(std::isnan(value) ? 0.0 : std::clamp(std::round(value), -128.0, 127.0));
}
void narrow(const double* from, std::vector<char>& to) {
    std::transform(from, from + to.size(), to.begin(), narrowed);
}
void narrow(const dcomplex* from, std::vector<char>& to) { narrow(reinterpret_cast<const double*>(from), to); }

void go_to(BufferFile& file, std::int64_t offset) {
    file.seek(offset - file.tell(), BufferFile::FROM_CURRENT);  // from the start, a seek to 0 does nothing
}

std::size_t stored_size(const RasterDescription& raster, const Tile& tile) {
    return tile.size() * static_cast<std::size_t>(raster.element_sizeof());
}

bool is_narrow(const RasterDescription& raster) { return raster.CellType >= INT8_COMPLEX; }

/** What a name stands for; throws Failure where the system does not tell. */
std::filesystem::file_type kind_of(const std::string& name) {
    std::error_code error;
    const auto kind = std::filesystem::status(name, error).type();
    if (kind == std::filesystem::file_type::none) throw Failure(name + ": " + error.message());
    return kind;
}
bool can_be_replaced(const std::string& name) {
    const auto kind = kind_of(name);
    return kind == std::filesystem::file_type::not_found || kind == std::filesystem::file_type::regular;
}

std::string cause_of(const BufferFile& file) {
    return file.systemError() != 0 ? std::generic_category().message(file.systemError())
                                   : status_text(file.status());
}

// The first values that are rounded beyond a type.
struct Beyond {
    double low, high;
};
std::optional<Beyond> beyond(int cell_type) {
    switch (cell_type) {
        case INT32:
        case INT_COMPLEX:
            return Beyond{-2147483648.5, 2147483647.5};
        case INT16:
        case SHORT_COMPLEX:
            return Beyond{-32768.5, 32767.5};
        case INT8:
        case INT8_COMPLEX:
            return Beyond{-128.5, 127.5};
        default:
            return std::nullopt;
    }
}

bool is_lost(double value) { return std::isnan(value); }
bool is_lost(const dcomplex& value) { return std::isnan(value.real()) || std::isnan(value.imag()); }
bool is_clipped(double value, const Beyond& limit) { return value <= limit.low || value >= limit.high; }
bool is_clipped(const dcomplex& value, const Beyond& limit) {
    return !is_lost(value) && (is_clipped(value.real(), limit) || is_clipped(value.imag(), limit));
}

template <typename T>
void count_losses(const T* from, std::size_t count, int cell_type, Losses& losses) {
    const auto limit = beyond(cell_type);
    if (!limit) return;
    for (const T* value = from; value != from + count; ++value) {
        losses.lost += is_lost(*value) ? 1 : 0;
        losses.clipped += is_clipped(*value, *limit) ? 1 : 0;
    }
}

}  // namespace

void read_description(const std::string& name, DataFile& raster) {
    const std::string side_file = name + ".hdr";
    require_regular_file(name);
    if (!std::filesystem::exists(side_file) && Document::in(name)) throw Failure(name + ": describes no raster");
    require_regular_file(side_file);
    if (raster.read_hdr(name.c_str()) != QUO_OK)
        throw Failure(side_file + ": no complete description of a raster");
    const std::int64_t size = raster.rasterSize();
    if (size < 0) throw Failure(side_file + ": describes no possible raster");
    std::error_code error;
    const auto length = std::filesystem::file_size(name, error);
    if (error) throw Failure(name + ": " + error.message());
    if (length < static_cast<std::uintmax_t>(size)) {
        throw Failure(name + ": has " + std::to_string(length) + " bytes, its description needs " +
                      std::to_string(size));
    }
}

void read_samples_description(const std::string& name, DataFile& raster) {
    read_description(name, raster);
    if (raster.NrOfLinesPerImage < 1 || raster.NrOfPixelsPerLine < 1) throw Failure(name + ": is empty");
}

std::string type_name(int cell_type) {
    return cell_type >= 0 && static_cast<std::size_t>(cell_type) < kNames.size()
               ? std::string{kNames[static_cast<std::size_t>(cell_type)]}
               : std::to_string(cell_type);
}

std::vector<std::string> type_names() { return {kNames.begin(), kNames.end()}; }

int type_of(std::string_view name) {
    const auto* found = std::ranges::find(kNames, quo::upper(std::string{name}));
    if (found == kNames.end())
        throw WrongUse("no cell type " + std::string{name} + "; there are " + quo::joined(kNames));
    return static_cast<int>(found - kNames.begin());
}

Cut cut_of(std::string_view text, int length, const char* option) {
    const auto colon = text.find(':');
    const auto first = index_of(text.substr(0, colon), 0);
    const auto last = colon == std::string_view::npos ? std::nullopt : index_of(text.substr(colon + 1), length);
    if (!first || !last || *first < 0 || *last > length || *first >= *last) {
        throw WrongUse(std::string{option} + " " + std::string{text} + ": no part of 0:" + std::to_string(length));
    }
    return {*first, *last};
}

std::int64_t sample_offset(const RasterDescription& raster, std::int64_t line, std::int64_t sample) {
    const std::int64_t size = raster.element_sizeof();
    return raster.HeaderOffset + line * (raster.NrOfPixelsPerLine * size + raster.RowPrefix) + raster.RowPrefix +
           sample * size;
}

bool holds_every_value(const RasterDescription& to, const RasterDescription& from) {
    const auto part = [](const RasterDescription& raster) {
        return raster.element_sizeof() / (1 + raster.is_complex());
    };
    return beyond(to.CellType) && beyond(from.CellType) && part(from) <= part(to);
}

RasterReader::RasterReader(std::string name, const RasterDescription& description)
    : name_{std::move(name)}, file_{name_.c_str()} {
    file_.copyDescription(description);
    file_.open(BufferFile::READ);
    if (!file_.is_open()) throw Failure(name_ + ": cannot be opened: " + cause_of(file_));
}

void RasterReader::fail() const {
    throw_if_interrupted();
    throw Failure(name_ + ": cannot be read: " + cause_of(file_));
}

void RasterReader::read(const Tile& tile, char* to) {
    // Parts of lines that are nearer to each other are read together with what lies between.
    constexpr std::int64_t kSmallGap = 4096, kAtOnce = 1 << 19;
    const std::int64_t distance = sample_offset(file_, 1, 0) - sample_offset(file_, 0, 0);
    const auto part = static_cast<std::int64_t>(tile.samples) * file_.element_sizeof();
    const int most =
        distance - part > kSmallGap ? 1 : static_cast<int>(std::max(kAtOnce / distance, std::int64_t{1}));
    for (int line = 0; line < tile.lines; line += most) {
        const int lines = std::min(most, tile.lines - line);
        const std::int64_t bytes = (lines - 1) * distance + part;
        lines_.resize(static_cast<std::size_t>(bytes));
        go_to(file_, sample_offset(file_, tile.first_line + line, tile.first_sample));
        if (file_.read(lines_.data(), static_cast<int>(bytes)) != bytes) fail();
        for (int i = 0; i < lines; ++i, to += part) std::copy_n(lines_.data() + i * distance, part, to);
    }
}

template <typename T>
void RasterReader::read(const Tile& tile, T* to) {
    if constexpr (!kIsComplex<T>) {
        if (file_.is_complex() != 0) fail();
    } else {
        if (file_.is_complex() == 0) {
            real_.resize(tile.size());
            read(tile, real_.data());
            std::copy(real_.begin(), real_.end(), to);
            return;
        }
    }
    if (!is_narrow(file_)) {
        file_.readbuffer(to, tile.first_line, tile.lines, tile.first_sample, tile.samples);
        if (file_.status() != QUO_OK) fail();
        return;
    }
    narrow_.resize(stored_size(file_, tile));
    read(tile, narrow_.data());
    widen(narrow_, to);
}
template void RasterReader::read(const Tile&, float*);
template void RasterReader::read(const Tile&, double*);
template void RasterReader::read(const Tile&, fcomplex*);
template void RasterReader::read(const Tile&, dcomplex*);

NewRaster::NewRaster(const std::string& name, const RasterDescription& description) : name_{name} {
    if (name == "-") throw WrongUse("-: a raster needs a side file, for which standard output has no room");
    for (const std::string& file : {name, name + ".hdr"}) {
        if (!can_be_replaced(file)) throw Failure(file + ": is no regular file");
    }
    file_.copyDescription(description);
    file_.setFilename(name.c_str());
    const int status = file_.create();
    if (status == QUO_REFUSED) throw Failure(name + ": name too long");
    if (status != QUO_OK) throw Failure(name + ": cannot be created with its side file: " + cause_of(file_));
}

void NewRaster::fail() const {
    throw_if_interrupted();
    throw Failure(name_ + ": cannot be written: " + cause_of(file_));
}

void NewRaster::write(const Tile& tile, const char* from) {
    const bool together = tile.samples == file_.NrOfPixelsPerLine && file_.RowPrefix == 0;
    const int parts = together ? 1 : tile.lines, bytes = static_cast<int>(stored_size(file_, tile)) / parts;
    for (int line = 0; line < parts; ++line, from += bytes) {
        go_to(file_, sample_offset(file_, tile.first_line + line, tile.first_sample));
        if (file_.write(from, bytes) != bytes) fail();
    }
}

void NewRaster::copy_bytes(std::int64_t offset, RasterReader& from, std::int64_t from_offset, std::int64_t bytes) {
    go_to(from.file_, from_offset);
    go_to(file_, offset);
    const int status = file_.copyFrom(from.file_, bytes);
    if (status == QUO_READ_FAILED) from.fail();
    if (status != QUO_OK) fail();
}

template <typename T>
void NewRaster::write(const Tile& tile, const T* from) {
    if constexpr (std::is_same_v<T, double> || std::is_same_v<T, dcomplex>) {
        if (counts_losses_) count_losses(from, tile.size(), file_.CellType, losses_);
        if (is_narrow(file_)) {
            narrow_.resize(stored_size(file_, tile));
            narrow(from, narrow_);
            write(tile, narrow_.data());
            return;
        }
    }
    file_.writebuffer(from, tile.first_line, tile.lines, tile.first_sample, tile.samples);
    if (file_.status() != QUO_OK) fail();
}
template void NewRaster::write(const Tile&, const float*);
template void NewRaster::write(const Tile&, const double*);
template void NewRaster::write(const Tile&, const fcomplex*);
template void NewRaster::write(const Tile&, const dcomplex*);

void NewRaster::commit() {
    throw_if_interrupted();
    if (file_.commit() != QUO_OK) fail();
    say_losses();
}

void NewRaster::commit(const std::string& from, const RasterDerivation& how) {
    throw_if_interrupted();
    require_done(name_, "cannot be written", [&] { return commit_derived(file_, (from + ".hdr").c_str(), how); });
    say_losses();
}

void NewRaster::say_losses() const {
    const std::string all = std::to_string(std::int64_t{file_.NrOfLinesPerImage} * file_.NrOfPixelsPerLine);
    const auto say = [&](const std::string& what, std::int64_t samples) {
        if (samples > 0)
            complain(name_ + ": " + what + ": " + std::to_string(samples) + " of " + all + " samples");
    };
    say("clipped to the bounds of " + type_name(file_.CellType), losses_.clipped);
    say("no number, written as 0", losses_.lost);
}

}  // namespace tool
