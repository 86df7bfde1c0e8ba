// The rows of a chunk as a body of a rank-k update sums them: copied to the stack, each with its depth side by side.
//
// A row has room for 576 bytes of depth, so that two rows that are summed together begin 1152 bytes after the last two.
// The depth in use is filled up with zeros to whole vectors, and the rows to an even number.
#pragma once

#include "blas/kernels/level3/gemm/small.h"
#include "blas/kernels/level3/rank_k/strips.h"
#include "blas/kernels/simd/lanes.h"

namespace qtb::QTB_TIER {
namespace {

constexpr QtbInt row_bytes = 576;

template <class T>
struct ChunkCopy {
  static constexpr QtbInt depth = row_bytes / static_cast<QtbInt>(sizeof(T));  // of a row at most
  static constexpr QtbInt vectors_of(QtbInt l) { return (l + lanes<T> - 1) / lanes<T>; }

  alignas(64) T element[strips::chunk_rows * depth];
  T *row(QtbInt i) { return element + i * depth; }
  const T *row(QtbInt i) const { return element + i * depth; }
};

// Moves one vector. Compilers would make a call of a loop of nothing but these, for a few vectors an expensive one.
template <class T>
[[gnu::always_inline]] inline void move_vector(T *to, Vec<T> v) {
  keep_in_place(v);
  store_aligned(to, v);
}

// The rows that fill up the last pair.
template <class T>
void clear_row(QtbInt rows, QtbInt depth, ChunkCopy<T> &copy) {
  if (rows % 2 != 0)
    for (QtbInt l = 0; l < depth; l += lanes<T>) move_vector(copy.row(rows) + l, zero<T>());
}

// Rows as they are: row i of op(A) at a + i*lda.
template <class T>
[[gnu::noinline]] void copy_rows(QtbInt rows, QtbInt depth, const T *a, QtbInt lda, ChunkCopy<T> &copy) {
  const auto copy_some = [&](QtbInt i, auto count) __attribute__((always_inline)) {
    const T *const from = a + i * lda;
    T *const to = copy.row(i);
    const auto copy_vectors = [&](QtbInt l, auto part) __attribute__((always_inline)) {
      repeat<count.value>(
          [&](auto r) { move_vector(to + l + r.value * copy.depth, load_part<part.value>(from + l + r.value * lda)); });
    };
    constexpr int whole = static_cast<int>(lanes<T>);
    QtbInt l = 0;
    for (; l + whole <= depth; l += whole) copy_vectors(l, Constant<whole>());
    if constexpr (whole > 1)
      if (l < depth) with_count<whole - 1>(depth - l, [&](auto part) { copy_vectors(l, part); });
  };
  constexpr int at_once = 4;
  QtbInt i = 0;
  for (; i + at_once <= rows; i += at_once) copy_some(i, Constant<at_once>());
  for (; i < rows; i++) copy_some(i, Constant<1>());
  clear_row(rows, depth, copy);
}

// A square of lanes x lanes elements: its columns become rows.
template <class T>
[[gnu::always_inline]] inline void turn(const Vec<T> (&column)[lanes<T>], T *to) {
  constexpr QtbInt ld = ChunkCopy<T>::depth;
  if constexpr (lanes<T> == 4) {
    const __m128 low01 = _mm_unpacklo_ps(column[0], column[1]), high01 = _mm_unpackhi_ps(column[0], column[1]);
    const __m128 low23 = _mm_unpacklo_ps(column[2], column[3]), high23 = _mm_unpackhi_ps(column[2], column[3]);
    store_aligned(to, _mm_movelh_ps(low01, low23));
    store_aligned(to + ld, _mm_movehl_ps(low23, low01));
    store_aligned(to + 2 * ld, _mm_movelh_ps(high01, high23));
    store_aligned(to + 3 * ld, _mm_movehl_ps(high23, high01));
  } else if constexpr (lanes<T> == 2 && is_complex<T>) {
    store_aligned(to, _mm_movelh_ps(column[0], column[1]));
    store_aligned(to + ld, _mm_movehl_ps(column[1], column[0]));
  } else if constexpr (lanes<T> == 2) {
    store_aligned(to, _mm_unpacklo_pd(column[0], column[1]));
    store_aligned(to + ld, _mm_unpackhi_pd(column[0], column[1]));
  } else {
    store_aligned(to, column[0]);
  }
}

// Rows that lie across the columns of A: element (i, l) of op(A) at a[i + l*lda]. Rows that fill up a square are zeros.
template <class T>
[[gnu::noinline]] void copy_across(QtbInt rows, QtbInt depth, const T *a, QtbInt lda, ChunkCopy<T> &copy) {
  constexpr int whole = static_cast<int>(lanes<T>);
  const auto copy_columns = [&](QtbInt l, auto columns) {
    const auto copy_square = [&](QtbInt i, auto count) {
      Vec<T> column[whole];
      repeat<whole>([&](auto e) {
        if constexpr (e.value < columns.value)
          column[e.value] = load_part<count.value>(a + i + (l + e.value) * lda);
        else
          column[e.value] = zero<T>();
      });
      turn<T>(column, copy.row(i) + l);
    };
    QtbInt i = 0;
    for (; i + whole <= rows; i += whole) copy_square(i, Constant<whole>());
    if constexpr (whole > 1)
      if (i < rows) with_count<whole - 1>(rows - i, [&](auto count) { copy_square(i, count); });
  };
  QtbInt l = 0;
  for (; l + whole <= depth; l += whole) copy_columns(l, Constant<whole>());
  if constexpr (whole > 1)
    if (l < depth) with_count<whole - 1>(depth - l, [&](auto columns) { copy_columns(l, columns); });
  if constexpr (whole == 1) clear_row(rows, depth, copy);
}

}  // namespace
}  // namespace qtb::QTB_TIER
