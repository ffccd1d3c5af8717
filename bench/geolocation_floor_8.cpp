// SPDX-License-Identifier: Apache-2.0
#define QUO_BENCH_LANES 8
#define QUO_BENCH_OPERATE operate_8
#include "geolocation_floor.inc"
