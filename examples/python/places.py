# SPDX-License-Identifier: Apache-2.0
from quo_base import Product

product = Product("scene.hdr")
times = product.grid.times(line=[1501, 1501], sample=[5675, 12000])
ground = product.orbit.to_ground(times.azimuth_time, times.range_time, height=[0, 350])
print(ground.latitude, ground.longitude, ground.status)
print(abs(product.raster[1500:1600, 5000:6000]).mean())
