// SPDX-License-Identifier: Apache-2.0
#include "faults/jobs.h"

#include "objects/records.h"
#include "quo_base/Coregist.h"
#include "quo_base/MatrixAlgebraANSI.h"
#include "quo_base/ckerr.h"
#include "quo_base/debugIO.h"
#include "quo_base/gen_utils.h"
#include "quo_base/generalSAR_configuration.h"
#include "quo_base/interp.h"
#include "quo_base/mission_import.h"
#include "quo_base/product.h"
#include "quo_base/profile.h"
#include "quo_base/quorelReport.h"
#include "quo_base/quorelxml_v2.h"
#include "support/diagnostics.h"
#include "support/raster.h"
#include "support/scenes.h"

namespace {

using test::file_in;
using test::Run;
using Folder = const std::string&;

/** 0 is only said where everything is right; wrong values with a good status are worse than any crash. */
int judged(int status, bool right) {
    if (status == 0 && !right) std::abort();
    return status;
}

std::shared_ptr<GeneralSAR> product() {
    auto made = std::make_shared<GeneralSAR>();
    test::fill_product(*made);
    return made;
}
template <GSObject kObject>
Run write_object(Folder folder) {
    return [made = product(), file = file_in(folder, "product.hdr")]() noexcept {
        return made->GSget(kObject)->writehdr(file);
    };
}
constexpr char kProduct[] = "product.hdr", kNewProduct[] = "new.hdr";
template <const char* kName>
Run write_product(Folder folder) {
    return [made = product(), file = file_in(folder, kName)]() noexcept { return made->GSwrite(file); };
}
Run read_product(Folder folder) {
    const char* const file = file_in(folder, "whole.hdr");
    auto whole = std::make_shared<GeneralSAR>(), read = std::make_shared<GeneralSAR>();
    whole->GSread(file);
    return [=] {
        if ([&]() noexcept { return read->GSread(file); }() != 0) return 1;
        const auto there = test::present_in(*read);
        for (const GSObject object : there)
            judged(0, test::differing_fields(*whole->GSget(object), *read->GSget(object)).empty());
        if (there != test::present_in(*whole)) return 1;
        return judged(0, test::differences(*whole, *read).empty());
    };
}
/** Orbits that are read, copied, re-sampled and checked: whatever fails, each has all of its vectors or none. */
Run use_orbit(Folder folder) {
    auto read = std::make_shared<GeneralSAROrbit>(), copy = std::make_shared<GeneralSAROrbit>();
    auto record = std::make_shared<SAROrbitStateVectors_Obj>();
    return [=, file = file_in(folder, "orbit.hdr")] {
        std::vector<SVFinding> findings;
        int status = copy->SVCreate(1.5, 9.7, 12);
        if (status == 0 && copy->nSV_n != 12) std::abort();
        if (status == 0) status = record->readhdr(file);
        if (status == 0) status = read->readhdr(file);
        if (status == 0) status = read->clone(copy.get());
        if (status == 0) status = copy->SVResample(9.0);
        if (status == 0) status = copy->SVCheck(findings);
        for (const auto& orbit : {read, copy})
            judged(0, (orbit->pSV_m != nullptr) == (orbit->nSV_n > 0) && !orbit->pSV_m == !orbit->vSV_mOs);
        judged(0, !record->pSV_m == !record->vSV_mOs);
        return status;
    };
}

Run write_configuration(Folder folder) {
    auto made = std::make_shared<GeneralSAR_configuration>();
    for (int i = 0; i < 6; ++i) made->GSenable(static_cast<GScObject>(i));
    return [made, file = file_in(folder, "records.xml")] {
        try {
            return made->GSwrite(file, 1);
        } catch (const quorelException&) {
            return 1;
        }
    };
}
Run write_coregistration(Folder folder) {
    return [made = std::make_shared<Coregist>(), file = file_in(folder, "product.hdr")] {
        return made->writepar(file);
    };
}
Run write_factor(Folder folder) {
    auto tables = std::make_shared<EnvisatCalibrationFactors>();
    tables->IM_HH[0] = 17.3;
    return [tables, file = file_in(folder, "stripmap.hdr")]() noexcept { return tables->writeFactor(file); };
}

template <typename Document, int (*kUse)(Document& document, const char* file)>
Run with_document(Folder folder) {
    return [document = std::make_shared<Document>(), file = file_in(folder, "product.hdr")] {
        return kUse(*document, file);
    };
}
int add_values(quorelxml& document, const char* file) {
    const double values[] = {1.5, 2.5};
    const char* text = "New";
    if (const int status = document.initXmlFile(file)) return status;
    if (const int status = document.writeDouble(2, "New/a", values, 2)) return status;
    if (const int status = document.writeString(1, "New/b", &text, 1)) return status;
    return document.write();
}
int add_instruction(quorelxmlPi& document, const char* file) {
    const int status = document.initXmlFile(file, "New.xsl");
    return status != 0 ? status : document.write();
}
int read_values(quorelxml& document, const char* file) {
    double value = 0.0;
    if (document.initXmlFile(file) != 0) return 1;
    const int status = document.readDouble(1, "SamplingConstants/prf_hz", &value, 1);
    return judged(status, value != 0.0);
}

Run describe(Folder folder) {
    static const std::string text(9000, '<');  // more than fits into the serializer's first buffer
    return [file = file_in(folder, "names.hdr")] { return quorelxml{}.setDescription(file, text.c_str()); };
}

template <int (*kUse)(const char* file)>
Run with_profile(Folder folder) {
    return [file = file_in(folder, "a.par")] { return kUse(file); };
}
Run copy_profile(Folder folder) {
    return
        [from = file_in(folder, "a.par"), to = file_in(folder, "out.csv")] { return copyParameterFile(from, to); };
}
int set_and_sync(const char* file) {
    const double values[] = {1.5, 2.5};
    const int status = WriteProfileDoubleArray("s", "New", values, 2, file);
    return status != 0 ? status : SyncProfile(file);
}
int delete_and_sync_all(const char* file) {
    if (GetSetProfileChar(1, "s", "New", "17.3", file) == nullptr) return 1;
    DelProfileKey("s", "k", file);
    return SyncProfile(nullptr) == -1 ? 0 : 1;
}
int read_keys(const char* file) {
    int values[] = {0, 0};
    const int status = GetParInt(file, "list", 2, values, 0, "t");
    return judged(status, values[0] == 17 && values[1] == 29);
}
Run fall_back(Folder folder) {
    auto pulse = std::make_shared<SARPulse_Obj>();
    return [pulse, file = file_in(folder, "records.xml")] {  // which has no such section
        const int status = pulse->readhdr(file);
        (void)SyncProfile(nullptr);
        return status == 1 ? 0 : 1;
    };
}

template <typename Raster>
std::shared_ptr<Raster> raster(Folder folder, const char* name) {
    auto made = std::make_shared<Raster>();
    made->setFilename(file_in(folder, name));
    made->NrOfLinesPerImage = 7;
    made->NrOfPixelsPerLine = 5;
    made->CellType = FLOAT32;
    return made;
}
constexpr char kOldRaster[] = "out.raw", kNewRaster[] = "new.raw";
template <typename Raster, const char* kTo>
Run copy_raster(Folder folder) {
    return [from = raster<Raster>(folder, "in.raw"), file = file_in(folder, kTo)] { return from->copy(file); };
}
Run describe_raster(Folder folder) {
    return [made = raster<DataFile>(folder, "out.raw")] { return made->write_hdr(); };
}
template <int kMode, int kBuffer>
Run write_raster(Folder folder) {
    auto made = raster<DataFile>(folder, "out.raw");
    made->BufferSize = kBuffer;
    return [=, bytes = test::raster_bytes(*made)] {
        int status = made->open(kMode);
        for (std::size_t done = 0; status == 0 && done < bytes.size(); done += 20)
            status = made->write(bytes.data() + done, 20);
        const int closed = made->close();
        return status != 0 ? status : closed;
    };
}
/** What is written beside samples that cannot be read never takes zeros over them. */
Run update_raster(Folder folder) {
    const char* const file = file_in(folder, "out.raw");
    return [made = raster<BufferFile>(folder, "out.raw"), file, old = test::read_text(file)] {
        made->open(BufferFile::READ_WRITE);
        made->initbuffer(16, 0);
        for (const int place : {2, 5, 9, 25, 29, 1}) {  // samples with no byte 0
            made->seek(place, BufferFile::FROM_START);
            made->write("w", 1);
        }
        made->close();
        std::error_code failed;  // the job's own look may be the one that fails
        if (!std::filesystem::is_regular_file(file, failed)) return made->status();
        std::array<char, 64> now{};
        std::FILE* const stream = std::fopen(file, "rb");
        const std::size_t there = stream ? std::fread(now.data(), 1, now.size(), stream) : 0;
        if (stream) std::fclose(stream);
        for (std::size_t i = 0; i < there; ++i) judged(0, now.at(i) == old[i] || now.at(i) == 'w');
        return made->status();
    };
}
Run make_raster(Folder folder) {
    auto made = raster<BufferFile>(folder, "out.raw");
    return [=, bytes = test::raster_bytes(*made)] {
        if (const int status = made->create()) return status;
        made->initbuffer(16, 0);
        made->write(bytes.data(), static_cast<int>(bytes.size()));
        return made->commit();
    };
}
Run read_region(Folder folder) {
    auto made = raster<DataFile>(folder, "in.raw");
    return [made, file = file_in(folder, "in.raw")] {
        std::array<float, 35> samples{};
        int status = made->read_hdr(file);
        if (status == 0)
            status =
                BufferIO{made.get(), 0, 5, 0, 7, FLOAT32}.readbuffer(reinterpret_cast<char*>(samples.data()), 5);
        made->close();
        return judged(status, samples[34] == static_cast<float>(test::part_value(6, 4, 0)));
    };
}

template <int kBuffer>
Run write_stream(Folder folder) {
    auto made = raster<BufferFile>(folder, "out.raw");
    return [=, bytes = test::raster_bytes(*made)] {
        made->open(BufferFile::WRITE);
        made->initbuffer(kBuffer, 0);
        for (std::size_t done = 0; made->status() == 0 && done < bytes.size(); done += 20)
            made->write(bytes.data() + done, 20);
        made->close();
        return made->status();
    };
}

Run use_handle(Folder folder) {
    return [header = file_in(folder, "whole.hdr"), file = file_in(folder, "in.raw")] {
        quo_product* opened = nullptr;
        double centroids = 0.0;
        float sample = 0.0F;
        int status = quo_product_open(header, file, &opened);
        if (status != 0) return judged(status, false);
        status = quo_product_number(opened, "PolySAR/ndc", &centroids);
        if (status == 0) status = quo_product_read(opened, 6, 1, 4, 1, FLOAT32, &sample, sizeof sample);
        judged(quo_product_close(opened), true);
        return judged(status, centroids == 2.0 && sample == static_cast<float>(test::part_value(6, 4, 0)));
    };
}

/** No file is touched here: what is computed is right, or the status says that memory was short. */
Run compute(Folder folder) {
    struct Given {
        GeneralSAROrbit orbit;
        ROI_Obj roi;
        polyDC doppler;
    };
    auto given = std::make_shared<Given>();
    test::load_orbit(test::kScenes[0], given->orbit);
    given->roi.read_roi(file_in(folder, "scene.xml"), "ROI");
    given->doppler.trg0 = given->roi.FastStartTime;
    given->doppler.taz0 = given->roi.SlowStartTime;
    return [given] {
        const double matrix[] = {2.0, 1.0, 1.0, 3.0}, x[] = {1.0, 2.0, 3.0, 5.0}, y[] = {3.0, 5.0, 7.0, 11.0};
        const std::array<fcomplex, 15> image{};
        std::array<fcomplex, 4> at{fcomplex{17.3F}};
        double inverse[4]{}, line[2]{};
        polyFR rate;
        int status = MatInv(matrix, inverse, 2);
        if (status == 0) status = polfit(x, y, 4, line, 1);
        if (status == 0) status = interp2D{}.interp2(image.data(), 5, 3, x, x, 2, at.data());
        if (status == 0) status = demodulationPhase{0.5}.applyDemodPhase(at.data(), 2, 2);
        if (status == 0) status = given->orbit.SVGetFRpoly(&given->roi, &given->doppler, &rate);
        return judged(status, std::abs(inverse[0] - 0.6) + std::abs(line[1] - 2.0) < 1e-9 && at[0] == fcomplex{} &&
                                  rate.pol[0] < 0.0);
    };
}

Run write_chirp(Folder folder) {
    auto pulse = std::make_shared<SARPulse_Obj>();
    pulse->PulseLength = 1e-6;
    pulse->Bandwidth = 17.3e6;
    pulse->PulseSamplingRate = 2e7;
    return [pulse, file = file_in(folder, "out.raw")] { return pulse->writeChirp(file); };
}
Run dump(Folder folder) {
    return [file = file_in(folder, "out.raw")] {
        const std::array<float, 6> values{17.3F};
        return write_debug(file, values.data(), 0, 2, 3);
    };
}
Run report(Folder folder) {
    return [file = file_in(folder, "report"), shown = file_in(folder, "progress")] {
        exit_report();
        if (init_report(file, "title", 1) != 0) return 1;
        quo_add_report("words", QUO_WARNING, 1, "function", "file");
        quorelReport progress;
        progress.setProgressName(shown);
        const int status = progress.progress_update(17.3F, "words");
        return exit_report() != 0 ? 1 : status;
    };
}

/** An annotation and its measurement, taken from a seed that has the lengths of both in its first line. */
constexpr char kDelivered[] = "s1a-iw-grd-vv-20211223t051122-20211223t051147-030148-039993-001";
void lay_out_delivery(const std::string& folder) {
    std::istringstream seed{test::read_text(QUO_IMPORT_SEED)};
    std::size_t lengths[2]{};
    seed >> lengths[0] >> lengths[1];
    seed.ignore();
    for (const auto& [length, place] : {std::pair{lengths[0], "/annotation/"}, {lengths[1], "/measurement/"}}) {
        std::filesystem::create_directory(folder + place);
        std::string part(length, '\0');
        seed.read(part.data(), static_cast<std::streamsize>(length));
        test::write_text(folder + place + kDelivered + (place[1] == 'a' ? ".xml" : ".tiff"), part);
    }
}
Run import_product(Folder folder) {
    static const std::string annotation = std::string{"annotation/"} + kDelivered + ".xml";
    setenv("QUO_TIFF_MODULE", QUO_TEST_TIFF_MODULE, 1);
    return [from = file_in(folder, annotation.c_str()), to = file_in(folder, "new.raw")] {
        quo_import_request request{};
        request.source = from;
        request.raster = to;
        quo_import_result result{};
        return quo_import_sentinel1(&request, &result);
    };
}

constexpr auto kOldOrNew = test::Promise::kOldOrNew, kReports = test::Promise::kReports,
               kUnchanged = test::Promise::kUnchanged, kLists = test::Promise::kLists,
               kTells = test::Promise::kTells, kSurvives = test::Promise::kSurvives,
               kSilent = test::Promise::kSilent;

}  // namespace

