// SPDX-License-Identifier: Apache-2.0
#include "objects/records.h"
#include "support/diagnostics.h"
#include "support/fields.h"

// What holds for every header object and every configuration record. Its fields are those that
// tests/data/objects/fields.csv lists, and a filled object is, byte for byte, the header that stands beside the
// list; the parameter file of its name holds the same values.

namespace {

using testing::Contains, testing::ElementsAreArray, testing::IsEmpty, testing::Not;
using Object = GeneralSAR_BaseXML;

// --- one way to read, write and copy each of them ---------------------------------------------------------------

constexpr const char *kPolynomial = "Polynomial-0", *kRegion = "SubArea", *kPoint = "NorthWest";

int read_object(GeneralSAR_Base& object, const char* file) { return object.readhdr(file); }
int read_object(ROI_Obj& object, const char* file) { return object.read_roi(file, kRegion); }
int read_object(geopoint& object, const char* file) { return object.readhdr(file, kPoint); }
int read_object(Coregist& object, const char* file) { return object.readpar(file); }
template <std::derived_from<poly> Polynomial>
int read_object(Polynomial& object, const char* file) {
    return object.readpar(file, kPolynomial);
}

int write_object(GeneralSAR_Base& object, const char* file) { return object.writehdr(file); }
int write_object(ROI_Obj& object, const char* file) { return object.write_roi(file, kRegion); }
int write_object(geopoint& object, const char* file) { return object.writehdr(file, kPoint); }
int write_object(Coregist& object, const char* file) { return object.writepar(file); }
int write_object(poly& object, const char* file) { return object.writepar(file, kPolynomial); }
// The same file holds the description of its raster.
int write_object(AntennaPattern_Obj& object, const char* file) {
    const std::string name = file ? file : "";
    object.PatternFile.setFilename(name.substr(0, name.rfind('.')).c_str());
    return object.writehdr();
}

int status_of(const std::function<int()>& call, const std::string& what) {
    try {
        return call();
    } catch (const quorelException& e) {
        EXPECT_EQ(e.what(), what);
        return 1;
    }
}
int read_object(GeneralSAR_ConfigurationRecord& object, const char* file) {
    return status_of([&] { return object.readpar(file, 1); }, "Cannot read specific configuration file");
}
int write_object(GeneralSAR_ConfigurationRecord& object, const char* file) {
    return status_of([&] { return object.writepar(file, 1); }, "Cannot write specific configuration file");
}

template <typename Class>
int clone_object(Class& from, Class& to) {
    return from.clone(&to);
}
int clone_object(BufferFile& from, BufferFile& to) { return to.clone(&from); }

constexpr int kNoOrbit = QUO_READ_FAILED;

struct Subject {
    std::string name;  // of the class
    std::unique_ptr<Object> (*make)();
    int (*read)(Object&, const char*), (*write)(Object&, const char*), (*clone)(Object&, Object&);
    int incomplete = 1, unwritable = 1;  // statuses of reading less than is mandatory, and of writing in vain
};
void PrintTo(const Subject& row, std::ostream* stream) { *stream << row.name; }

// The compiler's name of a class is its own behind a length.
template <typename... Classes>
void add(std::vector<Subject>& all, int incomplete = 1, int unwritable = 1) {
    (all.push_back(
         {std::strpbrk(typeid(Classes).name(), "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz"),
          []() -> std::unique_ptr<Object> { return std::make_unique<Classes>(); },
          [](Object& object, const char* file) { return read_object(static_cast<Classes&>(object), file); },
          [](Object& object, const char* file) { return write_object(static_cast<Classes&>(object), file); },
          [](Object& from, Object& to) {
              return clone_object(static_cast<Classes&>(from), static_cast<Classes&>(to));
          },
          incomplete, unwritable}),
     ...);
}
std::vector<Subject> subjects() {
    std::vector<Subject> all;
    add<SamplingConstants_Obj, SARPulse_Obj, SensorAttitude_Obj, SpectralWindows_Obj, DataSetInfo_Obj, SwathInfo,
        AntennaPattern_Obj, geoCoords_Obj, BufferFile, ROI_Coords, polySAR>(all);
    add<QuickLook_Obj, geopoint>(all, 0);
    add<GSRoi_Obj, ROI_Obj, Coregist>(all, 1, 0);
    add<GSDataFile_Obj>(all, 0, 0);
    add<SAROrbitStateVectors_Obj, GeneralSAROrbit>(all, kNoOrbit);
    add<poly, polyDC, polyFR, polySL2GR, polyGR2SL, polySL2THETA, polySL2PHI, extended_polyDC, extended_polyFR>(
        all);
    add<AzimuthConf, DCestConf, ExtractorConf, generalProcessingConf, FinefitestConf, EnvisatCalibrationFactors,
        DemExtractorConf, GeocodingConf, ATPrecise_FitestConf, CoregistrationConf, CoherenceConf>(all);
    return all;
}

// --- the suite --------------------------------------------------------------------------------------------------

class EveryObject : public testing::TestWithParam<Subject> {
protected:
    std::unique_ptr<Object> filled(int seed = 1) {
        auto object = subject_.make();
        test::fill(*object, seed);
        return object;
    }
    /** The status of reading `content`. Every call has a file of its own: parameter files stay in memory under
     * their names. */
    int read(Object& object, const std::string& content) {
        const std::string file = report_.file("header" + std::to_string(++files_) + ".hdr");
        test::write_text(file, content);
        return subject_.read(object, file.c_str());
    }
    [[nodiscard]] int expected(bool complete) const { return complete ? 0 : subject_.incomplete; }
    [[nodiscard]] std::string golden(const char* ending) const {
        const std::string file = std::string{QUO_TEST_DATA} + "/objects/" + subject_.name + ending;
        EXPECT_TRUE(std::filesystem::exists(file)) << file;
        return test::read_text(file);
    }
    /** A new object; an orbit as a failed read leaves it, which may have had a count before. */
    [[nodiscard]] std::unique_ptr<Object> fresh() const {
        auto object = subject_.make();
        if (subject_.incomplete == kNoOrbit) object->destroyBuffers();
        return object;
    }
    /** What was read without one value, against the same read whole: it is as in a new object, and the others
     * arrive, where they do. */
    void expect_missing(const std::string& name, bool others, Object& whole, Object& partial) {
        if (name == "PatternSamples") return;  // follows the raster
        EXPECT_THAT(test::differing_fields(*fresh(), partial), Not(Contains(name)));
        if (!others) return;
        EXPECT_THAT(test::differing_fields(whole, partial), ElementsAreArray({name}));
    }

