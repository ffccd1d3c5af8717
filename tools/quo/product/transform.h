// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_TRANSFORM_H
#define QUO_TOOL_TRANSFORM_H

#include "quo_base/fft.h"

namespace tool {

/** A plan in place, for images of m rows of n samples, released with the object. Throws Failure where there is no
 * such plan, and where it cannot be run. */
class Transform {
public:
    /** Directions as fft_makep_c() takes them. */
    Transform(int n, int m, int along_rows, int down_columns);
    ~Transform() { fft_destp_c(&plan_); }
    Transform(const Transform&) = delete;
    Transform& operator=(const Transform&) = delete;

    void run(fcomplex* image) const;

private:
    FftPlan plan_{};
};

/** Throws Failure unless the status of a transform is 0. */
void require_transform(int status);

}  // namespace tool

#endif
