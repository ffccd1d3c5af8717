// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_CHECKED_SIZE_H
#define QUO_CHECKED_SIZE_H

#include <concepts>
#include <optional>

namespace quo {

/** Integer arithmetic that answers nothing instead of overflowing. Operands of any integer type mix safely. */
template <std::integral Result>
class Checked {
public:
    constexpr Checked(std::integral auto value) noexcept { ok_ = !__builtin_add_overflow(value, 0, &value_); }

    constexpr Checked& operator*=(Checked other) noexcept {
        ok_ = !__builtin_mul_overflow(value_, other.value_, &value_) && ok_ && other.ok_;
        return *this;
    }
    constexpr Checked& operator+=(Checked other) noexcept {
        ok_ = !__builtin_add_overflow(value_, other.value_, &value_) && ok_ && other.ok_;
        return *this;
    }
    friend constexpr Checked operator*(Checked a, Checked b) noexcept { return a *= b; }
    friend constexpr Checked operator+(Checked a, Checked b) noexcept { return a += b; }

    /** The result, or nothing when any step overflowed. */
    [[nodiscard]] constexpr std::optional<Result> value() const noexcept {
        return ok_ ? std::optional{value_} : std::nullopt;
    }

private:
    Result value_{};
    bool ok_;
};

}  // namespace quo

#endif
