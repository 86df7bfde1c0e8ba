// A rank-k update as the kernels see it: C := alpha*op(A)*op(A)' + beta*C on one triangle of C.
//
// C is n x n with columns ldc apart. op(A) is n x k: A itself, or its transpose where A is stored k x n. ' is the
// transpose; of a Hermitian update it is the conjugate transpose, op(A) is A or the conjugate transpose of what is
// stored, and alpha and beta are real. A does not overlap C.
#pragma once

#include "blas/kernels/level3/gemm/tier_gemm.h"

namespace qtb::QTB_TIER {
namespace {

template <class T, bool hermitian>
struct FactorOf {
  using Type = T;
};
template <class T>
struct FactorOf<T, true> {
  using Type = Real<T>;
};

template <class T, bool is_hermitian>
struct RankK {
  static constexpr bool hermitian = is_hermitian;
  using Element = T;
  using Scalar = typename FactorOf<T, is_hermitian>::Type;

  bool upper, transposed;
  QtbInt n, k;
  Scalar alpha;
  const T *a;
  QtbInt lda;
  Scalar beta;
  T *c;
  QtbInt ldc;

  // Nothing to add: the triangle is scaled, and A not read.
  bool only_scales() const { return is_zero(alpha) || k <= 0; }
  // Row i of op(A), and element (i, j) of C.
  const T *row(QtbInt i) const { return transposed ? a + i * lda : a + i; }
  T *at(QtbInt i, QtbInt j) const { return c + i + j * ldc; }
  // The update of the triangle on count rows and columns of C from i0 on.
  RankK on_diagonal(QtbInt i0, QtbInt count) const {
    RankK part = *this;
    part.n = count, part.a = row(i0), part.c = at(i0, i0);
    return part;
  }
  // to := factor*to + alpha*op(A)*op(A)' over rows from i0 and columns from j0 on, a rectangle, by GEMM.
  void multiply(QtbInt i0, QtbInt rows, QtbInt j0, QtbInt columns, Scalar factor, T *to, QtbInt ldt) const {
    constexpr Op turned = hermitian ? Op::conjugate : Op::transpose;
    gemm(transposed ? turned : Op::none, transposed ? Op::none : turned, rows, columns, k, widened(alpha), row(i0), lda,
         row(j0), lda, widened(factor), to, ldt);
  }

 private:
  static T widened(Scalar v) {
    if constexpr (hermitian)
      return {v, 0};
    else
      return v;
  }
};

// The arguments of the shapes syrk and herk. Every other letter than T and C reads A as it is.
template <bool hermitian, class T, class S>
RankK<T, hermitian> rank_k(const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const S *alpha,
                           const T *a, const QtbInt *lda, const S *beta, T *c, const QtbInt *ldc) {
  return {
      is_letter(*uplo, 'U'), is_letter(*trans, 'T') || is_letter(*trans, 'C'), *n, *k, *alpha, a, *lda, *beta, c, *ldc};
}

}  // namespace
}  // namespace qtb::QTB_TIER
