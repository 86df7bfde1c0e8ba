// The diagonal kernels of TRSV and TRMV, in place for a small triangle with leading dimension lda. x is the first
// element of a vector of any increment but 0 and any address; a negative increment walks down from there.
//
// x := op(T)^-1*x for an order of at most 32: one kernel per type and case of the triangle,
// qtb_blas_<tier>_dtrsv_diag_<uplo><trans><diag>.
//
// x := op(T)*x for an order of at most 64: one kernel per type, qtb_blas_<tier>_dtrmv_diag.
#pragma once

#include "blas/kernels/element.h"

#define QTB_DIAGONAL_SOLVE_PARAMS(T) const QtbInt *n, const T *a, const QtbInt *lda, T *x, const QtbInt *incx

// X(T, prefix, case, uplo, op, diag) for each of the cases as the names spell them.
#define QTB_DIAGONAL_SOLVES_OF(X, T, prefix, letter, op) \
  X(T, prefix, u##letter##n, true, Op::op, false)        \
  X(T, prefix, u##letter##u, true, Op::op, true)         \
  X(T, prefix, l##letter##n, false, Op::op, false)       \
  X(T, prefix, l##letter##u, false, Op::op, true)
#define QTB_REAL_DIAGONAL_SOLVES(X, T, prefix)  \
  QTB_DIAGONAL_SOLVES_OF(X, T, prefix, n, none) \
  QTB_DIAGONAL_SOLVES_OF(X, T, prefix, t, transpose)
#define QTB_DIAGONAL_SOLVES(X)                       \
  QTB_REAL_DIAGONAL_SOLVES(X, float, s)              \
  QTB_REAL_DIAGONAL_SOLVES(X, double, d)             \
  QTB_REAL_DIAGONAL_SOLVES(X, cfloat, c)             \
  QTB_DIAGONAL_SOLVES_OF(X, cfloat, c, c, conjugate) \
  QTB_REAL_DIAGONAL_SOLVES(X, cdouble, z)            \
  QTB_DIAGONAL_SOLVES_OF(X, cdouble, z, c, conjugate)

namespace qtb::QTB_TIER {
extern "C" {
#define QTB_DECLARE(T, prefix, name, upper, op, unit) \
  QTB_HIDDEN void QTB_TIER_NAME(prefix##trsv_diag_##name)(QTB_DIAGONAL_SOLVE_PARAMS(T));
QTB_DIAGONAL_SOLVES(QTB_DECLARE)
#undef QTB_DECLARE

QTB_HIDDEN QTB_FUNCTION(trmv, float, QTB_TIER_NAME(strmv_diag));
QTB_HIDDEN QTB_FUNCTION(trmv, double, QTB_TIER_NAME(dtrmv_diag));
QTB_HIDDEN QTB_FUNCTION(trmv, cfloat, QTB_TIER_NAME(ctrmv_diag));
QTB_HIDDEN QTB_FUNCTION(trmv, cdouble, QTB_TIER_NAME(ztrmv_diag));
}

namespace {

constexpr QtbInt largest_diagonal_solve = 32, largest_diagonal_product = 64;

template <class T>
using DiagonalSolve = void(QTB_DIAGONAL_SOLVE_PARAMS(T));

template <class T, bool upper, Op op, bool unit>
struct DiagonalSolveOf;
#define QTB_CHOOSE(T, prefix, name, upper, op, unit)                                  \
  template <>                                                                         \
  struct DiagonalSolveOf<T, upper, op, unit> {                                        \
    static constexpr DiagonalSolve<T> *run = QTB_TIER_NAME(prefix##trsv_diag_##name); \
  };
QTB_DIAGONAL_SOLVES(QTB_CHOOSE)
#undef QTB_CHOOSE

template <class T, bool upper, Op op>
DiagonalSolve<T> *diagonal_solve(bool unit) {
  return unit ? DiagonalSolveOf<T, upper, op, true>::run : DiagonalSolveOf<T, upper, op, false>::run;
}
template <class T, bool upper>
DiagonalSolve<T> *diagonal_solve(Op op, bool unit) {
  if (op == Op::none) return diagonal_solve<T, upper, Op::none>(unit);
  if constexpr (is_complex<T>)
    if (op == Op::conjugate) return diagonal_solve<T, upper, Op::conjugate>(unit);
  return diagonal_solve<T, upper, Op::transpose>(unit);
}
template <class T>
DiagonalSolve<T> *diagonal_solve(bool upper, Op op, bool unit) {
  return upper ? diagonal_solve<T, true>(op, unit) : diagonal_solve<T, false>(op, unit);
}

}  // namespace
}  // namespace qtb::QTB_TIER
