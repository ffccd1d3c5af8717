// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_FAULTS_JOBS_H
#define QUO_TESTS_FAULTS_JOBS_H

#include "support/prelude.h"

namespace test {

/** What a job owes to its folder, whatever fails. In all cases: no crash, no file beside those of a run without
 * faults, no descriptor left open, and 0 only where everything is new. */
enum class Promise {
    kOldOrNew,   ///< every file together old or together new
    kReports,    ///< the same, but the status is always 0 and the report tells
    kSilent,     ///< the same, but nothing tells
    kUnchanged,  ///< all old: the job reads, and gives 0 only with what is in the files
    kLists,      ///< the same, but what it lists may tell instead of a message, by the system's own words
    kTells,      ///< writes where the file stands: 0 only where it is new
    kSurvives    ///< nothing more than not to crash
};

using Run = std::function<int()>;
struct Job {
    std::string name;
    Promise promise = Promise::kOldOrNew;
    Run (*prepare)(const std::string& folder) = nullptr;  ///< does what is to be done without faults
    bool killed = false;                                  ///< whether it is killed at random as well
    std::string verb = {};                                ///< a run of the tool instead; "@" stands for the folder
    bool takes_memory = true;                             ///< whether memory is refused
};
const std::vector<Job>& jobs();
void PrintTo(const Job& job, std::ostream* stream);

/** The files that all jobs find, and for imports a product. */
void lay_out(const std::string& folder, const Job& job);
/** The name of a file in the folder; it lives as long as the process. */
const char* file_in(const std::string& folder, const char* name);

}  // namespace test

#endif
