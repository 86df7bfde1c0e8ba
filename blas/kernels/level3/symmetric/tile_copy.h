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

// What becomes of an element in its two places. Passed by value: stores to the tile could otherwise change it, as far
// as compilers see.
template <class T, bool hermitian>
struct Mirroring {
  T alpha;
  Scaled<T> stored;
  ScaledConjugate<T> conjugated;
  explicit Mirroring(T factor) : alpha(factor), stored(factor), conjugated(factor) {}

  // The image of x, of which v is what is stored.
  [[gnu::always_inline]] Vec<T> mirrored(Vec<T> x, Vec<T> v) const {
    if constexpr (hermitian)
      return conjugated(x);
    else
      return v;
  }
  [[gnu::always_inline]] void copy_element(const T *from, T *to, T *image) const {
    const Vec<T> x = load_everywhere(from), v = stored(x);
    store_lowest(to, v);
    store_lowest(image, mirrored(x, v));
  }
  [[gnu::always_inline]] void copy_diagonal(const T *from, T *to) const {
    if constexpr (hermitian)
      *to = load_single(parts(from)) * alpha;
    else
      store_lowest(to, stored(load_everywhere(from)));
  }

 private:
  static Vec<T> load_everywhere(const T *p) {
    if constexpr (is_complex<T>)
      return load_repeated(p);
    else
      return broadcast(load_single(p));
  }
};

// Four rows of four columns, and the columns of their image.
template <class T, bool hermitian>
[[gnu::always_inline]] inline void copy_block(const T *from, QtbInt lda, T *to, T *image, QtbInt order,
                                              Mirroring<T, hermitian> m) {
  constexpr int step = static_cast<int>(lanes<T>), vectors = columns_together / step;
  repeat<vectors>([&](auto g) {
    repeat<vectors>([&](auto r) {
      Vec<T> v[step];
      repeat<step>([&](auto s) {
        constexpr int row = r.value * step, column = g.value * step + s.value;
        const Vec<T> x = load_unaligned(from + row + column * lda), here = m.stored(x);
        store_unaligned(to + row + column * order, here);
        v[s.value] = m.mirrored(x, here);
      });
      transpose(v);
      repeat<step>(
          [&](auto s) { store_unaligned(image + g.value * step + (r.value * step + s.value) * order, v[s.value]); });
    });
  });
}

// The triangle of some columns, the first element of the diagonal at from.
template <bool upper, class T, bool hermitian>
[[gnu::always_inline]] inline void copy_triangle(QtbInt columns, const T *from, QtbInt lda, T *to, QtbInt order,
                                                 Mirroring<T, hermitian> m) {
  for (QtbInt j = 0; j < columns; j++) {
    m.copy_diagonal(from + j + j * lda, to + j + j * order);
    for (QtbInt i = upper ? 0 : j + 1, end = upper ? j : columns; i < end; i++)
      m.copy_element(from + i + j * lda, to + i + j * order, to + j + i * order);
  }
}

template <class T, bool hermitian, bool upper>
void copy_symmetric(QtbInt order, const T *a, QtbInt lda, T *tile, T alpha) {
  constexpr QtbInt four = columns_together;
  const Mirroring<T, hermitian> m(alpha);
  QtbInt j0 = 0;
  for (; j0 + four <= order; j0 += four) {
    const QtbInt first = upper ? 0 : j0 + four;
    const T *from = a + first + j0 * lda;
    T *to = tile + first + j0 * order, *image = tile + j0 + first * order;
    copy_triangle<upper>(four, a + j0 + j0 * lda, lda, tile + j0 + j0 * order, order, m);
    QtbInt rows = upper ? j0 : order - first;
    for (; rows >= four; rows -= four, from += four, to += four, image += four * order)
      copy_block(from, lda, to, image, order, m);
    for (; rows > 0; rows--, from++, to++, image += order)
      repeat<columns_together>(
          [&](auto j) { m.copy_element(from + j.value * lda, to + j.value * order, image + j.value); });
  }
  const QtbInt columns = order - j0;
  if (columns == 0) return;
  copy_triangle<upper>(columns, a + j0 + j0 * lda, lda, tile + j0 + j0 * order, order, m);
  if constexpr (upper)
    for (QtbInt j = j0; j < order; j++)
      for (QtbInt i = 0; i < j0; i++) m.copy_element(a + i + j * lda, tile + i + j * order, tile + j + i * order);
}

}  // namespace
}  // namespace qtb::QTB_TIER
