// SPDX-License-Identifier: Apache-2.0
#include "sarutillib/ground/processor_level.h"

#include <gtest/gtest.h>

#include <cstdlib>

namespace {

TEST(ProcessorLevel, IsLoweredByNameAndNeverRaised) {
    using enum quo::ProcessorLevel;
    EXPECT_EQ(quo::lowered_level(kAvx512, "sse2"), kBase);
    EXPECT_EQ(quo::lowered_level(kAvx512, "avx2"), kAvx2);
    EXPECT_EQ(quo::lowered_level(kAvx2, "avx512"), kAvx2);
    for (const char* other : {"", "AVX2", "avx", static_cast<const char*>(nullptr)})
        EXPECT_EQ(quo::lowered_level(kAvx512, other), kAvx512);
    // Where the tests run with the variable set, it holds.
    EXPECT_EQ(quo::lowered_level(quo::processor_level(), std::getenv("QUO_CPU")), quo::processor_level());
}

}  // namespace
