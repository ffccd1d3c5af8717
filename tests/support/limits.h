// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_SUPPORT_LIMITS_H
#define QUO_TESTS_SUPPORT_LIMITS_H

#include <sys/resource.h>

#include "support/prelude.h"

namespace test {

/** No file can grow beyond so many bytes: what a full disk looks like to a writer. */
class FullDisk {
public:
    explicit FullDisk(rlim_t bytes) : handler_{std::signal(SIGXFSZ, SIG_IGN)} {
        getrlimit(RLIMIT_FSIZE, &before_);
        const rlimit limit{bytes, before_.rlim_max};
        setrlimit(RLIMIT_FSIZE, &limit);
    }
    ~FullDisk() {
        setrlimit(RLIMIT_FSIZE, &before_);
        (void)std::signal(SIGXFSZ, handler_);
        errno = 0;
    }
    FullDisk(const FullDisk&) = delete;
    FullDisk& operator=(const FullDisk&) = delete;

private:
    void (*handler_)(int);
    rlimit before_{};
};

/** The rights of an ordinary user, also where the tests run as the administrator. */
class OrdinaryUser {
public:
    OrdinaryUser() : before_{geteuid()} {
        // A child that is this user in all respects may look into itself, as the search for leaks does.
        if (before_ == 0 && setresuid(kNobody, kNobody, before_) != 0)
            throw std::runtime_error("cannot give up rights");
    }
    ~OrdinaryUser() {
        if (before_ == 0 && setresuid(before_, before_, before_) != 0) std::abort();
        errno = 0;
    }
    OrdinaryUser(const OrdinaryUser&) = delete;
    OrdinaryUser& operator=(const OrdinaryUser&) = delete;

private:
    static constexpr uid_t kNobody = 65534;
    uid_t before_;
};

}  // namespace test

#endif
