// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_EXAMPLES_AZIMUTH_FOCUSING_H
#define QUO_EXAMPLES_AZIMUTH_FOCUSING_H

#include <vector>

#include "filters.h"
#include "quo_base/generalSAR.h"
#include "quo_base/generalSAR_configuration.h"
#include "range_histories.h"
#include "stopwatch.h"
#include "transform.h"

namespace example {

/** How an image is cut into blocks. Lines of the image are counted like those of the raw data, samples like those
 * of the compressed data. */
struct BlockLayout {
    int block_lines, block_samples;  // of a transform
    int first_line, lines, samples;  // of the image: what lies wholly within the data
    int step_lines, step_samples;    // of the image that one block gives
    int lead_lines;                  // data lines that a block begins after its first image line; negative: before
    int guard_samples;               // samples that a block begins before its first image sample
};

/** The Doppler band that is processed. */
struct DopplerBand {
    double width_hz, hamming;
    double prf_hz;
};

/** Lays blocks out for compressed data of the region `data`, so that each holds whole apertures: the lines and
 * samples that the histories of its targets run through. Blocks become longer than the configuration's, and
 * overlap more, where that takes it. They become narrower where a block's edge would migrate otherwise than its
 * middle by more than a twentieth of a sample, and shorter where the orbit changes the phase at the Doppler
 * centroid by more than 0.05 rad from the middle of a block's lines to their ends. */
BlockLayout lay_out(GeneralSAR& product, const AzimuthConf& conf, const ROI_Obj& data, const DopplerBand& band,
                    double height_m);

/** Focuses blocks of compressed data in azimuth.
 *
 * A target at the closest distance R0 has in both frequencies, f in azimuth and g in range, the phase
 *
 *     -(4 pi R0 / c) sqrt((f0 + g)^2 - (c f / 2 v)^2)
 *
 * (R. K. Raney et al., "Precision SAR Processing Using Chirp Scaling", IEEE Trans. Geosci. Remote Sens. 32(4),
 * 1994). Its series in g has a part without g, which is the history of the phase, one with g, which is the
 * migration, and one with g^2, a dispersion that grows with the squint and is known as secondary range
 * compression. Higher parts stay below 0.001 rad.
 *
 * All three are taken out for the block's middle range in the plane of both frequencies. Back in range, each
 * column gets the rest of its own history's phase. What remains is the difference in migration within a block,
 * which the layout bounds. The phase of a focused target is -4 pi R0 / lambda. */
class AzimuthFocusing {
public:
    AzimuthFocusing(const BlockLayout& layout, const DopplerBand& band, double range_step_s);

    /** Where the data is to be put before focus(), and where the image is afterwards. */
    [[nodiscard]] Block& block() { return block_; }
    /** Focuses the block, whose first sample has this range time, with the Doppler of this azimuth time. */
    void focus(GeneralSAR& product, RangeHistories& histories, double range_s, double azimuth_s, Stopwatch& watch);

private:
    void aim(GeneralSAR& product, RangeHistories& histories, double range_s, double azimuth_s);
    void filter_middle();   // for the middle range, in both frequencies
    void filter_columns();  // the rest of each column
    [[nodiscard]] double doppler_hz(int bin) const;
    [[nodiscard]] RowPhase middle_phase(double doppler_hz) const;
    [[nodiscard]] RowPhase column_phase(double doppler_hz) const;

    DopplerBand band_;
    double range_step_s_;
    double centre_hz_ = 0.0, scale_ = 0.0;
    Hyperbola middle_{}, near_{}, far_{};
    RangeHistories::PhasePolynomial miss_{};
    Block block_;
    Transform forward_, inverse_range_, inverse_azimuth_;
    std::vector<double> weights_;  // of each azimuth bin; 0 outside the band
};

}  // namespace example

#endif
