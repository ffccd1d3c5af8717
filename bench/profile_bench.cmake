quo_bench(profile SOURCES profile_bench.cpp COMPONENTS profile)
