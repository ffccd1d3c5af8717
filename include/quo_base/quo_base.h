// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_QUO_BASE_H
#define QUO_BASE_QUO_BASE_H

/** @file
 * All of the library. C programs get the plain functions, C++ programs the classes too. */

#include "quo_base/MatrixAlgebraANSI.h"
#include "quo_base/alloc_free.h"
#include "quo_base/api.h"
#include "quo_base/ckerr.h"
#include "quo_base/debugIO.h"
#include "quo_base/fft.h"
#include "quo_base/gen_utils.h"
#include "quo_base/geometry.h"
#include "quo_base/gr_pt.h"
#include "quo_base/interp_orb.h"
#include "quo_base/mission_import.h"
#include "quo_base/product.h"
#include "quo_base/profile.h"

#ifdef __cplusplus
#include "quo_base/Coregist.h"
#include "quo_base/SARpolynomials.h"
#include "quo_base/acquisition.h"
#include "quo_base/datafile.h"
#include "quo_base/dataset_info.h"
#include "quo_base/derived_raster.h"
#include "quo_base/generalSAR.h"
#include "quo_base/generalSAR_configuration.h"
#include "quo_base/generalSARorbit.h"
#include "quo_base/geo_grid.h"
#include "quo_base/image_grid.h"
#include "quo_base/interp.h"
#include "quo_base/quorelReport.h"
#include "quo_base/quorelxml_v2.h"
#include "quo_base/roi.h"
#include "quo_base/swath.h"
#endif

#endif
