#ifndef QUO_TESTS_PRODUCTS_H
#define QUO_TESTS_PRODUCTS_H

#include <cmath>
#include <stdexcept>
#include <string>
#include <vector>

#include "quo_base/generalSAR.h"
#include "support/fields.h"
#include "support/scenes.h"

namespace test {

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

/** Everything of a product that travels through a file, each part as an object with a table. */
struct Part {
    std::string name;
    GeneralSAR_BaseXML* object;
};
template <typename List>
void add_list(std::vector<Part>& parts, const char* name, const List& list, int count) {
    for (int i = 0; i < count; ++i) parts.push_back({name + std::to_string(i), &list[i]});
}
inline std::vector<Part> parts_of(GeneralSAR& p) {
    std::vector<Part> parts = {{"DataFile", &p.dataFile.File},
                               {"Roi", &p.roi.Roi},
                               {"PolySAR", &p.polynomials},
                               {"SamplingConstants", &p.samplingConstants},
                               {"StateVectors", &p.stateVectors},
                               {"Orbit", &p.orbit},
                               {"Pulse", &p.pulse},
                               {"AntennaPattern", &p.antennaPattern},
                               {"DataSetInfo", &p.dataSetInfo},
                               {"SensorAttitude", &p.sensorAttitude},
                               {"SpectralWindows", &p.spectralWindows},
                               {"GeoCoords", &p.geoCoords},
                               {"NorthWest", &p.geoCoords.NorthWest},
                               {"NorthEast", &p.geoCoords.NorthEast},
                               {"SouthWest", &p.geoCoords.SouthWest},
                               {"SouthEast", &p.geoCoords.SouthEast},
                               {"Center", &p.geoCoords.Center},
                               {"SwathInfo", &p.swathInfo},
                               {"BufferFile", &p.bufferFile}};
    add_list(parts, "DC", p.polynomials.DC, p.polynomials.ndc);
    add_list(parts, "FR", p.polynomials.FR, p.polynomials.nfr);
    add_list(parts, "SL2GR", p.polynomials.SL2GR, p.polynomials.nsl2gr);
    add_list(parts, "GR2SL", p.polynomials.GR2SL, p.polynomials.ngr2sl);
    add_list(parts, "SL2THETA", p.polynomials.SL2THETA, p.polynomials.nsl2theta);
    add_list(parts, "SL2PHI", p.polynomials.SL2PHI, p.polynomials.nsl2phi);
    return parts;
}

/** "part.field" for every field in which two products differ. */
inline std::vector<std::string> differences(GeneralSAR& a, GeneralSAR& b) {
    const std::vector<Part> left = parts_of(a), right = parts_of(b);
    if (left.size() != right.size()) return {"number of polynomials"};
    std::vector<std::string> names;
    for (std::size_t i = 0; i < left.size(); ++i)
        for (const std::string& field : differing_fields(*left[i].object, *right[i].object))
            names.push_back(left[i].name + '.' + field);
    return names;
}

inline void set_raster(RasterDescription& raster, int samples) {
    raster.NrOfLinesPerImage = 803;
    raster.NrOfPixelsPerLine = samples;
    raster.HeaderOffset = 29;
    raster.RowPrefix = 12;
    raster.ByteOrder = 1;
    raster.CellType = SHORT_COMPLEX;
}

/** Fills every object with values of its own, the orbit with a scene's, and enables it. */
inline void fill_product(GeneralSAR& p) {
    p.polynomials.CreatePolys(4, 3, 1, 2, 1, 2);
    int seed = 0;
    for (const Part& part : parts_of(p))
        if (part.object != &p.stateVectors && part.object != &p.orbit && part.object != &p.polynomials)
            fill_fields(*part.object, ++seed);
    for (geopoint* point : {&p.geoCoords.NorthWest, &p.geoCoords.NorthEast, &p.geoCoords.SouthWest,
                            &p.geoCoords.SouthEast, &p.geoCoords.Center}) {
        point->Latitude = point->Point[0];
        point->Longitude = point->Point[1];
        point->Height = point->Point[2];
        point->IncidenceAngle = point->Point[3];
        point->LookAngle = point->Point[4];
    }
    load_orbit(kScenes[0], p.orbit);
    if (p.stateVectors.readhdr(kScenes[0].path(".xml").c_str())) throw std::runtime_error{"no state vectors"};
    // A time that fifteen digits hold.
    p.stateVectors.t0SV_s = p.orbit.t0SV_s = std::round(p.orbit.t0SV_s);
    if (p.orbit.computeApproximateSV()) throw std::runtime_error{"no orbit"};
    p.swathInfo.Swst_changes = 3;
    p.swathInfo.createBuffers();
    set_raster(p.dataFile.File, 17);
    set_raster(p.bufferFile, 17);
    p.antennaPattern.PatternSamples = 17;
    p.antennaPattern.createBuffers();
    for (const GSObject object : all_objects()) p.GSenable(object);
}

}  // namespace test

#endif
