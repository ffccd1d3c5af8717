// SPDX-License-Identifier: Apache-2.0
#include "input.h"

#include <fcntl.h>
#include <poll.h>
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
constexpr std::size_t kMostOfLines = 4 * kLongestLine;  // that are given out together
constexpr int kLookForSignals_ms = 50;

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

// A signal may have gone to another thread, or have come just before the wait: that does not end it.
void LineReader::wait_for_input() const {
    pollfd input{.fd = descriptor_, .events = POLLIN, .revents = 0};
    int ready = 0;
    do {
        throw_if_interrupted();
        ready = poll(&input, 1, kLookForSignals_ms);
    } while (ready == 0 || (ready < 0 && errno == EINTR));
}

std::size_t LineReader::read_some(char* to, std::size_t room) {
    ssize_t got = 0;
    do {
        wait_for_input();
        got = read(descriptor_, to, room);
    } while (got < 0 && errno == EINTR);
    if (got < 0) throw Failure(name_ + ": " + system_cause());
    bytes_read_ += got;
    return static_cast<std::size_t>(got);
}

bool LineReader::refill() {
    begin_ = 0;
    end_ = read_some(block_.data(), block_.size());
    return end_ > 0;
}

/** Of the line behind the last one. */
void LineReader::require_length(std::size_t length) const {
    if (length > kLongestLine)
        throw Failure(name_ + ": line " + std::to_string(line_number_ + 1) + " is longer than 1 MiB");
}

bool LineReader::next(std::string& line) {
    line.clear();
    bool found = false;
    while (begin_ < end_ || refill()) {
        const char* first = block_.data() + begin_;
        const char* last = block_.data() + end_;
        const char* feed = std::find(first, last, '\n');
        line.append(first, feed);
        require_length(line.size());
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

std::string LineReader::next_lines(std::size_t most) {
    const std::int64_t last = line_number_ + static_cast<std::int64_t>(most);
    std::string text{block_.data() + begin_, end_ - begin_};
    std::size_t whole = 0;  // what of it is whole lines
    const auto is_enough = [&] { return line_number_ == last || whole >= kMostOfLines; };
    while (true) {
        for (std::size_t feed = 0; !is_enough() && (feed = text.find('\n', whole)) != text.npos; ++line_number_) {
            require_length(feed - whole);
            whole = feed + 1;
        }
        if (is_enough()) break;
        require_length(text.size() - whole);
        const std::size_t filled = text.size();
        text.resize(filled + kBlock);
        text.resize(filled + read_some(text.data() + filled, kBlock));
        if (text.size() > filled) continue;
        if (whole < filled) ++line_number_;  // the last line may lack its line feed
        whole = filled;
        break;
    }
    // All whole lines before the last piece that was read have been taken: what is left is no longer than a piece.
    begin_ = 0;
    end_ = text.copy(block_.data(), block_.size(), whole);
    text.resize(whole);
    return text;
}

}  // namespace tool
