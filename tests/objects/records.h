// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_RECORDS_H
#define QUO_TESTS_RECORDS_H

#include "quo_base/Coregist.h"
#include "quo_base/generalSAR.h"
#include "quo_base/generalSAR_configuration.h"
#include "support/fields.h"

/** Header objects without knowing their class: what they are made of, made-up contents, comparison. */
namespace test {

/** An object with fields of its own, inside another. */
struct Part {
    std::string name;
    GeneralSAR_BaseXML* object;
};
/** The object and whatever travels with it through a header. */
inline std::vector<Part> parts_of(GeneralSAR_BaseXML& object) {
    std::vector<Part> parts{{"", &object}};
    if (auto* const roi = dynamic_cast<GSRoi_Obj*>(&object)) parts.push_back({"Roi.", &roi->Roi});
    if (auto* const file = dynamic_cast<GSDataFile_Obj*>(&object)) parts.push_back({"File.", &file->File});
    if (auto* const pattern = dynamic_cast<AntennaPattern_Obj*>(&object))
        parts.push_back({"PatternFile.", &pattern->PatternFile});
    if (auto* const grid = dynamic_cast<geoCoords_Obj*>(&object))
        parts.insert(parts.end(), {{"NorthWest.", &grid->NorthWest},
                                   {"NorthEast.", &grid->NorthEast},
                                   {"SouthWest.", &grid->SouthWest},
                                   {"SouthEast.", &grid->SouthEast},
                                   {"Center.", &grid->Center}});
    if (auto* const set = dynamic_cast<polySAR*>(&object)) {
        const auto add = [&parts](const char* name, const auto& list, int count) {
            for (int i = 0; i < count; ++i) parts.push_back({name + std::to_string(i) + '.', &list[i]});
        };
        add("DC", set->DC, set->ndc);
        add("FR", set->FR, set->nfr);
        add("SL2GR", set->SL2GR, set->nsl2gr);
        add("GR2SL", set->GR2SL, set->ngr2sl);
        add("SL2THETA", set->SL2THETA, set->nsl2theta);
        add("SL2PHI", set->SL2PHI, set->nsl2phi);
    }
    return parts;
}

/** Every value of an object by its name, those beside the table included. */
inline std::vector<std::pair<std::string, std::vector<std::string>>> contents(GeneralSAR_BaseXML& object) {
    std::vector<std::pair<std::string, std::vector<std::string>>> all;
    for (const auto& [name, part] : parts_of(object)) {
        const auto add = [&all, &part_name = name](const char* field, const auto& values) {
            all.emplace_back(part_name + field, std::vector<std::string>{});
            for (const auto value : values) all.back().second.push_back(digits(value));
        };
        for (int i = 0; i < part->elementCount(); ++i)
            all.emplace_back(name + part->element(i)->name, values_of(*part->element(i)));
        if (const auto* const raster = dynamic_cast<const RasterDescription*>(part))
            add("offset", std::vector{raster->HeaderOffset});
        if (const auto* const p = dynamic_cast<const geopoint*>(part))
            add("members", std::vector{p->Latitude, p->Longitude, p->Height, p->IncidenceAngle, p->LookAngle});
        if (const auto* const pattern = dynamic_cast<const AntennaPattern_Obj*>(part))
            add("Pattern", pattern->Pattern);
        if (const auto* const swath = dynamic_cast<const SwathInfo*>(part)) {
            add("Swst_changes_bursts", swath->Swst_changes_bursts);
            add("BurstStartTimes", swath->BurstStartTimes);
        }
    }
    return all;
}

/** Names of the values in which two objects of one class differ. */
inline std::vector<std::string> differences(GeneralSAR_BaseXML& a, GeneralSAR_BaseXML& b) {
    const auto left = contents(a), right = contents(b);
    if (left.size() != right.size()) return {"number of values"};
    std::vector<std::string> names;
    for (std::size_t i = 0; i < left.size(); ++i)
        if (left[i] != right[i]) names.push_back(left[i].first);
    return names;
}

/** State vectors along a circle, in values that fifteen digits hold; the table is filled already. */
template <typename Orbit>
void set_orbit(Orbit& orbit, int count) {
    orbit.nSV_n = count;
    EXPECT_EQ(orbit.createBuffers(), 0);
    const double scale[] = {7.1e6, 6.3e6, 3.2e6};
    for (int i = 0; i < 3 * count; ++i) {
        const int vector = i / 3, axis = i % 3;
        const double angle = 0.0103 * vector, turned = angle + std::acos(0.0);
        orbit.pSV_m[i] = std::round(scale[axis] * std::cos(angle + axis));
        orbit.vSV_mOs[i] = std::round(scale[axis] * std::cos(turned + axis)) / 1024.0;
    }
}

/** Gives every value of the object one of its own, and its arrays lengths; the same seed makes the same values. */
inline void fill(GeneralSAR_BaseXML& object, int seed = 1) {
    auto* const set = dynamic_cast<polySAR*>(&object);
    if (set) set->CreatePolys(2, 1, seed, 3, 1, 2);
    int next = seed;
    for (const auto& [name, part] : parts_of(object)) {
        if (part != set) fill_fields(*part, next += 2);
        if (auto* const p = dynamic_cast<geopoint*>(part))
            std::tie(p->Latitude, p->Longitude, p->Height, p->IncidenceAngle, p->LookAngle) =
                std::tie(p->Point[0], p->Point[1], p->Point[2], p->Point[3], p->Point[4]);
        if (auto* const raster = dynamic_cast<RasterDescription*>(part)) {
            raster->HeaderOffset = raster->RowPrefix + 29;
            raster->copyDescription(*raster);  // the element shows it
            raster->ByteOrder = seed % 2;
            raster->CellType = seed == 1 ? SHORT_COMPLEX : INT16;
        }
        if (auto* const swath = dynamic_cast<SwathInfo*>(part)) {
            swath->Swst_changes = 2 + seed;
            swath->createBuffers();
        }
        if (auto* const pattern = dynamic_cast<AntennaPattern_Obj*>(part)) {
            pattern->PatternSamples = 16 + seed;
            pattern->createBuffers();
        }
        if (auto* const vectors = dynamic_cast<SAROrbitStateVectors_Obj*>(part)) set_orbit(*vectors, 4 + seed);
        if (auto* const orbit = dynamic_cast<GeneralSAROrbit*>(part)) set_orbit(*orbit, 4 + seed);
    }
    if (auto* const pattern = dynamic_cast<AntennaPattern_Obj*>(&object)) {
        pattern->PatternFile.NrOfPixelsPerLine = pattern->PatternSamples;
        pattern->PatternFile.CellType = FLOAT32;
    }
}

// --- whole products -----------------------------------------------------------------------------------------

inline std::vector<GSObject> all_objects() {
    std::vector<GSObject> objects(GeneralSAR::kObjects);
    for (std::size_t i = 0; i < objects.size(); ++i) objects[i] = static_cast<GSObject>(i);
    return objects;
}
inline std::vector<GSObject> present_in(const GeneralSAR& product) {
    std::vector<GSObject> objects = all_objects();
    std::erase_if(objects, [&](GSObject object) { return !product.GSexists(object); });
    return objects;
}

/** "object.value" for everything in which two products differ. */
inline std::vector<std::string> differences(GeneralSAR& a, GeneralSAR& b) {
    std::vector<std::string> names;
    for (const GSObject object : all_objects())
        for (const std::string& value : differences(*a.GSget(object), *b.GSget(object)))
            names.push_back(std::to_string(object) + '.' + value);
    return names;
}

/** Fills every object with values of its own and enables it. What two of them share in a file is the same. */
inline void fill_product(GeneralSAR& p) {
    for (const GSObject object : all_objects()) {
        fill(*p.GSget(object));
        p.GSenable(object);
    }
    for (RasterDescription* raster :
         {static_cast<RasterDescription*>(&p.dataFile.File), static_cast<RasterDescription*>(&p.bufferFile)})
        raster->copyDescription(p.antennaPattern.PatternFile);
    EXPECT_EQ(p.orbit.computeApproximateSV(), 0);
}

}  // namespace test

#endif
