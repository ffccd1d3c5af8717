// SPDX-License-Identifier: Apache-2.0
/* Imports of annotations, measurements and orbit files of any bytes: taken over whole, or refused with a line and
 * nothing left behind. Before the first line feed stand the lengths of the annotation and the measurement. */

#include <cstdlib>
#include <filesystem>

#include "bytes.h"
#include "quo_base/mission_import.h"

namespace {

using property::require;
namespace fs = std::filesystem;

/** A product's folder in memory. */
class Folder {
public:
    Folder() : path_{"/dev/shm/quo_import" + std::to_string(getpid())} {
        fs::create_directories(path_ / "annotation");
        fs::create_directories(path_ / "measurement");
        fs::create_directories(path_ / "out");
    }
    ~Folder() { fs::remove_all(path_); }
    Folder(const Folder&) = delete;
    Folder& operator=(const Folder&) = delete;

    std::string put(const char* name, std::string_view content) const {
        std::ofstream{path_ / name, std::ios::binary} << content;
        return (path_ / name).string();
    }
    [[nodiscard]] std::string out() const { return (path_ / "out" / "image").string(); }
    [[nodiscard]] bool out_is_empty() const { return fs::is_empty(path_ / "out"); }

private:
    fs::path path_;
};

constexpr const char* kName = "s1a-iw-grd-vv-20211223t051122-20211223t051147-030148-039993-001";

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    setenv("QUO_TIFF_MODULE", QUO_FUZZ_TIFF_MODULE, 1);
    property::Bytes bytes{{reinterpret_cast<const char*>(data), size}};
    const std::string lengths{bytes.take_until('\n')};
    char* behind = nullptr;
    const auto annotation_bytes = std::strtoul(lengths.c_str(), &behind, 10),
               tiff_bytes = std::strtoul(behind, nullptr, 10);
    const Folder folder;
    const std::string annotation =
        folder.put(("annotation/" + std::string{kName} + ".xml").c_str(), bytes.take(annotation_bytes));
    folder.put(("measurement/" + std::string{kName} + ".tiff").c_str(), bytes.take(tiff_bytes));
    const bool with_orbit = !bytes.empty();
    const std::string orbit = folder.put("orbit.EOF", bytes.rest()), raster = folder.out();

    quo_import_request request{};
    request.source = annotation.c_str();
    request.raster = raster.c_str();
    request.orbit_file = with_orbit ? orbit.c_str() : nullptr;
    quo_import_result result{};
    if (quo_import_sentinel1(&request, &result) != 0) {
        require(result.message[0] != '\0', "a refusal has a reason");
        require(folder.out_is_empty(), "a refusal leaves nothing behind");
    } else {
        require(fs::exists(raster) && fs::exists(raster + ".hdr"), "an import has raster and header");
    }
    return 0;
}
