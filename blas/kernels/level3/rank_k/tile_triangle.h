// The triangle of C that a rank-k or rank-2k update writes, in square tiles: C := beta*C + X.
//
// C is n x n with columns ldc apart; only its upper or its lower triangle is read or written. Tiles off the diagonal
// lie in the triangle whole, and GEMM computes them in place. Of a tile on the diagonal GEMM computes the full square
// into a buffer, whose triangle is then added to C.
//
// A Hermitian C has a real beta, and its diagonal becomes real; the imaginary parts that stand there are not read. A
// beta of 0 stores without reading. No alignment is asked for.
#pragma once

#include "blas/kernels/element.h"

namespace qtb::QTB_TIER {
namespace {

// rectangle(i0, rows, j0, columns) for each tile off the diagonal, diagonal(i0, order) for each on it: all tiles are of
// order rows and columns but those at the end.
template <class Rectangle, class Diagonal>
void walk_tiles(bool upper, QtbInt n, QtbInt order, Rectangle rectangle, Diagonal diagonal) {
  const auto extent = [=](QtbInt first) { return n - first < order ? n - first : order; };
  for (QtbInt j0 = 0; j0 < n; j0 += order) {
    const QtbInt end = upper ? j0 : n;
    for (QtbInt i0 = upper ? 0 : j0 + order; i0 < end; i0 += order) rectangle(i0, extent(i0), j0, extent(j0));
    diagonal(j0, extent(j0));
  }
}

// c := beta*c over count elements, and x added where adds is set.
template <bool adds, class T>
void join_column(QtbInt count, const T *x, T beta, T *c) {
  const Factor<T> factor(beta);
  const bool reads_c = !is_zero(beta), scales_c = !is_one(beta);
  const auto joined = [&](auto load, QtbInt i) {
    Vec<T> v = zero<T>();
    if (reads_c) v = scales_c ? factor.times(load(c + i)) : load(c + i);
    if constexpr (adds) v = add(v, load(x + i));
    return v;
  };
  QtbInt i = 0;
  for (; i + lanes<T> <= count; i += lanes<T>)
    store_unaligned(c + i, joined([](const T *p) { return load_unaligned(p); }, i));
  for (; i < count; i++) {
    if constexpr (is_complex<T>)
      store_lowest(c + i, joined([](const T *p) { return load_repeated(p); }, i));
    else
      store_lowest(c + i, joined([](const T *p) { return load_lowest(p); }, i));
  }
}

template <bool hermitian, bool adds, class T, class S>
void join_triangle(bool upper, QtbInt n, const T *x, QtbInt ldx, S beta, T *c, QtbInt ldc) {
  for (QtbInt j = 0; j < n; j++, x += adds ? ldx : 0, c += ldc) {
    if constexpr (!hermitian) {
      const QtbInt begin = upper ? 0 : j, end = upper ? j + 1 : n;
      join_column<adds>(end - begin, x + (adds ? begin : 0), beta, c + begin);
    } else {
      const QtbInt begin = upper ? 0 : j + 1, end = upper ? j : n;
      join_column<adds>(2 * (end - begin), parts(x + (adds ? begin : 0)), beta, parts(c + begin));
      S *const diagonal = parts(c + j);
      S re = is_zero(beta) ? S{0} : beta * load_single(diagonal);
      if constexpr (adds) re += load_single(parts(x + j));
      store_single(diagonal, re);
      store_single(diagonal + 1, S{0});
    }
  }
}

// C := beta*C on the triangle. A beta of 1 does nothing, and leaves a Hermitian diagonal as it stands.
template <bool hermitian, class T, class S>
void scale_triangle(bool upper, QtbInt n, S beta, T *c, QtbInt ldc) {
  if (!is_one(beta)) join_triangle<hermitian, false>(upper, n, static_cast<const T *>(nullptr), 0, beta, c, ldc);
}

// C := beta*C + the triangle of a tile on the diagonal, whose columns are ldt apart in its buffer.
template <bool hermitian, class T, class S>
void add_tile_triangle(bool upper, QtbInt n, const T *tile, QtbInt ldt, S beta, T *c, QtbInt ldc) {
  join_triangle<hermitian, true>(upper, n, tile, ldt, beta, c, ldc);
}

}  // namespace
}  // namespace qtb::QTB_TIER
