// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BENCH_GEOLOCATION_FLOOR_H
#define QUO_BENCH_GEOLOCATION_FLOOR_H

namespace bench {

/** Numbers of operations. */
struct Operations {
    int multiplications, additions, divisions;
};

/** Does as many on packs of doubles, in chains that keep the processor busy: no work of as many operations takes
 * less. A division goes with every six multiplications at most. */
void operate_4(const Operations& operations);
void operate_8(const Operations& operations);

}  // namespace bench

#endif
