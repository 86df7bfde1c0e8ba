// What the forms of the small path share: operands as they see them, parts of vectors, and what becomes of a sum in C.
//
// A form works along vectors: of the rows of C, or of its columns where these are what lies side by side in the operand
// that it loads by vector. Lanes beyond the elements in question hold zeros.
#pragma once

#include "blas/kernels/element.h"
#include "blas/kernels/level3/gemm/family.h"
#include "blas/kernels/simd/repeat.h"

namespace qtb::QTB_TIER {
namespace {

// beta*C + alpha*sum, by vector.
template <class T>
struct Finish {
  Factor<T> alpha, beta;
  bool reads_c, scales_c;
  Finish(T a, T b) : alpha(a), beta(b), reads_c(!is_zero(b)), scales_c(!is_one(b)) {}
  template <class Load>
  Vec<T> operator()(Vec<T> sum, Load load_c) const {
    Vec<T> v = alpha.times(sum);
    if (!reads_c) return add(zero<T>(), v);  // what is added to a C of zeros: never -0
    const Vec<T> old = load_c();
    return add(scales_c ? beta.times(old) : old, v);
  }
};

// count elements of a vector, zeros in the other lanes, and their store; steps of inc apart for the store of a row.
template <int count, class T>
Vec<T> load_part(const T *p) {
  if constexpr (count == lanes<T>) {
    return load_unaligned(p);
  } else if constexpr (count == 1) {
    return load_lowest(p);
  } else {
    const __m128 pair = _mm_castpd_ps(load_lowest(reinterpret_cast<const double *>(p)));
    if constexpr (count == 2)
      return pair;
    else
      return _mm_movelh_ps(pair, load_lowest(p + 2));
  }
}
template <int count, class T>
void store_part(T *p, Vec<T> v) {
  if constexpr (count == lanes<T>) {
    store_unaligned(p, v);
  } else if constexpr (count == 1) {
    store_lowest(p, v);
  } else {
    store_lowest(reinterpret_cast<double *>(p), _mm_castps_pd(v));
    if constexpr (count == 3) store_lowest(p + 2, _mm_movehl_ps(v, v));
  }
}
template <int count, class T>
Vec<T> gather_part(const T *p, QtbInt inc) {
  if constexpr (count == 1) {
    return load_lowest(p);
  } else if constexpr (count == lanes<T>) {
    return gather(p, inc);
  } else {
    const __m128 pair = _mm_unpacklo_ps(load_lowest(p), load_lowest(p + inc));
    if constexpr (count == 2)
      return pair;
    else
      return _mm_movelh_ps(pair, load_lowest(p + 2 * inc));
  }
}
template <int count, class T>
void scatter_part(T *p, QtbInt inc, Vec<T> v) {
  if constexpr (count == 1) {
    store_lowest(p, v);
  } else if constexpr (lanes<T> == 4) {
    store_lowest(p, v);
    store_lowest(p + inc, _mm_shuffle_ps(v, v, 1));
    if constexpr (count > 2) store_lowest(p + 2 * inc, _mm_shuffle_ps(v, v, 2));
    if constexpr (count > 3) store_lowest(p + 3 * inc, _mm_shuffle_ps(v, v, 3));
  } else {
    scatter(p, inc, v);
  }
}

// An operand whose elements along the vector lie side by side: element (v, l) at x[v + l*ld].
template <class T>
struct SideBySide {
  const T *x;
  QtbInt ld;
  bool conjugated;
};
// The other operand, element by element: (l, e) at y[l*by_depth + e*by_element].
template <class T>
struct ByElement {
  const T *y;
  QtbInt by_depth, by_element;
  bool conjugated;
};
// C, from the tile's first element: (v, e) at c[v*along + e*across]; along is 1 unless C is written by rows.
template <class T>
struct Target {
  T *c;
  QtbInt along, across;
};

// The parts of complex products whose signs conjugation changes. Sums of products of x with the real parts of y and
// with its imaginary parts become (x.re*y.re - x.im*y.im, x.im*y.re + x.re*y.im).
template <class T>
Vec<T> join_products(Vec<T> by_re, Vec<T> by_im, bool x_conjugated, bool y_conjugated) {
  const Real<T> negative = -Real<T>{0}, none = 0;
  const Vec<T> first = alternate(none, x_conjugated ? negative : none);
  const Vec<T> second = alternate(x_conjugated == y_conjugated ? negative : none, y_conjugated ? negative : none);
  return add(bit_xor(first, by_re), bit_xor(second, swap_parts(by_im)));
}

// f(Constant<i>()) for an i from 1 to most.
template <int most, class F>
[[gnu::always_inline]] inline void with_count(QtbInt i, F &&f) {
  if constexpr (most > 1)
    if (i < most) return with_count<most - 1>(i, f);
  f(Constant<most>());
}

}  // namespace
}  // namespace qtb::QTB_TIER
