// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_MATRIXALGEBRAANSI_H
#define QUO_BASE_MATRIXALGEBRAANSI_H

#include "quo_base/api.h"

QUO_BASE_C_BEGIN

/** @file
 * Dense linear algebra and least squares in double precision.
 *
 * Two shapes of arguments. Routines on `double**` take 1-based matrices and vectors as quo_base/alloc_free.h makes
 * them: a[1..n][1..n], b[1..n]. Routines on `double*` take contiguous 0-based arrays: row-major, element (i, j) of
 * a matrix with c columns at i * c + j, unless said otherwise. Polynomial coefficients ascend: c[0] + c[1] x + ...
 *
 * Results: 0; 7 when memory cannot be had; 10 for a numerical failure or dimensions that do not fit. The lowest
 * routines write their message to the standard error stream, without a line end; a routine that passes on
 * another's status adds an ERROR_CALL_TREE entry to the report. Unless said otherwise outputs are unchanged on
 * failure and arguments must not overlap. Any number of threads may call at a time, on arrays of their own.
 * Methods: G. H. Golub and C. F. Van Loan, "Matrix Computations", 4th ed., 2013. */

/** Basis of a linear fit: writes the `count` basis functions at x into values[1..count]. */
typedef void (*QuoBasisFunction)(double x, double values[], int count);

/** @name Inversion, products, transposes
 * @{ */

/** Inverse of a[1..n][1..n] into y[1..n][1..n] through the LU decomposition. `a` is overwritten with its LU
 * factors, also when 10 is returned. Returns 0, 7 or the status of ludcmp(). */
QUO_BASE_API int InvMatrix(double** a, double** y, int n) QUO_NOEXCEPT;
/** Inverse of a flat n x n array into another; `y` may be `a` itself. Returns 0, 7 or the status of InvMatrix().
 */
QUO_BASE_API int MatInv(const double* a, double* y, int n) QUO_NOEXCEPT;
/** c = a x b on flat column-major arrays: element (i, k) of a matrix with r rows at i + k * r. `c` has rows_a rows
 * and cols_b columns. When cols_a differs from rows_b the message "Mmolt: the columns of the first matrix do not
 * match the rows of the second" goes to the standard error stream and 10 is returned; rows_a < 1 returns 0 and
 * writes nothing. */
QUO_BASE_API int Mmolt(const double* a, const double* b, double* c, int rows_a, int cols_a, int rows_b,
                       int cols_b) QUO_NOEXCEPT;
/** Transpose of a flat rows x cols array into a flat cols x rows one. Does nothing for a dimension below 1. */
QUO_BASE_API void Transpose_Matrix(const double* a, double* out, int rows, int cols) QUO_NOEXCEPT;

/** @}
 * @name Solvers on 1-based matrices
 * @{ */

/** LU decomposition of a[1..n][1..n] in place, partial pivoting with every row scaled by its largest magnitude: L
 * with unit diagonal below, U on and above the diagonal. indx[1..n] receives the row exchanges, *d +1 or -1 for
 * their parity. A zero pivot is replaced by 1e-20. A row of zeros, or one that is not finite, gives "Singular
 * matrix in lud decomposition" and 10, with `a` unchanged; n < 1 gives 10. Returns 7 when the scaling vector
 * cannot be had. */
QUO_BASE_API int ludcmp(double** a, int n, int* indx, double* d) QUO_NOEXCEPT;
/** Solves a x = b with the factors and exchanges of ludcmp(); b[1..n] becomes x. */
QUO_BASE_API void lubksb(double** a, int n, const int* indx, double* b) QUO_NOEXCEPT;
/** Gauss-Jordan elimination with full pivoting: a[1..n][1..n] becomes its inverse, the m right-hand sides in
 * b[1..n][1..m] their solutions. Returns 7, or 10 after "ld-gaussj: Singular Matrix-1" (the pivot would be a
 * value that is not finite) or "ld-gaussj: Singular Matrix-2" (the pivot is zero); both matrices then hold
 * what the elimination left. n < 1 gives 10. */
