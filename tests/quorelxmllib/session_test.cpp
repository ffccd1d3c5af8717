// SPDX-License-Identifier: Apache-2.0

// Runs the sessions of data/headers/sessions.txt.
#include "header_files.h"
#include "quorelxmllib/legacy_list.h"
#include "quorelxmllib/xml_text.h"
#include "support/plain_calls.h"

namespace {

constexpr char kScript[] = QUO_TEST_DATA "/headers/sessions.txt";

/** A header with this inside its channel. */
void header(const char* inside) { test::write_text("header.xml", test::header_text(inside)); }

/** A text as XML holds it; "(none)" where it cannot. */
std::string stored(const char* text) { return quo::xml_text(text).value_or("(none)"); }
int fits(const char* text) { return quo::xml_text(text) ? 1 : 0; }
int is_field_path(const char* path) { return quo::is_field_path(path) ? 1 : 0; }
template <typename Number>
int scan(const char* list, Number* values, int count) {
    const int found = quo::scan_list(list, values, count);
    errno = 0;  // which tells of numbers beyond the type, as strtod's does
    return found;
}

class Session : public test::PlainSession {
protected:
    test::OpenDocument document_;
    quorelxmlPi styled_;
};

TEST_P(Session, AnswersAndWritesWhatTheScriptSays) {
    using Open = test::OpenDocument;
    const auto node = [this](auto& words, auto&) {
        void* const found = words.text(3) ? document_.getNode(words.whole(1), words.text(2), words.whole(3))
                                          : document_.getNode(words.whole(1), words.text(2));
        return found ? 1 : 0;
    };
    test::Calls calls = QUO_MEMBERS(
        document_, &Open::initXmlFile, &Open::write, &Open::clean, &Open::setDescription, &Open::setDebug,
        &Open::readInt, &Open::readFloat, &Open::readDouble, &Open::writeInt, &Open::writeFloat,
        &Open::writeDouble, &Open::writeString, &Open::isRecognized, &Open::loaded, &Open::numberOfChannels,
        &Open::description, &Open::fileName, &Open::channelExists, &Open::fieldExists, &Open::countNodes,
        &Open::fieldHasCount, &Open::clearField, &Open::createChannel, &Open::setFormat, &Open::format);
    calls.merge(QUO_CALLS(header, stored, fits, is_field_path));
    calls.merge(test::Calls{{"scan_doubles", test::call_of(scan<double>)},
                            {"scan_floats", test::call_of(scan<float>)},
                            {"scan_ints", test::call_of(scan<std::int32_t>)},
                            {"getNode", node},
                            {"createField",
                             [this](auto& words, auto&) {
                                 return document_.createField(words.whole(1), words.text(2), words.whole(3));
                             }},
                            {"readString",
                             [this](auto& words, auto& told) {
                                 test::Argument<char* const*> room{words.text(3)};
                                 const int status = document_.readString(words.whole(1), words.text(2), room.get(),
                                                                         words.whole(4));
                                 return room.tell(told), status;
                             }},
                            {"styled", [this](auto& words, auto&) {
                                 return styled_.initXmlFile(words.text(1), words.text(2)) +
                                        styled_.initXmlFile(words.text(1), words.text(2)) + styled_.write();
                             }}});
    run(kScript, calls);
}
INSTANTIATE_TEST_SUITE_P(Script, Session, testing::ValuesIn(test::sessions_of(kScript)),
                         [](const auto& row) { return row.param; });

}  // namespace
