#ifndef QUO_EXAMPLES_PROGRESS_H
#define QUO_EXAMPLES_PROGRESS_H

#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <string>
#include <utility>

#include "quo_base/debugIO.h"

namespace example {

/** Tells how far a job has come: a percentage on a terminal, or the commands of a waitbar that a parent process
 * draws; nothing where standard error is a file. */
class Progress {
public:
    Progress(std::string title, bool waitbar)
        : title_{std::move(title)}, waitbar_{waitbar}, terminal_{!waitbar && isatty(STDERR_FILENO) == 1} {
        errno = 0;  // that of isatty() would count as the next function's
        if (waitbar_) waitbar_open(title_.c_str());
    }
    ~Progress() {
        if (waitbar_) waitbar_close();
        if (terminal_) std::fputc('\n', stderr);
    }
    Progress(const Progress&) = delete;
    Progress& operator=(const Progress&) = delete;

    void show(double share) {
        const int percent = static_cast<int>(100.0 * std::clamp(share, 0.0, 1.0));
        if (percent == percent_) return;
        percent_ = percent;
        if (waitbar_) waitbar_update(static_cast<float>(percent) / 100.0F);
        if (terminal_) std::fprintf(stderr, "\r%s: %d %%", title_.c_str(), percent);
    }

private:
    std::string title_;
    bool waitbar_, terminal_;
    int percent_ = -1;
};

}  // namespace example

#endif
