#ifndef QUO_TESTS_SUPPORT_LIMITS_H
#define QUO_TESTS_SUPPORT_LIMITS_H

#include <sys/resource.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <stdexcept>

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
        if (before_ == 0 && seteuid(65534) != 0) throw std::runtime_error("cannot give up rights");
        // Nor may a child of such a user be traced, as looking for its leaks would.
        setenv("LSAN_OPTIONS", "detect_leaks=0", 1);
    }
    ~OrdinaryUser() {
        if (seteuid(before_) != 0) std::abort();
        unsetenv("LSAN_OPTIONS");
        errno = 0;
    }
    OrdinaryUser(const OrdinaryUser&) = delete;
    OrdinaryUser& operator=(const OrdinaryUser&) = delete;

private:
    uid_t before_;
};

}  // namespace test

#endif
