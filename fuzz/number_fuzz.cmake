# SPDX-License-Identifier: Apache-2.0
quo_fuzz(number SOURCES number_fuzz.cpp COMPONENTS gen_utils)
