#include <gtest/gtest.h>
#include <libxml/xmlmemory.h>

#include <cstdlib>
#include <new>
#include <string>

#include "header_files.h"
#include "quorelxmllib/header_session.h"
#include "shelf.h"

namespace {

/** How many allocations still succeed, of the program and of libxml2 together; none is counted while negative. */
long allowed = -1;
/** Whether one allocation fails, or all from then on. */
bool only_one = false;
bool has_failed = false;

bool refused() {
    if (allowed < 0) return false;
    if (allowed > 0) {
        --allowed;
        return false;
    }
    has_failed = true;
    if (only_one) allowed = -1;
    return true;
}

/** Makes the allocation after the next `room` fail, and those after it as well or not. */
void start_failing(long room, bool once) {
    has_failed = false;
    only_one = once;
    allowed = room;
}
/** Whether any allocation failed. */
bool stop_failing() {
    allowed = -1;
    errno = 0;
    return has_failed;
}

void* xml_malloc(std::size_t size) { return refused() ? nullptr : std::malloc(size); }
void* xml_realloc(void* block, std::size_t size) { return refused() ? nullptr : std::realloc(block, size); }
char* xml_strdup(const char* text) { return refused() ? nullptr : strdup(text); }

}  // namespace

void* operator new(std::size_t size) {
    if (refused()) throw std::bad_alloc{};
    if (void* const block = std::malloc(size ? size : 1)) return block;
    throw std::bad_alloc{};
}
void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
    return refused() ? nullptr : std::malloc(size ? size : 1);
}
void* operator new[](std::size_t size) { return operator new(size); }
void* operator new[](std::size_t size, const std::nothrow_t& tag) noexcept { return operator new(size, tag); }
// Inlined, the pairs of these and the operators above would look mismatched to the compiler.
[[gnu::noinline]] void operator delete(void* block) noexcept { std::free(block); }
[[gnu::noinline]] void operator delete(void* block, std::size_t) noexcept { std::free(block); }
[[gnu::noinline]] void operator delete[](void* block) noexcept { std::free(block); }
[[gnu::noinline]] void operator delete[](void* block, std::size_t) noexcept { std::free(block); }

namespace {

using test::read_text;
using test::Shelf;
using test::write_text;

struct Job {
    const char* name;
    int (*run)(Shelf& object, const char* file);
};

int write_object(Shelf& object, const char* file) { return object.writeAuxiliaryFile(file, 1, "New"); }
int write_in_session(Shelf& object, const char* file) {
    quo::HeaderSession session{file};
    const int status = object.writeAuxiliaryFile(file, 1, "New");
    const int committed = session.commit();
    return status ? status : committed;
}
int write_document(Shelf&, const char* file) {
    quorelxml document;
    const double values[] = {1.5, 2.5};
    const char* text = "New";
    if (const int status = document.initXmlFile(file)) return status;
    if (const int status = document.writeDouble(2, "New/a", values, 2)) return status;
    if (const int status = document.writeString(1, "New/b", &text, 1)) return status;
    return document.write();
}
int write_description(Shelf&, const char* file) { return quorelxml{}.setDescription(file, "<New>"); }
int write_instruction(Shelf&, const char* file) {
    quorelxmlPi document;
    if (const int status = document.initXmlFile(file, "New.xsl")) return status;
    return document.write();
}

class HeaderMemory : public testing::TestWithParam<std::tuple<Job, bool>> {};

// Every allocation fails once. Whatever happens, the file is the old one or the complete new one, and the new one
// whenever success was reported.
TEST_P(HeaderMemory, LeavesTheOldFileOrTheCompleteNewOne) {
    const auto& [job, once] = GetParam();
    const test::TemporaryFolder folder;
    const std::string file = folder.file("header.xml"), old = Shelf::text();
    xmlMemSetup(std::free, xml_malloc, xml_realloc, xml_strdup);
    Shelf object;
    object.fill(3);
    write_text(file, old);
    ASSERT_EQ(job.run(object, file.c_str()), 0);
    const std::string complete = read_text(file);
    ASSERT_NE(complete, old);

    const test::CapturedStderr quiet;
    int status = -1;
    long successes = 0;
    for (long room = 0; room < 20000; ++room) {
        write_text(file, old);
        start_failing(room, once);
        try {
            status = job.run(object, file.c_str());
        } catch (const std::bad_alloc&) {
            status = 7;  // only the session's own construction may throw
        }
        const bool failed = stop_failing();
        EXPECT_TRUE(status == 0 || status == 1 || status == 7) << room;
        const std::string now = read_text(file);
        EXPECT_TRUE(now == (status == 0 ? complete : old)) << room << ": " << status << now;
        EXPECT_EQ(test::entries(folder).size(), 1U) << room;
        if (!failed) break;
        successes += status == 0;
    }
    EXPECT_EQ(status, 0) << "never enough memory";
    EXPECT_LT(successes, 20) << "failures went unnoticed";
}
constexpr Job kJobs[] = {{"Object", write_object},
                         {"Session", write_in_session},
                         {"Document", write_document},
                         {"Description", write_description},
                         {"StyleSheet", write_instruction}};
INSTANTIATE_TEST_SUITE_P(Jobs, HeaderMemory, testing::Combine(testing::ValuesIn(kJobs), testing::Bool()),
                         [](const auto& row) {
                             return std::string{std::get<0>(row.param).name} +
                                    (std::get<1>(row.param) ? "One" : "All");
                         });

TEST(HeaderMemoryRead, GivesTheWholeObjectOrAFailure) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("header.xml");
    xmlMemSetup(std::free, xml_malloc, xml_realloc, xml_strdup);
    write_text(file, Shelf::text());
    Shelf whole;
    ASSERT_TRUE(whole.readAuxiliaryFile(file.c_str(), 1, "Shelf"));
    const test::CapturedStderr quiet;
    bool read = false;
    for (long room = 0; room < 20000; ++room) {
        Shelf object, copy;
        object.fill(5);
        start_failing(room, room % 2 == 0);
        read = object.readAuxiliaryFile(file.c_str(), 1, "Shelf");
        const int cloned = read ? whole.clone(&copy) : 0;
        const bool failed = stop_failing();
        EXPECT_TRUE(!read || object == whole) << room;
        EXPECT_TRUE(cloned == 7 || !read || copy == whole) << room;
        if (!failed) break;
    }
    EXPECT_TRUE(read);
}

}  // namespace
