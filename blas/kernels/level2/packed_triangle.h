// x := op(T)*x and x := op(T)^-1*x in place for a packed triangle: the body of tpmv and tpsv.
//
// Columns go in groups of four. Every column starts where the last one ended, so that a group needs no address but that
// of its first column.
#pragma once

#include "blas/kernels/level2/triangle_groups.h"

namespace qtb::QTB_TIER {
namespace {

// An upper column is one element longer than the last, a lower one shorter.
template <class T, bool is_upper>
struct PackedTriangle {
  static constexpr bool upper = is_upper;
  const T *origin;
  QtbInt n;

  QtbInt step(QtbInt j) const { return upper ? j + 1 : n - 1 - j; }
  const T *behind() const { return origin + (upper ? n * (n + 1) / 2 : n * (n - 1) / 2); }
  QtbInt begin(QtbInt j) const { return upper ? 0 : j + 1; }
  QtbInt end(QtbInt j) const { return upper ? j : n; }
  bool holds_group(int) const { return true; }
};

template <Task task, class T>
QTB_FUNCTION(tpmv, T, take_packed) {
  const Op op = read_op<T>(trans);
  const bool unit = is_letter(*diag, 'U');
  if (is_letter(*uplo, 'U'))
    take_triangle<task, 4>(PackedTriangle<T, true>{ap, *n}, op, unit, x, *incx);
  else
    take_triangle<task, 4>(PackedTriangle<T, false>{ap, *n}, op, unit, x, *incx);
}

}  // namespace
}  // namespace qtb::QTB_TIER
