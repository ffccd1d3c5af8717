# SPDX-License-Identifier: Apache-2.0
quo_bench(raster SOURCES raster_bench.cpp COMPONENTS datafile)
# GDAL as a peer, where its headers are installed (libgdal-dev).
find_package(GDAL QUIET)
if(GDAL_FOUND)
    target_link_libraries(raster_bench PRIVATE GDAL::GDAL)
    target_compile_definitions(raster_bench PRIVATE QUO_HAVE_GDAL)
endif()
