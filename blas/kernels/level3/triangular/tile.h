// Tiles: four rows of a strip of B or of a packed triangle, in registers.
//
// A strip is some columns of B, or some of its rows where the triangle stands on the right: what a triangle acts on
// independently. A tile has four of the elements along the triangle, its rows here, by as many across as fill some
// vectors. Complex tiles hold the real and the imaginary parts in vectors of their own, so that their products need no
// shuffle; in memory, outside of B, a row of a tile is its real parts and then its imaginary ones.
#pragma once

#include "blas/kernels/element.h"
#include "blas/kernels/simd/lanes.h"
#include "blas/kernels/simd/repeat.h"

namespace qtb::QTB_TIER {
namespace {

constexpr QtbInt tile_rows = 4;

template <class T>
constexpr int planes = is_complex<T> ? 2 : 1;

// Vectors of each plane in a row of a tile that is width elements wide.
template <class T, int width>
constexpr int row_vectors = width / static_cast<int>(lanes<Real<T>>);

// Numbers in a row of a tile in memory.
template <class T, int width>
constexpr QtbInt row_length = planes<T> *width;

template <class T, int width>
struct Tile {
  Vec<T> v[tile_rows][planes<T>][row_vectors<T, width>];
};

// f(row, plane, vector) for each vector of a tile, by constants.
template <class T, int width, class F>
[[gnu::always_inline]] inline void each_vector(F f) {
  repeat<tile_rows>([&](auto r) __attribute__((always_inline)) {
    repeat<planes<T>>([&](auto p) __attribute__((always_inline)) {
      repeat<row_vectors<T, width>>([&](auto i) { f(r, p, i); });
    });
  });
}

template <class T, int width>
[[gnu::always_inline]] inline Tile<T, width> zero_tile() {
  Tile<T, width> t;
  each_vector<T, width>([&](auto row, auto plane, auto vector) __attribute__((always_inline)) {
    t.v[decltype(row)::value][decltype(plane)::value][decltype(vector)::value] = zero<T>();
  });
  return t;
}

// Rows become columns: as many vectors as one has lanes.
inline void transpose(__m128 (&x)[4]) { _MM_TRANSPOSE4_PS(x[0], x[1], x[2], x[3]); }
inline void transpose(__m128d (&x)[2]) {
  const __m128d low = interleaved_low(x[0], x[1]);
  x[1] = interleaved_high(x[0], x[1]);
  x[0] = low;
}
inline void transpose(__m128 (&x)[2]) {
  __m128d pairs[2] = {_mm_castps_pd(x[0]), _mm_castps_pd(x[1])};
  transpose(pairs);
  x[0] = _mm_castpd_ps(pairs[0]), x[1] = _mm_castpd_ps(pairs[1]);
}
inline void transpose(__m128d (&)[1]) {}

// Two vectors of complex elements as their real and their imaginary parts, and back.
inline void split(__m128 &x, __m128 &y) {
  const __m128 re = _mm_shuffle_ps(x, y, 0x88);
  y = _mm_shuffle_ps(x, y, 0xDD);
  x = re;
}
inline void split(__m128d &x, __m128d &y) {
  const __m128d re = interleaved_low(x, y);
  y = interleaved_high(x, y);
  x = re;
}
template <class V>
inline void unite(V &x, V &y) {
  const V low = interleaved_low(x, y);
  y = interleaved_high(x, y);
  x = low;
}

// Complex rows from vectors of elements into planes, and back.
template <class T, int width>
[[gnu::always_inline]] inline void split_rows(Tile<T, width> &t) {
  if constexpr (is_complex<T>)
    repeat<tile_rows>([&](auto row) __attribute__((always_inline)) {
      constexpr int r = decltype(row)::value;
      auto &v = t.v[r];
      if constexpr (row_vectors<T, width> == 1) {
        split(v[0][0], v[1][0]);
      } else {
        split(v[0][0], v[0][1]);
        split(v[1][0], v[1][1]);
        const Vec<T> first_im = v[0][1];
        v[0][1] = v[1][0];
        v[1][0] = first_im;
      }
    });
}
template <class T, int width>
[[gnu::always_inline]] inline void unite_rows(Tile<T, width> &t) {
  static_assert(!is_complex<T> || row_vectors<T, width> == 1);
  if constexpr (is_complex<T>)
    repeat<tile_rows>([&](auto row) __attribute__((always_inline)) {
      constexpr int r = decltype(row)::value;
      unite(t.v[r][0][0], t.v[r][1][0]);
    });
}

// Every element times alpha.
template <class T, int width>
[[gnu::always_inline]] inline void scale_tile(Tile<T, width> &t, T alpha) {
  repeat<static_cast<int>(tile_rows)>([&](auto row) __attribute__((always_inline)) {
    auto &v = t.v[decltype(row)::value];
    repeat<row_vectors<T, width>>([&](auto vector) __attribute__((always_inline)) {
      constexpr int i = decltype(vector)::value;
      const Vec<T> x = v[0][i], re = broadcast(real_part(alpha));
      v[0][i] = mul(re, x);
      if constexpr (is_complex<T>) {
        const Vec<T> y = v[1][i], im = broadcast(alpha.im);
        v[0][i] = sub(v[0][i], mul(im, y));
        v[1][i] = add(mul(re, y), mul(im, x));
      }
    });
  });
}

// A tile of a matrix: element (r, c) at x[r + c*ld] if transposed, which is a tile whose rows lie across the columns of
// the matrix; otherwise at x[c + r*ld].
template <bool transposed, int width, class T>
[[gnu::always_inline]] inline Tile<T, width> load_tile(const T *x, QtbInt ld) {
  Tile<T, width> t;
  constexpr int vectors = row_vectors<T, width>, across = static_cast<int>(lanes<T>);
  if constexpr (transposed) {
    repeat<static_cast<int>(tile_rows) / across>([&](auto group) __attribute__((always_inline)) {
      repeat<width / across>([&](auto vector) __attribute__((always_inline)) {
        constexpr int q = decltype(group)::value, i = decltype(vector)::value;
        Vec<T> columns[across];
        repeat<across>([&](auto c) __attribute__((always_inline)) {
          constexpr int j = decltype(c)::value;
          columns[j] = load_unaligned(x + q * across + (i * across + j) * ld);
        });
        transpose(columns);
        repeat<across>([&](auto row) __attribute__((always_inline)) {
          constexpr int r = decltype(row)::value;
          t.v[q * across + r][i / vectors][i % vectors] = columns[r];
        });
      });
    });
  } else {
    each_vector<T, width>([&](auto row, auto plane, auto vector) __attribute__((always_inline)) {
      constexpr int r = decltype(row)::value, p = decltype(plane)::value, i = decltype(vector)::value;
      t.v[r][p][i] = load_unaligned(x + r * ld + (p * vectors + i) * across);
    });
  }
  split_rows(t);
  return t;
}

template <bool transposed, int width, class T>
[[gnu::always_inline]] inline void store_tile(T *x, QtbInt ld, Tile<T, width> t) {
  unite_rows(t);
  constexpr int vectors = row_vectors<T, width>, across = static_cast<int>(lanes<T>);
  if constexpr (transposed) {
    repeat<static_cast<int>(tile_rows) / across>([&](auto group) __attribute__((always_inline)) {
      repeat<width / across>([&](auto vector) __attribute__((always_inline)) {
        constexpr int q = decltype(group)::value, i = decltype(vector)::value;
        Vec<T> columns[across];
        repeat<across>([&](auto row) __attribute__((always_inline)) {
          constexpr int r = decltype(row)::value;
          columns[r] = t.v[q * across + r][i / vectors][i % vectors];
        });
        transpose(columns);
        repeat<across>([&](auto c) __attribute__((always_inline)) {
          constexpr int j = decltype(c)::value;
          store_unaligned(x + q * across + (i * across + j) * ld, columns[j]);
        });
      });
    });
  } else {
    each_vector<T, width>([&](auto row, auto plane, auto vector) __attribute__((always_inline)) {
      constexpr int r = decltype(row)::value, p = decltype(plane)::value, i = decltype(vector)::value;
      store_unaligned(x + r * ld + (p * vectors + i) * across, t.v[r][p][i]);
    });
  }
}

// A tile in the rows of a strip or of a packed triangle, which lie on vector boundaries.
template <int width, class T>
[[gnu::always_inline]] inline void store_rows(Real<T> *rows, const Tile<T, width> &t) {
  each_vector<T, width>([&](auto row, auto plane, auto vector) __attribute__((always_inline)) {
    constexpr int r = decltype(row)::value, p = decltype(plane)::value, i = decltype(vector)::value;
    store_aligned(rows + r * row_length<T, width> + (p * row_vectors<T, width> + i) * lanes<Real<T>>, t.v[r][p][i]);
  });
}

}  // namespace
}  // namespace qtb::QTB_TIER
