// SPDX-License-Identifier: Apache-2.0

// Runs the sessions of data/signals/sessions.txt: what plans and resampling refuse.
#include "support/session.h"

#include <dlfcn.h>

#include <algorithm>
#include <functional>
#include <map>
#include <optional>
#include <tuple>

#include "quo_base/interp.h"
#include "signallib/engines.h"
#include "signallib/plan_store.h"

namespace {

constexpr char kScript[] = QUO_TEST_DATA "/signals/sessions.txt";

class Session : public testing::TestWithParam<std::string> {
protected:
    /** Whatever is refused leaves all samples alone. */
    int call(const test::Words& words, std::string& told) {
        const std::string name = words.text(0), plan = words.text(1) ? words.text(1) : "";
        const auto n = [&](std::size_t word) { return words.whole(word); };
        const auto at = [&](std::size_t word) { return words.text(word) ? samples_.data() + n(word) : nullptr; };
        const auto real_at = [&](std::size_t word) { return reinterpret_cast<float*>(at(word)); };
        FftPlan* const fft = plan == "none" || plan.empty() ? nullptr : &fft_[plan];
        CztPlan* const czt = plan == "none" || plan.empty() ? nullptr : &czt_[plan];
        const double positions[] = {1.0, 2.0};
        const double* const y = words.text(4) ? positions : nullptr;
        const std::map<std::string, std::function<int()>> calls = {
            {"fft_makep_c", [&] { return fft_makep_c(fft, n(2), n(3), n(4), n(5), n(6), n(7), n(8)); }},
            {"fft_makep_r", [&] { return fft_makep_r(fft, n(2), n(3), n(4), n(5), n(6), n(7), n(8)); }},
            {"fft_c", [&] { return fft_c(n(1), n(2), n(3), n(4), n(5), n(6), samples_.data(), samples_.data()); }},
            {"pfft_c", [&] { return pfft_c(fft, at(2), at(3)); }},
            {"pfft_r", [&] { return pfft_r(fft, real_at(2), real_at(3)); }},
            {"fft_destp_c", [&] { return fft_destp_c(fft); }},
            {"copy", [&] { return fft_[words.text(2)] = *fft, czt_[words.text(2)] = *czt, 0; }},
            {"nfft", [&] { return fft->nfft = n(2); }},
            {"made_up",
             [&] { return *fft = {reinterpret_cast<FftEnginePlan*>(this), 8, 8, 0, 1, nullptr, 8, 8, 0, 0}, 0; }},
            {"record",
             [&] {
                 for (const int value :
                      {fft->n, fft->nfft, fft->normalise_rows, fft->row_direction, fft->m, fft->mfft,
                       fft->normalise_columns, fft->column_direction, fft->rows ? 1 : 0, fft->columns ? 1 : 0})
                     told += std::to_string(value) + " ";
                 return told.back() = '\n', 0;
             }},
            {"genpow", [&] { return genpow(n(1), n(2)); }},
            {"czt_makep_c", [&] { return czt_makep_c(czt, n(2), n(3)); }},
            {"pczt_c", [&] { return pczt_c(czt, at(2), at(3), 0.1, 0.2, n(4)); }},
            {"czt_destp_c", [&] { return czt_destp_c(czt); }},
            {"setplans", [&] { return interp_.setplans(n(1), n(2), n(3), n(4)); }},
            {"resetplans", [&] { return interp_.resetplans(), 0; }},
            {"destroyplans", [&] { return interp_.destroyplans(); }},
            {"interpft_p", [&] { return interp_.interpft_p(at(1), at(2)); }},
            {"interpft", [&] { return interp_.interpft(at(1), n(2), n(3), n(4), n(5), samples_.data() + 512); }},
            {"interp_lin",
             [&] { return interp_.interp_lin(at(1), n(2), n(3), n(4), n(5), samples_.data() + 512); }},
            {"points",
             [&] {
                 return interp2D{}.interp2(at(1), n(2), n(3), positions, y, n(5), samples_.data() + 512, n(6));
             }},
            {"axes",
             [&] {
                 return interp2D{}.interp2(at(1), n(2), n(3), positions, n(5), y, n(5), samples_.data() + 512,
                                           n(6));
             }},
            {"clone", [&] { return std::copy_n(at(1), n(3), at(2)), 0; }},
            {"same", [&] { return std::equal(at(1), at(1) + n(3), at(2)) ? 1 : 0; }},
            {"engine",
             [&] {
                 const std::map<std::string, const char*> files = {
                     {"fake", QUO_TEST_FAKE_DFTI}, {"fftw", QUO_TEST_FFTW_MODULE}, {"none", "/nowhere/lib.so"}};
                 engine_.reset();
                 engine_.emplace(plan, files.at(words.text(2)), files.at(words.text(3)));
                 return told = fft_engine_name() + std::string{"\n"}, errno;
             }},
            {"fft_engine_error",
             [&] {
                 return told = std::string{fft_engine_error()}.substr(
                                   0, static_cast<std::size_t>(words.number(1, "999"))) +
                               "\n",
                        0;
             }},
            {"held", [] { return static_cast<int>(quo::plan_store().held()); }},
            {"room", [&] { return room_.emplace(static_cast<rlim_t>(words.number(1))), 0; }},
            {"refuse", [&] { return setenv("FAKE_DFTI_FAILS", words.text(1), 1); }},
            {"fake",
             [&] {
                 void* const library = dlopen(QUO_TEST_FAKE_DFTI, RTLD_NOW | RTLD_NOLOAD);
                 const int number = reinterpret_cast<int (*)()>(dlsym(library, words.text(1)))();
                 return dlclose(library), number - std::exchange(faked_[plan], number);
             }},
            {"report", [&] {
                 for (const auto& entry : report_.entries())
                     told += entry.kind + " " + entry.file + " " + entry.function + "\n";
                 return 0;
             }}};
        return calls.at(name)();
    }

    const test::Report report_;
    std::optional<test::Engine> engine_{std::in_place, "fftw"};
    std::optional<test::AddressSpace> room_;
    test::Samples samples_ = test::noise(1024);
    std::map<std::string, FftPlan> fft_;
    std::map<std::string, CztPlan> czt_;
    interp interp_;
    std::map<std::string, int> faked_;
};

TEST_P(Session, RefusesWhatTheScriptSays) {
    test::run_session(kScript, GetParam(), [this](const test::Words& words, std::string& told) {
        const test::CapturedStderr silent;
        const test::Samples before = samples_;
        const int result = call(words, told);
        EXPECT_TRUE(result == 0 || samples_ == before) << words.text(0);
        return result;
    });
}
INSTANTIATE_TEST_SUITE_P(Script, Session, testing::ValuesIn(test::sessions_of(kScript)),
                         [](const auto& row) { return row.param; });

}  // namespace
