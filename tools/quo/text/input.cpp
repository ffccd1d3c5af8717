#include "input.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>

#include "failure.h"
#include "interrupt.h"

namespace tool {
namespace {

constexpr std::size_t kBlock = 1 << 16;
constexpr std::size_t kLongestLine = 1 << 20;

}  // namespace

LineReader::LineReader(const std::string& name)
    : name_{name == "-" ? "standard input" : name},
      descriptor_{name == "-" ? STDIN_FILENO : open(name.c_str(), O_RDONLY | O_CLOEXEC)},
      owned_{name != "-"},
      block_(kBlock) {
    if (descriptor_ < 0) throw Failure(name_ + ": " + system_cause());
    struct stat about {};
    if (fstat(descriptor_, &about) == 0 && S_ISREG(about.st_mode)) bytes_in_all_ = about.st_size;
}

LineReader::~LineReader() {
    if (owned_) close(descriptor_);
}

bool LineReader::refill() {
    ssize_t got = 0;
    do {
        throw_if_interrupted();
        got = read(descriptor_, block_.data(), block_.size());
    } while (got < 0 && errno == EINTR);
    if (got < 0) throw Failure(name_ + ": " + system_cause());
    begin_ = 0;
    end_ = static_cast<std::size_t>(got);
    bytes_read_ += got;
    return got > 0;
}

bool LineReader::next(std::string& line) {
    line.clear();
    bool found = false;
    while (begin_ < end_ || refill()) {
        const char* first = block_.data() + begin_;
        const char* last = block_.data() + end_;
        const char* feed = std::find(first, last, '\n');
        line.append(first, feed);
        if (line.size() > kLongestLine)
            throw Failure(name_ + ": line " + std::to_string(line_number_ + 1) + " is longer than 1 MiB");
        found = true;
        begin_ = static_cast<std::size_t>(feed - block_.data());
        if (feed != last) {
            ++begin_;
            break;
        }
    }
    if (found) ++line_number_;
    if (!line.empty() && line.back() == '\r') line.pop_back();
    return found;
}

}  // namespace tool
