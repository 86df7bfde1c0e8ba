/*
 * QTB: dense linear-algebra kernels for 64-bit x86. The Basic Linear Algebra Subprograms of levels 1, 2 and 3 and the
 * sparse ones of level 1, in lower and upper case, for C from C99 on and C++ from C++98 on. One comment stands above
 * all the types of a family; the file is long because every routine has its prototype.
 *
 * Calling convention
 *   Every argument is a pointer to the caller's variable, also scalars, dimensions and options; QTBGetVersionString
 *   alone takes values. Integers have 64 bits. No input is written. Every argument belongs to the caller; nothing is
 *   kept beyond the call.
 *   A complex function stores its result through an extra first argument, on every platform.
 *   Options are characters of which only the first is read, in either case:
 *     trans, transa, transb   op(A) = A for N, the transpose A**T for T, the conjugate transpose A**H for C;
 *                             C counts as T in the real routines
 *     uplo                    U or L: the upper or the lower triangle is used, the other one is not touched
 *     side                    L or R: the special matrix stands on the left or on the right
 *     diag                    N, or U for a unit diagonal that is not read
 *
 * Fortran
 *   The names carry no underscore and the integers have 64 bits: compile with -fno-underscoring -fdefault-integer-8 or
 *   the like, or bind by name. The lengths of character arguments that a compiler appends behind the last argument may
 *   be passed or not; nothing reads them but xerbla. Call the complex functions as subroutines, the result in front.
 *
 * Vectors and matrices
 *   Matrices are column-major: element (i, j), zero-based, of an m x n matrix stands at a[i + j*lda], with lda at least
 *   max(1, m). Dimensions, increments and leading dimensions count elements of the array's type, never bytes.
 *   Element i of a vector of n elements stands at x[i*incx] for a positive increment, and at x[(i - n + 1)*incx] for a
 *   negative one: the array is the same, walked from its far end. An increment of 0 names the same element n times at
 *   Level 1, and is illegal at Level 2. Arrays need no more alignment than their elements, at Level 1 none.
 *   An array that is written may not overlap another argument. Inputs may overlap one another.
 *
 * What bad arguments get
 *   Level 1 and sparse routines test nothing: with n or nz below 1 they do nothing, or give zero. Levels 2 and 3 test
 *   the options, then the dimensions (negative), then the leading dimensions (too small) and increments (zero), each in
 *   the order of the arguments. The first illegal one, counted from 1, is reported on standard output, and the routine
 *   returns with its outputs untouched:
 *
 *     QTB ERROR: Parameter 8 was incorrect on entry to DGEMM
 *
 *   The test comes before everything else, so an illegal argument is reported also where a dimension of 0 leaves
 *   nothing to do. Pointers are not tested.
 *
 * Special values
 *   Where beta is zero the result is stored without being read, so it may hold anything. Where alpha is zero the
 *   operands that it multiplies are not read, other than in scal. Otherwise NaN and infinities spread as in the
 *   published definitions. The order of a summation depends on the processor, the number of threads and sometimes the
 *   alignment, and with it the last bits of a result.
 *
 * Threads
 *   Any thread may call any routine at any time. Large problems run on several threads of the OpenMP runtime; the
 *   environment variables QTB_NUM_THREADS, QTB_DOMAIN_NUM_THREADS, QTB_DYNAMIC and OMP_NUM_THREADS say how many.
 *
 * Sources
 *   Lawson, Hanson, Kincaid, Krogh: Basic linear algebra subprograms for Fortran usage. ACM TOMS 5, 1979 (Level 1).
 *   Dongarra, Du Croz, Hammarling, Hanson: An extended set of Fortran basic linear algebra subprograms. ACM TOMS 14,
 *   1988 (Level 2).
 *   Dongarra, Du Croz, Duff, Hammarling: A set of level 3 basic linear algebra subprograms. ACM TOMS 16, 1990
 *   (Level 3).
 *   Dodson, Grimes, Lewis: Sparse extensions to the Fortran basic linear algebra subprograms. ACM TOMS 17, 1991.
 *   Basic Linear Algebra Subprograms Technical Forum Standard, 2001 (amin, dcabs1 and the mixed forms).
 */
#ifndef QTB_H
#define QTB_H

#include <stdint.h>

#ifdef __cplusplus
#include <complex>

typedef std::complex<float> QtbFloatComplex;
typedef std::complex<double> QtbDoubleComplex;
#else
typedef float _Complex QtbFloatComplex;
typedef double _Complex QtbDoubleComplex;
#endif

/* The integer of every routine: dimensions, increments, leading dimensions, positions. */
typedef int64_t QtbInt;

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Level 1: vectors ---- */

/*
 * y := alpha*x + y. Nothing is read or written where alpha is zero.
 */
void saxpy(const QtbInt *n, const float *alpha, const float *x, const QtbInt *incx, float *y, const QtbInt *incy);
void daxpy(const QtbInt *n, const double *alpha, const double *x, const QtbInt *incx, double *y, const QtbInt *incy);
void caxpy(const QtbInt *n, const QtbFloatComplex *alpha, const QtbFloatComplex *x, const QtbInt *incx,
           QtbFloatComplex *y, const QtbInt *incy);
void zaxpy(const QtbInt *n, const QtbDoubleComplex *alpha, const QtbDoubleComplex *x, const QtbInt *incx,
           QtbDoubleComplex *y, const QtbInt *incy);

/*
 * y := x.
 */
void scopy(const QtbInt *n, const float *x, const QtbInt *incx, float *y, const QtbInt *incy);
void dcopy(const QtbInt *n, const double *x, const QtbInt *incx, double *y, const QtbInt *incy);
void ccopy(const QtbInt *n, const QtbFloatComplex *x, const QtbInt *incx, QtbFloatComplex *y, const QtbInt *incy);
void zcopy(const QtbInt *n, const QtbDoubleComplex *x, const QtbInt *incx, QtbDoubleComplex *y, const QtbInt *incy);

/*
 * x <-> y.
 */
void sswap(const QtbInt *n, float *x, const QtbInt *incx, float *y, const QtbInt *incy);
void dswap(const QtbInt *n, double *x, const QtbInt *incx, double *y, const QtbInt *incy);
void cswap(const QtbInt *n, QtbFloatComplex *x, const QtbInt *incx, QtbFloatComplex *y, const QtbInt *incy);
void zswap(const QtbInt *n, QtbDoubleComplex *x, const QtbInt *incx, QtbDoubleComplex *y, const QtbInt *incy);

/*
 * The dot product, the sum of x[i]*y[i]; zero for n below 1.
 */
float sdot(const QtbInt *n, const float *x, const QtbInt *incx, const float *y, const QtbInt *incy);
double ddot(const QtbInt *n, const double *x, const QtbInt *incx, const double *y, const QtbInt *incy);

/*
 * The complex dot products: dotu is the sum of x[i]*y[i], dotc that of conj(x[i])*y[i]. The element is stored at
 * result, also for n below 1, where it is zero; the value is the pointer result.
 */
