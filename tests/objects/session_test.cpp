// SPDX-License-Identifier: Apache-2.0

// Runs the sessions of data/objects/sessions.txt.

#include "objects/records.h"
#include "quo_base/profile.h"
#include "support/plain_calls.h"

namespace {

constexpr char kScript[] = QUO_TEST_DATA "/objects/sessions.txt";
using Info = DataSetInfo_Obj;

using ByStatus = int (polySAR::*)(double, double, double*) const;
using ByValue = double (polySAR::*)(double, double) const;

class Session : public test::PlainSession {
protected:
    Session() { FreeProfile(nullptr); }
    /** An object by the name that the script has for it; none by "(null)". */
    template <typename Class>
    [[nodiscard]] Class* object(const char* name) {
        return name ? dynamic_cast<Class*>(objects_.at(name)) : nullptr;
    }
    /** Tells a field, which may be of a part of the object or beside the table, or all of them. */
    std::int64_t get(const test::Words& words, std::string& told) {
        for (const auto& [name, values] : test::contents(*objects_.at(words.text(1)))) {
            if (words.text(2, name.c_str()) != name) continue;
            told += name;
            for (const std::string& value : values) told += " " + value;
            told += "\n";
        }
        return 0;
    }
    /** Gives a field the values behind its name; a text is one of them. */
    std::int64_t set(const test::Words& words) {
        const std::string wanted = words.text(2);
        std::size_t word = 2;
        for (const auto& [name, part] : test::parts_of(*objects_.at(words.text(1))))
            for (int i = 0; i < part->elementCount(); ++i)
                if (name + part->element(i)->name == wanted)
                    test::for_each_value(*part->element(i), [&]<typename T>(T& value) {
                        if constexpr (std::is_pointer_v<T>)
                            std::strncpy(value, words.text(++word), 511);
                        else
                            value = test::parsed<T>(words.text(++word));
                    });
        return word > 2 ? 0 : -1;
    }
    /** The values of an enumeration that a question holds for, and some that are none. */
    template <typename Enumeration>
    test::Call which(bool (Info::*question)(Enumeration) const) {
        return [this, question](auto&, auto& told) {
            for (int value = -1; value < 17; ++value)
                told += (info_.*question)(static_cast<Enumeration>(value)) ? std::to_string(value) + "\n" : "";
            return 0;
        };
    }

