// SPDX-License-Identifier: Apache-2.0
#include <cstdint>
#include <cstdio>

#include "quo_base/product.h"

int main() {
    quo_product* product = nullptr;
    if (quo_product_open("scene.hdr", nullptr, &product) != 0) {
        std::fprintf(stderr, "scene.hdr: no product that can be read\n");
        return 1;
    }
    const double line[] = {1501, 1501}, sample[] = {5675, 12000}, height_m[] = {0, 350};
    double latitude[2], longitude[2];
    int32_t status[2];
    quo_product_pixels_to_ground(product, 2, line, sample, height_m, latitude, longitude, nullptr, nullptr,
                                 nullptr, nullptr, nullptr, nullptr, status);
    for (int i = 0; i < 2; ++i) std::printf("%.7f N, %.7f E, status %d\n", latitude[i], longitude[i], status[i]);
    return quo_product_close(product);
}
