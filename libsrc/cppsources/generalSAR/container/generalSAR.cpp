// SPDX-License-Identifier: Apache-2.0
#include "quo_base/generalSAR.h"

#include <algorithm>
#include <array>
#include <string>
#include <string_view>
#include <type_traits>

#include "diagnosticslib/call_frame.h"
#include "generalSAR/container/readable_file.h"
#include "generalSAR/objects/raster_name.h"
#include "profilelib/profile_look.h"
#include "quorelxmllib/element_path.h"
#include "quorelxmllib/guarded.h"
#include "quorelxmllib/header_session.h"
#include "sarutillib/ground/bounded_text.h"

namespace {

constexpr const char* kSource = "generalSAR";

bool is_object(int object) { return object >= 0 && object < GeneralSAR::kObjects; }

/** The side file that the data file is written to: the header itself, or another. "" where there is no raster. */
std::string side_file_of(const char* header) {
    const auto raster = quo::raster_of_header(quo::text_or_empty(header));
    return raster ? *raster + ".hdr" : "";
}

/** What is done with an object whatever its class. */
struct Object {
    const char* name;
    GeneralSAR_Base* (*in)(GeneralSAR& product);
    int (*clone)(GeneralSAR& from, GeneralSAR& to);
};
template <auto Member>
constexpr Object object(const char* name) {
    return {name, [](GeneralSAR& product) -> GeneralSAR_Base* { return &(product.*Member); },
            [](GeneralSAR& from, GeneralSAR& to) {
                if constexpr (std::is_same_v<decltype(Member), BufferFile GeneralSAR::*>)
                    return (to.*Member).clone(&(from.*Member));  // the one that copies from its argument
                else
                    return (from.*Member).clone(&(to.*Member));
            }};
}
// In the order of GSObject.
constexpr std::array<Object, GeneralSAR::kObjects> kTable{
    object<&GeneralSAR::dataFile>("GSDataFile"),
    object<&GeneralSAR::roi>("GSRoi"),
    object<&GeneralSAR::polynomials>("polySAR"),
    object<&GeneralSAR::samplingConstants>("SamplingConstants"),
    object<&GeneralSAR::stateVectors>("StateVectors"),
    object<&GeneralSAR::orbit>("Orbit"),
    object<&GeneralSAR::pulse>("Pulse"),
    object<&GeneralSAR::antennaPattern>("AntennaPattern"),
    object<&GeneralSAR::dataSetInfo>("DataSetInfo"),
    object<&GeneralSAR::sensorAttitude>("SensorAttitude"),
    object<&GeneralSAR::spectralWindows>("SpectralWindows"),
    object<&GeneralSAR::geoCoords>("geoCoords"),
    object<&GeneralSAR::swathInfo>("SwathInfo"),
    object<&GeneralSAR::bufferFile>("BufferFile"),
};

}  // namespace

GeneralSAR::GeneralSAR()
    : objects_{[this] {
          std::array<GeneralSAR_Base*, kObjects> objects{};
          std::ranges::transform(kTable, objects.begin(), [this](const Object& row) { return row.in(*this); });
          return objects;
      }()} {}

const char* GeneralSAR::GSname(GSObject object) noexcept {
    return is_object(object) ? kTable[static_cast<std::size_t>(object)].name : "";
}

int GeneralSAR::GSread(const char* file) {
    quo::CallFrame frame{"GeneralSAR::GSread", kSource};
    if (const int status = quo::refuse_missing_file(frame, file)) return status;
    return quo::guarded(frame, [&] {
        const quo::JoinedSession session{file};
        const quo::ProfileLook look{file};
        GSdestroy();
        bool lacks_memory = false;
        for (int i = 0; i < kObjects; ++i) {
            const int failures = session.failures();
            const int status = quo::guarded(frame, [&] { return objects_[i]->readhdr(file); });
            if (status == QUO_NO_MEMORY) quo::HeaderSession::fail_all(status);
            present_[i] = status == QUO_OK;
            if (session.failures() == failures) continue;
            // Some objects answer 0 whatever they found, and some without a word.
            present_[i] = false;
            lacks_memory = lacks_memory || session.failed() == QUO_NO_MEMORY;
            (void)frame.fail(QUO_READ_FAILED, "An object of the product cannot be read");
        }
        linkObjects();
        // The status must be 0: this is how callers tell an object that did not fit from one that is not there.
        if (lacks_memory) errno = ENOMEM;
        return frame.success();
    });
}

