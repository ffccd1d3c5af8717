// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_FFT_H
#define QUO_BASE_FFT_H

#include "quo_base/api.h"

QUO_BASE_C_BEGIN

/** @file
 * Fourier transforms of images, row by row and column by column, and the chirp-z transform.
 *
 * An image is stored row after row; a row is n samples long in memory, of which the first nfft take part in a
 * transform, as do the first mfft of its m rows. All transforms are single precision.
 *
 * Direction codes, one per dimension: 0 no transform; +1 forward (exponent sign -1), unscaled; -1 inverse, then
 * divided by the length; -2 inverse, unscaled. A dimension of transform length 1 is skipped.
 *
 * The transforms are computed by an engine. QUO_FFT_ENGINE names it: "quo" (kernels of this library, for lengths
 * without a prime factor above 7), "fftw" (the module quo_base/libquo_base_fftw.so beside this library;
 * QUO_FFTW_MODULE may give another file), "mkl" (libmkl_rt; QUO_MKL_LIBRARY may give its file) or "auto", which is
 * the default: for each length the first that takes it of MKL, on processors of its maker only, "quo", FFTW, and
 * MKL on other processors. Any other value counts as "auto". FFTW and MKL are loaded when the first plan asks for
 * them. Engines run on the caller's thread alone.
 *
 * Making a plan takes microseconds to a few milliseconds and measures nothing, so that every run on one machine
 * gives the same bits. The tables of a plan are kept for the process (the 32 geometries used last), so that the
 * same plan made again takes well under 2 microseconds. Planning never touches the caller's buffers. FFTW
 * measures, which takes up to seconds, where QUO_FFT_PLANNING is "measure".
 *
 * Threads: all functions may be called by any number of threads at a time. Plans of FFTW are made one after the
 * other; transforms run side by side, by one plan too, on buffers that do not overlap. A plan is released when no
 * thread runs it any more.
 *
 * Relative error of a forward transform of length N (root of the mean square): at most 2e-7 * log2(N). */

/** An engine's plan for a batch of one-dimensional transforms; known by handle only. A handle is never followed
 * blindly: one that was released, or never made, is recognised and refused. */
typedef struct FftEnginePlan FftEnginePlan;

/** Transforms along the rows, down the columns, or both, in this order. Filled by fft_makep_c() and fft_makep_r().
 * A record holds handles: its copy is the same plan, and released with it. */
typedef struct FftPlan {
    FftEnginePlan* rows;    /**< mfft transforms of nfft samples, stride 1, distance n; null: none */
    int n;                  /**< samples per row */
    int nfft;               /**< transform length along the rows */
    int normalise_rows;     /**< 1: multiply by 1 / nfft afterwards */
    int row_direction;      /**< +1 forward, -1 inverse, 0 none */
    FftEnginePlan* columns; /**< nfft transforms of mfft samples, stride n, distance 1; null: none */
    int m;                  /**< number of rows */
    int mfft;               /**< transform length down the columns */
    int normalise_columns;  /**< 1: multiply by 1 / mfft afterwards */
    int column_direction;   /**< +1 forward, -1 inverse, 0 none */
} FftPlan;

/** Name of the engine for lengths without a prime factor above 7, which is loaded if it is not yet: "quo", "fftw",
 * "mkl", or "none" where the one that QUO_FFT_ENGINE names cannot be loaded. */
QUO_BASE_API const char* fft_engine_name(void) QUO_NOEXCEPT;

/** Why the engine failed on this thread: none can be loaded that takes the length, memory is too short, or what
 * the engine's library answered. Statuses 4, 5 and 7 of the functions below leave it, but for a chirp-z transform
 * that finds no memory of its own (7); making the next plan empties it. Nothing of the kind goes into the report.
 * @return the text, empty where there is none; never null, and valid until this thread's next call of this header
 */
QUO_BASE_API const char* fft_engine_error(void) QUO_NOEXCEPT;

/* ---- Complex transforms ---- */

