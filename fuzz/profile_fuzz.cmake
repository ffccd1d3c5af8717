quo_fuzz(profile SOURCES profile_fuzz.cpp COMPONENTS profile)
