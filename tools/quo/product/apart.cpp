// SPDX-License-Identifier: Apache-2.0
#include "apart.h"

#include <filesystem>

#include "common/same_file.h"
#include "failure.h"
#include "product.h"

namespace tool {
namespace {

using files::same_file;

/** What a link leads to is replaced where it lies. A file without a description of its own is none of ours: it may
 * be a measurement that an import has left in its place. */
void require_own_raster(const std::string& out) {
    std::error_code error;
    if (!std::filesystem::is_symlink(out, error)) return;
    const std::string target = std::filesystem::weakly_canonical(out, error).string();
    if (!std::filesystem::exists(target, error) || std::filesystem::exists(target + ".hdr", error)) return;
    throw Failure(out + ": is a link to " + target + ", which has no description of its own; name another output");
}

}  // namespace

std::vector<std::string> raster_files(const std::string& raster) { return {raster, raster + ".hdr"}; }

std::vector<std::string> header_files(const std::string& header) {
    const auto raster = raster_of(header);
    return raster ? std::vector{header, *raster} : std::vector{header};
}

void require_apart(const std::vector<std::string>& read, const std::vector<std::string>& written) {
    for (std::size_t i = 0; i < written.size(); ++i) {
        for (const std::string& input : read) {
            if (!same_file(written[i], input)) continue;
            throw Failure(written[i] + ": would replace " + (written[i] == input ? "what" : input + ", which") +
                          " the job reads");
        }
        for (std::size_t k = 0; k < i; ++k)
            if (same_file(written[i], written[k]))
                throw Failure(written[i] + ": is the same file as " + written[k]);
    }
}

void require_raster_apart(const std::string& in, const std::string& out) {
    const bool in_place = same_file(out, in) && same_file(out + ".hdr", in + ".hdr");
    if (!in_place) require_apart(raster_files(in), raster_files(out));
    require_own_raster(out);
}

}  // namespace tool
