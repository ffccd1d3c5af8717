// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_GEO_GRID_H
#define QUO_BASE_GEO_GRID_H

#include "quo_base/acquisition.h"
#include "quo_base/api.h"
#include "quo_base/datafile.h"
#include "quo_base/quorelxml_v2.h"
#include "quo_base/roi.h"

/** @file
 * Header objects that say where a product lies: its corners on the ground, its region of interest, its raster. One
 * object serves one thread at a time. */

/** The corners and the centre of a product on the ground, and the spacing of its grid. Section
 * "GroundCornersPoints": the spacing, and below it one section per point. GeneralSAROrbit::SVGetGeoCoords() fills
 * the points. */
class QUO_BASE_API geoCoords_Obj : public GeneralSAR_Base {
public:
    geoCoords_Obj();
    /** Reads the spacing from the XML section, else from the section "GeoGridSize" of the parameter file, then
     * each point as geopoint::readhdr() does: one that is in neither form keeps its values. 0; 1 without the
     * spacing. */
    int readhdr(const char* file) override;
    /** Replaces the whole section, the points in it, saving the file once. 0, or a failing status with the file as
     * it was. */
    int writehdr(const char* file) override;
    using GeneralSAR_Base::writehdr;
    int clone(geoCoords_Obj* to) const;  ///< copies spacing and points; 0

    /** The points of the grid, each in its own section. */
    geopoint NorthWest, NorthEast, SouthWest, SouthEast, Center;
    double EastingGridSize = -999.0;   ///< spacing of the grid to the east, m
    double NorthingGridSize = -999.0;  ///< spacing of the grid to the north, m

protected:
    void refreshParameters() override;
};

/** A product's region of interest, section "ROI". */
class QUO_BASE_API GSRoi_Obj : public GeneralSAR_Base {
public:
    int readhdr(const char* file) override;   ///< as ROI_Obj::read_roi(); 0 or 1
    int writehdr(const char* file) override;  ///< as ROI_Obj::write_roi(); 0
    using GeneralSAR_Base::writehdr;
    int clone(GSRoi_Obj* to) const;  ///< copies the region; 0

    ROI_Obj Roi;  ///< the region
};

/** The description of a product's raster. The raster is named like the product's header less its last four
 * characters, and its side file is that name with ".hdr" appended: the header itself where it ends so. */
class QUO_BASE_API GSDataFile_Obj : public GeneralSAR_Base {
public:
    /** Reads the side file of the header's raster. 0 whatever it holds, so that a product always has this entry;
     * a side file that could not be read whole leaves its entries in the report. 7 where memory is short. */
    int readhdr(const char* file) override;
    /** Writes the side file of the header's raster; File keeps its own name. A header is written without its
     * raster too: returns 0 even where nothing could be written; the report tells. */
    int writehdr(const char* file) override;
    using GeneralSAR_Base::writehdr;
    int clone(GSDataFile_Obj* to) const;  ///< copies name and description, opens nothing; 0 or a failing close

    DataFile File;  ///< name and description; opened by the caller, if at all
};

#endif
