// SPDX-License-Identifier: Apache-2.0
#include "quorelxmllib/legacy_list.h"

#include <locale.h>

#include "support/diagnostics.h"

namespace {

using quo::list_format;
using quo::scan_list;

TEST(ListFormat, RepeatsTheItemAndEndsWithTheLast) {
    const char* const expected[] = {"%.15g, %.15g, %.15g", "%.15g, %.15g, %.15g", "%d, %d, %d", "%s, \n%s, \n%s"};
    for (int type = 0; type <= 3; ++type) {
        const std::string format = list_format(100000, type);
        EXPECT_EQ(list_format(3, type), expected[type]);
        EXPECT_TRUE(format.size() < 4096U && format.size() > 4080U) << "cut to whole items within its room";
        EXPECT_TRUE(format.ends_with(list_format(2, type)));
    }
    EXPECT_EQ(list_format(2, -1) + list_format(2, 4) + list_format(0, 0), "");
}

// Every length around the blocks of the scan, and one whose format would not fit into 4096 characters. Each number
// must come back to the last bit, whatever the locale: with a decimal comma 1.5 was once read as 1.
TEST(ScanList, ReadsListsOfAnyLengthInAnyLocale) {
    const test::TemporaryFolder folder;
    const std::string make = "localedef -i de_DE -f UTF-8 '" + folder.file("de_DE.UTF-8") + "' >/dev/null 2>&1";
    const bool comma = std::system(make.c_str()) == 0;
    setenv("LOCPATH", folder.path().c_str(), 1);
    for (const int count : {2, 31, 32, 33, 64, 65, 5001}) {
        SCOPED_TRACE(count);
        std::vector<double> expected, values(static_cast<std::size_t>(count) + 1, -17.3);
        std::string text;
        for (int i = 0; i < count; ++i) {
            char number[32];
            std::snprintf(number, sizeof number, "%.15g", std::numbers::pi * std::pow(-1.37, i % 200) * (i + 1));
            expected.push_back(std::strtod(number, nullptr));
            (text += i ? ", " : "") += number;
        }
        EXPECT_EQ(setlocale(LC_ALL, "de_DE.UTF-8") != nullptr, comma);
        EXPECT_EQ(scan_list(text.c_str(), values.data(), count), count);
        EXPECT_EQ(scan_list(text.c_str(), values.data(), count + 1), count);
        setlocale(LC_ALL, "C");
        expected.push_back(-17.3);
        EXPECT_EQ(values, expected);
    }
    unsetenv("LOCPATH");
}

}  // namespace
