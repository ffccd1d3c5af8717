quo_bench(raster SOURCES raster_bench.cpp COMPONENTS datafile)
