// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_SPECTRUM_PICTURE_H
#define QUO_TOOL_SPECTRUM_PICTURE_H

#include <string>
#include <vector>

#include "common/drawing/picture.h"

namespace tool {

/** A power spectrum and what it tells. Bins stand in the order of the transform, frequency 0 first. */
struct SpectrumShown {
    std::string title;
    std::vector<double> decibel;   ///< bin by bin, against the peak of the smoothed one; not empty
    std::vector<double> smoothed;  ///< the same, smoothed; at most 0
    double rate = 1.0;             ///< sampling rate, Hz; 1 where frequencies are in cycles per sample
    bool in_hertz = false;
    std::string centre_name;
    double centre = 0.0, width = 0.0;  ///< of the band, cycles per sample
};

/** Draws spectra one below the other under a title and a line about them: bin by bin in a pale colour, smoothed in
 * a dark one, the part within 3 dB of the peak shaded and its width and centre marked and labelled. The decibels
 * reach as far as each spectrum does, at least 10 and at most 60 dB down. */
drawing::Picture draw_spectra(const std::string& title, const std::string& about,
                              const std::vector<SpectrumShown>& spectra);

}  // namespace tool

#endif
