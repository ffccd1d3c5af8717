// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_INTERP_H
#define QUO_BASE_INTERP_H

#include <vector>

#include "quo_base/api.h"
#include "quo_base/fft.h"

/** @file
 * Resampling: images of another size, samples between the samples, and phase ramps.
 *
 * Images are stored row after row; nx is the length of a row, ny the number of rows. Positions are in samples (x,
 * along the row) and rows (y), counted from 0. One object serves one thread at a time; functions keep nothing
 * between calls. */

/** Changes the size of an image along one axis, by Fourier zero-padding or by linear interpolation. */
class QUO_BASE_API interp {
public:
    interp() = default;
    ~interp();
    interp(const interp&) = delete;
    interp& operator=(const interp&) = delete;

    /** Makes the plans that interpft_p() runs, for an image of nx_in by ny_in samples that becomes nx_out by
     * ny_out. Plans made before are released. Sizes that do not change need no plans.
     *
     * @return 0; 1 when both axes change, an axis shrinks, a size is below 1 or an image beyond any memory; the
     * status of fft_makep_c(). After a failure there are no plans and no sizes. */
    int setplans(int nx_in, int ny_in, int nx_out, int ny_out);

    /** Releases the plans and keeps the sizes: interpft_p() then copies images of equal sizes and refuses others.
     * Returns 0. */
    int destroyplans();

    /** Forgets the sizes without releasing anything: interpft_p() is refused until setplans() is called. */
    void resetplans();

    /** Resamples with the plans at hand: the spectrum of each row (or column) of N samples is padded with zeros to
     * M and transformed back, so that band-limited periodic data is met within 1e-6 of its root mean square. Equal
     * sizes are copied.
     *
     * Along the rows, the Nyquist bin of an even N is halved and mirrored in the first row only, and
     * halved once for every row of the image, so that R rows leave 0.5^R of it; all other rows keep theirs whole
     * with nothing at the mirrored place. Down the columns it is halved and mirrored everywhere, once.
     *
     * @param[in,out] in   ny_in rows of nx_in; overwritten by its spectrum along the axis that changes
     * @param[out]    out  ny_out rows of nx_out, apart from `in`
     * @return 0; 1 for null pointers, without sizes, or without the plans that they need; 7 when an engine is out
     * of memory */
    int interpft_p(fcomplex* in, fcomplex* out);

    /** setplans(), interpft_p() and destroyplans().
     * @return 0, or the status of the step that failed, with an ERROR_CALL_TREE entry */
    int interpft(fcomplex* in, int nx_in, int ny_in, int nx_out, int ny_out, fcomplex* out);

    /** Linear interpolation along the axis that grows, by the integer factor f = ny_out / ny_in or nx_out / nx_in:
     * input sample i lands at f * i, and the f - 1 samples behind it lie on the line to the next. The last sample
     * has no next one and is held. Where the growth is no multiple, output beyond f times the input is left as it
     * is.
     *
     * @param[in]  in              ny_in rows of nx_in
     * @param[in]  nx_in, ny_in    size of the image
     * @param[in]  nx_out, ny_out  size that it gets
     * @param[out] out             ny_out rows of nx_out, apart from `in`
     * @return 0, also when nothing grows (nothing is looked at or written then, whatever the other arguments are);
     * 1 for null pointers, a size below 1, an image beyond any memory, or when one axis grows and the other
     * changes too */
    int interp_lin(const fcomplex* in, int nx_in, int ny_in, int nx_out, int ny_out, fcomplex* out);
    int interp_lin(const float* in, int nx_in, int ny_in, int nx_out, int ny_out, float* out);
    int interp_lin(const double* in, int nx_in, int ny_in, int nx_out, int ny_out, double* out);

private:
    int open_plans(int nx_out, int ny_out);
    int resample_rows(fcomplex* in, fcomplex* out) const;
    int resample_columns(fcomplex* in, fcomplex* out) const;

    FftPlan forward_{}, inverse_{};
    int nx_in_ = -1, ny_in_ = -1, nx_out_ = -1, ny_out_ = -1;
};

