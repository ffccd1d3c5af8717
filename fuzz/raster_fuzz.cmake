# SPDX-License-Identifier: Apache-2.0
quo_fuzz(raster SOURCES raster_fuzz.cpp COMPONENTS datafile)
