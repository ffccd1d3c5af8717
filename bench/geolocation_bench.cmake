quo_bench(geolocation SOURCES geolocation_bench.cpp COMPONENTS orbit)
