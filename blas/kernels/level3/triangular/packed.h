// A triangle packed for the base kernels.
//
// M is the triangle as it acts on the columns of B, or, from the right, on its rows. Its rows are taken four at a time,
// in the order in which a solve has them: from the first where M is lower, from the last where it is upper. Of four
// rows stand the tiles off the diagonal in that same order, then the one on it, each with four columns of M as its rows
// (tile.h), with zeros on the empty side. For a solve the reciprocals of the diagonal follow, each filling a vector: a
// pair of doubles. A unit diagonal is not read. Everything lies on vector boundaries.
#pragma once

#include "blas/kernels/level3/gemm/parts.h"
#include "blas/kernels/level3/triangular/levels.h"
#include "blas/kernels/level3/triangular/tile.h"

namespace qtb::QTB_TIER {
namespace {

using levels::Routine;

constexpr int packed_width = static_cast<int>(tile_rows);

// Numbers of a tile, and of the reciprocals of four rows.
template <class T>
constexpr QtbInt packed_tile = tile_rows *row_length<T, packed_width>;
template <class T>
constexpr QtbInt packed_reciprocals = tile_rows *planes<T> *lanes<Real<T>>;

// What is packed: how the triangle lies in memory, and what becomes of its elements.
template <class T>
struct PackedForm {
  bool conjugated, unit;
  T alpha;  // every element is multiplied by it
};

// Element (i, k) of M: at a[i + k*lda] if straight, otherwise at a[k + i*lda].
template <bool straight, class T>
const T *element_at(const T *a, QtbInt lda, QtbInt i, QtbInt k) {
  return straight ? a + i + k * lda : a + k + i * lda;
}

template <class T>
void set_element(Real<T> *tile, QtbInt row, QtbInt column, T v) {
  Real<T> *at = tile + column * row_length<T, packed_width> + row;
  at[0] = real_part(v);
  if constexpr (is_complex<T>) at[tile_rows] = v.im;
}

// The tile on the diagonal: only the triangle is read.
template <Routine routine, bool lower, bool straight, class T>
void pack_diagonal_tile(const PackedForm<T> &form, const T *a, QtbInt lda, Real<T> *out) {
  const auto value = [&](QtbInt i, QtbInt k) {
    const T v = *element_at<straight>(a, lda, i, k);
    const T w = is_complex<T> && form.conjugated ? conjugate(v) : v;
    return routine == Routine::trsm ? w : form.alpha * w;
  };
  for (QtbInt k = 0; k < packed_tile<T>; k += lanes<Real<T>>) store_aligned(out + k, zero<T>());
  for (QtbInt k = 0; k < tile_rows; k++)
    for (QtbInt i = lower ? k + 1 : 0; i < (lower ? tile_rows : k); i++) set_element(out, i, k, value(i, k));
  for (QtbInt k = 0; k < tile_rows; k++) {
    if constexpr (routine == Routine::trmm) {
      set_element(out, k, k, form.unit ? form.alpha : value(k, k));
    } else {
      const T reciprocal = form.unit ? one<T> : one<T> / value(k, k);
      Real<T> *at = out + packed_tile<T> + k * planes<T> * lanes<Real<T>>;
      store_aligned(at, broadcast(real_part(reciprocal)));
      if constexpr (is_complex<T>) store_aligned(at + lanes<Real<T>>, broadcast(reciprocal.im));
    }
  }
}

// Packs M, n x n with n a multiple of four.
template <Routine routine, bool lower, bool straight, class T>
void pack_triangle(const PackedForm<T> &form, QtbInt n, const T *a, QtbInt lda, Real<T> *out) {
  const bool scaled = routine == Routine::trmm && !is_one(form.alpha);
  const Vec<T> sign = form.conjugated ? broadcast(-Real<T>{0}) : zero<T>();
  const auto place = [&](QtbInt p) { return lower ? p : n - tile_rows - p; };
  for (QtbInt p = 0; p < n; p += tile_rows) {
    const QtbInt i = place(p);
    for (QtbInt q = 0; q < p; q += tile_rows, out += packed_tile<T>) {
      auto tile = load_tile<!straight, packed_width>(element_at<straight>(a, lda, i, place(q)), lda);
      if constexpr (is_complex<T>)
        repeat<static_cast<int>(tile_rows)>([&](auto row) __attribute__((always_inline)) {
          for (auto &im : tile.v[decltype(row)::value][1]) im = bit_xor(im, sign);
        });
      if (scaled) scale_tile(tile, form.alpha);
      store_rows(out, tile);
    }
    pack_diagonal_tile<routine, lower, straight>(form, element_at<straight>(a, lda, i, i), lda, out);
    out += packed_tile<T> + (routine == Routine::trsm ? packed_reciprocals<T> : 0);
  }
}

}  // namespace
}  // namespace qtb::QTB_TIER
