// Triangular products and solves from the right with a triangle of 1 to 8 columns, in place (small_right.cpp):
//
//   trmm_small_right    B := alpha*B*op(T)
//   trsm_small_right    B := B*op(T)^-1
//
// B is m x n with columns ldb apart, T stands in a with columns lda apart and does not overlap B. m may be 0, and
// alpha not. No alignment is asked for. Neither the other triangle nor a unit diagonal is read. A solve divides.
#pragma once

#include "blas/kernels/level3/gemm/parts.h"
#include "blas/kernels/level3/triangular/form.h"

namespace qtb::QTB_TIER {

// No slot has them. They have the arguments of trmm, of which a side is not looked at, nor an alpha in a solve.
#define QTB_DECLARE_SMALL_RIGHT(t, T)                                                 \
  extern "C" QTB_HIDDEN QTB_FUNCTION(trmm, T, QTB_TIER_NAME(x##t##trmm_small_right)); \
  extern "C" QTB_HIDDEN QTB_FUNCTION(trmm, T, QTB_TIER_NAME(x##t##trsm_small_right));
QTB_PARTS(QTB_DECLARE_SMALL_RIGHT)
#undef QTB_DECLARE_SMALL_RIGHT

namespace {

constexpr QtbInt most_small_columns = 8;

#define QTB_NAME_SMALL_RIGHT(t, T)                                                                                  \
  inline void trmm_small_right(const TriForm &form, QtbInt m, QtbInt n, T alpha, const T *a, QtbInt lda, T *b,      \
                               QtbInt ldb) {                                                                        \
    call_with_form(QTB_TIER_NAME(x##t##trmm_small_right), form, m, n, alpha, a, lda, b, ldb);                       \
  }                                                                                                                 \
  inline void trsm_small_right(const TriForm &form, QtbInt m, QtbInt n, const T *a, QtbInt lda, T *b, QtbInt ldb) { \
    call_with_form(QTB_TIER_NAME(x##t##trsm_small_right), form, m, n, T{}, a, lda, b, ldb);                         \
  }
QTB_PARTS(QTB_NAME_SMALL_RIGHT)
#undef QTB_NAME_SMALL_RIGHT

}  // namespace
}  // namespace qtb::QTB_TIER
