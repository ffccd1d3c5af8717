#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <string>
#include <utility>
#include <vector>

#include "header_files.h"

namespace {

/** The children of the section "Set": names and numbers in the order of the file. */
using Model = std::vector<std::pair<std::string, int>>;

int count_of(const Model& model, const std::string& name) {
    return static_cast<int>(std::ranges::count(model, name, &Model::value_type::first));
}
int first_of(const Model& model, const std::string& name) {
    const auto found = std::ranges::find(model, name, &Model::value_type::first);
    return found == model.end() ? -1 : found->second;
}

class ManyChildren : public testing::TestWithParam<unsigned> {
protected:
    // Enough children and look-ups in vain that the document answers from its index.
    static constexpr int kNames = 300, kSteps = 4000;

    std::string any_name() { return "child" + std::to_string(random_() % kNames); }
    static std::string path(const std::string& name) { return "Set/" + name; }

    /** Writes one, appends copies of one, or removes all of one name. */
    void change_one(unsigned choice) {
        const std::string name = any_name(), field = path(name);
        const int present = count_of(model_, name);
        if (choice < 300) {
            const auto value = static_cast<std::int32_t>(random_() % 1000000);
            ASSERT_EQ(document_.writeInt(1, field.c_str(), &value, 1), 0);
            if (present == 0) model_.emplace_back(name, value);
            std::ranges::find(model_, name, &Model::value_type::first)->second = value;
        } else if (choice < 340) {
            ASSERT_EQ(document_.createField(1, field.c_str(), present + 2), 0);
            model_.insert(model_.end(), 2, {name, 0});
        } else {
            ASSERT_EQ(document_.clearField(1, field.c_str()), 0);
            std::erase_if(model_, [&](const auto& child) { return child.first == name; });
        }
    }
    // An element with children of its own may become one with a text: what was below it is gone.
    void clear_all(bool by_text) {
        const char* text = "nothing";
        if (by_text) {
            ASSERT_EQ(document_.writeString(1, "Set", &text, 1), 0);
        }
        ASSERT_EQ(document_.clearField(1, "Set"), 0);
        model_.clear();
    }
    // Texts beside elements make a save load the tree once more.
    void save_with_mixed_content() {
        const char* text = "text";
        ASSERT_EQ(document_.writeString(1, "Mixed", &text, 1), 0);
        ASSERT_EQ(document_.createField(1, "Mixed/element"), 0);
        ASSERT_EQ(document_.write(), 0);
    }
    void look_up() {
        const std::string name = any_name();
        std::int32_t value = -1;
        EXPECT_EQ(document_.readInt(1, path(name).c_str(), &value, 1), count_of(model_, name) > 0 ? 0 : 1);
        EXPECT_EQ(value, first_of(model_, name)) << name;
        EXPECT_EQ(document_.countNodes(1, path(name).c_str()), count_of(model_, name)) << name;
    }

    std::mt19937 random_{GetParam()};
    test::TemporaryFolder folder_;
    test::OpenDocument document_{folder_.file("header.xml").c_str()};
    Model model_;
};

TEST_P(ManyChildren, AreFoundWhateverCameAndWent) {
    for (int step = 0; step < kSteps; ++step) {
        const auto choice = random_() % 1000;
        if (choice < 440) change_one(static_cast<unsigned>(choice));
        if (choice >= 440 && choice < 443) clear_all(choice == 442);
        if (choice >= 443 && choice < 446) save_with_mixed_content();
        look_up();
        ASSERT_FALSE(HasFailure()) << "step " << step;
    }
}
INSTANTIATE_TEST_SUITE_P(Seeds, ManyChildren, testing::Range(1U, 6U));

}  // namespace
