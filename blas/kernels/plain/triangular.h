// x := op(T)*x and x := op(T)^-1*x in place for a triangle: the core of trmm and trsm from the left.
//
// V is anything that x[i] reads and writes an element of. A column of T is either scattered, with N (the element of its
// number updates the others), or gathered, with T and C (the others go into the element of its number); the columns are
// taken in the order in which an element is used before it is overwritten. A zero element scatters nothing: its column
// is not read, nor, in a solve, its diagonal. A unit diagonal is never read.
#pragma once

#include "blas/kernels/plain/storage.h"

namespace qtb::QTB_TIER {
namespace {

template <bool conjugated, class T, class V>
void gather_product(Triangle<const T> t, bool unit, V x) {
  for (QtbInt s = 0; s < t.n; s++) {
    const QtbInt j = t.upper ? t.n - 1 - s : s;
    const T *column = t.column(j);
    T sum = unit ? x[j] : conjugate_if<conjugated>(column[j]) * x[j];
    for (QtbInt i = t.off_begin(j); i < t.off_end(j); i++) sum += conjugate_if<conjugated>(column[i]) * x[i];
    x[j] = sum;
  }
}

template <class T, class V>
void triangular_product(Triangle<const T> t, Op op, bool unit, V x) {
  if (op == Op::transpose) return gather_product<false>(t, unit, x);
  if (op == Op::conjugate) return gather_product<true>(t, unit, x);
  for (QtbInt s = 0; s < t.n; s++) {
    const QtbInt j = t.upper ? s : t.n - 1 - s;
    const T *column = t.column(j);
    const T factor = x[j];
    if (is_zero(factor)) continue;
    for (QtbInt i = t.off_begin(j); i < t.off_end(j); i++) x[i] += factor * column[i];
    if (!unit) x[j] = factor * column[j];
  }
}

template <bool conjugated, class T, class V>
void gather_solve(Triangle<const T> t, bool unit, V x) {
  for (QtbInt s = 0; s < t.n; s++) {
    const QtbInt j = t.upper ? s : t.n - 1 - s;
    const T *column = t.column(j);
    T rest = x[j];
    for (QtbInt i = t.off_begin(j); i < t.off_end(j); i++) rest -= conjugate_if<conjugated>(column[i]) * x[i];
    x[j] = unit ? rest : rest / conjugate_if<conjugated>(column[j]);
  }
}

template <class T, class V>
void triangular_solve(Triangle<const T> t, Op op, bool unit, V x) {
  if (op == Op::transpose) return gather_solve<false>(t, unit, x);
  if (op == Op::conjugate) return gather_solve<true>(t, unit, x);
  for (QtbInt s = 0; s < t.n; s++) {
    const QtbInt j = t.upper ? t.n - 1 - s : s;
    const T *column = t.column(j);
    if (is_zero(x[j])) continue;
    const T factor = unit ? x[j] : x[j] / column[j];
    x[j] = factor;
    for (QtbInt i = t.off_begin(j); i < t.off_end(j); i++) x[i] -= factor * column[i];
  }
}

}  // namespace
}  // namespace qtb::QTB_TIER
