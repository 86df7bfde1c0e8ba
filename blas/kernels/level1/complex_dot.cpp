// cdotu, zdotu: the sum of x[i] * y[i]; cdotc, zdotc: of conj(x[i]) * y[i]. The element goes through result, which is
// also the value; zero for n below 1.
//
// Increments in elements, of either sign or zero; addresses of any alignment. No product is made element by element:
// two sets of accumulators sum plain lane products, and only their join at the end knows signs, so that the loops of
// the plain and the conjugated product are one. With x = (xr, xi), y = (yr, yi) the lanes of an element are
//
//                                      first set           second set
//   def, sse42, avx: x and swapped x   (xr yr, xi yi)      (xi yr, xr yi)
//   sse3, ssse3: duplicated parts      (xr yr, xr yi)      (xi yr, xi yi)

#include "blas/kernels/level1/dot.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
struct LaneProducts {
  static constexpr bool gathers = true, updates = false;
  Vec<T> first[4] = {zero<T>(), zero<T>(), zero<T>(), zero<T>()};
  Vec<T> second[4] = {zero<T>(), zero<T>(), zero<T>(), zero<T>()};

  template <int k>
  void add_products(Vec<T> for_first, Vec<T> for_second, Vec<T> y) {
    first[k] = add(first[k], mul(for_first, y));
    second[k] = add(second[k], mul(for_second, y));
    keep_in_place(first[k]);
    keep_in_place(second[k]);
  }
  // The operand of the second set is made first, as a copy: the products may then overwrite both.
  template <int k>
  void add_products(Vec<T> x, Vec<T> y) {
#if defined(__SSE3__)
    if constexpr (duplicates_parts) return add_products<k>(real_parts(x), imaginary_parts(x), y);
#endif
    Vec<T> swapped = swap_parts(x);
    keep_in_place(swapped);
    add_products<k>(x, swapped, y);
  }
  // Duplicating costs two shuffles, and a shuffle takes the place of an addition or a multiplication. A part loaded
  // from memory costs a load instead, or at least no copy: every other vector is loaded by parts, so that neither loads
  // nor arithmetic alone set the pace.
  template <int k, class X, class Y>
  void vector(X &x, Y &y) {
    constexpr bool by_parts = duplicates_parts && k % 2 == 0;
    Vec<T> from_y = y.load(k);
    keep_in_place(from_y);  // or each of the two products would load it
#if defined(__SSE3__)
    if constexpr (by_parts && requires { load_real_parts(x.at(k)); })
      return add_products<k % 4>(load_real_parts(x.at(k)), load_imaginary_parts(x.at(k)), from_y);
#endif
    Vec<T> from_x = x.load(k);
    if constexpr (!by_parts) keep_in_place(from_x);
    add_products<k % 4>(from_x, from_y);
  }
  void single(const T *x, const T *y) { add_products<0>(load_lowest(x), load_lowest(y)); }
};

// The sum of a vector's elements, in its lowest lanes; above, zeros.
inline __m128 sum_elements(__m128 v) { return sum_halves(v); }
inline __m128d sum_elements(__m128d v) { return v; }

// (a0 + a1, b0 + b1) in the lowest lanes.
inline __m128 add_neighbours(__m128 a, __m128 b) { return sum_elements(_mm_unpacklo_ps(a, b)); }
inline __m128d add_neighbours(__m128d a, __m128d b) { return _mm_add_pd(_mm_unpacklo_pd(a, b), _mm_unpackhi_pd(a, b)); }

// An element's lane sums become the element.
template <bool conjugate, class R, class V>
V join_parts(V first, V second) {
#if defined(__SSE3__)
  if constexpr (duplicates_parts) {
    if constexpr (conjugate) return swap_parts(add_subtract(swap_parts(first), second));
    return add_subtract(first, swap_parts(second));
  }
#endif
  // The sign bit turns xi yi, or xi yr if x is conjugated.
  if constexpr (conjugate)
    second = bit_xor(second, alternate(R(-0.0), R(0)));
  else
    first = bit_xor(first, alternate(R(0), R(-0.0)));
  return add_neighbours(first, second);
}

// One procedure for both products of a type: its loops are long.
template <Row row, bool contiguous, class T>
[[gnu::noinline]] Vec<T> sum_products(bool conjugate, QtbInt n, const T *x, QtbInt incx, const T *y, QtbInt incy) {
  Walk<const T, const T> walk{n, x, incx, y, incy};
  LaneProducts<T> products;
  passes<row, contiguous>(walk, products);
  single_passes<1>(walk, products);
  const Vec<T> first = sum_elements(join_accumulators(products.first));
  const Vec<T> second = sum_elements(join_accumulators(products.second));
  return conjugate ? join_parts<true, Real<T>>(first, second) : join_parts<false, Real<T>>(first, second);
}

template <Row row, bool conjugate, class T>
T *dot(T *result, const QtbInt *n, const T *x, const QtbInt *incx, const T *y, const QtbInt *incy) {
  Vec<T> value = zero<T>();
  if (*n > 0)
    value = dot_is_contiguous(*incx, *incy) ? sum_products<row, true>(conjugate, *n, x, 1, y, 1)
                                            : sum_products<row, false>(conjugate, *n, x, *incx, y, *incy);
  store_lowest(result, value);
  return result;
}

constexpr bool plain = false, conjugated = true;

}  // namespace

QTB_KERNEL(cdotu, cdot, cfloat, (dot<row_cdot, plain>))
QTB_KERNEL(cdotc, cdot, cfloat, (dot<row_cdot, conjugated>))
QTB_KERNEL(zdotu, cdot, cdouble, (dot<row_zdot, plain>))
QTB_KERNEL(zdotc, cdot, cdouble, (dot<row_zdot, conjugated>))

}  // namespace qtb::QTB_TIER
