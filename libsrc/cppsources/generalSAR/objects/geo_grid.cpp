// SPDX-License-Identifier: Apache-2.0
#include "quo_base/geo_grid.h"

#include <algorithm>
#include <iterator>
#include <string>

#include "diagnosticslib/call_frame.h"
#include "profilelib/profile_look.h"
#include "quo_base/profile.h"
#include "quorelxmllib/field_table.h"
#include "quorelxmllib/guarded.h"
#include "quorelxmllib/header_session.h"
#include "sarutillib/ground/bounded_text.h"

namespace {

constexpr const char* kSource = "generalSAR";
constexpr const char* kProfileSection = "GeoGridSize";

namespace point {
using Obj = geopoint;
constexpr quo::FieldTable kTable{"GroundCornersPoints", QUO_FIELD(Point)};
// The members that the values of Point belong to.
constexpr double Obj::*kNamed[] = {&Obj::Latitude, &Obj::Longitude, &Obj::Height, &Obj::IncidenceAngle,
                                   &Obj::LookAngle};
constexpr const char* kProfileSection = "Coordinates";

std::string section_of(const char* name) {
    return std::string{kTable.section()} + "/" + std::string{quo::text_or_empty(name)};
}
}  // namespace point

using Obj = geoCoords_Obj;
constexpr quo::FieldTable kTable{"GroundCornersPoints", QUO_FIELD(EastingGridSize, quo::unit("m")),
                                 QUO_FIELD(NorthingGridSize, quo::unit("m"))};

struct NamedPoint {
    const char* name;
    geopoint Obj::*point;
};
constexpr NamedPoint kPoints[] = {{"NorthWest", &Obj::NorthWest},
                                  {"NorthEast", &Obj::NorthEast},
                                  {"SouthWest", &Obj::SouthWest},
                                  {"SouthEast", &Obj::SouthEast},
                                  {"Center", &Obj::Center}};

}  // namespace

QUO_RECORD(geoCoords_Obj, kTable)

int Obj::clone(geoCoords_Obj* to) const {
    for (const auto& [name, point] : kPoints) (this->*point).clone(&(to->*point));
    return kTable.copy(*this, *to);
}

int Obj::writehdr(const char* file) {
    quo::CallFrame frame{"geoCoords_Obj::writehdr", kSource};
    return quo::guarded(frame, [&] {
        quo::JoinedSession session{file};
        if (const int status = writeAuxiliaryFile(file, 1, kTable.section())) return frame.callee(status);
        for (const auto& [name, point] : kPoints)
            if (const int status = (this->*point).writehdr(file, name)) return frame.callee(status);
        return quo::pass_on(frame, session.commit());
    });
}

int Obj::readhdr(const char* file) {
    quo::CallFrame frame{"geoCoords_Obj::readhdr", kSource};
    return quo::guarded(frame, [&] {
        const quo::JoinedSession session{file};
        if (!readAuxiliaryFile(file, 1, kTable.section()))
            if (const int status = kTable.of(*this).read_profile(file, kProfileSection))
                return frame.silent(status);
        for (const auto& [name, point] : kPoints)
            if (const int status = (this->*point).readhdr(file, name)) return frame.callee(status);
        return frame.success();
    });
}

QUO_RECORD(geopoint, point::kTable)
int geopoint::clone(geopoint* to) const {
    for (const auto member : point::kNamed) to->*member = this->*member;
    return point::kTable.copy(*this, *to);
}
int geopoint::writehdr(const char* file, const char* name) {
    std::ranges::transform(point::kNamed, Point, [this](auto member) { return this->*member; });
    return writeAuxiliaryFile(file, 1, point::section_of(name).c_str());
}
int geopoint::readhdr(const char* file, const char* name) {
    // What Point holds becomes the named members even where neither form of the file has the point: the two never
    // differ after a read.
    if (!readAuxiliaryFile(file, 1, point::section_of(name).c_str())) {
        if (const int unread = quo::Record::unread(*this)) return unread;
        const quo::ProfileLook look{file};
        GetProfileDoubleArray(point::kProfileSection, name, Point, static_cast<int>(std::size(Point)), file);
    }
    const double* value = Point;
    for (const auto member : point::kNamed) this->*member = *value++;
    return QUO_OK;
}
