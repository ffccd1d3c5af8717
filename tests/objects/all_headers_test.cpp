// SPDX-License-Identifier: Apache-2.0
#include "quo_base/quo_base.h"
#include "support/diagnostics.h"

namespace {

// A component whose header is forgotten there would be missing for everybody who includes the one header.
TEST(QuoBase, IncludesEveryPublicHeader) {
    const std::filesystem::path folder = std::filesystem::path{QUO_TEST_DATA} / "../../include/quo_base";
    const std::string all = test::read_text(folder / "quo_base.h");
    for (const auto& entry : std::filesystem::directory_iterator{folder}) {
        const std::string name = entry.path().filename().string();
        if (name == "quo_base.h") continue;
        EXPECT_NE(all.find("#include \"quo_base/" + name + "\""), all.npos) << name;
    }
}

}  // namespace
