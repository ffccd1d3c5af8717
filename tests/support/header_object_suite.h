#ifndef QUO_TESTS_SUPPORT_HEADER_OBJECT_SUITE_H
#define QUO_TESTS_SUPPORT_HEADER_OBJECT_SUITE_H

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <string>
#include <vector>

#include "support/diagnostics.h"
#include "support/fields.h"

/** What holds for every header object of fixed size: instantiate the suite with one case per class.
 *
 *     struct Windows : test::HeaderCase {
 *         using Object = SpectralWindows_Obj;  // with readhdr(file), writehdr(file) and clone(to)
 *         static constexpr const char* kSection = "SpectralWindows";
 *         static constexpr test::FieldRow kRows[] = {test::text("AzMatchedFilterType"), ...};
 *     };
 *     using Cases = testing::Types<Windows, ...>;
 *     namespace test {
 *     INSTANTIATE_TYPED_TEST_SUITE_P(Acquisition, HeaderObject, Cases, CaseName);
 *     } */
namespace test {

/** What is true of most classes; a case redefines what is not. */
struct HeaderCase {
    static constexpr bool kFallsBack = true;  // readhdr turns to parameter files
    static constexpr bool kReadAlwaysSays0 = false;
    static constexpr bool kWriteAlwaysSays0 = false;
    static std::vector<std::string> not_cloned() { return {}; }
};

template <typename Case>
class HeaderObject : public testing::Test {
protected:
    using Object = typename Case::Object;

    /** The status of reading `content` into `object`. Every call has a file of its own: parameter files stay in
     * memory under their names. */
    int read(Object& object, const std::string& content) {
        const std::string file = folder_.file("header" + std::to_string(++files_));
        write_text(file, content);
        return object.readhdr(file.c_str());
    }
    std::string written(Object& object) {
        const std::string file = folder_.file("written.xml");
        EXPECT_EQ(object.writehdr(file.c_str()), 0);
        return read_text(file);
    }
    static int expected(bool complete) { return complete || Case::kReadAlwaysSays0 ? 0 : 1; }