QtbFloatComplex *cdotu(QtbFloatComplex *result, const QtbInt *n, const QtbFloatComplex *x, const QtbInt *incx,
                       const QtbFloatComplex *y, const QtbInt *incy);
QtbDoubleComplex *zdotu(QtbDoubleComplex *result, const QtbInt *n, const QtbDoubleComplex *x, const QtbInt *incx,
                        const QtbDoubleComplex *y, const QtbInt *incy);
QtbFloatComplex *cdotc(QtbFloatComplex *result, const QtbInt *n, const QtbFloatComplex *x, const QtbInt *incx,
                       const QtbFloatComplex *y, const QtbInt *incy);
QtbDoubleComplex *zdotc(QtbDoubleComplex *result, const QtbInt *n, const QtbDoubleComplex *x, const QtbInt *incx,
                        const QtbDoubleComplex *y, const QtbInt *incy);

/*
 * The dot product of single-precision vectors, summed in double precision: dsdot gives the sum, sdsdot the sum plus
 * sb, rounded once to single precision. With n below 1 they give zero and sb.
 */
double dsdot(const QtbInt *n, const float *x, const QtbInt *incx, const float *y, const QtbInt *incy);
float sdsdot(const QtbInt *n, const float *sb, const float *x, const QtbInt *incx, const float *y, const QtbInt *incy);

/*
 * x := alpha*x. csscal and zdscal scale a complex vector by a real number. A zero alpha multiplies too: a NaN or an
 * infinity in x becomes NaN.
 */
void sscal(const QtbInt *n, const float *alpha, float *x, const QtbInt *incx);
void dscal(const QtbInt *n, const double *alpha, double *x, const QtbInt *incx);
void cscal(const QtbInt *n, const QtbFloatComplex *alpha, QtbFloatComplex *x, const QtbInt *incx);
void zscal(const QtbInt *n, const QtbDoubleComplex *alpha, QtbDoubleComplex *x, const QtbInt *incx);
void csscal(const QtbInt *n, const float *alpha, QtbFloatComplex *x, const QtbInt *incx);
void zdscal(const QtbInt *n, const double *alpha, QtbDoubleComplex *x, const QtbInt *incx);

/*
 * Applies a plane rotation: (x, y) := (c*x + s*y, c*y - s*x), with real c and s.
 */
void srot(const QtbInt *n, float *x, const QtbInt *incx, float *y, const QtbInt *incy, const float *c, const float *s);
void drot(const QtbInt *n, double *x, const QtbInt *incx, double *y, const QtbInt *incy, const double *c,
          const double *s);
void csrot(const QtbInt *n, QtbFloatComplex *x, const QtbInt *incx, QtbFloatComplex *y, const QtbInt *incy,
           const float *c, const float *s);
void zdrot(const QtbInt *n, QtbDoubleComplex *x, const QtbInt *incx, QtbDoubleComplex *y, const QtbInt *incy,
           const double *c, const double *s);

/*
 * Makes the plane rotation that takes (a, b) to (r, 0). On return a holds r, c and s the rotation. In the real
 * routines b holds z, from which c and s can be had again: s = z, c = sqrt(1 - z*z) where |z| < 1; c = 1/z, s =
 * sqrt(1 - c*c) where |z| > 1; c = 0, s = 1 where z = 1. The complex ones leave b as it is; c is real, and 0 where a
 * is zero. They form squares without scaling, so parts beyond the square root of the largest number overflow.
 */
void srotg(float *a, float *b, float *c, float *s);
void drotg(double *a, double *b, double *c, double *s);
void crotg(QtbFloatComplex *a, QtbFloatComplex *b, float *c, QtbFloatComplex *s);
void zrotg(QtbDoubleComplex *a, QtbDoubleComplex *b, double *c, QtbDoubleComplex *s);

/*
 * Applies a modified rotation: (x, y) := H*(x, y), the 2 x 2 matrix H given by param, 5 elements: flag, h11, h21,
 * h12, h22. Flag -2: H is the identity, nothing is touched. -1: all four as stored. 0: h21 and h12 as stored, h11 =
 * h22 = 1. 1: h11 and h22 as stored, h12 = 1, h21 = -1.
 */
void srotm(const QtbInt *n, float *x, const QtbInt *incx, float *y, const QtbInt *incy, const float *param);
void drotm(const QtbInt *n, double *x, const QtbInt *incx, double *y, const QtbInt *incy, const double *param);

/*
 * Makes the modified rotation that zeroes the second element of (sqrt(d1)*x1, sqrt(d2)*y1). d1, d2 and x1 are
 * updated; param (5 elements, as rotm takes it) gets the flag and the elements of H that the flag says are stored.
 */
void srotmg(float *d1, float *d2, float *x1, const float *y1, float *param);
void drotmg(double *d1, double *d2, double *x1, const double *y1, double *param);

/*
 * The Euclidean norm of x, without overflow or harmful underflow on the way; zero for n below 1. A negative increment
 * walks the same elements as its absolute value; an increment of 0 takes the first element n times.
 */
float snrm2(const QtbInt *n, const float *x, const QtbInt *incx);
double dnrm2(const QtbInt *n, const double *x, const QtbInt *incx);
float scnrm2(const QtbInt *n, const QtbFloatComplex *x, const QtbInt *incx);
double dznrm2(const QtbInt *n, const QtbDoubleComplex *x, const QtbInt *incx);

/*
 * The sum of |x[i]|; of a complex vector, the sum of |re| + |im|. Zero for n below 1. An increment of 0 takes the
 * first element n times.
 */
float sasum(const QtbInt *n, const float *x, const QtbInt *incx);
double dasum(const QtbInt *n, const double *x, const QtbInt *incx);
float scasum(const QtbInt *n, const QtbFloatComplex *x, const QtbInt *incx);
double dzasum(const QtbInt *n, const QtbDoubleComplex *x, const QtbInt *incx);

/*
 * The one-based position of the first element of largest (amax) or smallest (amin) magnitude, |re| + |im| for complex
 * elements; 0 for n or incx below 1. NaN is not skipped: the elements are visited in order, and one takes over unless
 * the best so far compares at least as good, so a NaN takes over, and so does the element behind a NaN.
 */
QtbInt isamax(const QtbInt *n, const float *x, const QtbInt *incx);
QtbInt idamax(const QtbInt *n, const double *x, const QtbInt *incx);
QtbInt icamax(const QtbInt *n, const QtbFloatComplex *x, const QtbInt *incx);
QtbInt izamax(const QtbInt *n, const QtbDoubleComplex *x, const QtbInt *incx);
QtbInt isamin(const QtbInt *n, const float *x, const QtbInt *incx);
QtbInt idamin(const QtbInt *n, const double *x, const QtbInt *incx);
QtbInt icamin(const QtbInt *n, const QtbFloatComplex *x, const QtbInt *incx);
QtbInt izamin(const QtbInt *n, const QtbDoubleComplex *x, const QtbInt *incx);