void GeneralSAR::linkObjects() {
    if (GSexists(gsSamplingConstants) && GSexists(gsOrbit)) orbit.setLambda(samplingConstants.lambda_m);
    if (!GSexists(gsDataSetInfo)) return;
    if (GSexists(gsOrbit)) orbit.setLookSign(dataSetInfo.LookDirection);
    if (GSexists(gsStateVectors)) stateVectors.LookDirection = dataSetInfo.LookDirection;
}

int GeneralSAR::GSwrite(const char* file) {
    quo::CallFrame frame{"GeneralSAR::GSwrite", kSource};
    const int status = quo::guarded(frame, [&] {
        quo::JoinedSession header{file}, side_file{side_file_of(file).c_str()};
        for (int i = kObjects; i-- > 0;) {
            if (!present_[i] || objects_[i]->writehdr(file) != QUO_NO_MEMORY) continue;
            quo::HeaderSession::fail_all(QUO_NO_MEMORY);
            (void)frame.fail(QUO_NO_MEMORY, "Memory allocation failure");  // the object itself may report nothing
        }
        const int saved = header.commit();
        return saved ? saved : side_file.commit();
    });
    if (status != QUO_OK) quo::HeaderSession::fail_all(status);  // a session around this one would save less
    return status ? QUO_OK : frame.success();  // callers rely on 0: the outcome stands in the report alone
}

GeneralSAR_Base* GeneralSAR::GSget(GSObject object) noexcept {
    return is_object(object) ? objects_[object] : nullptr;
}

const GeneralSAR_Base* GeneralSAR::GSelements(GSObject object) const noexcept {
    if (!is_object(object)) return nullptr;
    return object == gsRoi ? &roi.Roi : objects_[object];
}

const parElement* GeneralSAR::GSelement(GSObject object, std::string_view field) const noexcept {
    const GeneralSAR_Base* const elements = GSelements(object);
    return elements ? quo::element_at(*elements, field) : nullptr;
}

int GeneralSAR::GSenable(GSObject object) noexcept {
    if (!is_object(object)) return QUO_REFUSED;
    present_[object] = true;
    return QUO_OK;
}

int GeneralSAR::GSdisable(GSObject object) noexcept {
    if (!is_object(object)) return QUO_REFUSED;
    present_[object] = false;
    return QUO_OK;
}

bool GeneralSAR::GSexists(GSObject object) const noexcept { return is_object(object) && present_[object]; }

int GeneralSAR::cloneObject(int index, GeneralSAR& other) {
    return kTable[static_cast<std::size_t>(index)].clone(*this, other);
}

int GeneralSAR::GSclone(GeneralSAR* other) {
    quo::CallFrame frame{"GeneralSAR::GSclone", kSource};
    if (!other) return frame.fail(QUO_REFUSED, "No container to copy into");
    if (other == this) return frame.success();
    int first_failure = QUO_OK;
    for (int i = 0; i < kObjects; ++i) {
        if (!present_[i]) continue;
        const int status = cloneObject(i, *other);
        other->present_[i] = status == QUO_OK;
        if (first_failure == QUO_OK) first_failure = status;
    }
    return first_failure == QUO_OK ? frame.success() : frame.callee(first_failure);
}

int GeneralSAR::GSdestroy() {
    polynomials.DestroyPolys();
    stateVectors.SVDestroy();
    orbit.SVDestroy();
    swathInfo.destroyBuffers();
    antennaPattern.destroyBuffers();
    return QUO_OK;
}
