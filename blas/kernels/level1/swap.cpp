// sswap, dswap, cswap, zswap: x[i] and y[i] change places over n elements, bit for bit.
//
// Increments in elements, of either sign or zero; addresses of any alignment; x and y must not overlap.

#include "blas/kernels/level1/walk.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
struct Exchange {
  static constexpr bool gathers = false, updates = true;
  template <int k, class X, class Y>
  void vector(X &x, Y &y) const {
    const Vec<T> from_x = x.load(k), from_y = y.load(k);
    x.store(k, from_y);
    y.store(k, from_x);
  }
  void single(T *x, T *y) const {
    const auto from_x = load_bits(x), from_y = load_bits(y);
    store_bits(x, from_y);
    store_bits(y, from_x);
  }
};

template <Row row, class T>
void swap(const QtbInt *n, T *x, const QtbInt *incx, T *y, const QtbInt *incy) {
  if (*n < 1) return;
  elementwise<row, Exchange<T>>(same_unit(*incx, *incy), *n, x, *incx, y, *incy);
}

// Elements as wide as a vector: side by side they are twice as many doubles, from the tier on whose dswap gains by it.
template <Row row, auto real_swap, class T>
void complex_swap(const QtbInt *n, T *x, const QtbInt *incx, T *y, const QtbInt *incy) {
  if (*n < 1) return;
  if (this_tier >= tier_ssse3 && both_one(*incx, *incy)) {
    const QtbInt part_count = 2 * *n, one = 1;
    real_swap(&part_count, parts(x), &one, parts(y), &one);
    return;
  }
  swap<row>(n, x, incx, y, incy);
}

}  // namespace

QTB_KERNEL(sswap, swap, float, swap<row_sswap>)
QTB_KERNEL(dswap, swap, double, swap<row_dswap>)
QTB_KERNEL(cswap, swap, cfloat, swap<row_cswap>)
QTB_KERNEL(zswap, swap, cdouble, (complex_swap<row_zswap, QTB_TIER_NAME(xdswap)>))

}  // namespace qtb::QTB_TIER
