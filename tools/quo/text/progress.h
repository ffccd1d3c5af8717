// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_PROGRESS_H
#define QUO_TOOL_PROGRESS_H

#include <chrono>
#include <cstdint>
#include <string>

namespace tool {

/** A bar on standard error for jobs that somebody waits for: it shows itself only on a terminal and only when the
 * job takes longer than half a second, and is wiped away at the end. With a waitbar title it leaves the drawing to
 * the parent process instead, whom it tells the share that is done, line by line (quo_base/debugIO.h). */
class Progress {
public:
    /** @param waitbar_title  null: no waitbar */
    explicit Progress(const char* waitbar_title);
    ~Progress();
    Progress(const Progress&) = delete;
    Progress& operator=(const Progress&) = delete;

    /** `done` of `in_all`; in_all 0 where the end is not known, and then the rows are counted instead. */
    void show(std::int64_t done, std::int64_t in_all, std::int64_t rows);
    /** `done` bytes of `in_all`, for jobs that go in large steps: with speed and the time that is left. */
    void step(std::int64_t done, std::int64_t in_all);
    /** Takes the bar away, so that a message can stand in its place. */
    void wipe();

private:
    using Clock = std::chrono::steady_clock;

    void draw(const std::string& text);
    void tell(double share);

    bool waitbar_, terminal_;
    double told_ = -1.0;
    bool visible_ = false;
    unsigned calls_ = 0;
    Clock::time_point start_, next_;
};

}  // namespace tool

#endif
