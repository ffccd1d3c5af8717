// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_CALL_FRAME_H
#define QUO_CALL_FRAME_H

#include <cerrno>
#include <cstddef>
#include <type_traits>
#include <utility>

#include "diagnosticslib/call_stack.h"
#include "quo_base/ckerr.h"

namespace quo {

/** A function whose frame is opened by a helper that several share: its name, and the line where it calls the
 * helper, which its entries tell. Made from the name alone, as the helper's parameter. */
struct SharedCall {
    SharedCall(const char* name, int at = __builtin_LINE()) noexcept : function{name}, line{at} {}
    const char* function;
    int line;
};

/** The ceremony of a tracked function: errno is reported and cleared and the name pushed on entry; leaving without
 * success() frees every block that the call and its callees still hold; the name is popped in any case. Nothing is
 * copied, formatted, allocated, locked or written while all goes well. The frame is the function's first local, on
 * the stack of the thread that runs it. */
class CallFrame {
public:
    /** `function` and `source` are literals: they are kept by address and shown in the report as they stand. */
    CallFrame(const char* function, const char* source, int line = __builtin_LINE()) noexcept
        : function_{function}, source_{source} {
        check_errno(line);
        stack_.push(function);
    }
    CallFrame(const SharedCall& call, const char* source) noexcept
        : function_{call.function}, source_{source}, shared_line_{call.line} {
        check_errno();
        stack_.push(function_);
    }
    ~CallFrame() {
        if (!succeeded_) freeall_ckerr();
        stack_.pop();
    }
    CallFrame(CallFrame&&) = delete;

    /** Reports what a system call left in errno, and clears it. */
    void check_errno(int line = __builtin_LINE()) noexcept {
        if (errno != 0) [[unlikely]]
            report_errno(line);
    }
    /** Clears what a foreign library left in errno: it would show up as an ERROR of the next function. */
    static void drop_errno() noexcept { errno = 0; }

    [[nodiscard]] int success(int line = __builtin_LINE()) noexcept {
        check_errno(line);
        succeeded_ = true;
        return QUO_OK;
    }
    [[nodiscard]] int fail(int status, const char* message, int line = __builtin_LINE()) noexcept {
        return leave(status, message, QUO_ERROR, line);
    }
    [[nodiscard]] int callee(int status, int line = __builtin_LINE()) noexcept {
        return leave(status, "Called function returned ERROR", QUO_ERROR_CALL_TREE, line);
    }
    /** A failure that callers expect, such as a key that is not there: it stays out of the report. */
    [[nodiscard]] int silent(int status) noexcept {
        drop_errno();
        return status;
    }

private:
    [[gnu::cold]] int leave(int status, const char* message, int kind, int line) noexcept {
        check_errno(line);  // the system's own text first, then what the library makes of it
        quo_add_report(message, kind, line_of(line), function_, source_);
        return status;
    }
    /** Clears errno as well: the caller's frame would report the same number again. */
    [[gnu::cold]] void report_errno(int line) noexcept {
        quo_check(errno, line_of(line), function_, source_);
        errno = 0;
    }
    [[nodiscard]] int line_of(int line) const noexcept { return shared_line_ != 0 ? shared_line_ : line; }

    CallStack& stack_ = call_stack();
    const char *function_, *source_;
    int shared_line_ = 0;
    bool succeeded_ = false;
};

/** A frame in the hands of a helper that functions share: entries tell the line where the helper was called.
 * Made from the frame itself, as the helper's parameter. */
class CallerFrame {
public:
    CallerFrame(CallFrame& frame, int line = __builtin_LINE()) noexcept : frame_{frame}, line_{line} {}

    [[nodiscard]] int success() const noexcept { return frame_.success(line_); }
    [[nodiscard]] int fail(int status, const char* message) const noexcept {
        return frame_.fail(status, message, line_);
    }
    [[nodiscard]] int callee(int status) const noexcept { return frame_.callee(status, line_); }

private:
    CallFrame& frame_;
    int line_;
};

/** A zero-filled array from the tracked allocator, released when it goes. Empty when memory could not be had or
 * the size overflows. */
template <typename T>
class TrackedBuffer {
    static_assert(std::is_trivially_copyable_v<T> && alignof(T) <= 16, "the elements begin and end as mere bytes");

public:
    TrackedBuffer() noexcept = default;
    explicit TrackedBuffer(std::size_t count) noexcept
        : data_{static_cast<T*>(calloc_ckerr(count, sizeof(T)))}, size_{data_ ? count : 0} {
        // A failed allocation leaves a null entry among the tracked blocks.
        if (!data_) free_ckerr(nullptr);
    }
    ~TrackedBuffer() {
        if (data_) free_ckerr(data_);
    }
    TrackedBuffer(TrackedBuffer&& other) noexcept
        : data_{std::exchange(other.data_, nullptr)}, size_{std::exchange(other.size_, 0)} {}
    TrackedBuffer& operator=(TrackedBuffer&&) = delete;

    explicit operator bool() const noexcept { return data_ != nullptr; }
    [[nodiscard]] T* data() noexcept { return data_; }
    [[nodiscard]] const T* data() const noexcept { return data_; }
    [[nodiscard]] std::size_t size() const noexcept { return size_; }
    T& operator[](std::size_t i) noexcept { return data_[i]; }
    const T& operator[](std::size_t i) const noexcept { return data_[i]; }
    T* begin() noexcept { return data_; }
    T* end() noexcept { return data_ + size_; }

private:
    T* data_ = nullptr;
    std::size_t size_ = 0;
};

}  // namespace quo

#endif
