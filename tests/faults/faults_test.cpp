// SPDX-License-Identifier: Apache-2.0
#include "support/faults.h"

#include <sys/mman.h>

#include "faults/jobs.h"
#include "quo_base/ckerr.h"
#include "quo_base/datafile.h"
#include "quo_base/profile.h"
#include "quo_base/quorelxml_v2.h"
#include "support/diagnostics.h"
#include "support/failing_memory.h"

// Every system call of every job that saves or reads fails in turn, in each way that it can, once and from then
// on; so does every allocation; and the process is killed before each call. One rule holds for all: a file is what
// it was or what it was to become, and success means the latter.

// Only a build that counts what runs has it: a process that ends without its exit handlers tells its counts by it.
extern "C" [[gnu::weak]] void __gcov_dump();

namespace {

// The stores of parameters and of calls end the process themselves where memory ends, as if it were killed.
constexpr char kLastWords[] = "Memory ";
constexpr char kSaid[] = "quo: [^\n]*\n";
constexpr unsigned kLongest_s = 120;  // a verb takes milliseconds: what is not done by then hangs
constexpr uid_t kOrdinaryUser = 65534;
// Verbs and imports allocate some thousand times, most of them in loops over what was read: of later allocations
// one in a share of those before is tried, unless the environment asks for all (QUO_ALL_ALLOCATIONS=1).
constexpr long kSampling = 4;

using test::Call;
using test::Job;
using test::Promise;

/** A system call and what it can say. */
struct Failing {
    const char* name;
    Call call;
    std::vector<int> errors;
};
const std::vector<Failing> kFailing = {
    {"open", Call::kOpen, {EIO, EMFILE, EACCES, ESTALE, ENOSPC, EINTR}},
    {"read", Call::kRead, {EIO, ESTALE, EINTR, test::kShort}},
    {"write", Call::kWrite, {EIO, ENOSPC, EDQUOT, EINTR, test::kShort}},
    {"fsync", Call::kSync, {EIO, ENOSPC, EINTR}},
    {"close", Call::kClose, {EIO, EDQUOT}},
    {"rename", Call::kRename, {EIO, ENOSPC, EACCES, EINVAL}},
    {"link", Call::kLink, {EIO, EPERM}},
    {"ftruncate", Call::kResize, {EIO, ENOSPC, EINTR}},
    {"fchmod", Call::kMode, {EPERM}},
    {"fchown", Call::kOwner, {EPERM}},
    {"flock", Call::kLock, {ENOLCK, EINTR}},
    {"copy_file_range", Call::kCopy, {EIO, ENOSPC, test::kShort}},
    {"stat", Call::kStat, {EIO, ESTALE, EACCES}},
    {"access", Call::kAccess, {EIO, EACCES}},
    {"readlink", Call::kReadLink, {EIO, EACCES}},
    {"memory", Call::kMemory, {ENOMEM}},
    {"kill", Call::kAny, {test::kKill}},
};

/** Permissions and bytes of the files of a folder, by name; of what is no file, that it is there. */
using State = std::map<std::string, std::string>;
State state_of(const std::string& folder) {
    State state;
    if (!std::filesystem::exists(folder)) return state;
    for (const auto& entry : std::filesystem::recursive_directory_iterator{folder}) {
        const auto mode = std::to_string(static_cast<unsigned>(entry.status().permissions())) + ' ';
        const bool is_file = entry.is_regular_file() && !entry.is_symlink();
        state[entry.path().string().substr(folder.size() + 1)] =
            is_file ? mode + test::read_text(entry.path()) : "no file";
    }
    return state;
}
void restore(const std::string& folder, const State& state) {
    std::filesystem::remove_all(folder);
    std::filesystem::create_directory(folder);
    for (const auto& [name, content] : state) {  // a folder comes before what is in it
        const std::string file = folder + '/' + name;
        if (content == "no file") {
            std::filesystem::create_directory(file);
            continue;
        }
        test::write_text(file, content.substr(content.find(' ') + 1));
        chmod(file.c_str(), static_cast<mode_t>(std::stoul(content)));
    }
}
/** Whether a file is as it is in a state. */
bool holds(const State& state, const State::value_type& file) {
    const auto found = state.find(file.first);
    return found != state.end() && found->second == file.second;
}

struct Outcome {
    int status = 0, signal = 0;
    long descriptors = 0;
    bool reached = false, blocks = false;
    std::string output, said;  // of the tool, where it succeeds and where it fails
};

/** What stands where a file is to be written, and whether that can be done all the same. Whoever runs the job has
 * no rights beyond those of the files. */
struct Obstacle {
    const char* name;
    void (*lay)(const std::string& folder, const std::string& file);
    bool passable = false;
};
const Obstacle kObstacles[] = {
    {"a folder",
     [](auto&, auto& file) {
         std::filesystem::remove(file);
         std::filesystem::create_directory(file);
     }},
    {"a full device",
     [](auto&, auto& file) {
         std::filesystem::remove(file);
         std::filesystem::create_symlink("/dev/full", file);
     }},
    {"no folder", [](auto& folder, auto&) { std::filesystem::remove_all(folder); }},
    {"a file that may not be written", [](auto&, auto& file) { chmod(file.c_str(), 0444); }},
    // It is written where it stands, with a warning.
    {"a folder that may not be written", [](auto& folder, auto&) { chmod(folder.c_str(), 0555); }, true},
};

/** Runs one job again and again, each time in a process of its own and on the same files. */
class Bench {
public:
    explicit Bench(const Job& job) : job_{job}, shared_{memfd_create("watch", 0)} {
        if (ftruncate(shared_, sizeof *watch_) != 0) throw std::runtime_error("no memory to share");
        watch_ = static_cast<test::Watch*>(
            mmap(nullptr, sizeof *watch_, PROT_READ | PROT_WRITE, MAP_SHARED, shared_, 0));
        init_ckerr_locking();
        std::filesystem::create_directory(folder_);
        test::lay_out(folder_, job);
        old_ = state_of(folder_);
        if (job.prepare) run_ = job.prepare(folder_);
        whole_ = run();
        counted_ = *watch_;
        fresh_ = state_of(folder_);
        reset();
        EXPECT_TRUE(whole_.status == 0 && whole_.signal == 0) << test::read_text(beside_.file("err"));
        EXPECT_EQ(old_ == fresh_, job.promise == Promise::kUnchanged || job.promise == Promise::kLists);
    }
    ~Bench() {
        munmap(watch_, sizeof *watch_);
        close(shared_);
    }
    Bench(const Bench&) = delete;
    Bench& operator=(const Bench&) = delete;

