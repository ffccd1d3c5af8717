# SPDX-License-Identifier: Apache-2.0
import quo_base

product = quo_base.Product("cut.hdr")
print(product.grid.times(100, 100))
cut_map = quo_base.geocode(product, "dem.tif", heights="ellipsoid", quantities=["image", "local_incidence"])
print(cut_map.image.shape, float(cut_map.image.mean()), float(cut_map.local_incidence.mean()))