/*
 * |re(z)| + |im(z)|.
 */
double dcabs1(const QtbDoubleComplex *z);

/* ---- Sparse Level 1 ---- */

/*
 * x is a compressed vector of nz elements, of which element k stands at position indx[k] of the full vector y.
 * Positions are one-based: indx[k] = 1 is y[0]. They are not tested. They should be distinct; where they are not, the
 * elements act in order, so later ones see what earlier ones stored. Source: Dodson, Grimes and Lewis, 1991.
 */

/*
 * y[indx[k]] := a*x[k] + y[indx[k]]. Nothing is touched where a is zero.
 */
void saxpyi(const QtbInt *nz, const float *a, const float *x, const QtbInt *indx, float *y);
void daxpyi(const QtbInt *nz, const double *a, const double *x, const QtbInt *indx, double *y);
void caxpyi(const QtbInt *nz, const QtbFloatComplex *a, const QtbFloatComplex *x, const QtbInt *indx,
            QtbFloatComplex *y);
void zaxpyi(const QtbInt *nz, const QtbDoubleComplex *a, const QtbDoubleComplex *x, const QtbInt *indx,
            QtbDoubleComplex *y);

/*
 * The sum of x[k]*y[indx[k]]; zero for nz below 1.
 */
float sdoti(const QtbInt *nz, const float *x, const QtbInt *indx, const float *y);
double ddoti(const QtbInt *nz, const double *x, const QtbInt *indx, const double *y);

/*
 * The same for complex vectors, dotci with conj(x[k]). The element is stored at result, zero for nz below 1; the
 * value is the pointer result.
 */
QtbFloatComplex *cdotui(QtbFloatComplex *result, const QtbInt *nz, const QtbFloatComplex *x, const QtbInt *indx,
                        const QtbFloatComplex *y);
QtbDoubleComplex *zdotui(QtbDoubleComplex *result, const QtbInt *nz, const QtbDoubleComplex *x, const QtbInt *indx,
                         const QtbDoubleComplex *y);
QtbFloatComplex *cdotci(QtbFloatComplex *result, const QtbInt *nz, const QtbFloatComplex *x, const QtbInt *indx,
                        const QtbFloatComplex *y);
QtbDoubleComplex *zdotci(QtbDoubleComplex *result, const QtbInt *nz, const QtbDoubleComplex *x, const QtbInt *indx,
                         const QtbDoubleComplex *y);

/*
 * Gather: x[k] := y[indx[k]]. Elements are moved bit by bit.
 */
void sgthr(const QtbInt *nz, const float *y, float *x, const QtbInt *indx);
void dgthr(const QtbInt *nz, const double *y, double *x, const QtbInt *indx);
void cgthr(const QtbInt *nz, const QtbFloatComplex *y, QtbFloatComplex *x, const QtbInt *indx);
void zgthr(const QtbInt *nz, const QtbDoubleComplex *y, QtbDoubleComplex *x, const QtbInt *indx);

/*
 * Gather and zero: x[k] := y[indx[k]], then y[indx[k]] := 0.
 */
void sgthrz(const QtbInt *nz, float *y, float *x, const QtbInt *indx);
void dgthrz(const QtbInt *nz, double *y, double *x, const QtbInt *indx);
void cgthrz(const QtbInt *nz, QtbFloatComplex *y, QtbFloatComplex *x, const QtbInt *indx);
void zgthrz(const QtbInt *nz, QtbDoubleComplex *y, QtbDoubleComplex *x, const QtbInt *indx);

/*
 * Scatter: y[indx[k]] := x[k]. Elements are moved bit by bit.
 */
void ssctr(const QtbInt *nz, const float *x, const QtbInt *indx, float *y);
void dsctr(const QtbInt *nz, const double *x, const QtbInt *indx, double *y);
void csctr(const QtbInt *nz, const QtbFloatComplex *x, const QtbInt *indx, QtbFloatComplex *y);
void zsctr(const QtbInt *nz, const QtbDoubleComplex *x, const QtbInt *indx, QtbDoubleComplex *y);

/*
 * Applies a plane rotation: (x[k], y[indx[k]]) := (c*x[k] + s*y[indx[k]], c*y[indx[k]] - s*x[k]). Nothing is touched
 * where c is 1 and s is 0.
 */
void sroti(const QtbInt *nz, float *x, const QtbInt *indx, float *y, const float *c, const float *s);
void droti(const QtbInt *nz, double *x, const QtbInt *indx, double *y, const double *c, const double *s);

/* ---- Level 2: matrix and vector ---- */

/*
 * Storage of an n x n triangle, symmetric or Hermitian matrix, of which only the triangle named by uplo is used:
 *   full    a, lda x n with lda at least max(1, n): element (i, j) at a[i + j*lda]
 *   band    a, lda x n with lda at least k + 1, k diagonals beside the main one: element (i, j) of the upper triangle
 *           at a[k + i - j + j*lda], of the lower one at a[i - j + j*lda]
 *   packed  ap, n*(n + 1)/2 elements, the columns of the triangle one behind the other
 * Indices i and j are zero-based here. The imaginary parts of the diagonal of a Hermitian matrix are taken as zero; an
 * update (her, hpr, her2, hpr2) stores them as zero.
 * Source: Dongarra, Du Croz, Hammarling and Hanson, 1988.
 */

/*
 * y := alpha*op(A)*x + beta*y, A an m x n matrix; x has n elements and y has m for trans N, the other way for T and
 * C.
 */
void sgemv(const char *trans, const QtbInt *m, const QtbInt *n, const float *alpha, const float *a, const QtbInt *lda,
           const float *x, const QtbInt *incx, const float *beta, float *y, const QtbInt *incy);
void dgemv(const char *trans, const QtbInt *m, const QtbInt *n, const double *alpha, const double *a, const QtbInt *lda,
           const double *x, const QtbInt *incx, const double *beta, double *y, const QtbInt *incy);
void cgemv(const char *trans, const QtbInt *m, const QtbInt *n, const QtbFloatComplex *alpha, const QtbFloatComplex *a,
           const QtbInt *lda, const QtbFloatComplex *x, const QtbInt *incx, const QtbFloatComplex *beta,
           QtbFloatComplex *y, const QtbInt *incy);
void zgemv(const char *trans, const QtbInt *m, const QtbInt *n, const QtbDoubleComplex *alpha,
           const QtbDoubleComplex *a, const QtbInt *lda, const QtbDoubleComplex *x, const QtbInt *incx,
           const QtbDoubleComplex *beta, QtbDoubleComplex *y, const QtbInt *incy);

/*
 * The same for a band matrix of kl diagonals below and ku above the main one: element (i, j) of A stands at a[ku + i
 * - j + j*lda], lda at least kl + ku + 1.
 */
void sgbmv(const char *trans, const QtbInt *m, const QtbInt *n, const QtbInt *kl, const QtbInt *ku, const float *alpha,
           const float *a, const QtbInt *lda, const float *x, const QtbInt *incx, const float *beta, float *y,
           const QtbInt *incy);
