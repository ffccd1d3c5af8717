# SPDX-License-Identifier: Apache-2.0

# Of the tool's own sources, what reads, shows and writes text.
if(TARGET quo)
    quo_fuzz(table SOURCES table_fuzz.cpp COMPONENTS debugIO)
    target_include_directories(table_fuzz PRIVATE "${PROJECT_SOURCE_DIR}/tools/quo/text")
    target_link_libraries(table_fuzz PRIVATE quo_tool_text quo_command_line)
endif()
