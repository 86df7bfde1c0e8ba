// The oracle of Level 2: each routine as it is published, with arguments by value. A routine that overwrites an array
// returns what the array must then hold; a solve returns the residual op(T) x - b of the x that was found.
//
// The routines of symmetric matrices take a complex matrix as Hermitian, as the published names do.
#pragma once

#include <algorithm>

#include "tests/reference/common.h"

namespace qtb::reference {

template <class T>
inline constexpr Structure symmetric_or_hermitian = is_complex<T> ? Structure::hermitian : Structure::symmetric;

// y := alpha*op(A)*x + beta*y for any A: at most terms products in a sum.
template <class T>
Expectation matrix_times_vector(T alpha, const Layout &a_layout, const T *a, Structure structure, char trans,
                                const T *x, QtbInt incx, T beta, const T *y, QtbInt incy, QtbInt terms) {
  const bool n = is_letter(trans, 'N');
  const Layout y_layout = strided(n ? a_layout.rows : a_layout.cols, incy);
  const QuadComplex wide_alpha = test::widen(alpha), wide_beta = test::widen(beta);
  if (a_layout.rows == 0 || a_layout.cols == 0 || (is_value(wide_alpha, 0) && is_value(wide_beta, 1)))
    return untouched(y_layout);
  std::vector<Term> sum;
  if (!is_value(wide_alpha, 0))
    sum.push_back({wide_alpha, op(trans, read(a_layout, a, structure)),
                   read(strided(n ? a_layout.cols : a_layout.rows, incx), x)});
  return update(y_layout, sum, wide_beta, y, roundings<T>(terms, 3, 4));
}

template <class T>
Expectation gemv(char trans, QtbInt m, QtbInt n, T alpha, const T *a, QtbInt lda, const T *x, QtbInt incx, T beta,
                 const T *y, QtbInt incy) {
  return matrix_times_vector(alpha, full(m, n, lda), a, Structure::general, trans, x, incx, beta, y, incy,
                             is_letter(trans, 'N') ? n : m);
}

template <class T>
Expectation gbmv(char trans, QtbInt m, QtbInt n, QtbInt kl, QtbInt ku, T alpha, const T *a, QtbInt lda, const T *x,
                 QtbInt incx, T beta, const T *y, QtbInt incy) {
  return matrix_times_vector(alpha, band(m, n, kl, ku, lda), a, Structure::general, trans, x, incx, beta, y, incy,
                             std::min(is_letter(trans, 'N') ? n : m, kl + ku + 1));
}

// symv and hemv.
template <class T>
Expectation symv(char uplo, QtbInt n, T alpha, const T *a, QtbInt lda, const T *x, QtbInt incx, T beta, const T *y,
                 QtbInt incy) {
  return matrix_times_vector(alpha, triangle(uplo, n, lda), a, symmetric_or_hermitian<T>, 'N', x, incx, beta, y, incy,
                             n);
}

// sbmv and hbmv.
template <class T>
Expectation sbmv(char uplo, QtbInt n, QtbInt k, T alpha, const T *a, QtbInt lda, const T *x, QtbInt incx, T beta,
                 const T *y, QtbInt incy) {
  return matrix_times_vector(alpha, band_triangle(uplo, n, k, lda), a, symmetric_or_hermitian<T>, 'N', x, incx, beta, y,
                             incy, std::min(n, 2 * k + 1));
}

// spmv and hpmv.
template <class T>
Expectation spmv(char uplo, QtbInt n, T alpha, const T *ap, const T *x, QtbInt incx, T beta, const T *y, QtbInt incy) {
  return matrix_times_vector(alpha, packed_triangle(uplo, n), ap, symmetric_or_hermitian<T>, 'N', x, incx, beta, y,
                             incy, n);
}

// A := alpha*x*y^T + A, or with conjugated alpha*x*y^H + A.
template <class T>
Expectation ger(bool conjugated, QtbInt m, QtbInt n, T alpha, const T *x, QtbInt incx, const T *y, QtbInt incy,
                const T *a, QtbInt lda) {
  const Layout layout = full(m, n, lda);
  const QuadComplex wide_alpha = test::widen(alpha);
  if (m == 0 || n == 0 || is_value(wide_alpha, 0)) return untouched(layout);
  const Dense row = op(conjugated ? 'C' : 'T', read(strided(n, incy), y));
  return update(layout, {{wide_alpha, read(strided(m, incx), x), row}}, {1, 0}, a, is_complex<T> ? 6 : 3);
}

// A := alpha*x*x^H + A over the triangle of layout: syr, her, spr, hpr.
template <class T>
Expectation rank_one(const Layout &layout, Real<T> alpha, const T *x, QtbInt incx, const T *a) {
  if (layout.rows == 0 || alpha == 0) return untouched(layout);
  const Dense column = read(strided(layout.rows, incx), x);
  return update(layout, {{{Quad(alpha), 0}, column, op('C', column)}}, {1, 0}, a, is_complex<T> ? 6 : 3, Outcome::value,
                is_complex<T>);
}

// syr and her.
template <class T>
Expectation syr(char uplo, QtbInt n, Real<T> alpha, const T *x, QtbInt incx, const T *a, QtbInt lda) {
  return rank_one(triangle(uplo, n, lda), alpha, x, incx, a);
}

// spr and hpr.
template <class T>
Expectation spr(char uplo, QtbInt n, Real<T> alpha, const T *x, QtbInt incx, const T *ap) {
  return rank_one(packed_triangle(uplo, n), alpha, x, incx, ap);
}

// A := alpha*x*y^H + conj(alpha)*y*x^H + A over the triangle of layout: syr2, her2, spr2, hpr2.
template <class T>
Expectation rank_two(const Layout &layout, T alpha, const T *x, QtbInt incx, const T *y, QtbInt incy, const T *a) {
  const QuadComplex wide_alpha = test::widen(alpha);
  if (layout.rows == 0 || is_value(wide_alpha, 0)) return untouched(layout);
  const Dense cx = read(strided(layout.rows, incx), x), cy = read(strided(layout.rows, incy), y);
  return update(layout, {{wide_alpha, cx, op('C', cy)}, {conjugate(wide_alpha), cy, op('C', cx)}}, {1, 0}, a,
                is_complex<T> ? 8 : 5, Outcome::value, is_complex<T>);
}

// syr2 and her2.
template <class T>
Expectation syr2(char uplo, QtbInt n, T alpha, const T *x, QtbInt incx, const T *y, QtbInt incy, const T *a,
                 QtbInt lda) {
  return rank_two(triangle(uplo, n, lda), alpha, x, incx, y, incy, a);
}

// spr2 and hpr2.
template <class T>
Expectation spr2(char uplo, QtbInt n, T alpha, const T *x, QtbInt incx, const T *y, QtbInt incy, const T *ap) {
  return rank_two(packed_triangle(uplo, n), alpha, x, incx, y, incy, ap);
}

// x := op(T)*x for any storage of T.
template <class T>
Expectation triangle_times_vector(const Layout &layout, const T *a, char trans, char diag, const T *x, QtbInt incx,
                                  QtbInt terms) {
  const Layout x_layout = strided(layout.rows, incx);
  return update(x_layout, {{{1, 0}, op(trans, read(layout, a, triangular(diag))), read(x_layout, x)}}, {0, 0}, x,
                roundings<T>(terms, 2, 4));
}

template <class T>
Expectation trmv(char uplo, char trans, char diag, QtbInt n, const T *a, QtbInt lda, const T *x, QtbInt incx) {
  return triangle_times_vector(triangle(uplo, n, lda), a, trans, diag, x, incx, n);
}

template <class T>
Expectation tbmv(char uplo, char trans, char diag, QtbInt n, QtbInt k, const T *a, QtbInt lda, const T *x,
                 QtbInt incx) {
  return triangle_times_vector(band_triangle(uplo, n, k, lda), a, trans, diag, x, incx, std::min(n, k + 1));
}

template <class T>
Expectation tpmv(char uplo, char trans, char diag, QtbInt n, const T *ap, const T *x, QtbInt incx) {
  return triangle_times_vector(packed_triangle(uplo, n), ap, trans, diag, x, incx, n);
}

// op(T) x - b for any storage of T; b and x have the same increment.
template <class T>
Expectation vector_residual(const Layout &layout, const T *a, char trans, char diag, const T *b, const T *x,
                            QtbInt incx, QtbInt terms) {
  const Layout x_layout = strided(layout.rows, incx);
  return update(x_layout, {{{1, 0}, op(trans, read(layout, a, triangular(diag))), read(x_layout, x)}}, {-1, 0}, b,
                roundings<T>(terms, 3, 16), Outcome::residual);
}

template <class T>
Expectation trsv_residual(char uplo, char trans, char diag, QtbInt n, const T *a, QtbInt lda, const T *b, const T *x,
                          QtbInt incx) {
  return vector_residual(triangle(uplo, n, lda), a, trans, diag, b, x, incx, n);
}

template <class T>
Expectation tbsv_residual(char uplo, char trans, char diag, QtbInt n, QtbInt k, const T *a, QtbInt lda, const T *b,
                          const T *x, QtbInt incx) {
  return vector_residual(band_triangle(uplo, n, k, lda), a, trans, diag, b, x, incx, std::min(n, k + 1));
}

template <class T>
Expectation tpsv_residual(char uplo, char trans, char diag, QtbInt n, const T *ap, const T *b, const T *x,
                          QtbInt incx) {
  return vector_residual(packed_triangle(uplo, n), ap, trans, diag, b, x, incx, n);
}

}  // namespace qtb::reference
