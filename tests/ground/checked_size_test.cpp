// SPDX-License-Identifier: Apache-2.0
#include "sarutillib/ground/checked_size.h"

#include "support/prelude.h"

namespace {

TEST(Checked, AnswersWhatFitsAndNothingOnceAStepOverflows) {
    using quo::Checked;
    EXPECT_EQ((Checked<std::int64_t>{25307} * 1081 * std::size_t{8} + 4096).value(), 25307LL * 1081 * 8 + 4096);
    EXPECT_EQ((Checked<std::int64_t>{INT64_MAX / 2} * 2 + 1).value(), INT64_MAX);
    EXPECT_EQ((Checked<std::int32_t>{-3} * std::int64_t{7}).value(), -21);
    EXPECT_FALSE((Checked<std::int64_t>{INT64_MAX / 2 + 1} * 2).value());
    EXPECT_FALSE(Checked<std::int64_t>{UINT64_MAX}.value());
    EXPECT_FALSE((Checked<std::size_t>{8} * -1).value());
    EXPECT_FALSE((Checked<std::int32_t>{46341} * 46341).value());
    // Coming back into the range does not undo it.
    EXPECT_FALSE((Checked<std::int64_t>{INT64_MAX} + 1 + -1).value());
}

}  // namespace
