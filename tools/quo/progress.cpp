#include "progress.h"

#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <string>

#include "number.h"

namespace tool {
namespace {

constexpr unsigned kCallsPerLook = 256;  // the clock is read once for so many rows
constexpr std::size_t kWidth = 40;

std::string bar(double share) {
    const auto full = static_cast<std::size_t>(share * static_cast<double>(kWidth));
    return "[" + std::string(full, '=') + std::string(kWidth - full, ' ') + "] " +
           std::to_string(static_cast<int>(share * 100.0)) + " %";
}

}  // namespace

Progress::Progress(Unit unit)
    : terminal_{isatty(STDERR_FILENO) == 1},
      unit_{unit},
      start_{Clock::now()},
      next_{start_ + std::chrono::milliseconds{500}} {}

Progress::~Progress() { wipe(); }

void Progress::show(std::int64_t done, std::int64_t in_all, std::int64_t rows) {
    if (!terminal_ || ++calls_ % kCallsPerLook != 0 || Clock::now() < next_) return;
    next_ = Clock::now() + std::chrono::milliseconds{100};
    const double share =
        in_all > 0 ? std::clamp(static_cast<double>(done) / static_cast<double>(in_all), 0.0, 1.0) : 0.0;
    const std::string text = (in_all > 0 ? bar(share) + "  " : "") + std::to_string(rows) + " rows";
    draw(text);
}

void Progress::step(std::int64_t done, std::int64_t in_all) {
    const auto now = Clock::now();
    if (!terminal_ || now < next_ || in_all <= 0 || done <= 0) return;
    next_ = now + std::chrono::milliseconds{100};
    const double share = std::clamp(static_cast<double>(done) / static_cast<double>(in_all), 0.0, 1.0);
    const double elapsed_s = std::chrono::duration<double>(now - start_).count();
    std::string text = bar(share);
    if (unit_ == Unit::kBytes) text += "  " + fixed(static_cast<double>(done) / elapsed_s / 1e6, 0) + " MB/s";
    draw(text + "  " + fixed(elapsed_s * (1.0 - share) / share, 0) + " s left  ");
}

void Progress::draw(const std::string& text) {
    std::fprintf(stderr, "\r%s", text.c_str());
    visible_ = true;
}

void Progress::wipe() {
    if (!visible_) return;
    std::fputs("\r\033[K", stderr);
    visible_ = false;
}

}  // namespace tool
