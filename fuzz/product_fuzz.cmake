# SPDX-License-Identifier: Apache-2.0
quo_fuzz(product SOURCES product_fuzz.cpp COMPONENTS product)