void dgbmv(const char *trans, const QtbInt *m, const QtbInt *n, const QtbInt *kl, const QtbInt *ku, const double *alpha,
           const double *a, const QtbInt *lda, const double *x, const QtbInt *incx, const double *beta, double *y,
           const QtbInt *incy);
void cgbmv(const char *trans, const QtbInt *m, const QtbInt *n, const QtbInt *kl, const QtbInt *ku,
           const QtbFloatComplex *alpha, const QtbFloatComplex *a, const QtbInt *lda, const QtbFloatComplex *x,
           const QtbInt *incx, const QtbFloatComplex *beta, QtbFloatComplex *y, const QtbInt *incy);
void zgbmv(const char *trans, const QtbInt *m, const QtbInt *n, const QtbInt *kl, const QtbInt *ku,
           const QtbDoubleComplex *alpha, const QtbDoubleComplex *a, const QtbInt *lda, const QtbDoubleComplex *x,
           const QtbInt *incx, const QtbDoubleComplex *beta, QtbDoubleComplex *y, const QtbInt *incy);

/*
 * A := alpha*x*y**T + A (ger, geru) or alpha*x*y**H + A (gerc), A an m x n matrix, x of m elements, y of n.
 */
void sger(const QtbInt *m, const QtbInt *n, const float *alpha, const float *x, const QtbInt *incx, const float *y,
          const QtbInt *incy, float *a, const QtbInt *lda);
void dger(const QtbInt *m, const QtbInt *n, const double *alpha, const double *x, const QtbInt *incx, const double *y,
          const QtbInt *incy, double *a, const QtbInt *lda);
void cgeru(const QtbInt *m, const QtbInt *n, const QtbFloatComplex *alpha, const QtbFloatComplex *x, const QtbInt *incx,
           const QtbFloatComplex *y, const QtbInt *incy, QtbFloatComplex *a, const QtbInt *lda);
void zgeru(const QtbInt *m, const QtbInt *n, const QtbDoubleComplex *alpha, const QtbDoubleComplex *x,
           const QtbInt *incx, const QtbDoubleComplex *y, const QtbInt *incy, QtbDoubleComplex *a, const QtbInt *lda);
void cgerc(const QtbInt *m, const QtbInt *n, const QtbFloatComplex *alpha, const QtbFloatComplex *x, const QtbInt *incx,
           const QtbFloatComplex *y, const QtbInt *incy, QtbFloatComplex *a, const QtbInt *lda);
void zgerc(const QtbInt *m, const QtbInt *n, const QtbDoubleComplex *alpha, const QtbDoubleComplex *x,
           const QtbInt *incx, const QtbDoubleComplex *y, const QtbInt *incy, QtbDoubleComplex *a, const QtbInt *lda);

/*
 * y := alpha*A*x + beta*y, A symmetric (symv) or Hermitian (hemv), full storage.
 */
void ssymv(const char *uplo, const QtbInt *n, const float *alpha, const float *a, const QtbInt *lda, const float *x,
           const QtbInt *incx, const float *beta, float *y, const QtbInt *incy);
void dsymv(const char *uplo, const QtbInt *n, const double *alpha, const double *a, const QtbInt *lda, const double *x,
           const QtbInt *incx, const double *beta, double *y, const QtbInt *incy);
void chemv(const char *uplo, const QtbInt *n, const QtbFloatComplex *alpha, const QtbFloatComplex *a, const QtbInt *lda,
           const QtbFloatComplex *x, const QtbInt *incx, const QtbFloatComplex *beta, QtbFloatComplex *y,
           const QtbInt *incy);
void zhemv(const char *uplo, const QtbInt *n, const QtbDoubleComplex *alpha, const QtbDoubleComplex *a,
           const QtbInt *lda, const QtbDoubleComplex *x, const QtbInt *incx, const QtbDoubleComplex *beta,
           QtbDoubleComplex *y, const QtbInt *incy);

/*
 * The same in band storage with k diagonals beside the main one.
 */
void ssbmv(const char *uplo, const QtbInt *n, const QtbInt *k, const float *alpha, const float *a, const QtbInt *lda,
           const float *x, const QtbInt *incx, const float *beta, float *y, const QtbInt *incy);
void dsbmv(const char *uplo, const QtbInt *n, const QtbInt *k, const double *alpha, const double *a, const QtbInt *lda,
           const double *x, const QtbInt *incx, const double *beta, double *y, const QtbInt *incy);
void chbmv(const char *uplo, const QtbInt *n, const QtbInt *k, const QtbFloatComplex *alpha, const QtbFloatComplex *a,
           const QtbInt *lda, const QtbFloatComplex *x, const QtbInt *incx, const QtbFloatComplex *beta,
           QtbFloatComplex *y, const QtbInt *incy);
void zhbmv(const char *uplo, const QtbInt *n, const QtbInt *k, const QtbDoubleComplex *alpha, const QtbDoubleComplex *a,
           const QtbInt *lda, const QtbDoubleComplex *x, const QtbInt *incx, const QtbDoubleComplex *beta,
           QtbDoubleComplex *y, const QtbInt *incy);

/*
 * The same in packed storage.
 */
void sspmv(const char *uplo, const QtbInt *n, const float *alpha, const float *ap, const float *x, const QtbInt *incx,
           const float *beta, float *y, const QtbInt *incy);
void dspmv(const char *uplo, const QtbInt *n, const double *alpha, const double *ap, const double *x,
           const QtbInt *incx, const double *beta, double *y, const QtbInt *incy);
void chpmv(const char *uplo, const QtbInt *n, const QtbFloatComplex *alpha, const QtbFloatComplex *ap,
           const QtbFloatComplex *x, const QtbInt *incx, const QtbFloatComplex *beta, QtbFloatComplex *y,
           const QtbInt *incy);
void zhpmv(const char *uplo, const QtbInt *n, const QtbDoubleComplex *alpha, const QtbDoubleComplex *ap,
           const QtbDoubleComplex *x, const QtbInt *incx, const QtbDoubleComplex *beta, QtbDoubleComplex *y,
           const QtbInt *incy);

/*
 * A := alpha*x*x**T + A (syr) or, with a real alpha, alpha*x*x**H + A (her), full storage.
 */
void ssyr(const char *uplo, const QtbInt *n, const float *alpha, const float *x, const QtbInt *incx, float *a,
          const QtbInt *lda);
void dsyr(const char *uplo, const QtbInt *n, const double *alpha, const double *x, const QtbInt *incx, double *a,
          const QtbInt *lda);
void cher(const char *uplo, const QtbInt *n, const float *alpha, const QtbFloatComplex *x, const QtbInt *incx,
          QtbFloatComplex *a, const QtbInt *lda);
void zher(const char *uplo, const QtbInt *n, const double *alpha, const QtbDoubleComplex *x, const QtbInt *incx,
          QtbDoubleComplex *a, const QtbInt *lda);

