// SPDX-License-Identifier: Apache-2.0
#include <atomic>
#include <barrier>
#include <regex>
#include <thread>

#include "diagnosticslib/call_frame.h"
#include "quo_base/SARpolynomials.h"
#include "quo_base/acquisition.h"
#include "quo_base/datafile.h"
#include "quo_base/fft.h"
#include "quo_base/gen_utils.h"
#include "quo_base/generalSARorbit.h"
#include "quo_base/product.h"
#include "quo_base/profile.h"
#include "quo_base/quorelReport.h"
#include "quo_base/quorelxml_v2.h"
#include "support/diagnostics.h"
#include "support/raster.h"
#include "support/scenes.h"

namespace {

constexpr int kThreads = 8;

/** Runs `work(thread)` on several threads, which begin together. */
void side_by_side(const std::function<void(int)>& work) {
    std::barrier start{kThreads};
    std::vector<std::jthread> threads;
    for (int thread = 0; thread < kThreads; ++thread)
        threads.emplace_back([&, thread] {
            start.arrive_and_wait();
            errno = 0;  // waiting leaves something there
            work(thread);
        });
}

/** Tracking and a report, and nothing left of either. */
class Threads : public testing::Test {
public:
    Threads() {
        exit_ckerr();
        init_ckerr_locking();
        init_report(report_.c_str(), "threads", 1);
        setenv("QUO_FFT_ENGINE", "auto", 1);
        setenv("QUO_FFTW_MODULE", QUO_TEST_FFTW_MODULE, 1);
    }
    ~Threads() override {
        exit_report();
        test::CapturedStderr captured;
        exit_ckerr();
        EXPECT_EQ(captured.text(), "");
        FreeProfile(nullptr);
        errno = 0;
    }

protected:
    [[nodiscard]] std::string file(const std::string& name) const { return folder_.file(name); }
    /** The report's text from the first entry on. */
    [[nodiscard]] std::string entries() const {
        const std::string text = test::read_text(report_);
        return text.substr(text.rfind("===\n") + 4);
    }

private:
    test::TemporaryFolder folder_;
    std::string report_ = folder_.file("report.txt");
};

// ---- what processors do, each on files of its own and on what all share

/** Where a thread works, and what it has found: the same on every thread. */
struct Desk {
    std::string folder, shared;
    std::vector<double> results;

