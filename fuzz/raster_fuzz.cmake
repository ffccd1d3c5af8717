quo_fuzz(raster SOURCES raster_fuzz.cpp COMPONENTS datafile)
