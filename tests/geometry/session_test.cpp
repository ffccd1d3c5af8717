// SPDX-License-Identifier: Apache-2.0

// Runs the sessions of data/geometry/sessions.txt.
#include "quo_base/interp_orb.h"
#include "support/plain_calls.h"

namespace {

constexpr char kScript[] = QUO_TEST_DATA "/geometry/sessions.txt";
using Session = test::PlainSession;

TEST_P(Session, AnswersAndWritesWhatTheScriptSays) {
    run(kScript, QUO_CALLS(POSMACRO, VELMACRO, ACCMACRO, POSVELACC_5, orb_interp));
}
INSTANTIATE_TEST_SUITE_P(Script, Session, testing::ValuesIn(test::sessions_of(kScript)),
                         [](const auto& row) { return row.param; });

}  // namespace