QUO_BASE_API int gaussj(double** a, int n, double** b, int m) QUO_NOEXCEPT;
/** gaussj() on the matrices of ldmatrix(). */
QUO_BASE_API int ldgaussj(double** a, int n, double** b, int m) QUO_NOEXCEPT;
/** Spreads the covariance of the mfit fitted parameters, standing in the upper left corner of covar[1..ma][1..ma],
 * to the places of these parameters: those with ia[i] != 0. Rows and columns of the others become 0. */
QUO_BASE_API void covsrt(double** covar, int ma, const int* ia, int mfit) QUO_NOEXCEPT;
/** QR decomposition of a[1..n][1..n] in place by Householder reflections: R without its diagonal above the
 * diagonal, its diagonal in d[1..n], reflection j is 1 - u u^T / c[j] with u in column j from the diagonal down.
 * *sing becomes 1 when R is singular, else 0; the decomposition is complete either way. Returns 0, or 10 for n
 * < 1 or a value that is not finite. */
QUO_BASE_API int qrdcmp(double** a, int n, double* c, double* d, int* sing) QUO_NOEXCEPT;
/** Solves a x = b with the factors of qrdcmp(); b[1..n] becomes x. Returns 0, or 10 when R is singular, with b
 * unchanged. */
QUO_BASE_API int qr_solve(double** a, int n, const double* c, const double* d, double* b) QUO_NOEXCEPT;

/** @}
 * @name Least squares
 * @{ */

/** General linear least squares by normal equations: fits the parameters a[1..ma] with ia[i] != 0 so that
 * sum a[i] f_i(x) meets the points x[1..n], y[1..n] of standard deviations sig[1..n]; the others keep their
 * values. covar[1..ma][1..ma] receives the covariance, *chisq the weighted sum of squared residuals. With no
 * parameter to fit "lfit_mod: no parameters to be fitted" goes to the standard error stream and 10 is returned.
 * Returns 0, 7 or the status of gaussj(). a and *chisq are unchanged on failure.
 *
 * The equations square the condition of the basis, and 0 does not vouch for the parameters: of a polynomial in
 * plain powers over 0..20, 10 digits are right at degree 3, 6 at degree 5, 2 at degree 7 and none from degree 8
 * on; of degree 2 over 1000..1020, 6; of degree 10 over -9..-3, none, not even the signs. Scaled to -1..1 and
 * centred, or with lsq_fit(), the same fits keep 9 digits and more up to degree 7. */
QUO_BASE_API int lfit_mod(const double* x, const double* y, const double* sig, int n, double* a, const int* ia,
                          int ma, double** covar, double* chisq, QuoBasisFunction basis) QUO_NOEXCEPT;
/** The same fit; its message is "lfit: no parameters to be fitted". */
QUO_BASE_API int lfitd(const double* x, const double* y, const double* sig, int n, double* a, const int* ia,
                       int ma, double** covar, double* chisq, QuoBasisFunction basis) QUO_NOEXCEPT;
/** General linear least squares by singular values: parameters a[1..ma] of the points x[1..n], y[1..n] of standard
 * deviations sig[1..n]. On return u[1..n][1..ma], w[1..ma], v[1..ma][1..ma] hold the decomposition of the design
 * matrix, singular values below 1e-5 of the largest set to 0; *chisq the weighted sum of squared residuals. Fewer
 * points than parameters: "SVDCMP: You must augment A with extra zero rows", 10; a singular value that does not
 * settle in 60 steps, or input that is not finite: "No convergence in 60 SVDCMP iterations", 10. Returns 0, 7
 * or 10; a failure leaves a and *chisq as they were, u, w and v with what it had made of them.
 *
 * What is dropped is missed in the fit, which is 0 all the same: look for zeros in w. In plain powers over 0..20
 * degree 3 keeps all its digits, degree 4 loses one singular value and all digits but the first, degree 5 three of
 * them and every digit, and so does degree 2 over 1000..1020. Scale x to -1..1 first: 9 digits at degree 5. */