/** Makes a plan for complex images.
 *
 * @param[out] plan      unchanged unless 0 is returned; to be released with fft_destp_c(). A plan that it held is
 * not released.
 * @param[in]  n, nfft   samples per row and transform length along the rows, 1 <= nfft <= n
 * @param[in]  m, mfft   rows and transform length down the columns, 1 <= mfft <= m
 * @param[in]  dir_rows, dir_cols  direction codes
 * @param[in]  in_place  0: the plan will be run from one buffer into another; else within one buffer
 * @return 0; 1 for a null plan, n < 1, m < 1 or an image that no address space holds; 2 for nfft outside 1..n; 3
 * for mfft outside 1..m; 4 when the row transforms cannot be had (unknown direction, no memory, no engine); 5 when
 * the column transforms cannot be had, in which case nothing is left of the rows'. fft_engine_error() tells the
 * cause where it lies with the engine. Memory that the engine may take is looked for before it starts: twice a row
 * of more than 65536 samples with "quo", four times a shorter one and up to 65 columns; with the others some five
 * times the transform, ten times with prime factors above 13, and up to 100 MiB more. */
QUO_BASE_API int fft_makep_c(FftPlan* plan, int n, int nfft, int m, int mfft, int dir_rows, int dir_cols,
                             int in_place) QUO_NOEXCEPT;

/** Runs a plan: the rows from `in` to `out`, then the columns of `out`; without a row transform the columns from
 * `in` to `out`. A normalised inverse is multiplied by its factor in single precision: 1 / nfft, divided by mfft,
 * as far as asked for.
 *
 * @param[in]  plan made by fft_makep_c(), for other buffers of the same shape too
 * @param[in]  in   m rows of n samples; only overwritten where it is `out`
 * @param[out] out  of the same shape; samples outside the first nfft of the first mfft rows are not touched. A
 * plan without any transform leaves it untouched.
 * @return 0; 1, with nothing written, for null pointers, a plan that was released, never made or made for real
 * data, buffers that are not the same for an in-place plan, or that overlap for any other; 7 when an engine
 * refuses to run, out of memory (what stands in `out` is then undefined). */
QUO_BASE_API int pfft_c(const FftPlan* plan, const fcomplex* in, fcomplex* out) QUO_NOEXCEPT;

/** Releases a plan of either kind and clears the record. A record of zeros, which a released one is too, holds
 * nothing to release.
 * @return 0; 1 for a null pointer, or handles that were released through another record or never made */
QUO_BASE_API int fft_destp_c(FftPlan* plan) QUO_NOEXCEPT;

/** Makes a plan (in place where in == out), runs it and releases it.
 * @return as fft_makep_c(), then as pfft_c() */
QUO_BASE_API int fft_c(int n, int nfft, int m, int mfft, int dir_rows, int dir_cols, const fcomplex* in,
                       fcomplex* out) QUO_NOEXCEPT;

/* ---- Real transforms ----
 *
 * One axis per plan. A spectrum of N real samples is packed into N floats: R0 R1 I1 R2 I2 ..., with R(N/2) last
 * for even N; the other half follows by conjugation. +1 goes from samples to the packed spectrum, -1 and -2 back.
 * Down the columns the spectrum is packed downwards, one float per row. */

/** As fft_makep_c(), for real images; 5 also when both axes are to be transformed. */
QUO_BASE_API int fft_makep_r(FftPlan* plan, int n, int nfft, int m, int mfft, int dir_rows, int dir_cols,
                             int in_place) QUO_NOEXCEPT;

/** As pfft_c(), for a plan made with fft_makep_r(). */
QUO_BASE_API int pfft_r(const FftPlan* plan, const float* in, float* out) QUO_NOEXCEPT;

/** As fft_c(), for real images. */
QUO_BASE_API int fft_r(int n, int nfft, int m, int mfft, int dir_rows, int dir_cols, const float* in,
                       float* out) QUO_NOEXCEPT;

