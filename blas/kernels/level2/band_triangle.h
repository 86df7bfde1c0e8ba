// x := op(T)*x and x := op(T)^-1*x in place for a triangle with k diagonals beside the main one: the bodies of tbmv and
// tbsv.
//
//   take_band       every type: groups of columns, with the arithmetic inline
//   call_by_column  complex types: each column by the tier's dot product (T, C) or AXPY (N), on what it has in the band
#pragma once

#include "blas/kernels/level2/band_forms.h"
#include "blas/kernels/level2/triangle_groups.h"

namespace qtb::QTB_TIER {
namespace {

// The diagonals are the rows of the array: the main one is the last of an upper band and the first of a lower one, and
// origin is its first element.
template <class T, bool is_upper>
struct BandTriangle {
  static constexpr bool upper = is_upper;
  const T *origin;
  QtbInt n, along, k;

  BandTriangle(const T *a, QtbInt lda, QtbInt order, QtbInt diagonals)
      : origin(upper ? a + diagonals : a), n(order), along(lda - 1), k(diagonals) {}
  QtbInt step(QtbInt) const { return along; }
  const T *behind() const { return origin + n * along; }
  QtbInt begin(QtbInt j) const { return !upper ? j + 1 : j > k ? j - k : 0; }
  QtbInt end(QtbInt j) const { return upper ? j : k < n - j ? j + k + 1 : n; }
  bool holds_group(int columns) const { return k >= columns - 1; }
};

// By groups of size columns.
template <Task task, int size, class T>
QTB_FUNCTION(tbmv, T, take_band) {
  const Op op = read_op<T>(trans);
  const bool unit = is_letter(*diag, 'U');
  if (is_letter(*uplo, 'U'))
    take_triangle<task, size>(BandTriangle<T, true>(a, *lda, *n, *k), op, unit, x, *incx);
  else
    take_triangle<task, size>(BandTriangle<T, false>(a, *lda, *n, *k), op, unit, x, *incx);
}

// ---- The tier's vector routines ----

inline void own_axpy(QTB_PARAMS_axpy(cfloat)) { QTB_TIER_NAME(xcaxpy)(QTB_ARGS_axpy); }
inline void own_axpy(QTB_PARAMS_axpy(cdouble)) { QTB_TIER_NAME(xzaxpy)(QTB_ARGS_axpy); }
template <bool conjugated>
void own_dot(QTB_PARAMS_cdot(cfloat)) {
  conjugated ? QTB_TIER_NAME(xcdotc)(QTB_ARGS_cdot) : QTB_TIER_NAME(xcdotu)(QTB_ARGS_cdot);
}
template <bool conjugated>
void own_dot(QTB_PARAMS_cdot(cdouble)) {
  conjugated ? QTB_TIER_NAME(xzdotc)(QTB_ARGS_cdot) : QTB_TIER_NAME(xzdotu)(QTB_ARGS_cdot);
}

// A column's part beside the diagonal with the elements of x that it meets. A call takes the vector's argument, which
// is its last element where the increment is negative. Columns are short, so that addresses are kept from column to
// column, and nothing but those is kept across a call.
template <Task task, Op op, class T, class Triangle>
[[gnu::noinline]] void call_columns(const Triangle &t, bool unit, const LineVector<T> &x) {
  constexpr bool upper = Triangle::upper, forward = goes_forward<task, op, Triangle>, conjugated = op == Op::conjugate;
  constexpr QtbInt one = 1;
  const QtbInt first = forward ? 0 : t.n - 1, lda = t.along + 1;
  const QtbInt own_step = forward ? x.inc : -x.inc, diagonal_step = forward ? lda : -lda;
  T *own = x.start + first * x.inc;
  const T *diagonal = t.origin + first * lda;
  QtbInt room = forward == upper ? 0 : t.n - 1;  // rows of the matrix beside the diagonal
  for (QtbInt left = t.n; left > 0; --left) {
    const QtbInt rows = room < t.k ? room : t.k;
    const T *const beside = upper ? diagonal - rows : diagonal + 1;
    // The elements of x on these rows: the nearest one is next to the column's own.
    T *const nearest = upper ? own - x.inc : own + x.inc, *const farthest =
                                                              upper ? own - rows * x.inc : own + rows * x.inc;
    T *const argument = upper == (x.inc < 0) ? nearest : farthest;
    const auto of_diagonal = [&] { return conjugate_if<conjugated>(load_element(diagonal)); };
    if constexpr (op == Op::none) {
      T factor = load_element(own);
      if (!is_zero(factor)) {
        if constexpr (task == Task::product) {
          if (!unit) store_element(own, factor * of_diagonal());
        } else {
          if (!unit) store_element(own, factor = Divisor<T>(of_diagonal()).divide(factor));
          factor = -factor;
        }
        if (rows > 0) own_axpy(&rows, &factor, beside, &one, argument, &x.inc);
      }
    } else {
      T sum{};
      if (rows > 0) own_dot<conjugated>(&sum, &rows, beside, &one, argument, &x.inc);
      T value = load_element(own);
      if constexpr (task == Task::product) {
        if (!unit) value = of_diagonal() * value;
        value += load_element(&sum);
      } else {
        value -= load_element(&sum);
        if (!unit) value = Divisor<T>(of_diagonal()).divide(value);
      }
      store_element(own, value);
    }
    own += own_step;
    diagonal += diagonal_step;
    room += forward == upper ? 1 : -1;
  }
}

template <Task task, class T, class Triangle>
void call_columns(const Triangle &t, Op op, bool unit, T *x, QtbInt incx) {
  const LineVector<T> v = line_vector(x, t.n, incx);
  switch (op) {
    case Op::none: return call_columns<task, Op::none>(t, unit, v);
    case Op::transpose: return call_columns<task, Op::transpose>(t, unit, v);
    case Op::conjugate: return call_columns<task, Op::conjugate>(t, unit, v);
  }
}

template <Task task, class T>
QTB_FUNCTION(tbmv, T, call_by_column) {
  const Op op = read_op<T>(trans);
  const bool unit = is_letter(*diag, 'U');
  if (is_letter(*uplo, 'U'))
    call_columns<task>(BandTriangle<T, true>(a, *lda, *n, *k), op, unit, x, *incx);
  else
    call_columns<task>(BandTriangle<T, false>(a, *lda, *n, *k), op, unit, x, *incx);
}

// ---- The choice ----

template <BandRoutine routine>
bool takes_general_form(const char *uplo, const char *trans, QtbInt n, QtbInt k) {
  return takes_general_form(routine, this_tier, {is_letter(*uplo, 'U'), is_letter(*trans, 'N'), n, k});
}

}  // namespace
}  // namespace qtb::QTB_TIER

// Defines qtb_blas_<tier>_<name>_general and the slot's procedure, which chooses: qtb_blas_<tier>_x<name>.
#define QTB_BAND_KERNELS(name, T, task)                                                                             \
  extern "C" QTB_HIDDEN QTB_FUNCTION(tbmv, T, QTB_TIER_NAME(name##_general));                                       \
  extern "C" QTB_FUNCTION(tbmv, T, QTB_TIER_NAME(name##_general)) { return take_band<task, 1>(QTB_ARGS(tbmv)); }    \
  namespace {                                                                                                       \
  QTB_FUNCTION(tbmv, T, name##_by_form) {                                                                           \
    if (*n <= 0) return;                                                                                            \
    if constexpr (has_column_calls(this_tier))                                                                      \
      if (!takes_general_form<BandRoutine::name>(uplo, trans, *n, *k)) return call_by_column<task>(QTB_ARGS(tbmv)); \
    QTB_TIER_NAME(name##_general)(QTB_ARGS(tbmv));                                                                  \
  }                                                                                                                 \
  }                                                                                                                 \
  QTB_KERNEL(name, tbmv, T, name##_by_form)
