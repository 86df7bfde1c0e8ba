// Sums of products over a depth, kept in registers: of a tile of some vectors by some columns, and of a dot product.
#pragma once

#include "blas/kernels/level3/gemm/small.h"

namespace qtb::QTB_TIER {
namespace {

// Elements in vector v of a tile: all of them are whole but the last one, which has last.
template <int vectors, int last, class T>
constexpr int count_of(int v) {
  return v + 1 < vectors ? static_cast<int>(lanes<T>) : last;
}

// The sums of a tile of vectors x columns: real products.
template <int vectors, int columns, int last, class T>
struct Sums {
  Vec<T> sum[vectors][columns];
  void clear() {
    repeat<vectors>([&](auto v) { repeat<columns>([&](auto e) { sum[v.value][e.value] = zero<T>(); }); });
  }
  void add_step(const T *x, const T *y, QtbInt by_element) {
    Vec<T> a[vectors];
    repeat<vectors>(
        [&](auto v) { a[v.value] = load_part<count_of<vectors, last, T>(v.value)>(x + v.value * lanes<T>); });
    repeat<columns>([&](auto e) {
      const Vec<T> b = broadcast(load_single(y + e.value * by_element));
      repeat<vectors>([&](auto v) { sum[v.value][e.value] = add(sum[v.value][e.value], mul(a[v.value], b)); });
    });
  }
  Vec<T> total(int v, int e, bool, bool) const { return sum[v][e]; }
};

// Complex products: x times the real part of y and x times the imaginary part are summed apart.
template <int vectors, int columns, int last, class R>
struct Sums<vectors, columns, last, Complex<R>> {
  using T = Complex<R>;
  Vec<T> by_re[vectors][columns], by_im[vectors][columns];
  void clear() {
    repeat<vectors>([&](auto v) {
      repeat<columns>([&](auto e) { by_re[v.value][e.value] = by_im[v.value][e.value] = zero<T>(); });
    });
  }
  void add_step(const T *x, const T *y, QtbInt by_element) {
    Vec<T> a[vectors];
    repeat<vectors>(
        [&](auto v) { a[v.value] = load_part<count_of<vectors, last, T>(v.value)>(x + v.value * lanes<T>); });
    repeat<columns>([&](auto e) {
      const R *b = parts(y + e.value * by_element);
      const Vec<T> re = broadcast(load_single(b)), im = broadcast(load_single(b + 1));
      repeat<vectors>([&](auto v) {
        by_re[v.value][e.value] = add(by_re[v.value][e.value], mul(a[v.value], re));
        by_im[v.value][e.value] = add(by_im[v.value][e.value], mul(a[v.value], im));
      });
    });
  }
  Vec<T> total(int v, int e, bool x_conjugated, bool y_conjugated) const {
    return join_products<T>(by_re[v][e], by_im[v][e], x_conjugated, y_conjugated);
  }
};

// Columns that are summed at once: enough sums to hide the latency of an addition, and as many as there are registers
// for beside two vectors.
template <class T>
constexpr int columns_at_once = is_complex<T> ? 2 : 4;

// ---- Dot products ----

// (a0, b0) and (a1, b1) of vectors whose complex elements are added up first, each filling a vector.
inline __m128 even_parts(__m128 a, __m128 b) {
  const __m128 low = _mm_unpacklo_ps(a, b), high = _mm_unpackhi_ps(a, b), sum = _mm_add_ps(low, high);
  return _mm_movelh_ps(sum, sum);
}
inline __m128 odd_parts(__m128 a, __m128 b) {
  const __m128 low = _mm_unpacklo_ps(a, b), high = _mm_unpackhi_ps(a, b), sum = _mm_add_ps(low, high);
  return _mm_movehl_ps(sum, sum);
}
inline __m128d even_parts(__m128d a, __m128d b) { return _mm_unpacklo_pd(a, b); }
inline __m128d odd_parts(__m128d a, __m128d b) { return _mm_unpackhi_pd(a, b); }

// Two sums of products along the depth: of x and y part by part, and for a complex type of x and y with its parts
// exchanged.
template <class T>
struct DotSum {
  Vec<T> direct = zero<T>(), crossed = zero<T>();
  void add_step(Vec<T> x, Vec<T> y, Vec<T> y_crossed) {
    direct = add(direct, mul(x, y));
    if constexpr (is_complex<T>) crossed = add(crossed, mul(x, y_crossed));
  }
  // The dot product, filling a vector.
  Vec<T> total(bool x_conjugated) const {
    if constexpr (!is_complex<T>) {
      return broadcast(sum_lanes(direct));
    } else {
      const Real<T> negative = -Real<T>{0}, none = 0;
      const Vec<T> sign = x_conjugated ? alternate(none, negative) : alternate(negative, none);
      return add(even_parts(direct, crossed), bit_xor(sign, odd_parts(direct, crossed)));
    }
  }
};

}  // namespace
}  // namespace qtb::QTB_TIER
