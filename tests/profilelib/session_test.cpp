// SPDX-License-Identifier: Apache-2.0

// Runs the sessions of data/profile/sessions.txt.

#include "quo_base/profile.h"
#include "support/plain_calls.h"

namespace {

constexpr char kScript[] = QUO_TEST_DATA "/profile/sessions.txt";

/** The key that most calls work on. */
void store(const char* value) { GetSetProfileChar(1, "s", "k", value, "a.par"); }
const char* stored() { return GetSetProfileChar(0, "s", "k", nullptr, "a.par"); }

class Session : public test::PlainSession {
protected:
    Session() { FreeProfile(nullptr); }
    ~Session() override { FreeProfile(nullptr); }
};

TEST_P(Session, AnswersAndWritesWhatTheScriptSays) {
    run(kScript,
        QUO_CALLS(store, stored, GetSetProfileChar, SyncProfile, FreeProfile, DelProfileKey, DelProfileSection,
                  GetMyProfileString, WriteMyProfileString, WriteMyProfileStringQuote, GetMyProfileStringArray,
                  WriteMyProfileStringArray, WriteMyProfileStringMatrix, GetMyProfileIntArray,
                  WriteMyProfileIntArray, WriteMyProfileInt, GetMyProfileInt64Array, WriteMyProfileInt64Array,
                  WriteMyProfileInt64, GetMyProfileLongArray, WriteMyProfileLongArray, GetMyProfileFloatArray,
                  WriteMyProfileFloatArray, GetProfileDoubleArray, WriteProfileDoubleArray, WriteMyProfileDouble,
                  WriteMyProfileDoubleMatrix, GetCheckMyProfileString, GetCheckMyProfileStringArray,
                  GetCheckMyProfileIntArray, GetCheckMyProfileInt64Array, GetCheckMyProfileLongArray,
                  GetCheckMyProfileFloatArray, GetCheckMyProfileDoubleArray, WriteCheckMyProfileString,
                  WriteCheckMyProfileIntArray, WriteCheckMyProfileInt64Array, WriteCheckMyProfileInt,
                  WriteCheckMyProfileInt64, WriteCheckMyProfileLongArray, WriteCheckMyProfileDouble,
                  WriteCheckMyProfileFloatArray, WriteCheckMyProfileDoubleArray, GetParString, SetParString,
                  GetParInt, SetParInt, GetParFloat, SetParFloat, GetParDouble, SetParDouble));
}
INSTANTIATE_TEST_SUITE_P(Script, Session, testing::ValuesIn(test::sessions_of(kScript)),
                         [](const auto& row) { return row.param; });

}  // namespace
