// SPDX-License-Identifier: Apache-2.0

// Runs the sessions of data/ground/sessions.txt.
#include "quo_base/gen_utils.h"
#include "sarutillib/ground/gen_utils_dates.h"
#include "support/plain_calls.h"

namespace {

constexpr char kScript[] = QUO_TEST_DATA "/ground/sessions.txt";
using quo::date_difference_seconds;

/** date2str, whose fields are told one by one. */
int date2fields(const char* text, int* numbers, double* fraction) {
    DateFields f{-7, -7, -7, -7, -7, -7, -7.0};
    const int code = date2str(text, &f);
    const int found[] = {f.year, f.month, f.day_of_year, f.hour, f.minute, f.second};
    std::ranges::copy(found, numbers);
    *fraction = f.fraction;
    return code;
}

using Session = test::PlainSession;

TEST_P(Session, AnswersAndWritesWhatTheScriptSays) {
    run(kScript, QUO_CALLS(date2fields, date_difference_seconds, ascii2sec85, utc_ch2num, sec852myascii,
                           sec852ascii, mystrcasecmp, check_fsep, getFileNameFromPath, copyParameterFile));
}
INSTANTIATE_TEST_SUITE_P(Script, Session, testing::ValuesIn(test::sessions_of(kScript)),
                         [](const auto& row) { return row.param; });

}  // namespace