    Outcome run(const test::Fault& fault = {}) { return wait(start(fault)); }
    pid_t start(const test::Fault& fault, bool endlessly = false);
    Outcome wait(pid_t child) const;
    [[nodiscard]] bool allocates_often() const { return !job_.verb.empty() || job_.name.starts_with("import"); }
    void reset() {
        if (state_of(folder_) != old_) restore(folder_, old_);
    }
    /** How many calls there are to fail: those of a run without faults, which are the same up to the one that
     * fails. How often memory is asked for shows only when all of it is there. */
    [[nodiscard]] long calls(Call call, int error) const {
        if (call == Call::kMemory) return std::numeric_limits<long>::max();
        return counted_.counted[error == test::kShort ? 1 : 0][static_cast<int>(call)];
    }
    /** Which rule an outcome breaks; empty where none. */
    [[nodiscard]] std::string breach(const test::Fault& fault, const Outcome& outcome) const;
    std::string breach_after_kill();
    /** The same where something is in the way of each file that the job is to change. */
    std::string breach_at(const Obstacle& obstacle);

private:
    /** Whether each line that a run without faults does not print has the words for an error. */
    [[nodiscard]] bool names_cause(const std::string& output, int error) const;
    [[noreturn]] void be_library(const test::Fault& fault, bool endlessly);
    [[noreturn]] void be_tool() const;

