// Sums of products of rows of a chunk's copy with rows of it: what the elements of a rank-k update are made of.
//
// Products are taken two rows by two, of real types four by two at once, which is as many sums as there are registers
// for. A sum has one vector of sums for real types; for complex ones two, of which the second one has the parts of one
// factor exchanged. Vectors are added one after the other along the depth, their lanes at the end.
#pragma once

#include "blas/kernels/level3/rank_k/chunk_copy.h"

namespace qtb::QTB_TIER {
namespace {

// Rows whose sums are taken at once.
template <class T>
constexpr int rows_at_once = is_complex<T> ? 2 : 4;

template <class T>
struct Sum {
  Vec<T> direct = zero<T>();
  void add_step(Vec<T> x, Vec<T> y, Vec<T>) {
    direct = add(direct, mul(x, y));
    keep_in_place(direct);
  }
};
template <class R>
struct Sum<Complex<R>> {
  Vec<R> direct = zero<R>(), crossed = zero<R>();
  void add_step(Vec<R> x, Vec<R> y, Vec<R> y_exchanged) {
    direct = add(direct, mul(x, y));
    crossed = add(crossed, mul(x, y_exchanged));
    keep_in_place(direct);
    keep_in_place(crossed);
  }
};

// f(l) at each vector of a depth of so many vectors, l its first element, four of them a turn.
template <class T, class F>
[[gnu::always_inline]] inline void walk_depth(QtbInt vectors, F f) {
  constexpr int at_once = 4;
  QtbInt l = 0;
  for (; vectors >= at_once; vectors -= at_once, l += at_once * lanes<T>)
    repeat<at_once>([&](auto v) __attribute__((always_inline)) { f(l + v.value * lanes<T>); });
  for (; vectors > 0; vectors--, l += lanes<T>) f(l);
}

template <class T>
[[gnu::always_inline]] inline Vec<T> exchanged_if_complex(Vec<T> v) {
  if constexpr (is_complex<T>)
    return swap_parts(v);
  else
    return v;
}

// sum[i][j] of rows x + i and y + j of the copy.
template <class T, int rows>
struct TileSums {
  Sum<T> sum[rows][2];
};
template <class T, int rows>
[[gnu::always_inline]] inline TileSums<T, rows> sum_tile(QtbInt vectors, const T *x, const T *y) {
  constexpr QtbInt ld = ChunkCopy<T>::depth;
  TileSums<T, rows> s;
  walk_depth<T>(
      vectors, [&](QtbInt l) __attribute__((always_inline)) {
        const Vec<T> y0 = load_aligned(y + l), y1 = load_aligned(y + l + ld);
        const Vec<T> exchanged0 = exchanged_if_complex<T>(y0), exchanged1 = exchanged_if_complex<T>(y1);
        repeat<rows>([&](auto i) __attribute__((always_inline)) {
          const Vec<T> x_i = load_aligned(x + l + i.value * ld);
          s.sum[i.value][0].add_step(x_i, y0, exchanged0);
          s.sum[i.value][1].add_step(x_i, y1, exchanged1);
        });
      });
  return s;
}

// Of the tile on the diagonal, rows x + i with x + j: sum[i][j] for i up to j. The others are not made.
template <class T, int rows>
struct TriangleSums {
  Sum<T> sum[rows][rows];
};
template <class T, int rows>
[[gnu::always_inline]] inline TriangleSums<T, rows> sum_triangle(QtbInt vectors, const T *x) {
  constexpr QtbInt ld = ChunkCopy<T>::depth;
  TriangleSums<T, rows> s;
  walk_depth<T>(
      vectors, [&](QtbInt l) __attribute__((always_inline)) {
        Vec<T> row[rows];
        repeat<rows>([&](auto i) __attribute__((always_inline)) { row[i.value] = load_aligned(x + l + i.value * ld); });
        repeat<rows>([&](auto j) __attribute__((always_inline)) {
          const Vec<T> exchanged_j = exchanged_if_complex<T>(row[j.value]);
          repeat<j.value + 1>([&](auto i) __attribute__((always_inline)) {
            s.sum[i.value][j.value].add_step(row[i.value], row[j.value], exchanged_j);
          });
        });
      });
  return s;
}

// What becomes of y in the product of x and y, or of x: the conjugate of a sum is that with the other one conjugated.
enum class Conjugated { none, second, first };

// Sums side by side, as many as fill a vector.
inline __m128 totals(const Sum<float> (&s)[4], Conjugated) {
  return neighbour_sums(neighbour_sums(s[0].direct, s[1].direct), neighbour_sums(s[2].direct, s[3].direct));
}
inline __m128d totals(const Sum<double> (&s)[2], Conjugated) { return neighbour_sums(s[0].direct, s[1].direct); }
inline __m128 totals(const Sum<cfloat> (&s)[2], Conjugated conjugated) {
  __m128 re, im;
  if (conjugated == Conjugated::none) {
    re = neighbour_differences(s[0].direct, s[1].direct), im = neighbour_sums(s[0].crossed, s[1].crossed);
  } else {
    re = neighbour_sums(s[0].direct, s[1].direct), im = neighbour_differences(s[0].crossed, s[1].crossed);
    if (conjugated == Conjugated::second) im = bit_xor(im, broadcast(-0.0F));
  }
  const __m128 parts = neighbour_sums(re, im);
  return _mm_shuffle_ps(parts, parts, _MM_SHUFFLE(3, 1, 2, 0));
}
inline __m128d totals(const Sum<cdouble> (&s)[1], Conjugated conjugated) {
  const __m128d re_im = interleaved_low(s[0].direct, s[0].crossed), im_re = interleaved_high(s[0].direct, s[0].crossed);
  if (conjugated == Conjugated::none) return add_subtract(re_im, im_re);
  const __m128d sign = alternate(0.0, -0.0);
  return conjugated == Conjugated::second ? add(im_re, bit_xor(re_im, sign)) : add(re_im, bit_xor(im_re, sign));
}

}  // namespace
}  // namespace qtb::QTB_TIER
