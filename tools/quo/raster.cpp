#include "raster.h"

#include <unistd.h>

#include <algorithm>
#include <array>
#include <cctype>
#include <charconv>
#include <filesystem>

#include "failure.h"

namespace tool {
namespace {

constexpr std::array<std::string_view, 10> kNames{"FLOAT_COMPLEX", "FLOAT32", "DOUBLE_COMPLEX", "FLOAT64",
                                                  "INT32_COMPLEX", "INT32",   "SHORT_COMPLEX",  "INT16",
                                                  "INT8_COMPLEX",  "INT8"};
constexpr std::int64_t kBlockBytes = 8 << 20;

std::optional<int> index_of(std::string_view text, int otherwise) {
    if (text.empty()) return otherwise;
    int value = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    return error == std::errc{} && end == text.data() + text.size() ? std::optional{value} : std::nullopt;
}

}  // namespace

void read_description(const std::string& name, DataFile& raster) {
    if (raster.read_hdr(name.c_str()) != QUO_OK) throw Failure(name + ".hdr: no complete description of a raster");
    const std::int64_t size = raster.rasterSize();
    if (size < 0) throw Failure(name + ".hdr: describes no possible raster");
    std::error_code error;
    const auto length = std::filesystem::file_size(name, error);
    if (error) throw Failure(name + ": " + error.message());
    if (length < static_cast<std::uintmax_t>(size)) {
        throw Failure(name + ": has " + std::to_string(length) + " bytes, its description needs " +
                      std::to_string(size));
    }
}

std::string type_name(int cell_type) {
    return cell_type >= 0 && static_cast<std::size_t>(cell_type) < kNames.size()
               ? std::string{kNames[static_cast<std::size_t>(cell_type)]}
               : std::to_string(cell_type);
}

int type_of(std::string_view name) {
    const auto same = [name](std::string_view known) {
        return std::ranges::equal(
            name, known, {}, [](unsigned char c) { return std::toupper(c); },
            [](unsigned char c) { return static_cast<int>(c); });
    };
    const auto* found = std::ranges::find_if(kNames, same);
    if (found == kNames.end()) throw WrongUse("no cell type " + std::string{name});
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

int block_lines(std::int64_t bytes_per_line, int lines) {
    return static_cast<int>(
        std::clamp<std::int64_t>(kBlockBytes / std::max<std::int64_t>(bytes_per_line, 1), 1, lines));
}

NewRaster::NewRaster(const std::string& name, const RasterDescription& like) : name_{name} {
    if (name.size() + 40 > 511) throw Failure(name + ": name too long");
    std::error_code error;
    const auto kind = std::filesystem::status(name, error).type();
    if (kind != std::filesystem::file_type::not_found && kind != std::filesystem::file_type::regular) {
        throw Failure(name + ": is no regular file");
    }
    file_.copyDescription(like);
}

void NewRaster::open() {
    unfinished_ = name_ + ".unfinished." + std::to_string(getpid());
    file_.setFilename(unfinished_.c_str());
    file_.open(BufferFile::WRITE);
    if (!file_.is_open()) {
        unfinished_.clear();
        throw Failure(name_ + ": cannot be created");
    }
    // Blocks that cannot be written are found by the length of what was written.
}

void NewRaster::commit() {
    file_.close();
    std::error_code error;
    const auto length = std::filesystem::file_size(unfinished_, error);
    if (error || length != static_cast<std::uintmax_t>(file_.rasterSize())) {
        throw Failure(name_ + ": cannot be written, is the disk full?");
    }
    std::filesystem::rename(unfinished_, name_, error);
    if (error) throw Failure(name_ + ": " + error.message());
    unfinished_.clear();
    file_.setFilename(name_.c_str());
    if (file_.writehdr() != QUO_OK) throw Failure(name_ + ".hdr: cannot be written");
}

NewRaster::~NewRaster() {
    file_.close();
    if (!unfinished_.empty()) unlink(unfinished_.c_str());
}

}  // namespace tool
