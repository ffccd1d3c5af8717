quo_bench(growth SOURCES growth_bench.cpp COMPONENTS container)