const char* test::file_in(const std::string& folder, const char* name) {
    static std::vector<std::unique_ptr<std::string>> names;
    return names.emplace_back(std::make_unique<std::string>(folder + '/' + name))->c_str();
}
void test::PrintTo(const Job& job, std::ostream* stream) { *stream << job.name; }

const std::vector<test::Job>& test::jobs() {
    static const std::vector<Job> kJobs = [] {
        std::vector<Job> jobs = {{"DataFileObject", kReports, write_object<gsDataFile>},
                                 {"Roi", kReports, write_object<gsRoi>},
                                 {"Polynomials", kOldOrNew, write_object<gsPolySAR>},
                                 {"SamplingConstants", kOldOrNew, write_object<gsSamplingConstants>},
                                 {"Orbit", kOldOrNew, write_object<gsOrbit>},
                                 {"SwathInfo", kOldOrNew, write_object<gsSwathInfo>},
                                 {"AntennaPattern", kOldOrNew, write_object<gsAntennaPattern>},
                                 {"GeoCoords", kOldOrNew, write_object<gsGeoCoords>},
                                 {"BufferFileObject", kOldOrNew, write_object<gsBufferFile>},
                                 {"Coregistration", kReports, write_coregistration},
                                 {"Product", kReports, write_product<kProduct>, true},
                                 {"NewProduct", kReports, write_product<kNewProduct>},
                                 {"Configuration", kOldOrNew, write_configuration},
                                 {"CalibrationFactor", kOldOrNew, write_factor},
                                 {"Document", kOldOrNew, with_document<quorelxml, add_values>},
                                 {"Description", kOldOrNew, describe},
                                 {"StyleSheet", kOldOrNew, with_document<quorelxmlPi, add_instruction>},
                                 {"Profile", kOldOrNew, with_profile<set_and_sync>, true},
                                 {"AllProfiles", kOldOrNew, with_profile<delete_and_sync_all>},
                                 {"ProfileCopy", kSilent, copy_profile},
                                 {"SideFile", kOldOrNew, describe_raster},
                                 {"DataFileCopy", kOldOrNew, copy_raster<DataFile, kOldRaster>, true},
                                 {"DataFileCopyToNew", kOldOrNew, copy_raster<DataFile, kNewRaster>},
                                 {"BufferFileCopy", kOldOrNew, copy_raster<BufferFile, kOldRaster>},
                                 {"Raster", kTells, write_raster<1, 0>},
                                 {"BufferedRaster", kTells, write_raster<2, 48>},
                                 {"StreamedRaster", kTells, write_stream<0>},
                                 {"BufferedStream", kTells, write_stream<48>},
                                 {"UpdatedRaster", kTells, update_raster},
                                 {"BufferFileMade", kOldOrNew, make_raster},
                                 {"importProduct", kOldOrNew, import_product},
                                 {"Chirp", kTells, write_chirp},
                                 {"Dump", kTells, dump},
                                 {"Report", kSurvives, report},
                                 {"ReadProduct", kUnchanged, read_product},
                                 {"ReadOrbit", kUnchanged, use_orbit},
                                 {"UseHandle", kUnchanged, use_handle},
                                 {"ReadDocument", kUnchanged, with_document<quorelxml, read_values>},
                                 {"ReadProfile", kUnchanged, with_profile<read_keys>},
                                 {"FallBack", kUnchanged, fall_back},
                                 {"ReadRegion", kUnchanged, read_region},
                                 {"Compute", kUnchanged, compute}};
#ifdef QUO_TOOL
        for (const auto& row : read_table("fault_verbs.txt", '|')) {
            const auto does = [&](const char* word) { return row[1].find(word) != row[1].npos; };
            jobs.push_back({row[0],
                            does("reads")   ? kUnchanged
                            : does("lists") ? kLists
                                            : kOldOrNew,
                            nullptr, does("killed"), row[2], !does("without memory")});
        }
#endif
        return jobs;
    }();
    return kJobs;
}

// Among them a header with more names than the first room of the parser's dictionary, and a description that needs
// memory of its own.
void test::lay_out(const std::string& folder, const Job& job) {
    for (const auto& file : std::filesystem::directory_iterator{QUO_TEST_DATA "/faults"})
        write_text(folder + '/' + file.path().filename().string(), read_text(file.path()));
    std::string scene = read_text(kScenes[0].path(".xml"));
    scene.insert(scene.find("</Channel>"),
                 "<RasterInfo><NrOfLinesPerImage>12236</NrOfLinesPerImage>"
                 "<NrOfPixelsPerLine>22694</NrOfPixelsPerLine><HeaderOffset>0</HeaderOffset>"
                 "<RowPrefix>0</RowPrefix><ByteOrder>0</ByteOrder><CellType>2</CellType>"
                 "</RasterInfo>");
    write_text(folder + "/scene.xml", scene);
    std::filesystem::permissions(folder + "/a.par", std::filesystem::perms{0640});
    if (job.name.starts_with("import")) lay_out_delivery(folder);
}
