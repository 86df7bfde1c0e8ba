// Sums of products of two rows with two rows, both of a chunk's copy: what an element of a rank-k update is made of.
//
// A sum has one vector of sums for real types; for complex ones two, of which the second one has the parts of one
// factor exchanged. Vectors are added one after the other along the depth, their lanes at the end.
#pragma once

#include "blas/kernels/level3/rank_k/chunk_copy.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
struct Sum {
  Vec<T> direct = zero<T>();
  void add_step(Vec<T> x, Vec<T> y, Vec<T>) { direct = add(direct, mul(x, y)); }
};
template <class R>
struct Sum<Complex<R>> {
  Vec<R> direct = zero<R>(), crossed = zero<R>();
  void add_step(Vec<R> x, Vec<R> y, Vec<R> y_exchanged) {
    direct = add(direct, mul(x, y));
    crossed = add(crossed, mul(x, y_exchanged));
  }
};

// What becomes of y: as it is, or its conjugate. The conjugate of a sum is the same with x and y in each other's place.
enum class Second { plain, conjugated, first_conjugated };

// Two elements side by side, in as many vectors as they need; lanes beyond them are zeros or a copy of one of them.
template <class T>
struct Pair {
  static constexpr int vectors = lanes<T> == 1 ? 2 : 1, in_vector = 2 / vectors;
  Vec<T> v[vectors];
};

inline Pair<float> totals(const Sum<float> &x, const Sum<float> &y, Second) {
  return {{neighbour_sums(neighbour_sums(x.direct, y.direct), zero<float>())}};
}
inline Pair<double> totals(const Sum<double> &x, const Sum<double> &y, Second) {
  return {{neighbour_sums(x.direct, y.direct)}};
}
inline Pair<cfloat> totals(const Sum<cfloat> &x, const Sum<cfloat> &y, Second second) {
  __m128 re, im;
  if (second == Second::plain) {
    re = neighbour_differences(x.direct, y.direct), im = neighbour_sums(x.crossed, y.crossed);
  } else {
    re = neighbour_sums(x.direct, y.direct), im = neighbour_differences(x.crossed, y.crossed);
    if (second == Second::conjugated) im = bit_xor(im, broadcast(-0.0F));
  }
  const __m128 parts = neighbour_sums(re, im);
  return {{_mm_shuffle_ps(parts, parts, _MM_SHUFFLE(3, 1, 2, 0))}};
}
inline __m128d total(const Sum<cdouble> &x, Second second) {
  const __m128d first = interleaved_low(x.direct, x.crossed), other = interleaved_high(x.direct, x.crossed);
  if (second == Second::plain) return add_subtract(first, other);
  const __m128d sign = alternate(0.0, -0.0);
  return second == Second::conjugated ? add(other, bit_xor(first, sign)) : add(first, bit_xor(other, sign));
}
inline Pair<cdouble> totals(const Sum<cdouble> &x, const Sum<cdouble> &y, Second second) {
  return {{total(x, second), total(y, second)}};
}

// f at each vector of a depth of so many vectors, four of them a turn. x and y are parts of rows.
template <class F>
[[gnu::always_inline]] inline void walk_depth(QtbInt vectors, F f) {
  constexpr int at_once = 4;
  QtbInt v = 0;
  for (; v + at_once <= vectors; v += at_once) repeat<at_once>([&](auto e) { f(v + e.value); });
  for (; v < vectors; v++) f(v);
}

// sum[i][j] of rows x + i and y + j of the copy.
template <class T>
struct SquareSums {
  Sum<T> sum[2][2];
  SquareSums(QtbInt vectors, const T *x, const T *y) {
    constexpr QtbInt ld = ChunkCopy<T>::depth;
    walk_depth(
        vectors, [&](QtbInt v) __attribute__((always_inline)) {
          const QtbInt l = v * lanes<T>;
          const Vec<T> x0 = load_aligned(x + l), x1 = load_aligned(x + l + ld);
          repeat<2>([&](auto j) {
            const Vec<T> y_j = load_aligned(y + l + j.value * ld), exchanged_j = is_complex<T> ? swap_parts(y_j) : y_j;
            sum[0][j.value].add_step(x0, y_j, exchanged_j);
            sum[1][j.value].add_step(x1, y_j, exchanged_j);
          });
        });
  }
};

// Of the square on the diagonal, rows x and x + 1 with themselves: (0, 0), (0, 1) and (1, 1).
template <class T>
struct TriangleSums {
  Sum<T> first, off, second;
  TriangleSums(QtbInt vectors, const T *x) {
    constexpr QtbInt ld = ChunkCopy<T>::depth;
    walk_depth(
        vectors, [&](QtbInt v) __attribute__((always_inline)) {
          const Vec<T> x0 = load_aligned(x + v * lanes<T>), x1 = load_aligned(x + v * lanes<T> + ld);
          const Vec<T> exchanged0 = is_complex<T> ? swap_parts(x0) : x0,
                       exchanged1 = is_complex<T> ? swap_parts(x1) : x1;
          first.add_step(x0, x0, exchanged0);
          off.add_step(x0, x1, exchanged1);
          second.add_step(x1, x1, exchanged1);
        });
  }
};

}  // namespace
}  // namespace qtb::QTB_TIER
