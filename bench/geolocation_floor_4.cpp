// SPDX-License-Identifier: Apache-2.0
#define QUO_BENCH_LANES 4
#define QUO_BENCH_OPERATE operate_4
#include "geolocation_floor.inc"
