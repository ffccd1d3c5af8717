# SPDX-License-Identifier: Apache-2.0
quo_fuzz(mapping SOURCES mapping_fuzz.cpp COMPONENTS polynomials Coregist)