/*
 * The same in packed storage.
 */
void sspr(const char *uplo, const QtbInt *n, const float *alpha, const float *x, const QtbInt *incx, float *ap);
void dspr(const char *uplo, const QtbInt *n, const double *alpha, const double *x, const QtbInt *incx, double *ap);
void chpr(const char *uplo, const QtbInt *n, const float *alpha, const QtbFloatComplex *x, const QtbInt *incx,
          QtbFloatComplex *ap);
void zhpr(const char *uplo, const QtbInt *n, const double *alpha, const QtbDoubleComplex *x, const QtbInt *incx,
          QtbDoubleComplex *ap);

/*
 * A := alpha*x*y**T + alpha*y*x**T + A (syr2) or alpha*x*y**H + conj(alpha)*y*x**H + A (her2), full storage.
 */
void ssyr2(const char *uplo, const QtbInt *n, const float *alpha, const float *x, const QtbInt *incx, const float *y,
           const QtbInt *incy, float *a, const QtbInt *lda);
void dsyr2(const char *uplo, const QtbInt *n, const double *alpha, const double *x, const QtbInt *incx, const double *y,
           const QtbInt *incy, double *a, const QtbInt *lda);
void cher2(const char *uplo, const QtbInt *n, const QtbFloatComplex *alpha, const QtbFloatComplex *x,
           const QtbInt *incx, const QtbFloatComplex *y, const QtbInt *incy, QtbFloatComplex *a, const QtbInt *lda);
void zher2(const char *uplo, const QtbInt *n, const QtbDoubleComplex *alpha, const QtbDoubleComplex *x,
           const QtbInt *incx, const QtbDoubleComplex *y, const QtbInt *incy, QtbDoubleComplex *a, const QtbInt *lda);

/*
 * The same in packed storage.
 */
void sspr2(const char *uplo, const QtbInt *n, const float *alpha, const float *x, const QtbInt *incx, const float *y,
           const QtbInt *incy, float *ap);
void dspr2(const char *uplo, const QtbInt *n, const double *alpha, const double *x, const QtbInt *incx, const double *y,
           const QtbInt *incy, double *ap);
void chpr2(const char *uplo, const QtbInt *n, const QtbFloatComplex *alpha, const QtbFloatComplex *x,
           const QtbInt *incx, const QtbFloatComplex *y, const QtbInt *incy, QtbFloatComplex *ap);
void zhpr2(const char *uplo, const QtbInt *n, const QtbDoubleComplex *alpha, const QtbDoubleComplex *x,
           const QtbInt *incx, const QtbDoubleComplex *y, const QtbInt *incy, QtbDoubleComplex *ap);

/*
 * x := op(A)*x (trmv) or the solution of op(A)*x' = x (trsv), A triangular, full storage. With diag U the diagonal is
 * not read and counts as ones. A singular matrix is not detected: the solution then holds infinities or NaN.
 */
void strmv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const float *a, const QtbInt *lda,
           float *x, const QtbInt *incx);
void dtrmv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const double *a, const QtbInt *lda,
           double *x, const QtbInt *incx);
void ctrmv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const QtbFloatComplex *a,
           const QtbInt *lda, QtbFloatComplex *x, const QtbInt *incx);
void ztrmv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const QtbDoubleComplex *a,
           const QtbInt *lda, QtbDoubleComplex *x, const QtbInt *incx);
void strsv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const float *a, const QtbInt *lda,
           float *x, const QtbInt *incx);
void dtrsv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const double *a, const QtbInt *lda,
           double *x, const QtbInt *incx);
void ctrsv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const QtbFloatComplex *a,
           const QtbInt *lda, QtbFloatComplex *x, const QtbInt *incx);
void ztrsv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const QtbDoubleComplex *a,
           const QtbInt *lda, QtbDoubleComplex *x, const QtbInt *incx);

/*
 * The same in band storage with k diagonals beside the main one.
 */
void stbmv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const QtbInt *k, const float *a,
           const QtbInt *lda, float *x, const QtbInt *incx);
void dtbmv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const QtbInt *k, const double *a,
           const QtbInt *lda, double *x, const QtbInt *incx);
void ctbmv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const QtbInt *k,
           const QtbFloatComplex *a, const QtbInt *lda, QtbFloatComplex *x, const QtbInt *incx);
void ztbmv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const QtbInt *k,
           const QtbDoubleComplex *a, const QtbInt *lda, QtbDoubleComplex *x, const QtbInt *incx);
void stbsv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const QtbInt *k, const float *a,
           const QtbInt *lda, float *x, const QtbInt *incx);
void dtbsv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const QtbInt *k, const double *a,
           const QtbInt *lda, double *x, const QtbInt *incx);
void ctbsv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const QtbInt *k,
           const QtbFloatComplex *a, const QtbInt *lda, QtbFloatComplex *x, const QtbInt *incx);
void ztbsv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const QtbInt *k,
           const QtbDoubleComplex *a, const QtbInt *lda, QtbDoubleComplex *x, const QtbInt *incx);

/*
 * The same in packed storage.
 */
void stpmv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const float *ap, float *x,
           const QtbInt *incx);
void dtpmv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const double *ap, double *x,
           const QtbInt *incx);
void ctpmv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const QtbFloatComplex *ap,
           QtbFloatComplex *x, const QtbInt *incx);
void ztpmv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const QtbDoubleComplex *ap,
           QtbDoubleComplex *x, const QtbInt *incx);
void stpsv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const float *ap, float *x,
           const QtbInt *incx);
void dtpsv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const double *ap, double *x,
           const QtbInt *incx);
void ctpsv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const QtbFloatComplex *ap,
           QtbFloatComplex *x, const QtbInt *incx);
void ztpsv(const char *uplo, const char *trans, const char *diag, const QtbInt *n, const QtbDoubleComplex *ap,
           QtbDoubleComplex *x, const QtbInt *incx);

/* ---- Level 3: matrix and matrix ---- */

/*
 * Full storage throughout. Of a triangular, symmetric or Hermitian matrix only the triangle named by uplo is used. The
 * imaginary parts of the diagonal of a Hermitian matrix are taken as zero; an update (herk, her2k) stores them as zero.
 * Source: Dongarra, Du Croz, Duff and Hammarling, 1990.
 */

/*
 * C := alpha*op(A)*op(B) + beta*C; op(A) is m x k, op(B) k x n, C m x n.
 */
void sgemm(const char *transa, const char *transb, const QtbInt *m, const QtbInt *n, const QtbInt *k,
           const float *alpha, const float *a, const QtbInt *lda, const float *b, const QtbInt *ldb, const float *beta,
           float *c, const QtbInt *ldc);
void dgemm(const char *transa, const char *transb, const QtbInt *m, const QtbInt *n, const QtbInt *k,
           const double *alpha, const double *a, const QtbInt *lda, const double *b, const QtbInt *ldb,
           const double *beta, double *c, const QtbInt *ldc);
