#include <gtest/gtest.h>

#include <filesystem>
#include <functional>
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

std::string repeated(std::string_view before, int times, const std::function<std::string(int)>& part,
                     std::string_view after) {
    std::string text{before};
    for (int i = 0; i < times; ++i) text += part(i);
    return text.append(after);
}

// A tree of one object per element, attribute and text took 11 to 33 times the size of the file.
TEST(HeaderMemory, IsAtMostEightTimesTheFile) {
#ifdef __SANITIZE_ADDRESS__
    GTEST_SKIP() << "the sanitizers hold memory of their own";
#endif
    const test::TemporaryFolder folder;
    const std::string file = folder.file("large.hdr"), field = "SamplingConstants/prf_hz";
    const auto number = [](int i) { return std::to_string(i); };
    const std::vector<std::string> shapes = {
        repeated(
            "<Big><a>\n", 150'000, [&](int i) { return "        <val N=\"" + number(i) + "\">0.12345</val>\n"; },
            "</a></Big>"),
        repeated(
            "<Big>", 300'000,
            [&](int i) { return "<f" + number(i % 999) + ">" + number(i) + "</f" + number(i % 999) + ">"; },
            "</Big>"),
        repeated(
            "", 90'000, [](int) { return "<S><a>1</a><b>2</b><c>3</c></S>"; }, ""),
        repeated(
            "<Big>", 1'500'000, [](int) { return "<a/>"; }, "</Big>"),
        repeated(
            "<Big>", 800'000, [](int) { return "<!---->"; }, "</Big>"),
    };
    const long idle = test::quo({"--version"}).peak_kib;
    for (const std::string& shape : shapes) {
        for (const std::vector<std::string>& job : {std::vector<std::string>{"get", file, field},
                                                    {"set", file, field, "1717"},
                                                    {"info", file},
                                                    {"validate", file}}) {
            test::write_text(file, header_with(shape));
            const auto most = idle + 8 * static_cast<long>(std::filesystem::file_size(file)) / 1024;
            EXPECT_LT(test::quo(job).peak_kib, most) << job[0] << ' ' << shape.substr(0, 30);
        }
    }
}

}  // namespace