    const Job& job_;
    test::TemporaryFolder beside_;
    const std::string folder_ = beside_.file("folder");
    test::Run run_;
    State old_, fresh_;
    Outcome whole_;
    const int shared_;
    test::Watch* watch_ = nullptr;
    test::Watch counted_{};
    bool ordinary_user_ = false;
};

pid_t Bench::start(const test::Fault& fault, bool endlessly) {
    *watch_ = {};
    watch_->fault = fault;
    watch_->uses_files = job_.verb.find('@') != std::string::npos;
    std::strncpy(watch_->folder, folder_.c_str(), sizeof watch_->folder - 1);
    std::fflush(stdout);  // or each child would say it again
    const pid_t child = fork();
    if (child != 0) return child;
    if (!freopen(beside_.file("out").c_str(), "w", stdout) || !freopen(beside_.file("err").c_str(), "w", stderr))
        _exit(99);
    (void)std::setvbuf(stderr, nullptr, _IONBF, 0);  // for what is said on the way into a crash
    if (!job_.verb.empty()) be_tool();
    be_library(fault, endlessly);
}

void Bench::be_library(const test::Fault& fault, bool endlessly) {
    init_report(beside_.file("report").c_str(), "faults", 1);
    if (ordinary_user_ && getuid() == 0 && setuid(kOrdinaryUser) != 0) _exit(99);
    test::start_watching(watch_);
    int status = 0;
    do {
        const bool refuses = fault.call == Call::kMemory;
        if (refuses) test::refuse_memory(fault.nth - 1, !fault.forever);
        watch_->reached = refuses;  // should the refusal end the process
        try {
            status = run_();
        } catch (const std::bad_alloc&) {
            status = QUO_NO_MEMORY;  // jobs that must not let it out are noexcept
        }
        if (refuses) watch_->reached = test::stop_refusing();
    } while (endlessly);
    run_ = nullptr;  // files that the job's objects hold open are closed with them
    watch_->returned = true;
    const long said = lseek(STDERR_FILENO, 0, SEEK_CUR);
    exit_report();
    exit_ckerr();  // which lists the tracked blocks that are left
    watch_->blocks = lseek(STDERR_FILENO, 0, SEEK_CUR) != said;
    if (__gcov_dump != nullptr) __gcov_dump();
    _exit(status != 0 ? 1 : 0);
}

void Bench::be_tool() const {
#ifdef QUO_TOOL
    std::istringstream line{job_.verb};
    std::vector<std::string> words{QUO_TOOL};
    for (std::string word; line >> word;) words.push_back(word[0] == '@' ? folder_ + word.substr(1) : word);
    std::vector<char*> arguments;
    for (std::string& word : words) arguments.push_back(word.data());
    arguments.push_back(nullptr);
    setenv("TMPDIR", beside_.path().c_str(), 1);  // what it leaves there when it is killed
    setenv("LD_PRELOAD", QUO_FAULTS, 1);
    setenv("QUO_FFT_ENGINE", "fftw", 1);
    setenv(test::kWatchVariable, std::to_string(shared_).c_str(), 1);
    alarm(kLongest_s);
    execv(QUO_TOOL, arguments.data());
#endif
    _exit(99);
}

Outcome Bench::wait(pid_t child) const {
    int ended = 0;
    if (waitpid(child, &ended, 0) != child) throw std::runtime_error("the child is lost");
    Outcome outcome;
    outcome.descriptors = watch_->returned ? watch_->descriptors : 0;
    outcome.reached = watch_->reached;
    outcome.blocks = watch_->blocks;
    if (WIFEXITED(ended)) outcome.status = WEXITSTATUS(ended);
    if (WIFSIGNALED(ended)) outcome.signal = WTERMSIG(ended);
    if (job_.promise == Promise::kReports &&
        test::read_text(beside_.file("report")).find("ERROR") != std::string::npos)
        outcome.status = 1;
    const bool succeeded = outcome.status == 0 && outcome.signal == 0;
    if (succeeded || job_.promise == Promise::kLists) outcome.output = test::read_text(beside_.file("out"));
    if (!succeeded) outcome.said = test::read_text(beside_.file("err"));
    return outcome;
}

bool Bench::names_cause(const std::string& output, int error) const {
    std::istringstream lines{output};
    for (std::string line; std::getline(lines, line);)
        if (whole_.output.find(line) == std::string::npos && line.find(strerror(error)) == std::string::npos)
            return false;
    return true;
}

std::string Bench::breach(const test::Fault& fault, const Outcome& outcome) const {
    const State now = state_of(folder_);
    if (outcome.signal != 0) return "signal " + std::to_string(outcome.signal) + ' ' + outcome.said;
    if (outcome.blocks) return "leaves memory";
    if (job_.promise == Promise::kSurvives) return "";
    const bool claims = outcome.status == 0 && job_.promise != Promise::kSilent;
    if (claims && (now != fresh_ || outcome.output != whole_.output)) return "0 but not new";
    if (claims && outcome.reached && fault.call == Call::kSync && fault.error != EINTR)
        return "0 but not on the disk";
    const bool lists = job_.promise == Promise::kLists && outcome.said.empty();
    if (outcome.status != 0 && lists && !names_cause(outcome.output, fault.error))
        return "lists " + outcome.output;
    if (outcome.status != 0 && !job_.verb.empty() && !lists &&
        !testing::Matches(testing::MatchesRegex(kSaid))(outcome.said))
        return "says " + outcome.said;
    // What reads measurements does not try again, and says so.
    const bool tries_again = job_.promise != Promise::kTells && !job_.name.starts_with("import");
    if (outcome.status != 0 && fault.call != Call::kOpen && tries_again &&
        (fault.error == EINTR || fault.error == test::kShort))
        return "not tried again";
    if (job_.promise != Promise::kTells && now != old_ && now != fresh_) return "neither old nor new";
    for (const auto& [name, content] : now)
        if (!old_.contains(name) && !fresh_.contains(name)) return "leaves " + name;
    return outcome.descriptors == 0 ? "" : "leaves a file open";
}

/** Each file is old or new, a raster has all samples of its description, and beside them is at most one file for
 * each that was to be saved; the next save sweeps it. */
std::string Bench::breach_after_kill() {
    if (job_.promise == Promise::kTells || job_.promise == Promise::kSurvives) return "";
    auto too_many = -std::ranges::count_if(fresh_, [&](const auto& file) { return !holds(old_, file); });
    for (const auto& file : state_of(folder_)) {
        if (holds(old_, file) || holds(fresh_, file)) continue;
        if (old_.contains(file.first) || fresh_.contains(file.first)) return file.first + " neither old nor new";
        ++too_many;
    }
    if (too_many > 0) return "too many files";
    for (const char* name : {"/in.raw", "/out.raw", "/new.raw"}) {
        DataFile raster;
        std::error_code missing;
        if (raster.read_hdr((folder_ + name).c_str()) == 0 &&
            raster.rasterSize() > static_cast<std::int64_t>(std::filesystem::file_size(folder_ + name, missing)))
            return name + std::string{" is shorter than its description says"};
    }
    if (run().status != 0) return "not saved again";
    for (const auto& file : state_of(folder_))
        if (!fresh_.contains(file.first)) return "the next save leaves " + file.first;
    return "";
}

std::string Bench::breach_at(const Obstacle& obstacle) {
    std::filesystem::permissions(beside_.path(), std::filesystem::perms{0755});
    chmod(folder_.c_str(), 0777);
    for (const auto& [name, content] : old_)
        if (chown((folder_ + '/' + name).c_str(), kOrdinaryUser, kOrdinaryUser) != 0) errno = 0;
    for (const auto& file : fresh_)
        if (!holds(old_, file)) obstacle.lay(folder_, folder_ + '/' + file.first);
    const State before = state_of(folder_);
    if (before == old_ && !obstacle.passable) return "";  // what is new has no rights that could be missing
    ordinary_user_ = true;
    const Outcome outcome = run();
    ordinary_user_ = false;
    const State now = state_of(folder_);
    const std::string report = test::read_text(beside_.file("report"));
    restore(folder_, old_);
    if (outcome.signal != 0) return "signal " + std::to_string(outcome.signal);
    const bool overwrites =
        std::ranges::all_of(fresh_, [&](const auto& file) { return old_.contains(file.first); });
    if (obstacle.passable && overwrites) {
        if (outcome.status != 0 || now != fresh_) return "not written in place";
        const bool tells = (job_.promise == Promise::kOldOrNew || job_.promise == Promise::kReports) &&
                           !job_.name.starts_with("BufferFile");
        return tells && report.find("WARNING") == report.npos ? "no warning" : "";
    }
    if (outcome.status == 0 && job_.promise != Promise::kSilent) return "0 but not new";
    return now == before || job_.promise == Promise::kTells ? "" : "not as before";
}

std::vector<std::string> breaches(Bench& bench, const Failing& failing, int error, bool forever) {
    std::vector<std::string> found;
    bool reached = true;
    const long calls = bench.calls(failing.call, error);
    const bool samples =
        failing.call == Call::kMemory && bench.allocates_often() && !std::getenv("QUO_ALL_ALLOCATIONS");
    for (long nth = 1; reached && nth <= calls; nth += samples ? 1 + nth / kSampling : 1) {
        const test::Fault fault{failing.call, error, nth, forever};
        const Outcome outcome = bench.run(fault);
        reached = outcome.reached;
        const bool killed = error == test::kKill || outcome.said.starts_with(kLastWords);
        const std::string breach = reached && killed ? bench.breach_after_kill() : bench.breach(fault, outcome);
        if (!reached && failing.call != Call::kMemory) found.push_back(std::to_string(nth) + " is not reached");
        if (!breach.empty()) found.push_back(std::to_string(nth) + (forever ? ". and later: " : ".: ") + breach);
        bench.reset();
    }
    return found;
}

class Faults : public testing::TestWithParam<Job> {};

TEST_P(Faults, LeaveOldOrNewAndSuccessMeansNew) {
    Bench bench{GetParam()};
    ASSERT_FALSE(HasFailure());
    for (const Failing& failing : kFailing) {
        if (failing.call == Call::kMemory && !GetParam().takes_memory) continue;
        for (const int error : failing.errors)
            for (const bool forever : {false, true}) {
                if (forever && (error == EINTR || error == test::kKill)) continue;
                SCOPED_TRACE(std::string{failing.name} + ' ' + (error > 0 ? strerrorname_np(error) : ""));
                EXPECT_THAT(breaches(bench, failing, error, forever), testing::IsEmpty());
            }
    }
}
TEST_P(Faults, LeaveAloneWhatCannotBeReplaced) {
    Bench bench{GetParam()};
    const Job& job = GetParam();
    if (!job.verb.empty() || job.promise == Promise::kUnchanged || job.promise == Promise::kSurvives) return;
    for (const Obstacle& obstacle : kObstacles) EXPECT_EQ(bench.breach_at(obstacle), "") << obstacle.name;
}
INSTANTIATE_TEST_SUITE_P(Jobs, Faults, testing::ValuesIn(test::jobs()),
                         [](const auto& row) { return row.param.name; });

// The same without knowledge of the calls: processes that save over and over are killed at any moment.
TEST(Kill, LeavesOldOrNewAndOneTemporaryFileThatTheNextSaveSweeps) {
    const char* const wanted = std::getenv("QUO_KILLS");
    const long kills = wanted ? std::strtol(wanted, nullptr, 10) : 30;
    std::vector<std::unique_ptr<Bench>> benches;
    for (const Job& job : test::jobs())
        if (job.killed) benches.push_back(std::make_unique<Bench>(job));
    std::mt19937 random{17};
    for (long i = 0; i < kills; ++i) {
        Bench& bench = *benches[static_cast<std::size_t>(i) % benches.size()];
        const pid_t child = bench.start({}, true);
        usleep(std::uniform_int_distribution<useconds_t>{0, 30000}(random));
        kill(child, SIGKILL);
        bench.wait(child);
        EXPECT_EQ(bench.breach_after_kill(), "") << i;
        bench.reset();
    }
}

// Whoever reads meanwhile finds a file as one of them saved it.
TEST(TwoProcesses, SaveOneFileEachOfThemWhole) {
    const auto save_header = [](const std::string& file, double value) {
        quorelxml document;
        const char* text = "New";
        return document.initXmlFile(file.c_str()) == 0 && document.writeDouble(1, "New/a", &value, 1) == 0 &&
               document.writeString(1, "New/b", &text, 1) == 0 && document.write() == 0;
    };
    const auto save_parameters = [](const std::string& file, double value) {
        return WriteProfileDoubleArray("s", "New", &value, 1, file.c_str()) == 0 && SyncProfile(file.c_str()) == 0;
    };
    const std::pair<const char*, std::function<bool(const std::string&, double)>> kinds[] = {
        {QUO_TEST_DATA "/faults/product.hdr", save_header}, {QUO_TEST_DATA "/faults/a.par", save_parameters}};
    for (const auto& [from, save] : kinds) {
        const test::TemporaryFolder folder;
        const std::string file = folder.file("shared"), old = test::read_text(from);
        std::set<std::string> whole{old};
        for (const double value : {17.3, 29.1}) {
            test::write_text(file, old);
            ASSERT_TRUE(save(file, value));
            whole.insert(test::read_text(file));
        }
        ASSERT_EQ(whole.size(), 3U);
        std::array<pid_t, 2> savers{};
        for (std::size_t i = 0; i < savers.size(); ++i) {
            savers.at(i) = fork();
            if (savers.at(i) != 0) continue;
            for (std::size_t k = 0; k < 100; ++k)
                if (!save(file, (i + k) % 2 == 0 ? 17.3 : 29.1)) _exit(1);
            _exit(0);
        }
        for (const pid_t saver : savers)
            for (int ended = 0; waitpid(saver, &ended, WNOHANG) == 0 || ended != 0;) {
                ASSERT_EQ(ended, 0) << "a save failed";
                ASSERT_TRUE(whole.contains(test::read_text(file)));
            }
    }
}

}  // namespace
