// SPDX-License-Identifier: Apache-2.0
#include "progress.h"

#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <string>

#include "number.h"
#include "quo_base/debugIO.h"

namespace tool {
namespace {

constexpr unsigned kCallsPerLook = 256;  // the clock is read once for so many rows
constexpr std::size_t kWidth = 40;
constexpr double kToldStep = 0.01;  // the waitbar is moved by this much or more

double share_of(std::int64_t done, std::int64_t in_all) {
    return in_all > 0 ? std::clamp(static_cast<double>(done) / static_cast<double>(in_all), 0.0, 1.0) : 0.0;
}

std::string bar(double share) {
    const auto full = static_cast<std::size_t>(share * static_cast<double>(kWidth));
    return "[" + std::string(full, '=') + std::string(kWidth - full, ' ') + "] " +
           std::to_string(static_cast<int>(share * 100.0)) + " %";
}

// Hours, minutes and seconds, such as "1:02:07".
std::string clock_text(double seconds) {
    const auto whole = static_cast<std::int64_t>(std::min(std::ceil(seconds), 1e9));
    const auto two_digits = [](std::int64_t value) { return (value < 10 ? "0" : "") + std::to_string(value); };
    const std::string hours = whole < 3600 ? "" : std::to_string(whole / 3600) + ":";
    return hours + two_digits(whole / 60 % 60) + ":" + two_digits(whole % 60);
}

}  // namespace

Progress::Progress(const char* waitbar_title)
    : waitbar_{waitbar_title != nullptr},
      terminal_{!waitbar_ && isatty(STDERR_FILENO) == 1},
      start_{Clock::now()},
      next_{start_ + std::chrono::milliseconds{500}} {
    if (waitbar_) waitbar_open(waitbar_title);
}

Progress::~Progress() {
    wipe();
    if (waitbar_) waitbar_close();
}

void Progress::show(std::int64_t done, std::int64_t in_all, std::int64_t rows) {
    if (waitbar_ && in_all > 0) tell(share_of(done, in_all));
    if (!terminal_ || ++calls_ % kCallsPerLook != 0 || Clock::now() < next_) return;
    next_ = Clock::now() + std::chrono::milliseconds{100};
    draw((in_all > 0 ? bar(share_of(done, in_all)) + "  " : "") + std::to_string(rows) + " rows");
}

void Progress::step(std::int64_t done, std::int64_t in_all) {
    const double share = share_of(done, in_all);
    if (waitbar_ && in_all > 0) tell(share);
    const auto now = Clock::now();
    if (!terminal_ || now < next_ || share <= 0.0) return;
    next_ = now + std::chrono::milliseconds{100};
    const double elapsed_s = std::chrono::duration<double>(now - start_).count();
    const double speed = static_cast<double>(done) / elapsed_s / 1e6;
    draw(bar(share) + "  " + fixed(speed, 0) + " MB/s  " + clock_text(elapsed_s * (1.0 - share) / share) +
         " left");
}

void Progress::tell(double share) {
    if (share < told_ + kToldStep && !(share == 1.0 && told_ < 1.0)) return;
    waitbar_update(static_cast<float>(share));
    told_ = share;
}

void Progress::draw(const std::string& text) {
    std::fprintf(stderr, "\r%s\033[K", text.c_str());
    visible_ = true;
}

void Progress::wipe() {
    if (!visible_) return;
    std::fputs("\r\033[K", stderr);
    visible_ = false;
}

}  // namespace tool
