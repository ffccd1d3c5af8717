#ifndef QUO_TESTS_SUPPORT_FULL_DISK_H
#define QUO_TESTS_SUPPORT_FULL_DISK_H

#include <sys/resource.h>

#include <cerrno>
#include <csignal>

namespace test {

/** While it stands, no file of the process grows beyond so many bytes: what a full disk does to a write. */
class FullDisk {
public:
    explicit FullDisk(rlim_t bytes) : handler_{std::signal(SIGXFSZ, SIG_IGN)} {
        getrlimit(RLIMIT_FSIZE, &before_);
        const rlimit limit{bytes, before_.rlim_max};
        setrlimit(RLIMIT_FSIZE, &limit);
    }
    ~FullDisk() {
        setrlimit(RLIMIT_FSIZE, &before_);
        static_cast<void>(std::signal(SIGXFSZ, handler_));
        errno = 0;
    }
    FullDisk(const FullDisk&) = delete;
    FullDisk& operator=(const FullDisk&) = delete;

private:
    rlimit before_{};
    void (*handler_)(int);
};

}  // namespace test

#endif
