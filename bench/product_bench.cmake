# SPDX-License-Identifier: Apache-2.0
quo_bench(product SOURCES product_bench.cpp COMPONENTS container)
