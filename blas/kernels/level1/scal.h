// sscal, dscal, cscal, zscal: x[i] := alpha * x[i] over n elements.
//
// Increments in elements, of either sign: a negative one touches the same elements as its absolute value. With a zero
// increment one element is multiplied n times. Addresses of any alignment. An alpha of zero multiplies like any other:
// NaN and infinity in x become NaN. Some tiers return at once for an alpha of one. An element's bits depend on the
// element alone.
#pragma once

#include "blas/kernels/level1/walk.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
struct Scaling {
  static constexpr bool gathers = true, updates = true;
  Factor<T> alpha;
  explicit Scaling(T a) : alpha(a) {}

  template <int k, class X, class Y>
  void vector(X &, Y &x) {
    x.store(k, alpha.times(x.load(k)));
  }
  void single(const T *, T *x) const {
    if constexpr (is_complex<T>)
      store_lowest(x, alpha.times(load_repeated(x)));
    else
      store_single(x, alpha.value * load_single(x));
  }
};

template <Row row, class T>
void scal(const QtbInt *n, const T *alpha, T *x, const QtbInt *incx) {
  if (*n < 1) return;
  if constexpr (returns_for_one<row>)
    if (is_one(*alpha)) return;
  const QtbInt inc = *incx < 0 ? -*incx : *incx;
  elementwise<row, Scaling<T>>(inc == 1, *n, x, inc, x, inc, alpha);
}

}  // namespace
}  // namespace qtb::QTB_TIER
