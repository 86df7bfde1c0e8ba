// Where a rectangle of op(A), op(B) or C begins in the caller's memory.
#pragma once

#include "blas/thread/32e/level3/gemm_plan.h"

namespace qtb {

template <class T>
struct GemmOperands {
  bool a_is_n, b_is_n;
  const T *a;
  QtbInt lda;
  const T *b;
  QtbInt ldb;
  T *c;
  QtbInt ldc;

  const T *a_at(QtbInt row, QtbInt depth) const { return a + (a_is_n ? row + depth * lda : depth + row * lda); }
  const T *b_at(QtbInt depth, QtbInt column) const {
    return b + (b_is_n ? depth + column * ldb : column + depth * ldb);
  }
  T *c_at(QtbInt row, QtbInt column) const { return c + row + column * ldc; }
};

template <class T>
GemmOperands<T> gemm_operands(const GemmPlan<T> *plan, const T *a, const QtbInt *lda, const T *b, const QtbInt *ldb,
                              T *c, const QtbInt *ldc) {
  return {plan->a_is_n, plan->b_is_n, a, *lda, b, *ldb, c, *ldc};
}

}  // namespace qtb
