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

// Columns with the elements of x that they meet. x counts from its first element; a call takes the vector's argument,
// which is its last element in memory order where the increment is negative.
template <class T, class Triangle>
struct ColumnCalls {
  Triangle t;
  LineVector<T> x;
  bool unit;

  static constexpr QtbInt one = 1;
  T *argument(QtbInt first, QtbInt rows) const { return x.start + (x.inc < 0 ? first + rows - 1 : first) * x.inc; }

  // x += factor * column j beside the diagonal.
  void add(QtbInt j, const T *column, T factor) const {
    const QtbInt first = t.begin(j), rows = t.end(j) - first;
    if (rows > 0) own_axpy(&rows, &factor, column + first, &one, argument(first, rows), &x.inc);
  }
  template <bool conjugated>
  T dot(QtbInt j, const T *column) const {
    const QtbInt first = t.begin(j), rows = t.end(j) - first;
    T sum{};
    if (rows > 0) own_dot<conjugated>(&sum, &rows, column + first, &one, argument(first, rows), &x.inc);
    return sum;
  }

  template <Task task, Op op>
  void take(QtbInt j, const T *column) const {
    constexpr bool conjugated = op == Op::conjugate;
    const auto diagonal = [&] { return conjugate_if<conjugated>(load_element(column + j)); };
    if constexpr (op == Op::none) {
      T own = x.get(j);
      if (is_zero(own)) return;
      if (task == Task::solve && !unit) own = quotient(own, diagonal());
      add(j, column, task == Task::solve ? -own : own);
      if (task == Task::product && !unit) own = own * diagonal();
      x.set(j, own);
    } else if constexpr (task == Task::product) {
      const T own = x.get(j);
      x.set(j, (unit ? own : diagonal() * own) + dot<conjugated>(j, column));
    } else {
      const T own = x.get(j) - dot<conjugated>(j, column);
      x.set(j, unit ? own : quotient(own, diagonal()));
    }
  }
};

template <Task task, Op op, class T, class Triangle>
[[gnu::noinline]] void call_columns(const Triangle &t, bool unit, const LineVector<T> &x) {
  const ColumnCalls<T, Triangle> calls{t, x, unit};
  for (QtbInt i = 0; i < t.n; ++i) {
    const QtbInt j = goes_forward<task, op, Triangle> ? i : t.n - 1 - i;
    calls.template take<task, op>(j, t.origin + j * t.along);
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
