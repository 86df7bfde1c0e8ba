// Triangular products and solves from the right with a triangle of 1 to 8 columns, in place:
//
//   trmm_small_right    B := alpha*B*op(T)
//   trsm_small_right    B := B*op(T)^-1
//
// B is m x n with columns ldb apart, T stands in a with columns lda apart and does not overlap B. m may be 0. No
// alignment is asked for. The other triangle is never read, nor a unit diagonal. A solve divides by the diagonal.
#pragma once

#include "blas/kernels/level3/triangular/unblocked.h"

namespace qtb::QTB_TIER {
namespace {

constexpr QtbInt most_small_columns = 8;

template <class T>
void trmm_small_right(const TriForm &form, QtbInt m, QtbInt n, T alpha, const T *a, QtbInt lda, T *b, QtbInt ldb) {
  trmm_unblocked(form, m, n, alpha, a, lda, b, ldb);
}

template <class T>
void trsm_small_right(const TriForm &form, QtbInt m, QtbInt n, const T *a, QtbInt lda, T *b, QtbInt ldb) {
  trsm_unblocked(form, m, n, a, lda, b, ldb);
}

}  // namespace
}  // namespace qtb::QTB_TIER
