// saxpy, daxpy, caxpy, zaxpy: y[i] := alpha * x[i] + y[i] over n elements.
//
// Increments in elements, of either sign or zero; addresses of any alignment; x and y must not overlap. An alpha that
// compares equal to zero, in both parts if complex, leaves y untouched, whatever x and y hold. An element's bits depend
// on the element alone, not on its place, the increments or the alignment.

#include "blas/kernels/level1/walk.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
struct Update {
  static constexpr bool gathers = true, updates = true;
  Factor<T> alpha;
  explicit Update(T a) : alpha(a) {}

  template <int k, class X, class Y>
  void vector(X &x, Y &y) {
    y.store(k, add(y.load(k), alpha.times(x.load(k))));
  }
  // A complex product is a chain of four instructions, and a load behind a store waits until that is known not to touch
  // it: two chains side by side, with all loads in front of both stores.
  template <int k, class X, class Y>
  requires(is_complex<T> &&this_tier >= tier_sse42) void two_vectors(X &x, Y &y) {
    const Vec<T> from_x[] = {x.load(k), x.load(k + 1)};
    const Vec<T> sum[] = {add(y.load(k), alpha.times(from_x[0])), add(y.load(k + 1), alpha.times(from_x[1]))};
    y.store(k, sum[0]);
    y.store(k + 1, sum[1]);
  }
  void single(const T *x, T *y) const {
    if constexpr (is_complex<T>)
      store_lowest(y, add(load_repeated(y), alpha.times(load_repeated(x))));
    else
      store_single(y, load_single(y) + alpha.value * load_single(x));
  }
};

template <Row row, class T>
void axpy(const QtbInt *n, const T *alpha, const T *x, const QtbInt *incx, T *y, const QtbInt *incy) {
  if (*n < 1 || is_zero(*alpha)) return;
  constexpr bool backward_is_contiguous = !is_complex<T> || backward_is_contiguous_in_dots;
  const bool contiguous = backward_is_contiguous ? same_unit(*incx, *incy) : both_one(*incx, *incy);
  elementwise<row, Update<T>>(contiguous, *n, x, *incx, y, *incy, alpha);
}

}  // namespace

QTB_KERNEL(saxpy, axpy, float, axpy<row_saxpy>)
QTB_KERNEL(daxpy, axpy, double, axpy<row_daxpy>)
QTB_KERNEL(caxpy, axpy, cfloat, axpy<row_caxpy>)
QTB_KERNEL(zaxpy, axpy, cdouble, axpy<row_zaxpy>)

}  // namespace qtb::QTB_TIER