void cgemm(const char *transa, const char *transb, const QtbInt *m, const QtbInt *n, const QtbInt *k,
           const QtbFloatComplex *alpha, const QtbFloatComplex *a, const QtbInt *lda, const QtbFloatComplex *b,
           const QtbInt *ldb, const QtbFloatComplex *beta, QtbFloatComplex *c, const QtbInt *ldc);
void zgemm(const char *transa, const char *transb, const QtbInt *m, const QtbInt *n, const QtbInt *k,
           const QtbDoubleComplex *alpha, const QtbDoubleComplex *a, const QtbInt *lda, const QtbDoubleComplex *b,
           const QtbInt *ldb, const QtbDoubleComplex *beta, QtbDoubleComplex *c, const QtbInt *ldc);

/*
 * C := alpha*A*B + beta*C for side L, alpha*B*A + beta*C for side R; A symmetric (symm) or Hermitian (hemm), m x m
 * for side L and n x n for side R; B and C m x n.
 */
void ssymm(const char *side, const char *uplo, const QtbInt *m, const QtbInt *n, const float *alpha, const float *a,
           const QtbInt *lda, const float *b, const QtbInt *ldb, const float *beta, float *c, const QtbInt *ldc);
void dsymm(const char *side, const char *uplo, const QtbInt *m, const QtbInt *n, const double *alpha, const double *a,
           const QtbInt *lda, const double *b, const QtbInt *ldb, const double *beta, double *c, const QtbInt *ldc);
void csymm(const char *side, const char *uplo, const QtbInt *m, const QtbInt *n, const QtbFloatComplex *alpha,
           const QtbFloatComplex *a, const QtbInt *lda, const QtbFloatComplex *b, const QtbInt *ldb,
           const QtbFloatComplex *beta, QtbFloatComplex *c, const QtbInt *ldc);
void zsymm(const char *side, const char *uplo, const QtbInt *m, const QtbInt *n, const QtbDoubleComplex *alpha,
           const QtbDoubleComplex *a, const QtbInt *lda, const QtbDoubleComplex *b, const QtbInt *ldb,
           const QtbDoubleComplex *beta, QtbDoubleComplex *c, const QtbInt *ldc);
void chemm(const char *side, const char *uplo, const QtbInt *m, const QtbInt *n, const QtbFloatComplex *alpha,
           const QtbFloatComplex *a, const QtbInt *lda, const QtbFloatComplex *b, const QtbInt *ldb,
           const QtbFloatComplex *beta, QtbFloatComplex *c, const QtbInt *ldc);
void zhemm(const char *side, const char *uplo, const QtbInt *m, const QtbInt *n, const QtbDoubleComplex *alpha,
           const QtbDoubleComplex *a, const QtbInt *lda, const QtbDoubleComplex *b, const QtbInt *ldb,
           const QtbDoubleComplex *beta, QtbDoubleComplex *c, const QtbInt *ldc);

/*
 * C := alpha*A*A**T + beta*C for trans N, A n x k; alpha*A**T*A + beta*C for trans T, A k x n; C symmetric, n x n. In
 * the real routines trans C is T; in the complex ones it is illegal.
 */
void ssyrk(const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const float *alpha, const float *a,
           const QtbInt *lda, const float *beta, float *c, const QtbInt *ldc);
void dsyrk(const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const double *alpha, const double *a,
           const QtbInt *lda, const double *beta, double *c, const QtbInt *ldc);
void csyrk(const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const QtbFloatComplex *alpha,
           const QtbFloatComplex *a, const QtbInt *lda, const QtbFloatComplex *beta, QtbFloatComplex *c,
           const QtbInt *ldc);
void zsyrk(const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const QtbDoubleComplex *alpha,
           const QtbDoubleComplex *a, const QtbInt *lda, const QtbDoubleComplex *beta, QtbDoubleComplex *c,
           const QtbInt *ldc);

/*
 * The same with A**H in place of A**T, real alpha and beta, C Hermitian; trans is N or C.
 */
void cherk(const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const float *alpha,
           const QtbFloatComplex *a, const QtbInt *lda, const float *beta, QtbFloatComplex *c, const QtbInt *ldc);
void zherk(const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const double *alpha,
           const QtbDoubleComplex *a, const QtbInt *lda, const double *beta, QtbDoubleComplex *c, const QtbInt *ldc);

/*
 * C := alpha*A*B**T + alpha*B*A**T + beta*C for trans N, A and B n x k; alpha*A**T*B + alpha*B**T*A + beta*C for
 * trans T, A and B k x n; C symmetric, n x n. In the real routines trans C is T; in the complex ones it is illegal.
 */
void ssyr2k(const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const float *alpha, const float *a,
            const QtbInt *lda, const float *b, const QtbInt *ldb, const float *beta, float *c, const QtbInt *ldc);
void dsyr2k(const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const double *alpha, const double *a,
            const QtbInt *lda, const double *b, const QtbInt *ldb, const double *beta, double *c, const QtbInt *ldc);
void csyr2k(const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const QtbFloatComplex *alpha,
            const QtbFloatComplex *a, const QtbInt *lda, const QtbFloatComplex *b, const QtbInt *ldb,
            const QtbFloatComplex *beta, QtbFloatComplex *c, const QtbInt *ldc);
void zsyr2k(const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const QtbDoubleComplex *alpha,
            const QtbDoubleComplex *a, const QtbInt *lda, const QtbDoubleComplex *b, const QtbInt *ldb,
            const QtbDoubleComplex *beta, QtbDoubleComplex *c, const QtbInt *ldc);

/*
 * C := alpha*A*B**H + conj(alpha)*B*A**H + beta*C for trans N, alpha*A**H*B + conj(alpha)*B**H*A + beta*C for trans
 * C, real beta, C Hermitian.
 */
void cher2k(const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const QtbFloatComplex *alpha,
            const QtbFloatComplex *a, const QtbInt *lda, const QtbFloatComplex *b, const QtbInt *ldb, const float *beta,
            QtbFloatComplex *c, const QtbInt *ldc);
void zher2k(const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const QtbDoubleComplex *alpha,
            const QtbDoubleComplex *a, const QtbInt *lda, const QtbDoubleComplex *b, const QtbInt *ldb,
            const double *beta, QtbDoubleComplex *c, const QtbInt *ldc);

/*
 * B := alpha*op(A)*B (trmm) or the solution X of op(A)*X = alpha*B (trsm) for side L, and the same with the matrices
 * in the other order for side R; A triangular, m x m for side L and n x n for side R; B m x n. With diag U the
 * diagonal of A is not read and counts as ones. A singular matrix is not detected: the solution then holds infinities
 * or NaN.
 */
void strmm(const char *side, const char *uplo, const char *transa, const char *diag, const QtbInt *m, const QtbInt *n,
           const float *alpha, const float *a, const QtbInt *lda, float *b, const QtbInt *ldb);
void dtrmm(const char *side, const char *uplo, const char *transa, const char *diag, const QtbInt *m, const QtbInt *n,
           const double *alpha, const double *a, const QtbInt *lda, double *b, const QtbInt *ldb);
