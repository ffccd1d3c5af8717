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
    template <typename Result, typename... Parameters>
    test::Call on(Result (quorelxml::*member)(Parameters...)) {
        return test::call_of(document_, member);
    }
    template <typename Result, typename... Parameters>
    test::Call on(Result (quorelxml::*member)(Parameters...) const) {
        return test::call_of(document_, member);
    }
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
    run(kScript, {{"header", test::call_of(header)},
                  {"stored", test::call_of(stored)},
                  {"fits", test::call_of(fits)},
                  {"is_field_path", test::call_of(is_field_path)},
                  {"scan_doubles", test::call_of(scan<double>)},
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
                       const int status =
                           document_.readString(words.whole(1), words.text(2), room.get(), words.whole(4));
                       return room.tell(told), status;
                   }},
                  {"styled",
                   [this](auto& words, auto&) {
                       return styled_.initXmlFile(words.text(1), words.text(2)) +
                              styled_.initXmlFile(words.text(1), words.text(2)) + styled_.write();
                   }},
                  {"initXmlFile", on(&quorelxml::initXmlFile)},
                  {"write", on(&quorelxml::write)},
                  {"clean", on(&quorelxml::clean)},
                  {"setDescription", on(&quorelxml::setDescription)},
                  {"setDebug", on(&quorelxml::setDebug)},
                  {"readInt", on(&quorelxml::readInt)},
                  {"readFloat", on(&quorelxml::readFloat)},
                  {"readDouble", on(&quorelxml::readDouble)},
                  {"writeInt", on(&quorelxml::writeInt)},
                  {"writeFloat", on(&quorelxml::writeFloat)},
                  {"writeDouble", on(&quorelxml::writeDouble)},
                  {"writeString", on(&quorelxml::writeString)},
                  {"isRecognized", on(&Open::isRecognized)},
                  {"loaded", on(&Open::loaded)},
                  {"numberOfChannels", on(&Open::numberOfChannels)},
                  {"description", on(&Open::description)},
                  {"fileName", on(&Open::fileName)},
                  {"channelExists", on(&Open::channelExists)},
                  {"fieldExists", on(&Open::fieldExists)},
                  {"countNodes", on(&Open::countNodes)},
                  {"fieldHasCount", on(&Open::fieldHasCount)},
                  {"clearField", on(&Open::clearField)},
                  {"createChannel", on(&Open::createChannel)},
                  {"setFormat", on(&Open::setFormat)},
                  {"format", on(&Open::format)}});
}
INSTANTIATE_TEST_SUITE_P(Script, Session, testing::ValuesIn(test::sessions_of(kScript)),
                         [](const auto& row) { return row.param; });

}  // namespace
