// y += alpha*A*x for a symmetric or Hermitian A of order n whose stored triangle is full, packed or a band: the frames
// of symv, hemv, spmv, hpmv, sbmv and hbmv.
//
// Columns go in groups, the rest singly. A group is swept once, so that the matrix is read once, and y read and written
// once per group. x and y have any increments and do not overlap; addresses of any alignment.
#pragma once

#include "blas/kernels/level2/symmetric_sweep.h"

namespace qtb::QTB_TIER {
namespace {

// The columns of a triangle, from the first on: element (i, j) is at column[i] once the walk has come to column j. A
// packed column starts where the last one ended, so that the distance of its row 0 from the last one's changes by
// growth, 1 or -1; else growth is 0.
template <class T>
struct ColumnWalk {
  const T *column;
  QtbInt step, growth;
  void advance(int count) {
    for (; count > 0; --count) {
      column += step;
      step += growth;
    }
  }
};

template <class T>
ColumnWalk<T> full_columns(const T *a, QtbInt lda) {
  return {a, lda, 0};
}
template <bool upper, class T>
ColumnWalk<T> packed_columns(const T *ap, QtbInt n) {
  return {ap, upper ? 1 : n - 1, upper ? 1 : -1};
}
// A band of k diagonals beside the main one keeps its diagonals as rows; the main one is the last of an upper band.
template <bool upper, class T>
ColumnWalk<T> band_columns(const T *a, QtbInt lda, QtbInt k) {
  return {upper ? a + k : a, lda - 1, 0};
}

// x and y of a product, from their logical first elements on.
template <class T>
struct Vectors {
  const T *x;
  QtbInt incx;
  T *y;
  QtbInt incy;
};

// The next count columns, with rows of the rectangle; the group's rows start at row first.
template <bool upper, int count, class T>
[[gnu::always_inline]] inline void add_next(QtbInt first, QtbInt rows, bool edge, T alpha, ColumnWalk<T> &walk,
                                            const Vectors<T> &v) {
  const T *const column = walk.column + first, *const x = v.x + first * v.incx;
  T *const y = v.y + first * v.incy;
  if (v.incx != 1 || v.incy != 1)
    add_group<upper, count>(rows, edge, column, walk.step, walk.growth, alpha, Strided<const T>{x, v.incx},
                            Strided<T>{y, v.incy});
  else if constexpr (sizeof(T) == vector_bytes)
    add_group<upper, count>(rows, edge, column, walk.step, walk.growth, alpha, Unaligned<const T>{x}, Unaligned<T>{y});
  else
    add_group<upper, count>(rows, edge, column, walk.step, walk.growth, alpha, Unaligned<const T>{x}, Aligned<T>{y});
  walk.advance(count);
}

// ---- Full and packed triangles ----

template <bool upper, int group, class T>
[[gnu::noinline]] void add_triangle(QtbInt n, T alpha, ColumnWalk<T> walk, Vectors<T> v) {
  QtbInt j = 0;
  for (; n - j >= group; j += group)
    add_next<upper, group>(upper ? 0 : j, upper ? j : n - j - group, false, alpha, walk, v);
  for (; j < n; ++j) add_next<upper, 1>(upper ? 0 : j, upper ? j : n - j - 1, false, alpha, walk, v);
}

// ---- Bands ----

// One column, or two of a band that has the element between them: the rows that both have, and the one that one of them
// has alone, unless the matrix ends before it.
template <bool upper, int count, class T>
[[gnu::always_inline]] inline void add_next_of_band(QtbInt n, QtbInt k, QtbInt j, T alpha, ColumnWalk<T> &walk,
                                                    const Vectors<T> &v) {
  static_assert(count == 1 || count == 2);
  const QtbInt room = upper ? j : n - j - count;  // rows of the matrix beside the group's own
  const QtbInt reach = k - (count - 1);
  const bool edge = count == 2 && room > reach;
  const QtbInt rows = room < reach ? room : reach;
  add_next<upper, count>(upper ? j - rows - edge : j, rows, edge, alpha, walk, v);
}

template <bool upper, int group, class T>
[[gnu::noinline]] void add_band(QtbInt n, QtbInt k, T alpha, ColumnWalk<T> walk, Vectors<T> v) {
  QtbInt j = 0;
  if (k >= group - 1)
    for (; n - j >= group; j += group) add_next_of_band<upper, group>(n, k, j, alpha, walk, v);
  for (; j < n; ++j) add_next_of_band<upper, 1>(n, k, j, alpha, walk, v);
}

}  // namespace
}  // namespace qtb::QTB_TIER