    [[nodiscard]] std::string file(const char* name) const { return folder + name; }
    void note(double value) { results.push_back(value); }
};

void use_headers(Desk& desk) {
    const std::string own = desk.file("header.xml"), scene = test::kScenes[0].path(".xml");
    SamplingConstants_Obj sampling;
    desk.note(sampling.readhdr(scene.c_str()));
    desk.note(sampling.prf_hz);
    desk.note(sampling.writehdr(own.c_str()));
    quorelxml document{own.c_str()};
    double prf_hz = 0.0;
    desk.note(document.readDouble(1, "SamplingConstants/prf_hz", &prf_hz, 1));
    desk.note(prf_hz);
    desk.note(sampling.writehdr(desk.file("none/header.xml").c_str()));  // reports
}

void use_parameters(Desk& desk) {
    const std::string own = desk.file("own.ini"), &shared = desk.shared;
    std::array<int, 3> numbers{1, 2, 3};
    desk.note(WriteMyProfileIntArray("Section", "numbers", numbers.data(), 3, own.c_str()));
    desk.note(SyncProfile(own.c_str()));
    FreeProfile(own.c_str());
    desk.note(GetMyProfileIntArray("Section", "numbers", numbers.data(), 3, own.c_str()));
    desk.note(numbers[2]);
    desk.note(WriteMyProfileInt(desk.folder.c_str(), "number", 7, shared.c_str()));
    char text[16] = "";
    desk.note(GetMyProfileString(desk.folder.c_str(), "number", text, sizeof text, shared.c_str()));
    desk.note(std::atoi(text));  // NOLINT(cert-err34-c): of a text that was just written
}

void use_rasters(Desk& desk) {
    DataFile raster;
    raster.setFilename(desk.file("raster.raw").c_str());
    raster.NrOfPixelsPerLine = 64;
    raster.NrOfLinesPerImage = 16;
    raster.CellType = FLOAT32;
    std::string bytes = test::raster_bytes(raster);
    const auto size = static_cast<std::int64_t>(bytes.size());
    desk.note(raster.open(1));
    desk.note(raster.write(bytes.data(), size));
    desk.note(raster.close());
    desk.note(raster.write_hdr());
    std::vector<float> samples(1024);
    desk.note(raster.open(0));
    desk.note(BufferIO{&raster, 0, 64, 0, 16, FLOAT32}.readbuffer(reinterpret_cast<char*>(samples.data()), 64));
    for (const float sample : samples) desk.note(sample);
    desk.note(raster.close());
}

void transform(Desk& desk) {
    constexpr int kColumns = 24, kRows = 360;
    std::vector<fcomplex> image(std::size_t{kColumns} * kRows);
    for (std::size_t i = 0; i < image.size(); ++i)
        image[i] = {static_cast<float>(i % 17), static_cast<float>(i % 5)};
    FftPlan plan{};
    desk.note(fft_makep_c(&plan, kColumns, kColumns, kRows, kRows, 1, 1, 1));
    desk.note(pfft_c(&plan, image.data(), image.data()));
    desk.note(fft_destp_c(&plan));
    desk.note(std::round(std::abs(image[77])));
    std::vector<float> real(363);  // of a factor that another engine takes
    for (std::size_t i = 0; i < real.size(); ++i) real[i] = static_cast<float>(i % 7);
    desk.note(fft_r(363, 363, 1, 1, 1, 0, real.data(), real.data()));
    desk.note(std::round(real[0]));
    desk.note(fft_c(1, 0, 1, 1, 1, 0, image.data(), image.data()));  // refused, which the thread alone is told
    desk.note(std::strlen(fft_engine_error()) == 0);
}

void geolocate(Desk& desk) {
    GeneralSAROrbit orbit;
    test::load_orbit(test::kScenes[0], orbit);
    for (const auto& point : test::load_tie_points(test::kScenes[0])) {
        double xyz[3], azimuth_s = 0.0, range_s = 0.0;
        desk.note(orbit.sat2earth(point.azimuth_time_s, point.range_time_s, xyz));
        desk.note(orbit.earth2sat(xyz, &azimuth_s, &range_s));
        desk.note(azimuth_s);
        desk.note(range_s);
    }
    desk.note(ascii2sec85("04-JAN-2022 10:11:12.5"));
}

constexpr auto kJobs = std::to_array({use_headers, use_parameters, use_rasters, transform, geolocate});

TEST_F(Threads, WorkingAtTheSameTimeFindWhatOneFindsAlone) {
    constexpr int kRounds = 3;
    std::array<Desk, kThreads> desks;
    const auto work = [&](int thread) {
        Desk& desk = desks.at(static_cast<std::size_t>(thread));
        desk.folder = file("desk" + std::to_string(thread)) + "/";
        desk.shared = file("shared.ini");
        std::filesystem::create_directory(desk.folder);
        std::array<std::vector<double>, kJobs.size()> found;
        for (std::size_t step = 0; step < kRounds * kJobs.size(); ++step) {
            const std::size_t job = (step + static_cast<std::size_t>(thread)) % kJobs.size();
            desk.results.clear();
            kJobs.at(job)(desk);
            found.at(job) = desk.results;
        }
        desk.results.clear();
        for (const auto& results : found) desk.results.insert(desk.results.end(), results.begin(), results.end());
        SyncProfile(nullptr);
    };
    test::CapturedStderr captured;
    work(0);
    const std::vector<double> alone = desks[0].results;
    EXPECT_STRNE(fft_engine_name(), "");
    side_by_side(work);
    for (const Desk& desk : desks) EXPECT_EQ(desk.results, alone);
    FreeProfile(nullptr);
    for (const Desk& desk : desks) {
        char number[8] = "";
        EXPECT_EQ(GetMyProfileString(desk.folder.c_str(), "number", number, sizeof number, desk.shared.c_str()),
                  0);
        EXPECT_STREQ(number, "7");
    }
    // The entries of the missing header: every number once, every entry in one piece.
    std::string text = entries();
    const std::regex entry{
        R"(\n(\d+)\)  ERROR \[\d+ sec\]\.\n    FILE : [^\n]+\n    FUNCTION : [^\n]+\n    LINE : \d+\.\n)"
        R"(    MESSAGE : [^\n]+\n|    \. Call tree: FILE [^\n]+, FUNCTION [^\n]+, LINE \d+\.\n)"};
    std::map<std::string, int> numbers;
    for (std::sregex_iterator found{text.begin(), text.end(), entry}, none; found != none; ++found)
        if ((*found)[1].matched) ++numbers[(*found)[1]];
    EXPECT_GE(numbers.size(), std::size_t{kRounds} * (kThreads + 1));
    for (const auto& [number, times] : numbers) EXPECT_EQ(times, 1) << number;
    EXPECT_EQ(std::regex_replace(text, entry, ""), "");
}

// What an object only tells, it tells to several at a time; what it finds out when it is first asked, too.
TEST_F(Threads, AskOneObjectAtTheSameTime) {
    constexpr int kList = 40;
    polySAR polynomials;
    ASSERT_EQ(polynomials.CreatePolys(kList, 1), 0);
    for (int i = 0; i < kList; ++i) {
        polynomials.DC[i].taz0 = i;
        polynomials.DC[i].pol[0] = 3.5 * i;
    }
    GeneralSAROrbit orbit;
    test::load_orbit(test::kScenes[0], orbit);
    constexpr std::size_t kPoints = 4000;
    const std::vector<double> times(kPoints, 1167930360.0), ranges(kPoints, 0.0054);
    double xyz[3];
    ASSERT_EQ(orbit.sat2earth(times[0], ranges[0], xyz), 0);
    constexpr int kLength = 512;
    FftPlan plan{};
    ASSERT_EQ(fft_makep_c(&plan, kLength, kLength, 1, 1, 1, 0, 1), 0);

    std::vector<double> x(kPoints * kThreads);
    side_by_side([&](int thread) {
        for (int i = 0; i < 1000; ++i) {
            const double t = (i + thread) % kList - 0.5;
            EXPECT_EQ(polynomials.EvaluateDC(0.005, t), 3.5 * std::ceil(t));
        }
        OrbitGround ground;
        ground.x_m = x.data() + kPoints * static_cast<std::size_t>(thread);
        EXPECT_EQ(orbit.sat2earth(OrbitSamples{kPoints, times.data(), ranges.data()}, ground), 0);
        std::vector<fcomplex> row(kLength, {1.0F, 0.0F});
        EXPECT_EQ(pfft_c(&plan, row.data(), row.data()), 0);
        EXPECT_EQ(row[0], fcomplex(kLength, 0.0F));
    });
    EXPECT_THAT(x, testing::Each(xyz[0]));
    EXPECT_EQ(fft_destp_c(&plan), 0);
}

// A product is closed by the one thread while the others still work on it.
TEST_F(Threads, ShareAProductUntilItIsClosed) {
    const std::string name = file("raster.raw");
    DataFile raster;
    raster.setFilename(name.c_str());
    raster.NrOfPixelsPerLine = 64;
    raster.NrOfLinesPerImage = 16;
    raster.CellType = INT16;
    test::write_text(name, test::raster_bytes(raster));
    ASSERT_EQ(raster.write_hdr(), 0);
    const test::CapturedStderr captured;
    quo_product* product = nullptr;
    ASSERT_EQ(quo_product_open(test::kScenes[0].path(".xml").c_str(), name.c_str(), &product), 0);
    side_by_side([&](int thread) {
        const double t = 1167930360.0, range = 0.0054, same = 12.5;
        for (int round = 0, refused = 0; refused < 3; ++round) {
            double first_s = same, longitude = same, sample = same;
            const int status[] = {
                quo_product_number(product, "StateVectorData/t0SV_s", &first_s),
                quo_product_to_ground(product, 1, &t, &range, nullptr, nullptr, nullptr, &longitude, nullptr,
                                      nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr),
                quo_product_read(product, 3, 1, thread, 1, FLOAT64, &sample, sizeof sample)};
            EXPECT_EQ(first_s, status[0] ? same : 1167930296.781409);
            EXPECT_NEAR(longitude, status[1] ? same : 11.68, 0.5);
            EXPECT_EQ(sample, status[2] ? same : test::part_value(3, thread, 0));
            refused = status[0] + status[1] + status[2];
            if (thread == 0 && round == 50) {
                EXPECT_EQ(refused, 0);
                EXPECT_EQ(quo_product_close(product), 0);
            }
        }
    });
}

// Threads that write parts of one raster have an object each.
TEST_F(Threads, WritePartsOfOneRaster) {
    const auto describe = [&](DataFile& raster) {
        raster.setFilename(file("parts.raw").c_str());
        raster.NrOfPixelsPerLine = 512;
        raster.NrOfLinesPerImage = 8 * kThreads;
        raster.CellType = INT16;
    };
    DataFile whole;
    describe(whole);
    const std::string bytes = test::raster_bytes(whole);
    test::write_text(file("parts.raw"), std::string(bytes.size(), '\0'));
    side_by_side([&](int thread) {
        DataFile part;
        describe(part);
        EXPECT_EQ(part.open(2), 0);
        const auto size = static_cast<std::int64_t>(bytes.size()) / kThreads;
        EXPECT_EQ(part.seek(thread * size, 0), 0);
        EXPECT_EQ(part.write(bytes.data() + thread * size, size), 0);
        EXPECT_EQ(part.close(), 0);
    });
    EXPECT_TRUE(test::read_text(file("parts.raw")) == bytes);
}

// A block belongs to the call that asked for it, on its own thread; who frees it does not matter.
TEST_F(Threads, EachFreesWhatItsOwnCallsTook) {
    std::array<std::array<std::atomic<void*>, 64>, kThreads> handed_on{};
    side_by_side([&](int thread) {
        for (std::size_t round = 0; round < 64; ++round) {
            void* const kept = malloc_ckerr(24);
            {
                quo::CallFrame frame{"failing()", "threads_test.cpp"};
                EXPECT_NE(calloc_ckerr(3, 8), nullptr);
            }  // without success: what it took is freed
            std::memset(kept, thread, 24);
            handed_on.at(static_cast<std::size_t>(thread + 1) % kThreads).at(round) = kept;
            if (void* const given = handed_on.at(static_cast<std::size_t>(thread)).at(round).exchange(nullptr))
                free_ckerr(given);
        }
    });
    // Their threads have ended; the next one's failing calls let their blocks be.
    std::jthread{[] { freeall_ckerr(); }}.join();
    for (auto& blocks : handed_on)
        for (auto& block : blocks)
            if (block) free_ckerr(block);
}

TEST_F(Threads, LeaveBlocksThatTheLeakReportNames) {
    std::jthread{[] {
        set_ckerr_fun("worker()");
        (void)malloc_ckerr(8);
        deccurdep();
    }}.join();
    void* const own = malloc_ckerr(8);
    test::CapturedStderr captured;
    exit_ckerr();
    const std::string report = captured.text();
    EXPECT_NE(report.find("\n2 buffers left"), report.npos) << report;
    EXPECT_NE(report.find("worker() : 0\t1\t\n"), report.npos) << report;
    EXPECT_NE(report.find("main() : 0\t\n"), report.npos) << report;
    std::free(static_cast<void**>(own)[-1]);
}

// Headers are looked into as parameter files, and forgotten when the last has looked: one that stayed would be
// written back as a parameter file.
TEST_F(Threads, LookingIntoOneHeaderLeavesNoTrace) {
    const std::string header = file("header.xml"), other = file("other.ini");
    test::write_text(header, "<Product><Channel number=\"1\"></Channel></Product>\n");
    const std::string before = test::read_text(header);
    test::CapturedStderr captured;
    side_by_side([&](int thread) {
        for (int round = 0; round < 20; ++round) {
            SamplingConstants_Obj sampling;
            EXPECT_NE(sampling.readhdr(header.c_str()), 0);
            if (thread == 0) WriteMyProfileInt("Section", "round", round, other.c_str());
            if (thread == 1) SyncProfile(nullptr);
        }
    });
    EXPECT_EQ(SyncProfile(nullptr), -1);
    EXPECT_EQ(test::read_text(header), before);
    EXPECT_NE(test::read_text(other).find("round = 19"), std::string::npos) << test::read_text(other);
}

}  // namespace
