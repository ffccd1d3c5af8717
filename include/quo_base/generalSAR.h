// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_GENERALSAR_H
#define QUO_BASE_GENERALSAR_H

#include <array>
#include <string_view>

#include "quo_base/SARpolynomials.h"
#include "quo_base/acquisition.h"
#include "quo_base/api.h"
#include "quo_base/datafile.h"
#include "quo_base/dataset_info.h"
#include "quo_base/generalSARorbit.h"
#include "quo_base/geo_grid.h"
#include "quo_base/quorelxml_v2.h"
#include "quo_base/roi.h"
#include "quo_base/swath.h"

/** @file
 * A whole product header: one object of each header class, read, written, copied and cleared together.
 *
 *     GeneralSAR product;
 *     if (product.GSread("scene.hdr") == 0 && product.GSexists(gsOrbit)) product.orbit.SVGetLatLon(...);
 */

/** The objects of a product, in the order in which they are read. */
enum GSObject : int {
    gsDataFile = 0,           ///< GSDataFile_Obj
    gsRoi = 1,                ///< GSRoi_Obj, section "ROI"
    gsPolySAR = 2,            ///< polySAR, "PolySAR"
    gsSamplingConstants = 3,  ///< SamplingConstants_Obj, "SamplingConstants"
    gsStateVectors = 4,       ///< SAROrbitStateVectors_Obj, "StateVectorData"
    gsOrbit = 5,              ///< GeneralSAROrbit, the same section
    gsPulse = 6,              ///< SARPulse_Obj, "Pulse"
    gsAntennaPattern = 7,     ///< AntennaPattern_Obj, "AntennaPattern"
    gsDataSetInfo = 8,        ///< DataSetInfo_Obj, "DataSetInfo"
    gsSensorAttitude = 9,     ///< SensorAttitude_Obj, "SensorAttitude"
    gsSpectralWindows = 10,   ///< SpectralWindows_Obj, "SpectralWindows"
    gsGeoCoords = 11,         ///< geoCoords_Obj, "GroundCornersPoints"
    gsSwathInfo = 12,         ///< SwathInfo, "SwathInfo"
    gsBufferFile = 13         ///< BufferFile, "RasterInfo"
};

/** The container of a product's header objects. Each has a presence flag, which says whether its content is valid;
 * the object exists either way, with its defaults in a new container, and stays at its place as long as the
 * container lives. One container serves one thread at a time; `const` members may run side by side. */
class QUO_BASE_API GeneralSAR {
public:
    /** Number of objects in the container. */
    static constexpr int kObjects = 14;

    /** Nothing present. */
    GeneralSAR();
    GeneralSAR(const GeneralSAR&) = delete;
    GeneralSAR& operator=(const GeneralSAR&) = delete;

    /** Reads a product header, an XML file or one of the older parameter files. What was there is released first
     * (GSdestroy()); present are then the objects whose readhdr() succeeded. An XML header is parsed once. Where
     * both are present, the orbit takes its wavelength from the sampling constants and, like the state vectors,
     * its look direction from the data set.
     * @return 0, whatever was found; 1 with the ERROR entry "File : %s DOES NOT EXIST!" where the file cannot be
     *         opened, with nothing changed; 7. An object that memory is short for, or whose file is there but
     *         cannot be read, is not present, with an ERROR entry; quo_take_system_error() then gives
     *         ENOMEM where memory was short. */
    int GSread(const char* file);
    /** Writes the present objects, the last of GSObject first, each into its own section, which it replaces; other
     * content of the file stays. An existing header is parsed once, and all sections are saved in one step, so
     * that a failure leaves the file as it was; when memory runs out at any object nothing is saved, while an
     * object that is refused (a text that XML cannot hold) keeps no other from the file. gsDataFile goes to the
     * side file of the header's raster, which is the header itself where that ends in ".hdr", else saved after it.
     * With nothing present no file is touched.
     * @return 0, also where something could not be written: callers rely on it, and the report tells. */
    int GSwrite(const char* file);

    /** The object, present or not; the caller casts it to the class that GSObject tells. Null for another number.
     */
    GeneralSAR_Base* GSget(GSObject object) noexcept;
    /** The object's name in lists for people, such as "SamplingConstants"; empty for another number. */
    static const char* GSname(GSObject object) noexcept;
    /** What the object registers in its section: its own elements or, for gsRoi, those of the region in it. Null
     * for another number. */
    const GeneralSAR_Base* GSelements(GSObject object) const noexcept;
    /** The one of them that stands at a path in headers, such as "SamplingConstants/prf_hz", present or not. Null
     * for another path or number. */
    const parElement* GSelement(GSObject object, std::string_view field) const noexcept;
    int GSenable(GSObject object) noexcept;         ///< sets the presence flag; 0, or 1 for another number
    int GSdisable(GSObject object) noexcept;        ///< clears it; 0, or 1 for another number
    bool GSexists(GSObject object) const noexcept;  ///< the presence flag; false for another number

    /** Copies every present object into `other` and sets its flag there; what is absent here stays as it is there.
     * @return 0; 1 for null; the status of the first copy that failed, which leaves that object's flag cleared and
     *         stops no other. */
    int GSclone(GeneralSAR* other);
    /** Releases polynomials, state vectors (of both objects), and the arrays of swath and antenna pattern.
     * The presence flags stay: whoever destroys content disables the objects. Returns 0. */
    int GSdestroy();

    GSDataFile_Obj dataFile;                  ///< description of the product's raster, by the header's name
    GSRoi_Obj roi;                            ///< region of interest in time
    polySAR polynomials;                      ///< Doppler and geometry polynomials
    SamplingConstants_Obj samplingConstants;  ///< how the acquisition was sampled
    SAROrbitStateVectors_Obj stateVectors;    ///< the orbit's state vectors
    GeneralSAROrbit orbit;                    ///< the orbit model, from the same vectors
    SARPulse_Obj pulse;                       ///< the transmitted pulse
    AntennaPattern_Obj antennaPattern;        ///< the elevation antenna pattern
    DataSetInfo_Obj dataSetInfo;              ///< what the product is
    SensorAttitude_Obj sensorAttitude;        ///< attitude and antenna of the sensor
    SpectralWindows_Obj spectralWindows;      ///< the weighting that the processor applied
    geoCoords_Obj geoCoords;                  ///< corners on the ground
    SwathInfo swathInfo;                      ///< timing of the bursts
    BufferFile bufferFile;                    ///< the product's raster, for reading in blocks

private:
    void linkObjects();
    int cloneObject(int index, GeneralSAR& other);

    const std::array<GeneralSAR_Base*, kObjects> objects_;
    std::array<bool, kObjects> present_{};
};

#endif
