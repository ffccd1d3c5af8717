quo_fuzz(number SOURCES number_fuzz.cpp COMPONENTS gen_utils)
