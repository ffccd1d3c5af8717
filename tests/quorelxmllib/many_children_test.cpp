#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <string>
#include <utility>
#include <vector>

#include "header_files.h"

namespace {

// The children of one element, as the document has them and as a list of names and numbers in the order of the
// file. There are children and look-ups in vain enough that the document answers from its index; an element with
// children may become one with a text, which takes what was below it; texts beside elements make a save load the
// tree once more.
TEST(ManyChildren, AreFoundWhateverCameAndWent) {
    const char* text = "text";
    for (unsigned seed = 1; seed < 6; ++seed) {
        std::mt19937 random{seed};
        const test::TemporaryFolder folder;
        test::OpenDocument document{folder.file("header.xml").c_str()};
        std::vector<std::pair<std::string, int>> model;
        for (int step = 0; step < 4000; ++step) {
            const auto choice = random() % 1000;
            const std::string name = "child" + std::to_string(random() % 300), path = "Set/" + name;
            const auto named = [&name](const auto& child) { return child.first == name; };
            auto present = static_cast<int>(std::ranges::count_if(model, named));
            int status = 0;
            if (choice < 300) {
                const auto value = static_cast<std::int32_t>(random() % 1000000);
                status = document.writeInt(1, path.c_str(), &value, 1);
                if (present == 0) model.emplace_back(name, value);
                std::ranges::find_if(model, named)->second = value;
            } else if (choice < 340) {
                status = document.createField(1, path.c_str(), present + 2);
                model.insert(model.end(), 2, {name, 0});
            } else if (choice < 440) {
                status = document.clearField(1, path.c_str());
                std::erase_if(model, named);
            } else if (choice < 443) {
                if (choice == 442) status = document.writeString(1, "Set", &text, 1);
                status += document.clearField(1, "Set");
                model.clear();
            } else if (choice < 446) {
                status = document.writeString(1, "Mixed", &text, 1) + document.createField(1, "Mixed/element") +
                         document.write();
            }
            ASSERT_EQ(status, 0);
            std::int32_t value = -1;
            present = static_cast<int>(std::ranges::count_if(model, named));
            ASSERT_EQ(document.readInt(1, path.c_str(), &value, 1), present > 0 ? 0 : 1) << step;
            ASSERT_EQ(value, present > 0 ? std::ranges::find_if(model, named)->second : -1) << step;
            ASSERT_EQ(document.countNodes(1, path.c_str()), present) << step;
        }
    }
}

}  // namespace
