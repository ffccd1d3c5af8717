// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_EXAMPLES_SAME_FILE_H
#define QUO_EXAMPLES_SAME_FILE_H

#include <filesystem>
#include <string>

namespace files {

/** Whether two names lead to one regular file, through links of either kind or other ways to write a path. Names
 * of no file yet lead to none. */
inline bool same_file(const std::string& a, const std::string& b) {
    std::error_code error;
    return std::filesystem::is_regular_file(a, error) && std::filesystem::equivalent(a, b, error);
}

}  // namespace files

#endif
