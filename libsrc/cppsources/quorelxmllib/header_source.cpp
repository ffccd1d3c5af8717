// SPDX-License-Identifier: Apache-2.0
#include "quorelxmllib/header_source.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>

#include "quo_base/quorelxml_v2.h"
#include "sarutillib/ground/transfer.h"

namespace quo {
namespace {

/** The status of a file that a system call failed on: whatever is not certain to be absent may be whole. */
int unread(int error) noexcept {
    errno = error;
    if (error == ENOENT || error == ENOTDIR) return QUO_REFUSED;
    return error == ENOMEM || error == EFBIG ? QUO_NO_MEMORY : QUO_READ_FAILED;
}

}  // namespace

int HeaderSource::open(const char* file) noexcept {
    file_ = Descriptor{retried([=] { return ::open(file, O_RDONLY | O_CLOEXEC); })};
    struct stat found {};
    if (!file_ || ::fstat(file_.get(), &found) != 0) return unread(errno);
    if (S_ISDIR(found.st_mode)) return unread(EISDIR);
    return found.st_size > quorelxml::kMostFileBytes ? unread(EFBIG) : QUO_OK;
}

bool HeaderSource::rewind() noexcept {
    const bool rewound = ::lseek(file_.get(), 0, SEEK_SET) == 0;
    bytes_ = rewound ? 0 : bytes_;
    errno = 0;
    return rewound;
}

int HeaderSource::read(void* source, char* buffer, int length) noexcept {
    auto& self = *static_cast<HeaderSource*>(source);
    const ssize_t got =
        retried([&] { return ::read(self.file_.get(), buffer, static_cast<std::size_t>(length)); });
    if (got > 0) self.bytes_ += got;
    const int error = got < 0 ? errno : self.bytes_ > quorelxml::kMostFileBytes ? EFBIG : 0;
    if (self.error_ == 0) self.error_ = error;
    return error != 0 ? -1 : static_cast<int>(got);
}

int HeaderSource::status() const noexcept { return error_ != 0 ? unread(error_) : QUO_OK; }

}  // namespace quo
