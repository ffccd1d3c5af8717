#ifndef QUO_EXAMPLES_APART_H
#define QUO_EXAMPLES_APART_H

#include <cerrno>
#include <cstddef>
#include <filesystem>
#include <stdexcept>
#include <string>
#include <vector>

namespace example {

/** The files that a program reads and those that it writes. */
struct Files {
    std::vector<std::string> read, written;
};

/** Throws where a file to be written is one that is read, by whatever name or link, or stands there twice: the
 * program would destroy what it needs. Names of no file yet are apart from all. */
inline void require_apart(const Files& files) {
    std::error_code error;
    const auto same = [&](const std::string& a, const std::string& b) {
        return a == b || (std::filesystem::is_regular_file(a, error) && std::filesystem::equivalent(a, b, error));
    };
    const auto refuse = [](const std::string& name) {
        throw std::runtime_error{name + ": would replace a file that the program needs"};
    };
    for (std::size_t i = 0; i < files.written.size(); ++i) {
        for (const std::string& input : files.read)
            if (same(files.written[i], input)) refuse(files.written[i]);
        for (std::size_t k = 0; k < i; ++k)
            if (same(files.written[i], files.written[k])) refuse(files.written[i]);
    }
    errno = 0;  // what looking left would count as an error of the next function of the library
}

}  // namespace example

#endif
