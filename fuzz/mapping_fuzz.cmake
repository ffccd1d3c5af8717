quo_fuzz(mapping SOURCES mapping_fuzz.cpp COMPONENTS polynomials Coregist)