void ctrmm(const char *side, const char *uplo, const char *transa, const char *diag, const QtbInt *m, const QtbInt *n,
           const QtbFloatComplex *alpha, const QtbFloatComplex *a, const QtbInt *lda, QtbFloatComplex *b,
           const QtbInt *ldb);
void ztrmm(const char *side, const char *uplo, const char *transa, const char *diag, const QtbInt *m, const QtbInt *n,
           const QtbDoubleComplex *alpha, const QtbDoubleComplex *a, const QtbInt *lda, QtbDoubleComplex *b,
           const QtbInt *ldb);
void strsm(const char *side, const char *uplo, const char *transa, const char *diag, const QtbInt *m, const QtbInt *n,
           const float *alpha, const float *a, const QtbInt *lda, float *b, const QtbInt *ldb);
void dtrsm(const char *side, const char *uplo, const char *transa, const char *diag, const QtbInt *m, const QtbInt *n,
           const double *alpha, const double *a, const QtbInt *lda, double *b, const QtbInt *ldb);
void ctrsm(const char *side, const char *uplo, const char *transa, const char *diag, const QtbInt *m, const QtbInt *n,
           const QtbFloatComplex *alpha, const QtbFloatComplex *a, const QtbInt *lda, QtbFloatComplex *b,
           const QtbInt *ldb);
void ztrsm(const char *side, const char *uplo, const char *transa, const char *diag, const QtbInt *m, const QtbInt *n,
           const QtbDoubleComplex *alpha, const QtbDoubleComplex *a, const QtbInt *lda, QtbDoubleComplex *b,
           const QtbInt *ldb);

/* ---- Support ---- */

/*
 * 1 if the first characters at a and b are the same in either case, else 0. Only the ASCII letters fold.
 */
QtbInt lsame(const char *a, const char *b);

/*
 * Reports an error as the routines do: prints an empty line and a message, and returns 0. name is the routine's name,
 * of which at most length and at most 20 characters are shown; info is the number of the illegal parameter. Other
 * codes: 0 and below, the internal condition -info; 1000 or 1079, not enough work memory; 1001, incompatible options.
 * Only the low 32 bits of info are read. The library's own reports do not pass through this name.
 */
int xerbla(const char *name, const QtbInt *info, int32_t length);

/*
 * Copies the library's version text into buffer, length bytes (both arguments by value): cut if need be, always ended
 * by a zero byte, with zeros up to the end of the buffer. Nothing is written for a length below 1.
 */
void QTBGetVersionString(char *buffer, int32_t length);

/* ---- The upper-case names, each the same routine ---- */

#if defined(__cplusplus) && (__cplusplus >= 201103L || defined(_MSC_VER))
#define QTB_UPPER_CASE(name, NAME) extern decltype(name) NAME;
#else /* what compilers have of it in C, and in C++ before it was standard */
#define QTB_UPPER_CASE(name, NAME) extern __typeof__(name) NAME;
#endif

