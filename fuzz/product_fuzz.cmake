quo_fuzz(product SOURCES product_fuzz.cpp COMPONENTS product)
