// The symmetrising copy: tile := alpha*A for all of a symmetric or Hermitian matrix of which one triangle is stored.
//
// A is order x order with columns lda apart; its other triangle is not read. Of a Hermitian A what is mirrored is the
// conjugate, and the imaginary parts on the diagonal are not read. The tile has columns order apart, without a gap, and
// does not overlap A. Each element is read once, multiplied by alpha, and stored in both its places: four columns
// together, whose rows off the diagonal go in blocks of 4 by 4 that are transposed in registers. No alignment is asked
// for.
#pragma once

#include "blas/kernels/level3/gemm/pack.h"

namespace qtb::QTB_TIER {
namespace {

constexpr int columns_together = 4;

template <class T, bool hermitian>
struct TileCopy {
  const T *a;
  QtbInt lda;
  T *tile;
  QtbInt order;
  T alpha;
  Scaled<T> stored;
  ScaledConjugate<T> mirrored;

  TileCopy(QtbInt n, const T *from, QtbInt ld, T *to, T factor)
      : a(from), lda(ld), tile(to), order(n), alpha(factor), stored(factor), mirrored(factor) {}

  void copy_vectors(QtbInt i0, QtbInt j0) const {
    constexpr int step = static_cast<int>(lanes<T>);
    repeat<columns_together / step>([&](auto g) {
      repeat<columns_together / step>([&](auto r) {
        const QtbInt i = i0 + r.value * step, j = j0 + g.value * step;
        Vec<T> v[step];
        repeat<step>([&](auto s) {
          const Vec<T> x = load_unaligned(a + i + (j + s.value) * lda), here = stored(x);
          store_unaligned(tile + i + (j + s.value) * order, here);
          v[s.value] = hermitian ? mirrored(x) : here;
        });
        transpose(v);
        repeat<step>([&](auto s) { store_unaligned(tile + j + (i + s.value) * order, v[s.value]); });
      });
    });
  }
  void copy_element(QtbInt i, QtbInt j) const {
    Vec<T> x;
    if constexpr (is_complex<T>)
      x = load_repeated(a + i + j * lda);
    else
      x = broadcast(load_single(a + i + j * lda));
    const Vec<T> here = stored(x);
    store_lowest(tile + i + j * order, here);
    store_lowest(tile + j + i * order, hermitian ? mirrored(x) : here);
  }
  void copy_diagonal(QtbInt j) const {
    if constexpr (hermitian)
      tile[j + j * order] = load_single(parts(a + j + j * lda)) * alpha;
    else
      copy_element(j, j);
  }

  // Rows begin to end of some columns, all of them off the diagonal.
  void copy_rows(QtbInt begin, QtbInt end, QtbInt j0, QtbInt columns) const {
    QtbInt i = begin;
    if (columns == columns_together)
      for (; i + columns_together <= end; i += columns_together) copy_vectors(i, j0);
    for (; i < end; i++)
      for (QtbInt j = j0; j < j0 + columns; j++) copy_element(i, j);
  }
  void copy_triangle(bool upper, QtbInt j0, QtbInt columns) const {
    for (QtbInt j = j0; j < j0 + columns; j++) {
      copy_diagonal(j);
      for (QtbInt i = j + 1; i < j0 + columns; i++) upper ? copy_element(j, i) : copy_element(i, j);
    }
  }
};

template <class T, bool hermitian, bool upper>
void copy_symmetric(QtbInt order, const T *a, QtbInt lda, T *tile, T alpha) {
  const TileCopy<T, hermitian> copy(order, a, lda, tile, alpha);
  for (QtbInt j0 = 0, columns; j0 < order; j0 += columns) {
    columns = order - j0 < columns_together ? order - j0 : columns_together;
    copy.copy_triangle(upper, j0, columns);
    if constexpr (upper)
      copy.copy_rows(0, j0, j0, columns);
    else
      copy.copy_rows(j0 + columns, order, j0, columns);
  }
}

}  // namespace
}  // namespace qtb::QTB_TIER
