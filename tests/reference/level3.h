// The oracle of Level 3: each routine as it is published, with arguments by value. A routine returns what its result
// array must then hold; trsm returns the residual op(A) X - alpha B, or X op(A) - alpha B, of the X that was found.
#pragma once

#include "tests/reference/common.h"

namespace qtb::reference {

template <class T>
Expectation gemm(char transa, char transb, QtbInt m, QtbInt n, QtbInt k, T alpha, const T *a, QtbInt lda, const T *b,
                 QtbInt ldb, T beta, const T *c, QtbInt ldc) {
  const Layout layout = full(m, n, ldc);
  const QuadComplex wide_alpha = test::widen(alpha), wide_beta = test::widen(beta);
  const bool nothing_to_add = k == 0 || is_value(wide_alpha, 0);
  if (m == 0 || n == 0 || (nothing_to_add && is_value(wide_beta, 1))) return untouched(layout);
  std::vector<Term> sum;
  if (!nothing_to_add) {
    const Layout la = is_letter(transa, 'N') ? full(m, k, lda) : full(k, m, lda);
    const Layout lb = is_letter(transb, 'N') ? full(k, n, ldb) : full(n, k, ldb);
    sum.push_back({wide_alpha, op(transa, read(la, a)), op(transb, read(lb, b))});
  }
  return update(layout, sum, wide_beta, c, roundings<T>(k, 3, 4));
}

// symm, or hemm with Structure::hermitian.
template <class T>
Expectation symm(Structure structure, char side, char uplo, QtbInt m, QtbInt n, T alpha, const T *a, QtbInt lda,
                 const T *b, QtbInt ldb, T beta, const T *c, QtbInt ldc) {
  const Layout layout = full(m, n, ldc);
  const QuadComplex wide_alpha = test::widen(alpha), wide_beta = test::widen(beta);
  if (m == 0 || n == 0 || (is_value(wide_alpha, 0) && is_value(wide_beta, 1))) return untouched(layout);
  const bool left = is_letter(side, 'L');
  const QtbInt order = left ? m : n;
  std::vector<Term> sum;
  if (!is_value(wide_alpha, 0)) {
    const Dense da = read(triangle(uplo, order, lda), a, structure), db = read(full(m, n, ldb), b);
    sum.push_back({wide_alpha, left ? da : db, left ? db : da});
  }
  return update(layout, sum, wide_beta, c, roundings<T>(order, 3, 4));
}

// C := alpha*op(A)*op(A)^T + beta*C over a triangle, or with hermitian op(A)^H, where alpha and beta are real.
template <class T>
Expectation rank_k(bool hermitian, char uplo, char trans, QtbInt n, QtbInt k, QuadComplex alpha, const T *a, QtbInt lda,
                   QuadComplex beta, const T *c, QtbInt ldc) {
  const Layout layout = triangle(uplo, n, ldc);
  const bool nothing_to_add = k == 0 || is_value(alpha, 0);
  if (n == 0 || (nothing_to_add && is_value(beta, 1))) return untouched(layout);
  std::vector<Term> sum;
  if (!nothing_to_add) {
    const Dense da = op(trans, read(is_letter(trans, 'N') ? full(n, k, lda) : full(k, n, lda), a));
    sum.push_back({alpha, da, op(hermitian ? 'C' : 'T', da)});
  }
  return update(layout, sum, beta, c, roundings<T>(k, 3, 4), Outcome::value, hermitian);
}

template <class T>
Expectation syrk(char uplo, char trans, QtbInt n, QtbInt k, T alpha, const T *a, QtbInt lda, T beta, const T *c,
                 QtbInt ldc) {
  return rank_k(false, uplo, trans, n, k, test::widen(alpha), a, lda, test::widen(beta), c, ldc);
}

template <class T>
Expectation herk(char uplo, char trans, QtbInt n, QtbInt k, Real<T> alpha, const T *a, QtbInt lda, Real<T> beta,
                 const T *c, QtbInt ldc) {
  return rank_k(true, uplo, trans, n, k, test::widen(alpha), a, lda, test::widen(beta), c, ldc);
}

// C := alpha*op(A)*op(B)^T + alpha*op(B)*op(A)^T + beta*C over a triangle; with hermitian the second alpha is
// conjugated and the transposes are too.
template <class T>
Expectation rank_2k(bool hermitian, char uplo, char trans, QtbInt n, QtbInt k, QuadComplex alpha, const T *a,
                    QtbInt lda, const T *b, QtbInt ldb, QuadComplex beta, const T *c, QtbInt ldc) {
  const Layout layout = triangle(uplo, n, ldc);
  const bool nothing_to_add = k == 0 || is_value(alpha, 0);
  if (n == 0 || (nothing_to_add && is_value(beta, 1))) return untouched(layout);
  std::vector<Term> sum;
  if (!nothing_to_add) {
    const bool plain = is_letter(trans, 'N');
    const Dense da = op(trans, read(plain ? full(n, k, lda) : full(k, n, lda), a));
    const Dense db = op(trans, read(plain ? full(n, k, ldb) : full(k, n, ldb), b));
    const char other = hermitian ? 'C' : 'T';
    sum.push_back({alpha, da, op(other, db)});
    sum.push_back({hermitian ? conjugate(alpha) : alpha, db, op(other, da)});
  }
  return update(layout, sum, beta, c, is_complex<T> ? static_cast<double>(4 * k + 4) : static_cast<double>(2 * k + 3),
                Outcome::value, hermitian);
}

template <class T>
Expectation syr2k(char uplo, char trans, QtbInt n, QtbInt k, T alpha, const T *a, QtbInt lda, const T *b, QtbInt ldb,
                  T beta, const T *c, QtbInt ldc) {
  return rank_2k(false, uplo, trans, n, k, test::widen(alpha), a, lda, b, ldb, test::widen(beta), c, ldc);
}

template <class T>
Expectation her2k(char uplo, char trans, QtbInt n, QtbInt k, T alpha, const T *a, QtbInt lda, const T *b, QtbInt ldb,
                  Real<T> beta, const T *c, QtbInt ldc) {
  return rank_2k(true, uplo, trans, n, k, test::widen(alpha), a, lda, b, ldb, test::widen(beta), c, ldc);
}

template <class T>
Expectation trmm(char side, char uplo, char transa, char diag, QtbInt m, QtbInt n, T alpha, const T *a, QtbInt lda,
                 const T *b, QtbInt ldb) {
  const Layout layout = full(m, n, ldb);
  const QuadComplex wide_alpha = test::widen(alpha);
  if (m == 0 || n == 0) return untouched(layout);
  const bool left = is_letter(side, 'L');
  const QtbInt order = left ? m : n;
  std::vector<Term> sum;
  if (!is_value(wide_alpha, 0)) {
    const Dense da = op(transa, read(triangle(uplo, order, lda), a, triangular(diag))), db = read(layout, b);
    sum.push_back({wide_alpha, left ? da : db, left ? db : da});
  }
  return update(layout, sum, {0, 0}, b, roundings<T>(order, 2, 4));
}

// b is what B held before the call, x what it holds afterwards; both have the leading dimension ldb.
template <class T>
Expectation trsm_residual(char side, char uplo, char transa, char diag, QtbInt m, QtbInt n, T alpha, const T *a,
                          QtbInt lda, const T *b, const T *x, QtbInt ldb) {
  const Layout layout = full(m, n, ldb);
  const QuadComplex wide_alpha = test::widen(alpha);
  if (m == 0 || n == 0) return untouched(layout);
  if (is_value(wide_alpha, 0)) return update(layout, {}, {0, 0}, b, 0);
  const bool left = is_letter(side, 'L');
  const QtbInt order = left ? m : n;
  const Dense da = op(transa, read(triangle(uplo, order, lda), a, triangular(diag))), dx = read(layout, x);
  Expectation e = update(layout, {{{1, 0}, left ? da : dx, left ? dx : da}}, negative(wide_alpha), b,
                         roundings<T>(order, 3, 16), Outcome::residual);
  e.alpha_magnitude = std::fmax(1, static_cast<double>(magnitude(wide_alpha)));
  return e;
}

}  // namespace qtb::reference
