// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_SUPPORT_FAULTS_H
#define QUO_TESTS_SUPPORT_FAULTS_H

/* System calls that fail on demand, whoever makes them: the library, libc or libxml2. A filter of the kernel hands
 * every call of interest to a handler of the process; those that concern one folder are counted and, where the
 * fault says so, fail. A program that cannot be changed gets the handler as a preloaded library, together with the
 * allocator of failing_memory.h. */

namespace test {

enum class Call {
    kOpen,
    kRead,
    kWrite,
    kSync,
    kClose,
    kRename,
    kLink,
    kResize,
    kMode,
    kOwner,
    kLock,
    kCopy,
    kStat,
    kAccess,
    kReadLink,
    kUnlink,
    kAny,
    kMemory,  // no system call: an allocation, which the job's runner refuses
    kNever
};

/** What happens instead of an error number: only half of the bytes are moved; the process is killed. */
constexpr int kShort = -1, kKill = -2;

struct Fault {
    Call call = Call::kNever;
    int error = 0;
    long nth = 0;  ///< counted from 1
    bool forever = false;
};

/** What a watched process is told and tells; in memory that it shares with its parent. */
struct Watch {
    Fault fault;
    char folder[200];                                 ///< only files below it count
    long calls;                                       ///< of the kind that is to fail
    long counted[2][static_cast<int>(Call::kNever)];  ///< calls of each kind; of them those that move bytes
    long descriptors;                                 ///< of files in the folder that are open
    bool reached;                                     ///< the fault has happened
    bool uses_files;                                  ///< of a preloaded program: it has memory up to the first
    bool returned;                                    ///< the job came back: what is open then stays open
    bool blocks;                                      ///< it left tracked memory
};

/** From here on this process, which must not end but by exec or exit, is watched. Its system calls on the folder
 * fail as watch->fault says; a file is not really flushed. Throws where the system has no such filter. */
void start_watching(Watch* watch);

/** Names the shared memory, as a descriptor's number, to a program that faults.cpp is preloaded into. */
constexpr const char* kWatchVariable = "QUO_WATCH";

}  // namespace test

#endif