QUO_BASE_API int svdfit(const double* x, const double* y, const double* sig, int n, double* a, int ma, double** u,
                        double** v, double* w, double* chisq, QuoBasisFunction basis) QUO_NOEXCEPT;

/** What lsq_fit() tells about a fit. */
typedef struct LsqSummary {
    int32_t rank;         /**< independent columns found */
    double condition;     /**< largest over smallest diagonal of R among them, columns scaled to length 1 */
    double residual_norm; /**< Euclidean norm of b - a x */
} LsqSummary;

/** Least squares through a rank-revealing QR decomposition: columns scaled to length 1, the longest remaining
 * column taken first, the solution refined where the columns are independent. Of a polynomial in plain powers over
 * 0..20, 13 digits are right at degree 5, whatever the residuals, and 8 at degree 8; of degree 10 over -9..-3, 6.
 * x[cols] minimises |b - a x| for a flat row-major a[rows][cols], b[rows]. Columns that add
 * less than rows * 2.2e-16 of the first to the span count as dependent and get the parameter 0. `summary` may be
 * null. Returns 0; 7; 10 for dimensions below 1, fewer rows than columns, or input that is not finite. */
QUO_BASE_API int lsq_fit(const double* a, int rows, int cols, const double* b, double* x,
                         LsqSummary* summary) QUO_NOEXCEPT;

/** Least-squares polynomial of degree d through n points x[0..n-1], y[0..n-1] into c[0..d], by normal equations in
 * plain powers of x, with the few digits that lfit_mod() tells of: scale and centre x, or take lsq_fit(). A
 * singular system is no failure, since callers rely on some result: what the elimination produced is returned with
 * 0. Returns 0, 7, or 10 for n < 1 or d < 0. */
QUO_BASE_API int polfit(const double* x, const double* y, int n, double* c, int d) QUO_NOEXCEPT;
/** polfit() with ncoef = d + 1 coefficients; when sse is not null it receives the sum of squared residuals. */
QUO_BASE_API int gen_polfit(int ncoef, const double* x, const double* y, int n, double* c,
                            double* sse) QUO_NOEXCEPT;
/** c[0] + c[1] x + ... + c[d] x^d; 0 for d < 0. At infinity the infinity that the highest power has, where its
 * coefficient is not 0. */
QUO_BASE_API double polval(const double* c, int d, double x) QUO_NOEXCEPT;
/** Least-squares solution out[3] of the 3 x 3 system a x = b: (a^T a)^-1 a^T b. Returns 0 or the status of
 * MatInv(). */
QUO_BASE_API int MSE_poly(const double* a, const double* b, double* out) QUO_NOEXCEPT;

/** @}
 * @name Fixed 3 x 3 routines; outputs may be inputs
 * @{ */

QUO_BASE_API double determ(const double* m) QUO_NOEXCEPT; /**< determinant */
/** Inverse by cofactors over the determinant; a singular matrix gives infinities or not-a-numbers. */
QUO_BASE_API void inv3x3(const double* m, double* out) QUO_NOEXCEPT;
QUO_BASE_API void mul3x3(const double* a, const double* b, double* out) QUO_NOEXCEPT;    /**< a x b */
QUO_BASE_API void mul(const double* a, const double* b, double* out) QUO_NOEXCEPT;       /**< a x b */
QUO_BASE_API void mul3x1(const double* a, const double* v, double* out) QUO_NOEXCEPT;    /**< a v, a 3-vector */
QUO_BASE_API void mul_NxM_M(const double* a, const double* v, double* out) QUO_NOEXCEPT; /**< a v, a 3-vector */
QUO_BASE_API void tran(const double* m, double* out) QUO_NOEXCEPT;                       /**< transpose */
/** Cosine of the angle between two 3-vectors; not a number when one of them is zero. */
QUO_BASE_API double COS_PHI_V(const double* a, const double* b) QUO_NOEXCEPT;

/** @} */

QUO_BASE_C_END

#endif
