// sdot, ddot: the sum of x[i] * y[i] over n elements; 0 for n below 1.
//
// Increments in elements, of either sign or zero; addresses of any alignment. The products of vectors are added to four
// accumulators in rotation, so that their additions do not wait for each other. The order in which all is joined
// belongs to the tier: two tiers may differ in the last bits, one tier gives the same bits for the same alignment.

#include "blas/kernels/level1/dot.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
struct Products {
  static constexpr bool gathers = true, updates = false;
  Vec<T> sum[4] = {zero<T>(), zero<T>(), zero<T>(), zero<T>()};

  template <int k, class X, class Y>
  void vector(X &x, Y &y) {
    sum[k % 4] = add(sum[k % 4], mul(x.load(k), y.load(k)));
    keep_in_place(sum[k % 4]);
  }
  void single(const T *x, const T *y) { sum[0] = add_lowest(sum[0], mul_lowest(load_lowest(x), load_lowest(y))); }
};

template <class T>
struct SingleProducts {
  T sum;
  void single(const T *x, const T *y) { sum += load_single(x) * load_single(y); }
};

template <Row row, bool contiguous, class T>
[[gnu::noinline]] T sum_products(QtbInt n, const T *x, QtbInt incx, const T *y, QtbInt incy) {
  Walk<const T, const T> walk{n, x, incx, y, incy};
  Products<T> products;
  passes<row, contiguous>(walk, products);
  if constexpr (joining == in_pairs) {
    SingleProducts<T> rest{sum_lanes(join_accumulators(products.sum))};
    single_passes<1>(walk, rest);
    return rest.sum;
  } else {
    single_passes<1>(walk, products);
    return sum_lanes(join_accumulators(products.sum));
  }
}

template <Row row, class T>
T dot(const QtbInt *n, const T *x, const QtbInt *incx, const T *y, const QtbInt *incy) {
  if (*n < 1) return 0;
  if (dot_is_contiguous(*incx, *incy)) return sum_products<row, true>(*n, x, 1, y, 1);
  return sum_products<row, false>(*n, x, *incx, y, *incy);
}

}  // namespace

QTB_KERNEL(sdot, dot, float, dot<row_sdot>)
QTB_KERNEL(ddot, dot, double, dot<row_ddot>)

}  // namespace qtb::QTB_TIER
