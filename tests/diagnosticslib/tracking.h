// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_TRACKING_H
#define QUO_TESTS_TRACKING_H

#include "quo_base/ckerr.h"
#include "support/diagnostics.h"

namespace test {

/** What exit_ckerr() prints. */
inline std::string leak_report() {
    CapturedStderr captured;
    exit_ckerr();
    return captured.text();
}
/** Its lines, one for each block. */
inline std::string leak_lines() {
    const std::string text = leak_report();
    const auto heading = text.find("coordinates: \n");
    return heading == text.npos ? "" : text.substr(heading + 14);
}

/** Tracking, freshly turned on. No tracked block may be left. */
class Tracking : public testing::Test {
public:
    Tracking() {
        exit_ckerr();
        init_ckerr_locking();
        errno = 0;
    }
    ~Tracking() override {
        EXPECT_EQ(leak_report(), "");
        for (void* block : marks_) free_ckerr(block);
        errno = 0;
    }

protected:
    /** A block that shows in the leak report which function is running. */
    void mark() { marks_.push_back(malloc_ckerr(1)); }

private:
    std::vector<void*> marks_;
};

}  // namespace test

#endif
