// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_EXAMPLES_RANGE_COMPRESSION_H
#define QUO_EXAMPLES_RANGE_COMPRESSION_H

#include <vector>

#include "quo_base/acquisition.h"
#include "quo_base/generalSAR_configuration.h"
#include "stopwatch.h"
#include "transform.h"

namespace example {

/** Compresses the pulse in raw lines: correlation with the replica by fast convolution (I. G. Cumming, F. H. Wong,
 * "Digital Processing of Synthetic Aperture Radar Data", 2005, chapter 3).
 *
 * The replica is centred, so that a target is found at the delay of its pulse's middle. An echo of amplitude 1
 * gives a peak of 1. */
class RangeCompression {
public:
    /** For lines of `samples` samples, `lines_in_block` at a time. */
    RangeCompression(const SARPulse_Obj& pulse, const AzimuthConf& conf, int samples, int lines_in_block);

    /** Where raw lines are to be put before compress(), at the start of each of its lines, zeros behind them. */
    [[nodiscard]] Block& block() { return block_; }
    /** Samples of a compressed line: those that a whole pulse stands behind. */
    [[nodiscard]] int samples() const { return samples_; }
    /** Range time of the first compressed sample after that of the first raw sample, s. */
    [[nodiscard]] double delay_s() const { return delay_s_; }

    void compress(Stopwatch& watch);

private:
    void filter();
    void prepare_filter(const std::vector<fcomplex>& replica, const SARPulse_Obj& pulse, const AzimuthConf& conf);

    int samples_;
    double delay_s_;
    Block block_, filter_;
    Transform forward_, inverse_;
};

}  // namespace example

#endif
