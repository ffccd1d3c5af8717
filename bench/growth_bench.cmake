# SPDX-License-Identifier: Apache-2.0
quo_bench(growth SOURCES growth_bench.cpp COMPONENTS container)
