#include <gtest/gtest.h>

#include "tool.h"

namespace {

class Scenes : public testing::TestWithParam<std::string> {};

// The headers in the repository are what the library writes today, byte for byte: a change of the format shows
// here.
TEST_P(Scenes, HeadersAreWhatTheLibraryWrites) {
    const test::TemporaryFolder folder;
    const std::string made = folder.file("made.xml");
    const auto run = test::Child{QUO_MAKE_HEADER, {test::scene_file(GetParam(), "_facts.json"), made}}.wait();
    ASSERT_EQ(run.exit_status, 0) << run.err;
    EXPECT_EQ(test::read_text(made), test::read_text(test::scene_file(GetParam())));
}
INSTANTIATE_TEST_SUITE_P(All, Scenes, testing::ValuesIn(test::scenes()),
                         [](const auto& scene) { return scene.param; });

}  // namespace
