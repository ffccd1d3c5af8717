# SPDX-License-Identifier: Apache-2.0
quo_fuzz(table SOURCES table_fuzz.cpp "${tool}/text/table.cpp" "${tool}/text/input.cpp" "${tool}/text/date.cpp" ${tool_text} COMPONENTS ckerr)
target_include_directories(table_fuzz PRIVATE "${tool}/text")
