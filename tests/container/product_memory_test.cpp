#include <gtest/gtest.h>
#include <libxml/xmlmemory.h>

#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <string>

#include "products.h"
#include "support/diagnostics.h"
#include "support/failing_new.h"

namespace {

// libxml2 shares the room of the program.
void* xml_malloc(std::size_t size) { return test::is_refused() ? nullptr : std::malloc(size); }
void* xml_realloc(void* block, std::size_t size) {
    return test::is_refused() ? nullptr : std::realloc(block, size);
}
char* xml_strdup(const char* text) { return test::is_refused() ? nullptr : strdup(text); }

class ProductMemory : public testing::TestWithParam<bool> {
protected:
    ProductMemory() {
        xmlMemSetup(std::free, xml_malloc, xml_realloc, xml_strdup);
        test::fill_product(product_);
        EXPECT_EQ(product_.GSwrite(file_.c_str()), 0);
        whole_ = test::read_text(file_);
    }
    const test::TemporaryFolder folder_;
    const std::string file_ = folder_.file("scene.hdr");
    const test::CapturedStderr quiet_;
    GeneralSAR product_;
    std::string whole_;
};

// Every allocation fails once. An object that failed on its way was left out of the product that was saved, and
// one that missed the open session was saved by itself and lost again. Steps are uneven to reach all the kinds of
// calls.
TEST_P(ProductMemory, SavesTheOldProductOrTheWholeNewOne) {
    const std::string old = "<QuorelXmlDoc><NumberOfChannels>0</NumberOfChannels><Description/></QuorelXmlDoc>";
    std::string fresh;
    test::write_text(file_, old);
    ASSERT_EQ(product_.GSwrite(file_.c_str()), 0);
    fresh = test::read_text(file_);
    bool failed = true;
    for (long room = 0; failed && room < 200000; room += room < 300 ? 1 : 37) {
        test::write_text(file_, old);
        test::fail_news(room, test::News::kThrowing, GetParam());
        EXPECT_EQ(product_.GSwrite(file_.c_str()), 0) << room;
        failed = test::stop_failing();
        const std::string now = test::read_text(file_);
        EXPECT_TRUE(now == old || now == fresh) << room;
        EXPECT_TRUE(failed || now == fresh) << room;
    }
    EXPECT_FALSE(failed) << "never enough memory";
}

// A failed allocation escaped as std::bad_alloc. What is present is whole; the rest is absent. One fails at a
// time: without any memory the parameter-file form, which objects try next, ends the process.
TEST_P(ProductMemory, ReadsWholeObjectsOnly) {
    if (!GetParam()) return;
    bool failed = true;
    for (long room = 0; failed && room < 200000; room += room < 300 ? 1 : 37) {
        GeneralSAR read;
        test::fail_news(room, test::News::kThrowing, true);
        const int status = read.GSread(file_.c_str());
        failed = test::stop_failing();
        EXPECT_TRUE(status == 0 || status == 7 || (failed && status == 1)) << room;
        if (status != 0 || !read.GSexists(gsPulse)) continue;
        EXPECT_EQ(read.pulse.Bandwidth, product_.pulse.Bandwidth) << room;
        if (!failed) {
            EXPECT_EQ(test::present_in(read), test::all_objects());
        }
    }
    EXPECT_FALSE(failed) << "never enough memory";
}
INSTANTIATE_TEST_SUITE_P(Rooms, ProductMemory, testing::Bool(),
                         [](const auto& row) { return row.param ? "One" : "All"; });

}  // namespace
