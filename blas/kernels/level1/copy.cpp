// scopy, dcopy, ccopy, zcopy: y[i] := x[i] over n elements, bit for bit.
//
// Increments in elements, of either sign or zero; addresses of any alignment; x and y must not overlap. A zero incy
// leaves the last element of the walk. Complex elements side by side are twice as many real ones.

#include "blas/kernels/level1/walk.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
struct Move {
  static constexpr bool gathers = false, updates = false;
  template <int k, class X, class Y>
  void vector(X &x, Y &y) const {
    y.store(k, x.load(k));
  }
  void single(const T *x, T *y) const { store_bits(y, load_bits(x)); }
};

template <Row row, class T>
void copy(const QtbInt *n, const T *x, const QtbInt *incx, T *y, const QtbInt *incy) {
  if (*n < 1) return;
  elementwise<row, Move<T>>(same_unit(*incx, *incy), *n, x, *incx, y, *incy);
}

template <auto real_copy, class T>
void complex_copy(const QtbInt *n, const T *x, const QtbInt *incx, T *y, const QtbInt *incy) {
  if (*n < 1) return;
  if (both_one(*incx, *incy)) {
    const QtbInt part_count = 2 * *n, one = 1;
    real_copy(&part_count, parts(x), &one, parts(y), &one);
    return;
  }
  Walk<const T, T> walk{*n, walk_start(x, *n, *incx), *incx, walk_start(y, *n, *incy), *incy};
  Move<T> move;
  single_passes<1>(walk, move);
}

}  // namespace

QTB_KERNEL(scopy, copy, float, copy<row_scopy>)
QTB_KERNEL(dcopy, copy, double, copy<row_dcopy>)
QTB_KERNEL(ccopy, copy, cfloat, complex_copy<QTB_TIER_NAME(xscopy)>)
QTB_KERNEL(zcopy, copy, cdouble, complex_copy<QTB_TIER_NAME(xdcopy)>)

}  // namespace qtb::QTB_TIER
