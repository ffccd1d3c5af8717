// SPDX-License-Identifier: Apache-2.0
/* A product from C: who made it, where a sample lies on the ground, when that place is seen, and a block of the
 * raster where there is one. Usage: product HEADER AZIMUTH_S RANGE_S; the result is the status of what failed. */
#include <stdio.h>
#include <stdlib.h>

#include "quo_base/product.h"

enum { kPoints = 3 };

static int show_header(const quo_product* product) {
    char mission[QUO_PRODUCT_TEXT_ROOM];
    double prf_hz, vectors;
    size_t values;
    int status = quo_product_text(product, "DataSetInfo/SensorName", mission, sizeof mission);
    if (!status) status = quo_product_number(product, "SamplingConstants/prf_hz", &prf_hz);
    if (!status) status = quo_product_number(product, "StateVectorData/nSV_n", &vectors);
    if (!status) status = quo_product_length(product, "StateVectorData/pSV_m", &values);
    if (status) return status;
    printf("%s, PRF %.3f Hz, %.0f state vectors, %zu coordinates\n", mission, prf_hz, vectors, values);
    return 0;
}

/* Samples a tenth of a millisecond apart in range: to the ground, and from the ground back to azimuth and range
 * time. */
static int show_ground(const quo_product* product, double azimuth, double range) {
    double azimuth_s[kPoints], range_s[kPoints], latitude[kPoints], longitude[kPoints], incidence[kPoints];
    for (int i = 0; i < kPoints; ++i) {
        azimuth_s[i] = azimuth;
        range_s[i] = range + 1e-4 * i;
    }
    int status = quo_product_to_ground(product, kPoints, azimuth_s, range_s, NULL, NULL, latitude, longitude, NULL,
                                       NULL, NULL, NULL, incidence, NULL, NULL, NULL, NULL);
    /* The times may be overwritten: they are read before. */
    if (!status)
        status = quo_product_to_radar(product, kPoints, latitude, longitude, NULL, NULL, NULL, NULL, NULL,
                                      azimuth_s, range_s, NULL);
    if (status) return status;
    for (int i = 0; i < kPoints; ++i)
        printf("%.7f N, %.7f E, seen at %.4f degrees; back at %.6f s, %.10f s\n", latitude[i], longitude[i],
               incidence[i], azimuth_s[i], range_s[i]);
    return 0;
}

/* The mean intensity of the raster's first lines, whatever the samples are in the file. */
static int show_raster(const quo_product* product) {
    int32_t lines, samples, type;
    int status = quo_product_raster(product, &lines, &samples, &type);
    if (status || lines == 0 || samples == 0) return status; /* a header alone */
    if (lines > 10) lines = 10;
    const size_t count = (size_t)lines * (size_t)samples;
    float* block = calloc(count, 2 * sizeof *block); /* real and imaginary parts in turn */
    if (!block) return QUO_NO_MEMORY;
    status = quo_product_read(product, 0, lines, 0, samples, FLOAT_COMPLEX, block, count * 2 * sizeof *block);
    double sum = 0.0;
    for (size_t i = 0; i < 2 * count; ++i) sum += (double)block[i] * (double)block[i];
    if (!status) printf("%d lines of %d samples, mean intensity %.3f\n", lines, samples, sum / (double)count);
    free(block);
    return status;
}

int main(int argc, char** argv) {
    if (argc != 4) return 2;
    quo_product* product;
    int status = quo_product_open(argv[1], NULL, &product);
    if (!status) {
        status = show_header(product);
        if (!status) status = show_ground(product, strtod(argv[2], NULL), strtod(argv[3], NULL));
        if (!status) status = show_raster(product);
        quo_product_close(product);
    }
    return status;
}
