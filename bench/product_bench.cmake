quo_bench(product SOURCES product_bench.cpp COMPONENTS container)
