# SPDX-License-Identifier: Apache-2.0
quo_fuzz(sentinel1 SOURCES sentinel1_fuzz.cpp COMPONENTS missions)
target_compile_definitions(sentinel1_fuzz PRIVATE QUO_FUZZ_TIFF_MODULE="$<TARGET_FILE:quo_base_tiff>")