/* ---- Chirp-z transform ----
 *
 * X[m] = sum over n of x[n] exp(-i n (a - m w)): the spectrum of x at the M angular frequencies a - m w, computed
 * as a convolution with a chirp (L. R. Rabiner, R. W. Schafer, C. M. Rader, "The Chirp z-Transform Algorithm",
 * IEEE Trans. Audio Electroacoust. AU-17(2), 1969). Relative error: at most 2e-6 for N + M up to 10000. */

/** Transforms of length L = genpow(N + M - 1, 1), forward unscaled and inverse divided by L, both in place. */
typedef struct CztPlan {
    FftPlan forward; /**< unscaled */
    FftPlan inverse; /**< divided by L */
    int N;           /**< input length */
    int M;           /**< output length */
} CztPlan;

/** Makes a chirp-z plan.
 * @return 0; 1 for a null plan, N < 1, M < 1 or lengths too great to be added; 4 when the transforms cannot be
 * had. The plan is unchanged unless 0 is returned. */
QUO_BASE_API int czt_makep_c(CztPlan* plan, int N, int M) QUO_NOEXCEPT;

/** Transforms `count` vectors.
 *
 * @param[in]  plan   made by czt_makep_c()
 * @param[in]  in     count vectors of N samples, one after the other
 * @param[out] out    count vectors of M samples; apart from `in`, or the same where M <= N
 * @param[in]  w      step of the angular frequency, radians per output sample, downwards
 * @param[in]  a      first angular frequency, radians per input sample
 * @param[in]  count  0 does nothing
 * @return 0; 1 for null pointers, a plan that was released or never made, a negative count or overlapping buffers;
 * 7 when working memory cannot be had, with nothing written, or when an engine refuses to run, which leaves the
 * vectors that are done. */
QUO_BASE_API int pczt_c(const CztPlan* plan, const fcomplex* in, fcomplex* out, double w, double a,
                        int count) QUO_NOEXCEPT;

/** Releases a chirp-z plan and clears the record, as fft_destp_c() does.
 * @return 0; 1 for a null pointer, or handles that were released through another record or never made */
QUO_BASE_API int czt_destp_c(CztPlan* plan) QUO_NOEXCEPT;

/** Makes a chirp-z plan, runs it and releases it.
 * @return as czt_makep_c(), then as pczt_c() */
QUO_BASE_API int czt_c(const fcomplex* in, int N, fcomplex* out, int M, double w, double a,
                       int count) QUO_NOEXCEPT;

/* ---- Lengths, halves, buffers ---- */

/** First of the lengths n, n + step, n + 2 step, ... whose prime factors are 2, 3 and 5 only. 5625 is
 * never returned; where it would be, the search starts again at 5626 with the same step.
 * @return the length; 0 for n < 1, and where there is none up to the greatest int (so for step < 1 unless n itself
 * is one) */
QUO_BASE_API int genpow(int n, int step) QUO_NOEXCEPT;

/** Rotates each of `rows` consecutive rows of n samples so that sample 0 moves to n / 2, the integer quotient.
 * @return n / 2; 0 for n < 1. Nothing is moved for a null pointer or rows < 1. */
QUO_BASE_API int fftshift(fcomplex* data, int n, int rows) QUO_NOEXCEPT;

/** Undoes fftshift(): sample n / 2 moves to 0. The same as fftshift() for even n. */
QUO_BASE_API int ifftshift(fcomplex* data, int n, int rows) QUO_NOEXCEPT;

/** Allocates a buffer aligned to 16 bytes, which the engines run fastest on.
 * @return the buffer, owned by the caller, to go back through fft_free() only; null if it cannot be had */
QUO_BASE_API void* fft_malloc(size_t bytes) QUO_NOEXCEPT;

/** As fft_malloc(), count * size bytes, zero-filled. */
QUO_BASE_API void* fft_calloc(size_t count, size_t size) QUO_NOEXCEPT;

/** Frees a buffer made by fft_malloc() or fft_calloc(); null does nothing. */
QUO_BASE_API void fft_free(void* buffer) QUO_NOEXCEPT;

QUO_BASE_C_END

#endif
