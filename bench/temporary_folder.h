// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BENCH_TEMPORARY_FOLDER_H
#define QUO_BENCH_TEMPORARY_FOLDER_H

#include <cstdlib>
#include <filesystem>
#include <stdexcept>
#include <string>

namespace bench {

/** A folder of its own for the files of a benchmark, gone with it. */
class Folder {
public:
    Folder() {
        std::string name = (std::filesystem::temp_directory_path() / "quo_bench_XXXXXX").string();
        if (!mkdtemp(name.data())) throw std::runtime_error("no temporary folder");
        path_ = name;
    }
    ~Folder() {
        std::error_code ignored;
        std::filesystem::remove_all(path_, ignored);
    }
    Folder(const Folder&) = delete;
    Folder& operator=(const Folder&) = delete;

    [[nodiscard]] std::string file(const std::string& name) const { return (path_ / name).string(); }

private:
    std::filesystem::path path_;
};

/** The folder of this program. */
inline const Folder& folder() {
    static const Folder made;
    return made;
}

}  // namespace bench

#endif
