#include "sarutillib/ground/checked_size.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <limits>

namespace {

using quo::Checked;
using Int = std::numeric_limits<std::int64_t>;
using Size = std::numeric_limits<std::uint64_t>;

TEST(Checked, AnswersWhatFitsAndNothingOnceAStepOverflows) {
    EXPECT_EQ((Checked<std::int64_t>{25307} * 1081 * std::size_t{8} + 4096).value(), 25307LL * 1081 * 8 + 4096);
    EXPECT_EQ((Checked<std::int64_t>{Int::max() / 2} * 2 + 1).value(), Int::max());
    EXPECT_EQ(Checked<std::uint64_t>{Size::max()}.value(), Size::max());
    EXPECT_EQ((Checked<std::int32_t>{-3} * std::int64_t{7}).value(), -21);

    EXPECT_FALSE((Checked<std::int64_t>{Int::max() / 2 + 1} * 2).value());
    EXPECT_FALSE(Checked<std::int64_t>{Size::max()}.value());
    EXPECT_FALSE(Checked<std::size_t>{-1}.value());
    EXPECT_FALSE((Checked<std::size_t>{8} * -1).value());
    EXPECT_FALSE((Checked<std::int32_t>{46341} * 46341).value());
    // Coming back into the range does not undo it.
    EXPECT_FALSE((Checked<std::int64_t>{Int::max()} + 1 + -1).value());
    EXPECT_FALSE((Checked<std::int64_t>{Int::max()} * 2 * 0).value());
}

}  // namespace
