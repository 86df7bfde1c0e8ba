// What a packed triangle (packed.h) does to a strip of B: multiplies it, or is solved for it. In place.
//
// A strip of width elements is kept a second time, a copy of rows on vector boundaries in the order of the packed rows:
// what a product reads, and what a solve has found so far. Tiles of four rows collect in registers what the rows ahead
// of them contribute, and then what their own tile on the diagonal does; the empty side of that is not multiplied, so
// that an infinity in B reaches no row that it has no part in.
#pragma once

#include "blas/kernels/level3/triangular/packed.h"

namespace qtb::QTB_TIER {
namespace {

using tiles::smaller;

// Number i of four, in all lanes.
template <int i>
__m128 fill_from(const float *four) {
  constexpr int choice = i * 0x55;
  return _mm_castsi128_ps(_mm_shuffle_epi32(_mm_castps_si128(load_aligned(four)), choice));
}
template <int i>
__m128d fill_from(const double *four) {
  return _mm_loaddup_pd(four + i);
}

template <bool subtract, class V>
[[gnu::always_inline]] inline void accumulate(V &sum, V x, V y) {
  sum = subtract ? sub(sum, mul(x, y)) : add(sum, mul(x, y));
}

// Row r of the tile: plus or less M's element (r, k) times a row of the strip. column: column k of M's tile.
template <bool subtract, int r, int width, class T, class Row>
[[gnu::always_inline]] inline void add_to_row(Tile<T, width> &t, const Real<T> *column, const Row &x) {
  constexpr int vectors = row_vectors<T, width>;
  const Vec<T> re = fill_from<r>(column);
  repeat<vectors>([&](auto vector) __attribute__((always_inline)) {
    constexpr int i = decltype(vector)::value;
    accumulate<subtract>(t.v[r][0][i], re, x[0][i]);
    if constexpr (is_complex<T>) accumulate<subtract>(t.v[r][1][i], re, x[1][i]);
  });
  if constexpr (is_complex<T>) {
    const Vec<T> im = fill_from<r>(column + tile_rows);
    repeat<vectors>([&](auto vector) __attribute__((always_inline)) {
      constexpr int i = decltype(vector)::value;
      accumulate<!subtract>(t.v[r][0][i], im, x[1][i]);
      accumulate<subtract>(t.v[r][1][i], im, x[0][i]);
    });
  }
}

// The rows of the strip ahead, each times its column of M.
template <bool subtract, int width, class T>
[[gnu::always_inline]] inline void add_rows_ahead(Tile<T, width> &t, const Real<T> *packed, const Real<T> *strip,
                                                  QtbInt rows) {
  constexpr int vectors = row_vectors<T, width>;
  for (QtbInt k = 0; k < rows; k += tile_rows) {
    repeat<static_cast<int>(tile_rows)>([&](auto step) __attribute__((always_inline)) {
      const Real<T> *at = strip + decltype(step)::value * row_length<T, width>;
      Vec<T> x[planes<T>][vectors];
      repeat<planes<T> * vectors>([&](auto vector) __attribute__((always_inline)) {
        constexpr int i = decltype(vector)::value;
        x[i / vectors][i % vectors] = load_aligned(at + i * lanes<Real<T>>);
      });
      repeat<static_cast<int>(tile_rows)>([&](auto r) __attribute__((always_inline)) {
        add_to_row<subtract, decltype(r)::value>(t, packed + decltype(step)::value * row_length<T, packed_width>, x);
      });
      each_vector<T, width>([&](auto row, auto plane, auto vector) __attribute__((always_inline)) {
        keep_in_place(t.v[decltype(row)::value][decltype(plane)::value][decltype(vector)::value]);
      });
    });
    strip += tile_rows * row_length<T, width>;
    packed += packed_tile<T>;
  }
}

// The tile on the diagonal times its own rows of the strip.
template <bool lower, int width, class T>
[[gnu::always_inline]] inline void add_own_rows(Tile<T, width> &t, const Real<T> *packed, const Real<T> *strip) {
  constexpr int vectors = row_vectors<T, width>;
  repeat<static_cast<int>(tile_rows)>([&](auto step) __attribute__((always_inline)) {
    constexpr int k = decltype(step)::value;
    Vec<T> x[planes<T>][vectors];
    repeat<planes<T> * vectors>([&](auto vector) __attribute__((always_inline)) {
      constexpr int i = decltype(vector)::value;
      x[i / vectors][i % vectors] = load_aligned(strip + k * row_length<T, width> + i * lanes<Real<T>>);
    });
    repeat<static_cast<int>(tile_rows)>([&](auto row) __attribute__((always_inline)) {
      constexpr int r = decltype(row)::value;
      if constexpr (lower ? r >= k : r <= k) add_to_row<false, r>(t, packed + k * row_length<T, packed_width>, x);
    });
  });
}

// The tile on the diagonal solved for the rows, by the reciprocals behind it.
template <bool lower, int width, class T>
[[gnu::always_inline]] inline void solve_own_rows(Tile<T, width> &t, const Real<T> *packed, bool unit) {
  constexpr int rows = static_cast<int>(tile_rows);
  repeat<rows>([&](auto step) __attribute__((always_inline)) {
    constexpr int k = lower ? decltype(step)::value : rows - 1 - decltype(step)::value;
    const Real<T> *reciprocal = packed + packed_tile<T> + k * planes<T> * lanes<Real<T>>;
    if constexpr (!is_complex<T>) {
      for (Vec<T> &x : t.v[k][0]) x = mul(x, load_aligned(reciprocal));
    } else if (!unit) {  // a complex product with one would make a NaN of an infinite part's neighbour
      const Vec<T> re = load_aligned(reciprocal), im = load_aligned(reciprocal + lanes<Real<T>>);
      repeat<row_vectors<T, width>>([&](auto vector) __attribute__((always_inline)) {
        constexpr int i = decltype(vector)::value;
        const Vec<T> x = t.v[k][0][i], y = t.v[k][1][i];
        t.v[k][0][i] = sub(mul(re, x), mul(im, y));
        t.v[k][1][i] = add(mul(re, y), mul(im, x));
      });
    }
    repeat<rows>([&](auto row) __attribute__((always_inline)) {
      constexpr int r = decltype(row)::value;
      if constexpr (lower ? r > k : r < k) add_to_row<true, r>(t, packed + k * row_length<T, packed_width>, t.v[k]);
    });
  });
}

// Elements across a strip whose tile fills eight registers.
template <class T>
constexpr int strip_width = 2 * static_cast<int>(lanes<Real<T>>) / planes<T>;

// Strips that go through the rows of a triangle together: one tile's rows of the packed triangle serve them all, and
// what one of them waits for in a solve the others fill.
constexpr QtbInt strips_at_once = 4;

// The tile that begins at row p of a strip, rows counted in the order of the packed ones.
template <Routine routine, bool lower, bool across, int width, class T>
void run_tile(QtbInt p, const Real<T> *packed, bool unit, T *b, QtbInt ldb, Real<T> *strip) {
  const Real<T> *const own = packed + p / tile_rows * packed_tile<T>;
  Real<T> *const own_rows = strip + p * row_length<T, width>;
  if constexpr (routine == Routine::trmm) {
    Tile<T, width> t = zero_tile<T, width>();
    add_rows_ahead<false>(t, packed, strip, p);
    add_own_rows<lower>(t, own, own_rows);
    store_tile<across>(b, ldb, t);
  } else {
    Tile<T, width> t = load_tile<across, width>(static_cast<const T *>(b), ldb);
    add_rows_ahead<true>(t, packed, strip, p);
    solve_own_rows<lower>(t, own, unit);
    store_rows(own_rows, t);
    store_tile<across>(b, ldb, t);
  }
}

// As many strips as are given, side by side in B. Row r of the first, along a triangle of n rows, is at b + r if
// across, with its elements ldb apart; otherwise at b + r*ldb.
template <Routine routine, bool lower, bool across, int width, class T>
void run_strips(QtbInt strips, QtbInt n, const Real<T> *packed, bool unit, T *b, QtbInt ldb, Real<T> *copies) {
  const QtbInt length = n * row_length<T, width>, step = width * (across ? ldb : 1);
  const auto place = [&](QtbInt p) { return b + (lower ? p : n - tile_rows - p) * (across ? 1 : ldb); };
  if constexpr (routine == Routine::trmm)
    for (QtbInt p = 0; p < n; p += tile_rows)
      for (QtbInt i = 0; i < strips; i++)
        store_rows(copies + i * length + p * row_length<T, width>,
                   load_tile<across, width>(static_cast<const T *>(place(p) + i * step), ldb));
  for (QtbInt p = 0; p < n; p += tile_rows) {
    for (QtbInt i = 0; i < strips; i++)
      run_tile<routine, lower, across, width>(p, packed, unit, place(p) + i * step, ldb, copies + i * length);
    packed += (p / tile_rows + 1) * packed_tile<T> + (routine == Routine::trsm ? packed_reciprocals<T> : 0);
  }
}

// All of B: others, a multiple of four, is how many elements a row along the triangle has.
template <Routine routine, bool lower, bool across, class T>
void run_all_strips(QtbInt n, QtbInt others, const Real<T> *packed, bool unit, T *b, QtbInt ldb, Real<T> *copies) {
  constexpr int width = strip_width<T>;
  const QtbInt step = across ? ldb : 1;
  QtbInt j = 0;
  while (j + width <= others) {
    const QtbInt strips = smaller((others - j) / width, strips_at_once);
    run_strips<routine, lower, across, width>(strips, n, packed, unit, b + j * step, ldb, copies);
    j += strips * width;
  }
  if constexpr (width > tile_rows)
    if (j < others) run_strips<routine, lower, across, packed_width>(1, n, packed, unit, b + j * step, ldb, copies);
}

}  // namespace
}  // namespace qtb::QTB_TIER