    /** All that a set of polynomials tells of its quantities. */
    test::Calls of_quantities() {
#define QUO_QUANTITY(KIND)                                                                                     \
    {"Evaluate" #KIND, test::call_of(set_, static_cast<ByStatus>(&polySAR::Evaluate##KIND))},                  \
        {"Evaluate" #KIND "interp",                                                                            \
         test::call_of(set_, static_cast<ByStatus>(&polySAR::Evaluate##KIND##interp))},                        \
        {"value" #KIND, test::call_of(set_, static_cast<ByValue>(&polySAR::Evaluate##KIND))},                  \
        {"value" #KIND "interp", test::call_of(set_, static_cast<ByValue>(&polySAR::Evaluate##KIND##interp))}, \
        {"get" #KIND "poly", test::call_of(set_, &polySAR::get##KIND##poly)}, {                                \
        "get" #KIND "num", test::call_of(set_, &polySAR::get##KIND##num)                                       \
    }
        return {QUO_QUANTITY(DC),    QUO_QUANTITY(FR),       QUO_QUANTITY(SL2GR),
                QUO_QUANTITY(GR2SL), QUO_QUANTITY(SL2THETA), QUO_QUANTITY(SL2PHI)};
    }

    ROI_Obj a_, b_, out_;
    FileROI_Obj file_;
    ROI_Coords coords_;
    Info info_;
    SwathInfo swath_, copy_;
    AntennaPattern_Obj pattern_, target_;
    polyDC dc_;
    polyFR fr_;
    polySAR set_;
    SARPulse_Obj pulse_;
    Coregist fit_;
    GeneralSAR product_;
    geopoint point_;
    geoCoords_Obj grid_;
    const std::map<std::string, GeneralSAR_BaseXML*> objects_ = {
        {"a", &a_},         {"b", &b_},         {"out", &out_},     {"file", &file_},       {"coords", &coords_},
        {"info", &info_},   {"swath", &swath_}, {"copy", &copy_},   {"pattern", &pattern_}, {"target", &target_},
        {"dc", &dc_},       {"fr", &fr_},       {"point", &point_}, {"grid", &grid_},       {"set", &set_},
        {"pulse", &pulse_}, {"fit", &fit_}};
};

TEST_P(Session, AnswersAndWritesWhatTheScriptSays) {
    const auto header = [this](auto& words) { return object<GeneralSAR_Base>(words.text(1)); };
    test::Calls calls = of_quantities();
    calls.merge(QUO_MEMBERS(a_, &ROI_Obj::SetFastAxe, &ROI_Obj::SetSlowAxe, &ROI_Obj::ResetROI,
                            &ROI_Obj::GetFastIndex, &ROI_Obj::GetSlowIndex, &ROI_Obj::GetFastRange,
                            &ROI_Obj::GetSlowRange, &ROI_Obj::write_roi));
    calls.merge(QUO_MEMBERS(file_, &FileROI_Obj::SetFile));
    calls.merge(QUO_MEMBERS(info_, &Info::SetImageType, &Info::SetSensorType, &Info::SetAcqMode,
                            &Info::SetProjection, &Info::SetUnitType, &Info::SetRefSys, &Info::SetType,
                            &Info::IsType, &Info::fillQUOREL, &Info::getPolarizationNbr, &Info::getISNbr));
    calls.merge(QUO_MEMBERS(swath_, &SwathInfo::readBurstTimes));
    calls.merge(QUO_MEMBERS(fit_, &Coregist::init, &Coregist::evaluateMAtime, &Coregist::evaluateMAtimeRange,
                            &Coregist::readpar));
    calls.merge(QUO_MEMBERS(product_, &GeneralSAR::GSread, &GeneralSAR::GSenable, &GeneralSAR::GSexists));
    calls.merge(QUO_MEMBERS(pulse_, &SARPulse_Obj::chirpSamples));
    calls.merge(test::Calls{
        {"get", [&](auto& words, auto& told) { return get(words, told); }},
        {"set", [&](auto& words, auto&) { return set(words); }},
        {"readhdr", [&](auto& words, auto&) { return header(words)->readhdr(words.text(2)); }},
        {"writehdr", [&](auto& words, auto&) { return header(words)->writehdr(words.text(2)); }},
        {"golden",
         [](auto& words, auto&) {  // a file of the test data, behind what is there
             return test::write_text(words.text(1),
                                     test::read_text(words.text(1)) +
                                         test::read_text(std::string{QUO_TEST_DATA "/objects/"} + words.text(2))),
                    0;
         }},
        {"replace",
         [](auto& words, auto&) {
             std::string text = test::read_text(words.text(1));
             const std::string from = words.text(2);
             return test::write_text(words.text(1), text.replace(text.find(from), from.size(), words.text(3))), 0;
         }},
        {"without",
         [](auto& words, auto&) {
             return test::write_text(words.text(1),
                                     test::without_element(test::read_text(words.text(1)), words.text(2))),
                    0;
         }},
        {"Time2Samples",
         [this](auto& words, auto&) {
             return fit_.Time2Samples(object<ROI_Obj>(words.text(1)), object<ROI_Obj>(words.text(2)));
         }},
        {"ConvertPolys",
         [this](auto& words, auto&) {
             return fit_.ConvertPolys(object<ROI_Obj>(words.text(1)), object<ROI_Obj>(words.text(2)));
         }},
        {"isNULL", [&](auto& words, auto&) { return object<ROI_Obj>(words.text(1))->isNULL(); }},
        {"corners",
         [this](auto&, auto& told) {
             for (const ROI_Time& corner :
                  {a_.GetUpLeft(), a_.GetUpRight(), a_.GetDownLeft(), a_.GetDownRight(), a_.GetCenter()})
                 told += test::digits(corner.FastTime) + " " + test::digits(corner.SlowTime) + "\n";
             return 0;
         }},
        {"IntersectROI",
         [this](auto& words, auto&) {
             return ROI_Obj::IntersectROI(object<ROI_Obj>(words.text(1)), object<ROI_Obj>(words.text(2)),
                                          object<ROI_Obj>(words.text(3)));
         }},
        {"GetROI",
         [this](auto& words, auto&) {
             return coords_.GetROI(object<ROI_Obj>(words.text(1)), object<ROI_Obj>(words.text(2)));
         }},
        {"read_roi", [this](auto&, auto&) { return file_.read_roi(); }},
        {"file",
         [this](auto&, auto& told) {
             return told = file_.FileName + std::string{" "} + file_.SectionName + "\n", 0;
         }},
        {"IsImageType", which(&Info::IsImageType)},
        {"IsSensorType", which(&Info::IsSensorType)},
        {"IsAcqMode", which(&Info::IsAcqMode)},
        {"IsProjection", which(&Info::IsProjection)},
        {"IsUnitType", which(&Info::IsUnitType)},
        {"IsRefSys", which(&Info::IsRefSys)},
        {"times",
         [this](auto& words, auto&) {
             return swath_.BurstStartTimes = test::Argument<const double*>{words.text(1)}.values, 0;
         }},
        {"clone", [this](auto&, auto&) { return swath_.clone(&copy_); }},
        {"samples",
         [this](auto& words, auto&) {
             pattern_.Pattern = test::Argument<const float*>{words.text(1)}.values;
             return pattern_.PatternFile.setFilename("pattern"), 0;
         }},
        {"getPatternArray",
         [this](auto& words, auto& told) {
             test::Argument<float*> room{words.text(2)};
             const int status = object<AntennaPattern_Obj>(words.text(1))->getPatternArray(room.get());
             return room.tell(told), status;
         }},
        {"WritePatternArray",
         [this](auto& words, auto&) { return object<AntennaPattern_Obj>(words.text(1))->WritePatternArray(); }},
        {"createBuffers",
         [this](auto& words, auto&) { return object<AntennaPattern_Obj>(words.text(1))->createBuffers(); }},
        {"writeboth",
         [this](auto& words, auto&) { return object<AntennaPattern_Obj>(words.text(1))->writehdr(); }},
        {"dc.readparold", test::call_of(dc_, &polyDC::readparold)},
        {"fr.readparold", test::call_of(fr_, &polyFR::readparold)},
        {"point.readhdr", [this](auto& words, auto&) { return point_.readhdr(words.text(1), words.text(2)); }},
        {"point.writehdr", [this](auto& words, auto&) { return point_.writehdr(words.text(1), words.text(2)); }},
        {"CreatePolys",
         test::call_of(set_, static_cast<int (polySAR::*)(int, int, int, int, int, int)>(&polySAR::CreatePolys))},
        {"generateChirp", [this](auto& words, auto& told) {
             test::Argument<float*> room{words.text(1)};
             const int status = pulse_.generateChirp(reinterpret_cast<fcomplex*>(room.get()));
             return room.tell(told), status;
         }}});
    run(kScript, calls);
}
INSTANTIATE_TEST_SUITE_P(Script, Session, testing::ValuesIn(test::sessions_of(kScript)),
                         [](const auto& row) { return row.param; });

}  // namespace
