#include "failing_reads.h"

#include <fcntl.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <cstdarg>

namespace {

std::string failing_file;
int error_of_open = 0;
int reads_left = -1;  // -1: no read fails
bool has_failed = false;

int fail(int error) {
    has_failed = true;
    errno = error;
    return -1;
}

}  // namespace

test::FailingReads::FailingReads(const std::string& file, int open_error, int reads) {
    failing_file = file;
    error_of_open = open_error;
    reads_left = open_error != 0 ? -1 : reads;
    has_failed = false;
}
test::FailingReads::~FailingReads() {
    error_of_open = 0;
    reads_left = -1;
}
bool test::FailingReads::happened() { return has_failed; }

// In front of the system's own.
extern "C" int open(const char* path, int flags, ...) {
    std::va_list arguments;
    va_start(arguments, flags);
    const unsigned mode = (flags & O_CREAT) != 0 ? va_arg(arguments, unsigned) : 0;
    va_end(arguments);
    if (error_of_open != 0 && (flags & O_ACCMODE) == O_RDONLY && path == failing_file) {
        const int error = error_of_open;
        error_of_open = 0;
        return fail(error);
    }
    return static_cast<int>(syscall(SYS_openat, AT_FDCWD, path, flags, mode));
}

extern "C" ssize_t read(int file, void* to, std::size_t size) {
    if (reads_left >= 0 && reads_left-- == 0) return fail(EIO);
    return syscall(SYS_read, file, to, size);
}