/* clang-format off */
QTB_UPPER_CASE(saxpy, SAXPY) QTB_UPPER_CASE(daxpy, DAXPY) QTB_UPPER_CASE(caxpy, CAXPY) QTB_UPPER_CASE(zaxpy, ZAXPY)
QTB_UPPER_CASE(scopy, SCOPY) QTB_UPPER_CASE(dcopy, DCOPY) QTB_UPPER_CASE(ccopy, CCOPY) QTB_UPPER_CASE(zcopy, ZCOPY)
QTB_UPPER_CASE(sswap, SSWAP) QTB_UPPER_CASE(dswap, DSWAP) QTB_UPPER_CASE(cswap, CSWAP) QTB_UPPER_CASE(zswap, ZSWAP)
QTB_UPPER_CASE(sdot, SDOT) QTB_UPPER_CASE(ddot, DDOT)
QTB_UPPER_CASE(cdotu, CDOTU) QTB_UPPER_CASE(zdotu, ZDOTU) QTB_UPPER_CASE(cdotc, CDOTC) QTB_UPPER_CASE(zdotc, ZDOTC)
QTB_UPPER_CASE(dsdot, DSDOT) QTB_UPPER_CASE(sdsdot, SDSDOT)
QTB_UPPER_CASE(sscal, SSCAL) QTB_UPPER_CASE(dscal, DSCAL) QTB_UPPER_CASE(cscal, CSCAL) QTB_UPPER_CASE(zscal, ZSCAL)
QTB_UPPER_CASE(csscal, CSSCAL) QTB_UPPER_CASE(zdscal, ZDSCAL)
QTB_UPPER_CASE(srot, SROT) QTB_UPPER_CASE(drot, DROT) QTB_UPPER_CASE(csrot, CSROT) QTB_UPPER_CASE(zdrot, ZDROT)
QTB_UPPER_CASE(srotg, SROTG) QTB_UPPER_CASE(drotg, DROTG) QTB_UPPER_CASE(crotg, CROTG) QTB_UPPER_CASE(zrotg, ZROTG)
QTB_UPPER_CASE(srotm, SROTM) QTB_UPPER_CASE(drotm, DROTM)
QTB_UPPER_CASE(srotmg, SROTMG) QTB_UPPER_CASE(drotmg, DROTMG)
QTB_UPPER_CASE(snrm2, SNRM2) QTB_UPPER_CASE(dnrm2, DNRM2) QTB_UPPER_CASE(scnrm2, SCNRM2)
QTB_UPPER_CASE(dznrm2, DZNRM2)
QTB_UPPER_CASE(sasum, SASUM) QTB_UPPER_CASE(dasum, DASUM) QTB_UPPER_CASE(scasum, SCASUM)
QTB_UPPER_CASE(dzasum, DZASUM)
QTB_UPPER_CASE(isamax, ISAMAX) QTB_UPPER_CASE(idamax, IDAMAX) QTB_UPPER_CASE(icamax, ICAMAX)
QTB_UPPER_CASE(izamax, IZAMAX) QTB_UPPER_CASE(isamin, ISAMIN) QTB_UPPER_CASE(idamin, IDAMIN)
QTB_UPPER_CASE(icamin, ICAMIN) QTB_UPPER_CASE(izamin, IZAMIN)
QTB_UPPER_CASE(dcabs1, DCABS1)
QTB_UPPER_CASE(saxpyi, SAXPYI) QTB_UPPER_CASE(daxpyi, DAXPYI) QTB_UPPER_CASE(caxpyi, CAXPYI)
QTB_UPPER_CASE(zaxpyi, ZAXPYI)
QTB_UPPER_CASE(sdoti, SDOTI) QTB_UPPER_CASE(ddoti, DDOTI)
QTB_UPPER_CASE(cdotui, CDOTUI) QTB_UPPER_CASE(zdotui, ZDOTUI) QTB_UPPER_CASE(cdotci, CDOTCI)
QTB_UPPER_CASE(zdotci, ZDOTCI)
QTB_UPPER_CASE(sgthr, SGTHR) QTB_UPPER_CASE(dgthr, DGTHR) QTB_UPPER_CASE(cgthr, CGTHR) QTB_UPPER_CASE(zgthr, ZGTHR)
QTB_UPPER_CASE(sgthrz, SGTHRZ) QTB_UPPER_CASE(dgthrz, DGTHRZ) QTB_UPPER_CASE(cgthrz, CGTHRZ)
QTB_UPPER_CASE(zgthrz, ZGTHRZ)
QTB_UPPER_CASE(ssctr, SSCTR) QTB_UPPER_CASE(dsctr, DSCTR) QTB_UPPER_CASE(csctr, CSCTR) QTB_UPPER_CASE(zsctr, ZSCTR)
QTB_UPPER_CASE(sroti, SROTI) QTB_UPPER_CASE(droti, DROTI)
QTB_UPPER_CASE(sgemv, SGEMV) QTB_UPPER_CASE(dgemv, DGEMV) QTB_UPPER_CASE(cgemv, CGEMV) QTB_UPPER_CASE(zgemv, ZGEMV)
QTB_UPPER_CASE(sgbmv, SGBMV) QTB_UPPER_CASE(dgbmv, DGBMV) QTB_UPPER_CASE(cgbmv, CGBMV) QTB_UPPER_CASE(zgbmv, ZGBMV)
QTB_UPPER_CASE(sger, SGER) QTB_UPPER_CASE(dger, DGER) QTB_UPPER_CASE(cgeru, CGERU) QTB_UPPER_CASE(zgeru, ZGERU)
QTB_UPPER_CASE(cgerc, CGERC) QTB_UPPER_CASE(zgerc, ZGERC)
QTB_UPPER_CASE(ssymv, SSYMV) QTB_UPPER_CASE(dsymv, DSYMV) QTB_UPPER_CASE(chemv, CHEMV) QTB_UPPER_CASE(zhemv, ZHEMV)
QTB_UPPER_CASE(ssbmv, SSBMV) QTB_UPPER_CASE(dsbmv, DSBMV) QTB_UPPER_CASE(chbmv, CHBMV) QTB_UPPER_CASE(zhbmv, ZHBMV)
QTB_UPPER_CASE(sspmv, SSPMV) QTB_UPPER_CASE(dspmv, DSPMV) QTB_UPPER_CASE(chpmv, CHPMV) QTB_UPPER_CASE(zhpmv, ZHPMV)
QTB_UPPER_CASE(ssyr, SSYR) QTB_UPPER_CASE(dsyr, DSYR) QTB_UPPER_CASE(cher, CHER) QTB_UPPER_CASE(zher, ZHER)
QTB_UPPER_CASE(sspr, SSPR) QTB_UPPER_CASE(dspr, DSPR) QTB_UPPER_CASE(chpr, CHPR) QTB_UPPER_CASE(zhpr, ZHPR)
QTB_UPPER_CASE(ssyr2, SSYR2) QTB_UPPER_CASE(dsyr2, DSYR2) QTB_UPPER_CASE(cher2, CHER2) QTB_UPPER_CASE(zher2, ZHER2)
QTB_UPPER_CASE(sspr2, SSPR2) QTB_UPPER_CASE(dspr2, DSPR2) QTB_UPPER_CASE(chpr2, CHPR2) QTB_UPPER_CASE(zhpr2, ZHPR2)
QTB_UPPER_CASE(strmv, STRMV) QTB_UPPER_CASE(dtrmv, DTRMV) QTB_UPPER_CASE(ctrmv, CTRMV) QTB_UPPER_CASE(ztrmv, ZTRMV)
QTB_UPPER_CASE(strsv, STRSV) QTB_UPPER_CASE(dtrsv, DTRSV) QTB_UPPER_CASE(ctrsv, CTRSV) QTB_UPPER_CASE(ztrsv, ZTRSV)
QTB_UPPER_CASE(stbmv, STBMV) QTB_UPPER_CASE(dtbmv, DTBMV) QTB_UPPER_CASE(ctbmv, CTBMV) QTB_UPPER_CASE(ztbmv, ZTBMV)
QTB_UPPER_CASE(stbsv, STBSV) QTB_UPPER_CASE(dtbsv, DTBSV) QTB_UPPER_CASE(ctbsv, CTBSV) QTB_UPPER_CASE(ztbsv, ZTBSV)
QTB_UPPER_CASE(stpmv, STPMV) QTB_UPPER_CASE(dtpmv, DTPMV) QTB_UPPER_CASE(ctpmv, CTPMV) QTB_UPPER_CASE(ztpmv, ZTPMV)
QTB_UPPER_CASE(stpsv, STPSV) QTB_UPPER_CASE(dtpsv, DTPSV) QTB_UPPER_CASE(ctpsv, CTPSV) QTB_UPPER_CASE(ztpsv, ZTPSV)
QTB_UPPER_CASE(sgemm, SGEMM) QTB_UPPER_CASE(dgemm, DGEMM) QTB_UPPER_CASE(cgemm, CGEMM) QTB_UPPER_CASE(zgemm, ZGEMM)
QTB_UPPER_CASE(ssymm, SSYMM) QTB_UPPER_CASE(dsymm, DSYMM) QTB_UPPER_CASE(csymm, CSYMM) QTB_UPPER_CASE(zsymm, ZSYMM)
QTB_UPPER_CASE(chemm, CHEMM) QTB_UPPER_CASE(zhemm, ZHEMM)
QTB_UPPER_CASE(ssyrk, SSYRK) QTB_UPPER_CASE(dsyrk, DSYRK) QTB_UPPER_CASE(csyrk, CSYRK) QTB_UPPER_CASE(zsyrk, ZSYRK)
QTB_UPPER_CASE(cherk, CHERK) QTB_UPPER_CASE(zherk, ZHERK)
QTB_UPPER_CASE(ssyr2k, SSYR2K) QTB_UPPER_CASE(dsyr2k, DSYR2K) QTB_UPPER_CASE(csyr2k, CSYR2K)
QTB_UPPER_CASE(zsyr2k, ZSYR2K)
QTB_UPPER_CASE(cher2k, CHER2K) QTB_UPPER_CASE(zher2k, ZHER2K)
QTB_UPPER_CASE(strmm, STRMM) QTB_UPPER_CASE(dtrmm, DTRMM) QTB_UPPER_CASE(ctrmm, CTRMM) QTB_UPPER_CASE(ztrmm, ZTRMM)
QTB_UPPER_CASE(strsm, STRSM) QTB_UPPER_CASE(dtrsm, DTRSM) QTB_UPPER_CASE(ctrsm, CTRSM) QTB_UPPER_CASE(ztrsm, ZTRSM)
QTB_UPPER_CASE(lsame, LSAME)
QTB_UPPER_CASE(xerbla, XERBLA)
/* clang-format on */

#undef QTB_UPPER_CASE

#ifdef __cplusplus
}
#endif

#endif
