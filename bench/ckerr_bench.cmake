quo_bench(ckerr SOURCES ckerr_bench.cpp COMPONENTS ckerr)
