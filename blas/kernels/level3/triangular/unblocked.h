// Triangular products and solves in place without packing (unblocked.cpp):
//
//   trmm_unblocked    B := alpha*op(T)*B, or alpha*B*op(T)
//   trsm_unblocked    B := op(T)^-1*B, or B*op(T)^-1
//
// B is m x n with columns ldb apart, T stands in a with columns lda apart and does not overlap B. m and n may be 0,
// alpha not. No alignment is asked for. The other triangle is never read, nor a unit diagonal, and no element of B
// meets one of T that is not stored: an infinity in B reaches only what it has a part in. A solve divides truly.
#pragma once

#include "blas/kernels/level3/gemm/parts.h"
#include "blas/kernels/level3/triangular/form.h"

namespace qtb::QTB_TIER {

// No slot has them. They have the arguments of trmm; a solve does not look at alpha.
#define QTB_DECLARE_UNBLOCKED(t, T)                                                 \
  extern "C" QTB_HIDDEN QTB_FUNCTION(trmm, T, QTB_TIER_NAME(x##t##trmm_unblocked)); \
  extern "C" QTB_HIDDEN QTB_FUNCTION(trmm, T, QTB_TIER_NAME(x##t##trsm_unblocked));
QTB_PARTS(QTB_DECLARE_UNBLOCKED)
#undef QTB_DECLARE_UNBLOCKED

namespace {

#define QTB_NAME_UNBLOCKED(t, T)                                                                                  \
  inline void trmm_unblocked(const TriForm &form, QtbInt m, QtbInt n, T alpha, const T *a, QtbInt lda, T *b,      \
                             QtbInt ldb) {                                                                        \
    call_with_form(QTB_TIER_NAME(x##t##trmm_unblocked), form, m, n, alpha, a, lda, b, ldb);                       \
  }                                                                                                               \
  inline void trsm_unblocked(const TriForm &form, QtbInt m, QtbInt n, const T *a, QtbInt lda, T *b, QtbInt ldb) { \
    call_with_form(QTB_TIER_NAME(x##t##trsm_unblocked), form, m, n, T{}, a, lda, b, ldb);                         \
  }
QTB_PARTS(QTB_NAME_UNBLOCKED)
#undef QTB_NAME_UNBLOCKED

}  // namespace
}  // namespace qtb::QTB_TIER
