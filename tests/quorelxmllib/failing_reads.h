#ifndef QUO_TESTS_FAILING_READS_H
#define QUO_TESTS_FAILING_READS_H

#include <string>

namespace test {

/** The next opening of a file for reading fails once with `open_error`; or else the read call after `reads` others
 * fails once with EIO. For programs that failing_reads.cpp is linked into. */
class FailingReads {
public:
    FailingReads(const std::string& file, int open_error, int reads = 0);
    ~FailingReads();
    FailingReads(const FailingReads&) = delete;
    FailingReads& operator=(const FailingReads&) = delete;

    /** Whether the failure has happened. */
    [[nodiscard]] static bool happened();
};

}  // namespace test

#endif
