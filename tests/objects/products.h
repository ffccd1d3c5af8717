#ifndef QUO_TESTS_PRODUCTS_H
#define QUO_TESTS_PRODUCTS_H

#include <string>
#include <vector>

#include "objects/records.h"
#include "quo_base/generalSAR.h"

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
