# SPDX-License-Identifier: Apache-2.0
quo_bench(ckerr SOURCES ckerr_bench.cpp COMPONENTS ckerr)