/** Interpolates complex images at any position.
 *
 * The kernel is a sinc of 32 samples per axis under a Kaiser window (J. F. Kaiser, "Nonrecursive Digital Filter
 * Design Using the I0-sinh Window Function", Proc. IEEE Int. Symp. Circuits and Systems, 1974) of shape 9,
 * tabulated at 512 places between two samples and interpolated linearly between these. Its weights add up to one,
 * so that constants are met exactly.
 *
 * Measured root mean square error, relative to the signal, where that fills the middle 80 % of the band or less:
 * at most 2e-5 of positions between the samples of one axis and on samples of the other, 3e-5 (2.6e-5 on average)
 * between the samples of both; of a single tone, whose ripple does not average out, 2e-5 and 3.3e-5. At the very
 * edge of the band half the amplitude is lost. The band is centred at zero: demodulate first what is not.
 *
 * A position outside the first to the last sample, or one that is no number, gives 0. Within 16 samples of a
 * border the kernel's missing part is left out and the rest scaled to add up to one.
 *
 * The final argument `lowpass`, p, narrows the band to 1/p for output p times as coarse: the kernel is stretched
 * to 32 p samples, with -6 dB at 1/(2 p) cycles per sample, and what lies beyond 1.2 times that frequency is 91 dB
 * down (at 1.22 times, the worst place), beyond 1.35 times 95 dB. 1 leaves the band whole, as do the forms without
 * the argument. */
class QUO_BASE_API interp2D {
public:
    /** At `count` positions, out[k] being the image at (x[k], y[k]).
     *
     * @param[in]  in       ny rows of nx samples
     * @param[in]  nx, ny   size of the image
     * @param[in]  x, y     positions, samples and rows from 0
     * @param[in]  count    number of positions
     * @param[out] out      apart from `in`; unchanged unless 0 is returned
     * @return 0; 1 for null pointers, nx, ny below 1 or an image beyond any memory, a negative count or lowpass
     * outside 1..64; 7 without memory */
    int interp2(const fcomplex* in, int nx, int ny, const double* x, const double* y, int count, fcomplex* out);
    /** The same in a narrowed band; `lowpass` from 1 to 64. */
    int interp2(const fcomplex* in, int nx, int ny, const double* x, const double* y, int count, fcomplex* out,
                int lowpass);

    /** On a grid: out, ny_out rows of nx_out, holds the image at (x[i], y[j]) in row j, column i. Faster than
     * single positions, as the axes are interpolated one after the other. Conditions and statuses as above. */
    int interp2(const fcomplex* in, int nx, int ny, const double* x, int nx_out, const double* y, int ny_out,
                fcomplex* out);
    int interp2(const fcomplex* in, int nx, int ny, const double* x, int nx_out, const double* y, int ny_out,
                fcomplex* out, int lowpass);

private:
    bool tabulate(int lowpass);

    std::vector<float> table_;  ///< the kernel at each place between two samples
    int tabulated_ = 0;         ///< the narrowing that it was made for; 0 for none
};

/** A phase along the rows, put on and taken off: linear for a spectrum that is not centred at zero (2 pi fdc / prf
 * radians per line, for instance), quadratic as well for one whose centre drifts.
 *
 * phase(k) = linear * (k - origin) + quadratic * (k - origin)^2, in radians, of sample k of a row. */
class QUO_BASE_API demodulationPhase {
public:
    /** @param origin     sample of phase 0
     *  @param linear     rad per sample
     *  @param quadratic  rad per sample squared */
    explicit demodulationPhase(double linear = 0.0, double quadratic = 0.0, double origin = 0.0)
        : linear_{linear}, quadratic_{quadratic}, origin_{origin} {}

    /** Phase at sample k, which need not be whole; rad, not wrapped. */
    double getDemodPhase(double k) const { return (linear_ + quadratic_ * (k - origin_)) * (k - origin_); }

    /** Multiplies every row by exp(-i phase): a signal of this phase becomes constant.
     *
     * @param[in]     nx, ny  size of the image
     * @param[in,out] data    ny rows of nx samples; unchanged unless 0 is returned
     * @return 0; 1 for a null pointer, nx or ny below 1; 7 without memory */
    int applyDemodPhase(fcomplex* data, int nx, int ny) const;
    /** Multiplies every row by exp(+i phase), which undoes applyDemodPhase(). */
    int applyModPhase(fcomplex* data, int nx, int ny) const;

private:
    double linear_, quadratic_, origin_;
};

#endif