    const Subject& subject_ = GetParam();
    const std::vector<test::ListedField> fields_ = test::listed_fields(subject_.name);
    const bool has_parameter_file_ =
        dynamic_cast<GeneralSAR_ConfigurationRecord*>(subject_.make().get()) == nullptr &&
        (fields_.empty() || !fields_[0].key.empty());
    const test::Report report_;
    const std::string file_ = report_.file("written.hdr");
    int files_ = 0;
};
INSTANTIATE_TEST_SUITE_P(Of, EveryObject, testing::ValuesIn(subjects()),
                         [](const auto& row) { return row.param.name; });

TEST_P(EveryObject, RegistersTheListedFields) {
    const auto object = subject_.make();
    const auto* const record = dynamic_cast<GeneralSAR_ConfigurationRecord*>(object.get());
    ASSERT_EQ(static_cast<std::size_t>(object->elementCount()), fields_.size());
    for (int i = 0; i < object->elementCount(); ++i) {
        const parElement& element = *object->element(i);
        std::string described = test::described(element) + "," + element.unit + "," + element.meaning;
        if (record) {
            EXPECT_EQ(std::string{record->unit(i)} + record->meaning(i),
                      std::string{element.unit} + element.meaning);
        }
        while (!record && described.ends_with(',')) described.pop_back();
        EXPECT_EQ(described, fields_[static_cast<std::size_t>(i)].description);
    }
    if (!record) return;
    const auto made = GeneralSAR_ConfigurationRecord::make(subject_.name);
    ASSERT_TRUE(made);
    const GeneralSAR_ConfigurationRecord &one = *made, &other = *record;
    EXPECT_TRUE(typeid(one) == typeid(other));
    EXPECT_EQ(record->section() + std::string{record->meaning(-1)} + record->unit(1000), subject_.name);
}

// Nothing of an older section stays.
TEST_P(EveryObject, IsWrittenAsTheGoldenHeader) {
    const auto older = filled(2);
    EXPECT_EQ(subject_.write(*older, file_.c_str()), 0);
    std::string text = test::read_text(file_);
    if (older->elementCount() > 0)
        text.insert(text.find('<' + std::string{older->element(0)->name}), "<Stray>1</Stray>");
    test::write_text(file_, text);
    EXPECT_EQ(subject_.write(*filled(), file_.c_str()), 0);
    EXPECT_EQ(test::read_text(file_), golden(".xml"));
}

// Whatever the object held before.
TEST_P(EveryObject, ComesBackFromTheGoldenHeader) {
    for (const bool full : {false, true}) {
        const auto object = full ? filled(2) : subject_.make();
        EXPECT_EQ(read(*object, golden(".xml")), 0);
        EXPECT_THAT(test::differences(*filled(), *object), IsEmpty());
    }
}

TEST_P(EveryObject, FailsOnlyWithoutAMandatoryElement) {
    const auto whole = filled();
    for (int i = 0; i < whole->elementCount(); ++i) {
        const parElement& element = *whole->element(i);
        const auto object = subject_.make();
        EXPECT_EQ(read(*object, test::without_element(golden(".xml"), element.name)),
                  expected(!element.mandatory));
        expect_missing(element.name, !element.mandatory, *whole, *object);
    }
}

TEST_P(EveryObject, ComesBackFromTheGoldenParameterFile) {
    if (!has_parameter_file_) return;
    std::vector<std::string> header_only;
    for (const auto& field : fields_)
        if (field.key == "-") header_only.push_back(field.description.substr(0, field.description.find(',')));
    const auto object = subject_.make();
    EXPECT_EQ(read(*object, golden(".par")), 0);
    EXPECT_EQ(test::differences(*filled(), *object), header_only);
}

// Every key is read, whichever failed: the others arrive.
TEST_P(EveryObject, FailsOnlyWithoutAMandatoryKey) {
    if (!has_parameter_file_) return;
    const bool nothing_without_all = subject_.incomplete == kNoOrbit || subject_.name == "polySAR";
    const std::string text = golden(".par");
    const auto whole = subject_.make();
    read(*whole, text);
    for (std::size_t i = 0; i < fields_.size(); ++i) {
        const auto& [key, mandatory, description] = fields_[i];
        if (key == "-") continue;
        SCOPED_TRACE(key);
        const auto start = text.find("\n" + key + " = "), end = text.find('\n', start + 1);
        ASSERT_NE(start, text.npos);
        const auto object = subject_.make(), cut = subject_.make();
        EXPECT_EQ(read(*object, std::string{text}.erase(start, end - start)), expected(!mandatory));
        expect_missing(whole->element(static_cast<int>(i))->name, !mandatory || !nothing_without_all, *whole,
                       *object);
        if (text[end - 1] != '}') continue;
        const auto last = text.rfind(' ', end);
        EXPECT_EQ(read(*cut, std::string{text}.erase(last, end - 1 - last)), expected(!mandatory))
            << "one value less";
    }
}

TEST_P(EveryObject, StaysAsItWasWithoutAWholeFile) {
    std::vector<std::string> spoilt;
    if (subject_.name == "GSDataFile_Obj") spoilt = {"File.CellType"};
    const auto object = subject_.make();
    const std::string missing = report_.file("missing.hdr"), text = golden(".xml");
    for (const char* file : {missing.c_str(), "", static_cast<const char*>(nullptr)})
        EXPECT_EQ(subject_.read(*object, file), expected(false));
    EXPECT_FALSE(std::filesystem::exists(missing));
    for (std::size_t length = 0; length + 2 < text.size(); length += 1 + text.size() / 40)
        EXPECT_EQ(read(*object, text.substr(0, length)), expected(false)) << length;
    EXPECT_THAT(test::differences(*fresh(), *object), ElementsAreArray(spoilt));
}

// A disk that fills up is tested with one class of each way of writing.
TEST_P(EveryObject, SaysThatItCannotBeWritten) {
    const test::CapturedStderr silent;
    const std::string nowhere = report_.file("no_such_folder/header.hdr");
    for (const char* file : {nowhere.c_str(), "", static_cast<const char*>(nullptr)})
        EXPECT_EQ(subject_.write(*filled(), file), subject_.unwritable);
}

TEST_P(EveryObject, ClonesIntoItsArgument) {
    std::vector<std::string> left_out;
    if (subject_.name == "QuickLook_Obj") left_out = {"QL_AzimuthML", "QL_RangeML"};
    const auto source = filled(1), same = filled(1), target = filled(2);
    EXPECT_EQ(subject_.clone(*source, *target) + subject_.clone(*source, *source), 0);
    EXPECT_THAT(test::differences(*source, *same), IsEmpty());
    EXPECT_THAT(test::differences(*source, *target), ElementsAreArray(left_out));
}

}  // namespace
