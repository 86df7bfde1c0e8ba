// Triangular products and solves in place without packing:
//
//   trmm_unblocked    B := alpha*op(T)*B, or alpha*B*op(T)
//   trsm_unblocked    B := op(T)^-1*B, or B*op(T)^-1
//
// B is m x n with columns ldb apart, T stands in a with columns lda apart and does not overlap B. m and n may be 0. No
// alignment is asked for. The other triangle is never read, nor a unit diagonal, and no element of B meets one of T
// that is not stored: an infinity in B reaches only what it has a part in. A solve divides by the diagonal.
#pragma once

#include "blas/kernels/level3/triangular/form.h"

namespace qtb::QTB_TIER {
namespace {

// Element (l, e) of op(T).
template <class T>
T element_of(const TriForm &form, const T *a, QtbInt lda, QtbInt l, QtbInt e) {
  const T v = form.op == Op::none ? a[l + e * lda] : a[e + l * lda];
  return form.op == Op::conjugate ? conjugate(v) : v;
}

template <class T>
void trmm_unblocked(const TriForm &form, QtbInt m, QtbInt n, T alpha, const T *a, QtbInt lda, T *b, QtbInt ldb) {
  const QtbInt size = form.left ? m : n, others = form.left ? n : m;
  const QtbInt along = form.left ? 1 : ldb, across = form.left ? ldb : 1;
  const bool upper = is_upper(form);
  for (QtbInt s = 0; s < size; s++) {
    const QtbInt e = upper == form.left ? s : size - 1 - s;
    const QtbInt first = upper == form.left ? e + 1 : 0, end = upper == form.left ? size : e;
    for (QtbInt j = 0; j < others; j++) {
      T *x = b + j * across;
      T sum = form.unit ? x[e * along] : element_of(form, a, lda, e, e) * x[e * along];
      for (QtbInt l = first; l < end; l++)
        sum += (form.left ? element_of(form, a, lda, e, l) : element_of(form, a, lda, l, e)) * x[l * along];
      x[e * along] = is_one(alpha) ? sum : alpha * sum;
    }
  }
}

template <class T>
void trsm_unblocked(const TriForm &form, QtbInt m, QtbInt n, const T *a, QtbInt lda, T *b, QtbInt ldb) {
  const QtbInt size = form.left ? m : n, others = form.left ? n : m;
  const QtbInt along = form.left ? 1 : ldb, across = form.left ? ldb : 1;
  const bool upper = is_upper(form);
  for (QtbInt s = 0; s < size; s++) {
    const QtbInt e = upper == form.left ? size - 1 - s : s;
    const QtbInt first = upper == form.left ? e + 1 : 0, end = upper == form.left ? size : e;
    for (QtbInt j = 0; j < others; j++) {
      T *x = b + j * across;
      T rest = x[e * along];
      for (QtbInt l = first; l < end; l++)
        rest -= (form.left ? element_of(form, a, lda, e, l) : element_of(form, a, lda, l, e)) * x[l * along];
      x[e * along] = form.unit ? rest : rest / element_of(form, a, lda, e, e);
    }
  }
}

}  // namespace
}  // namespace qtb::QTB_TIER
