#include <gtest/gtest.h>
#include <libxml/xmlmemory.h>

#include <cstdlib>
#include <cstring>
#include <new>
#include <string>

#include "header_files.h"
#include "quorelxmllib/header_session.h"
#include "shelf.h"
#include "support/failing_new.h"

namespace {

// libxml2 shares the room of the program.
void* xml_malloc(std::size_t size) { return test::is_refused() ? nullptr : std::malloc(size); }
void* xml_realloc(void* block, std::size_t size) {
    return test::is_refused() ? nullptr : std::realloc(block, size);
}
char* xml_strdup(const char* text) { return test::is_refused() ? nullptr : strdup(text); }

using test::read_text;
using test::Shelf;
using test::write_text;

struct Job {
    const char* name;
    int (*run)(Shelf& object, const char* file);
    bool from_nothing = false;
};

/** A header with more names than the first room of the parser's dictionary, a description that needs memory of its
 * own, and a value in two pieces. */
std::string old_header() {
    std::string text = Shelf::text(), names;
    for (int i = 0; i < 60; ++i) {
        const std::string name = "AnElementWithALongNameOfItsOwn" + std::to_string(i);
        names += "    <" + name + ">1</" + name + ">\n";
    }
    text.insert(text.find("  </Channel>"), names);
    text.replace(text.find("A scene"), 7, std::string(100, 'd'));
    return text.insert(text.find("2.25") + 1, "<!-- -->");
}

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
int write_description(Shelf&, const char* file) {
    static const std::string text(9000, '<');  // more than fits into the serializer's first buffer
    return quorelxml{}.setDescription(file, text.c_str());
}
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
    const std::string file = folder.file("header.xml"), old = job.from_nothing ? "" : old_header();
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
        test::fail_news(room, test::News::kAll, once);
        try {
            status = job.run(object, file.c_str());
        } catch (const std::bad_alloc&) {
            status = 7;  // only the session's own construction may throw
        }
        const bool failed = test::stop_failing();
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
constexpr Job kJobs[] = {{"Object", write_object},         {"Session", write_in_session},
                         {"Document", write_document},     {"Description", write_description},
                         {"Fresh", write_object, true},    {"FreshDescription", write_description, true},
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
    write_text(file, old_header());
    Shelf whole;
    ASSERT_TRUE(whole.readAuxiliaryFile(file.c_str(), 1, "Shelf"));
    const test::CapturedStderr quiet;
    bool read = false;
    for (long room = 0; room < 20000; ++room) {
        Shelf object, copy;
        object.fill(5);
        test::fail_news(room, test::News::kAll, room % 2 == 0);
        read = object.readAuxiliaryFile(file.c_str(), 1, "Shelf");
        const int cloned = read ? whole.clone(&copy) : 0;
        const bool failed = test::stop_failing();
        EXPECT_TRUE(!read || object == whole) << room;
        EXPECT_TRUE(cloned == 7 || !read || copy == whole) << room;
        if (!failed) break;
    }
    EXPECT_TRUE(read);
}

}  // namespace
