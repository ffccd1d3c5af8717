# Of the tool's own sources, what reads text.
set(text "${PROJECT_SOURCE_DIR}/tools/quo/text")
quo_fuzz(table SOURCES table_fuzz.cpp "${text}/table.cpp" "${text}/input.cpp" "${text}/number.cpp" "${text}/failure.cpp" "${text}/shown.cpp" "${text}/output.cpp" "${text}/interrupt.cpp" COMPONENTS ckerr)
target_include_directories(table_fuzz PRIVATE "${text}")
set_source_files_properties("${text}/output.cpp" "${text}/shown.cpp" PROPERTIES INCLUDE_DIRECTORIES "${PROJECT_SOURCE_DIR}/libsrc/sources")
