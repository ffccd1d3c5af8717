// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <vector>

#include "support/scenes.h"
#include "tool.h"

namespace {

/** A scene's header with one more section. */
std::string header_with(const std::string& section) {
    std::string text = test::read_text(test::kScenes[0].path(".xml"));
    return text.insert(text.find("</Channel>"), section);
}

struct Shape {
    const char* before;
    int times;
    std::string part;  // "#" is its number
    const char* after;

    [[nodiscard]] std::string text() const {
        std::string all = before;
        for (int i = 0; i < times; ++i)
            for (const char c : part) c == '#' ? all += std::to_string(i % 9999) : all += c;
        return all + after;
    }
};

// A tree of one object per element, attribute and text took 11 to 33 times the size of the file.
TEST(HeaderMemory, IsAtMostEightTimesTheFile) {
#ifdef __SANITIZE_ADDRESS__
    GTEST_SKIP() << "the sanitizers hold memory of their own";
#endif
    const test::TemporaryFolder folder;
    const std::string file = folder.file("large.hdr"), field = "SamplingConstants/prf_hz";
    const Shape shapes[] = {{"<Big><a>\n", 150'000, "        <val N=\"#\">0.12345</val>\n", "</a></Big>"},
                            {"<Big>", 300'000, "<f#>#</f#>", "</Big>"},
                            {"", 90'000, "<S><a>1</a><b>2</b><c>3</c></S>", ""},
                            {"<Big>", 1'500'000, "<a/>", "</Big>"},
                            {"<Big>", 800'000, "<!---->", "</Big>"}};
    const long idle = test::quo({"--version"}).peak_kib;
    for (const Shape& shape : shapes) {
        const std::string header = header_with(shape.text());
        for (const std::vector<std::string>& job : {std::vector<std::string>{"get", file, field},
                                                    {"set", file, field, "1717"},
                                                    {"info", file},
                                                    {"validate", file}}) {
            test::write_text(file, header);
            const auto most = idle + 8 * static_cast<long>(std::filesystem::file_size(file)) / 1024;
            EXPECT_LT(test::quo(job).peak_kib, most) << job[0] << ' ' << shape.part;
        }
    }
}

}  // namespace