    TemporaryFolder folder_;
    int files_ = 0;
};
TYPED_TEST_SUITE_P(HeaderObject);

TYPED_TEST_P(HeaderObject, RegistersItsFields) {
    typename TypeParam::Object object;
    expect_fields(object, TypeParam::kRows);
}

TYPED_TEST_P(HeaderObject, ComesBackFromItsSection) {
    typename TypeParam::Object source, target;
    fill_fields(source);
    EXPECT_EQ(this->read(target, this->written(source)), 0);
    EXPECT_THAT(differing_fields(source, target), testing::IsEmpty());
}

TYPED_TEST_P(HeaderObject, WritesItsElementsInOrderAndOnce) {
    typename TypeParam::Object object;
    fill_fields(object, 2);
    this->written(object);
    fill_fields(object);
    const std::string file = this->written(object);
    EXPECT_EQ(child_names(file, TypeParam::kSection), field_names(object));
    EXPECT_EQ(file.find(element_text(file, TypeParam::kSection)),
              file.rfind(std::string{"<"} + TypeParam::kSection + ">"));
    for (const FieldRow& row : TypeParam::kRows) {
        const auto values = child_names(file, row.name);
        EXPECT_EQ(std::ranges::count(values, "val"), row.count > 1 ? row.count : 0) << row.name;
    }
}

TYPED_TEST_P(HeaderObject, FailsOnlyWithoutAMandatoryElement) {
    typename TypeParam::Object source;
    fill_fields(source);
    const std::string file = this->written(source);
    for (const FieldRow& row : TypeParam::kRows) {
        SCOPED_TRACE(row.name);
        typename TypeParam::Object fresh, target;
        EXPECT_EQ(this->read(target, without_element(file, row.name)), this->expected(!row.mandatory_in_xml()));
        EXPECT_THAT(differing_fields(fresh, target), testing::Not(testing::Contains(row.name)));
        if (!row.mandatory_in_xml()) {
            EXPECT_THAT(differing_fields(source, target), testing::ElementsAre(row.name));
        }
    }
}

TYPED_TEST_P(HeaderObject, ComesBackFromAParameterFile) {
    if (!TypeParam::kFallsBack) return;
    typename TypeParam::Object source, target;
    fill_fields(source);
    std::vector<std::string> xml_only;
    for (const FieldRow& row : TypeParam::kRows)
        if (row.presence == Presence::kXmlOnly) xml_only.emplace_back(row.name);
    EXPECT_EQ(this->read(target, profile_text(source, TypeParam::kSection, TypeParam::kRows)), 0);
    EXPECT_EQ(differing_fields(source, target), xml_only);
}

// Every key is read, whichever failed: the others arrive.
TYPED_TEST_P(HeaderObject, ReadsEveryOtherKeyOfAParameterFile) {
    if (!TypeParam::kFallsBack) return;
    typename TypeParam::Object source;
    fill_fields(source);
    for (const FieldRow& row : TypeParam::kRows) {
        if (row.presence == Presence::kXmlOnly) continue;
        SCOPED_TRACE(row.key);
        typename TypeParam::Object fresh, target, complete;
        this->read(complete, profile_text(source, TypeParam::kSection, TypeParam::kRows));
        const std::string file = profile_text(source, TypeParam::kSection, TypeParam::kRows, row.key);
        EXPECT_EQ(this->read(target, file), this->expected(!row.mandatory_in_profile()));
        EXPECT_THAT(differing_fields(complete, target), testing::ElementsAre(row.name));
        EXPECT_THAT(differing_fields(fresh, target), testing::Not(testing::Contains(row.name)));

        const std::string cut = profile_text(source, TypeParam::kSection, TypeParam::kRows, "", row.key);
        if (row.count > 1) {
            EXPECT_EQ(this->read(target, cut), this->expected(!row.mandatory_in_profile()));
        }
    }
}

TYPED_TEST_P(HeaderObject, StaysAsItWasWithoutAFile) {
    typename TypeParam::Object fresh, target;
    const std::string missing = this->folder_.file("missing.xml");
    for (const char* file : {missing.c_str(), "", static_cast<const char*>(nullptr)})
        EXPECT_EQ(target.readhdr(file), this->expected(false));
    EXPECT_THAT(differing_fields(fresh, target), testing::IsEmpty());
    EXPECT_FALSE(std::filesystem::exists(missing));
}

TYPED_TEST_P(HeaderObject, RefusesAFileThatCannotBeWritten) {
    typename TypeParam::Object object;
    const std::string nowhere = this->folder_.file("no_such_folder/header.xml");
    for (const char* file : {nowhere.c_str(), "", static_cast<const char*>(nullptr)})
        EXPECT_EQ(object.writehdr(file), TypeParam::kWriteAlwaysSays0 ? 0 : 1);
}

TYPED_TEST_P(HeaderObject, ClonesIntoItsArgument) {
    typename TypeParam::Object source, same, target;
    fill_fields(source, 1);
    fill_fields(same, 1);
    fill_fields(target, 2);
    EXPECT_EQ(source.clone(&target), 0);
    EXPECT_THAT(differing_fields(source, same), testing::IsEmpty());
    EXPECT_THAT(differing_fields(source, target), testing::ElementsAreArray(TypeParam::not_cloned()));
}

REGISTER_TYPED_TEST_SUITE_P(HeaderObject, RegistersItsFields, ComesBackFromItsSection,
                            WritesItsElementsInOrderAndOnce, FailsOnlyWithoutAMandatoryElement,
                            ComesBackFromAParameterFile, ReadsEveryOtherKeyOfAParameterFile,
                            StaysAsItWasWithoutAFile, RefusesAFileThatCannotBeWritten, ClonesIntoItsArgument);

/** The name of a case in the tests' names. */
struct CaseName {
    template <typename Case>
    static std::string GetName(int /*index*/) {
        return Case::kSection;
    }
};

}  // namespace test

#endif
