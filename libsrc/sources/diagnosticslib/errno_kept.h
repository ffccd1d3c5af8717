// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_ERRNO_KEPT_H
#define QUO_ERRNO_KEPT_H

#include <cerrno>

namespace quo {

/** Gives errno its old value back: diagnostics must not change what the caller finds there. */
class ErrnoKept {
public:
    ErrnoKept() noexcept = default;
    ~ErrnoKept() { errno = kept_; }
    ErrnoKept(const ErrnoKept&) = delete;
    ErrnoKept& operator=(const ErrnoKept&) = delete;

private:
    int kept_ = errno;
};

}  // namespace quo

#endif
