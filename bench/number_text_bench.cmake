# SPDX-License-Identifier: Apache-2.0
quo_bench(number_text SOURCES number_text_bench.cpp COMPONENTS gen_utils)
