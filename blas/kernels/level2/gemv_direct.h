// y += alpha*op(A)*x straight from the operands: no inner kernels, no tiles.
//
// Columns go in groups of 4, 2 and 1, by sweeps where both increments are 1 and element by element otherwise. Any
// address, any increment but 0; y overlaps neither a nor x, which begin at their first elements.
#pragma once

#include "blas/kernels/level2/sweep.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
struct DirectProduct {
  QtbInt m, n;
  T alpha;
  const T *a;
  QtbInt lda;
  const T *x;
  QtbInt incx;
  T *y;
  QtbInt incy;
};

template <int count, bool contiguous, class T>
[[gnu::always_inline]] inline void add_group(const DirectProduct<T> &p) {
  T values[count];
  repeat<count>([&](auto j) { values[j.value] = p.alpha * load_element(p.x + j.value * p.incx); });
  const ColumnFactors<T, count> factors(values);
  const AnyColumns<T, count> columns(p.a, p.lda);
  if constexpr (contiguous) return add_sweep(p.m, columns, factors, p.y);
  AddingRows<T, AnyColumns<T, count>, Strided<T>, ColumnFactors<T, count>> walk{columns, {p.y, p.incy}, factors};
  single_rows(p.m, walk);
}

// Elements that fill a vector: a row is one, and takes the same place in its sum, wherever x stands.
template <int count, class T>
[[gnu::always_inline]] inline void dot_whole_elements(QtbInt rows, const AnyColumns<T, count> &columns, const T *x,
                                                      ColumnSums<T, count> &sums) {
  DotRows<T, count, AnyColumns<T, count>, Unaligned<const T>> walk{columns, {x}, sums};
  for (; rows >= 2; rows -= 2) walk.template pass<2>();
  if (rows > 0) walk.template pass<1>();
}

template <int count, bool conjugated, bool contiguous, class T>
[[gnu::always_inline]] inline void dot_group(const DirectProduct<T> &p) {
  ColumnSums<T, count> sums;
  const AnyColumns<T, count> columns(p.a, p.lda);
  if constexpr (contiguous) {
    if constexpr (lanes<T> == 1)
      dot_whole_elements(p.m, columns, p.x, sums);
    else
      dot_sweep(p.m, columns, p.x, sums);
    return add_totals(sums, conjugated, p.alpha, p.y);
  }
  DotRows<T, count, AnyColumns<T, count>, Strided<const T>> walk{columns, {p.x, p.incx}, sums};
  single_rows(p.m, walk);
  repeat<count>([&](auto j) {
    T *const y = p.y + j.value * p.incy;
    store_element(y, load_element(y) + p.alpha * sums.template total<conjugated>(j.value));
  });
}

template <int count, Op op, bool contiguous, class T>
[[gnu::always_inline]] inline void direct_group(DirectProduct<T> &p) {
  if constexpr (op == Op::none) {
    add_group<count, contiguous>(p);
    p.x += count * p.incx;
  } else {
    dot_group<count, op == Op::conjugate, contiguous>(p);
    p.y += count * p.incy;
  }
  p.a += count * p.lda;
}

template <Op op, bool contiguous, class T>
[[gnu::noinline]] void direct_groups(DirectProduct<T> p) {
  QtbInt columns = p.n;
  for (; columns >= 4; columns -= 4) direct_group<4, op, contiguous>(p);
  if ((columns & 2) != 0) direct_group<2, op, contiguous>(p);
  if ((columns & 1) != 0) direct_group<1, op, contiguous>(p);
}

template <Op op, class T>
void direct_product(const DirectProduct<T> &p) {
  if (p.incx == 1 && p.incy == 1)
    direct_groups<op, true>(p);
  else
    direct_groups<op, false>(p);
}

template <class T>
void direct_product(Op op, const DirectProduct<T> &p) {
  if (op == Op::none) return direct_product<Op::none>(p);
  if constexpr (is_complex<T>)
    if (op == Op::conjugate) return direct_product<Op::conjugate>(p);
  direct_product<Op::transpose>(p);
}

}  // namespace
}  // namespace qtb::QTB_TIER
