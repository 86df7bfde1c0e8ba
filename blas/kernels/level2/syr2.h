// A := alpha*x*y^T + alpha*y*x^T + A on columns of a triangle, of a Hermitian matrix alpha*x*y^H + conj(alpha)*y*x^H +
// A: syr2, spr2 and their pieces.
//
// A column whose elements of x and y are both zero is skipped (a NaN is not zero), but for the imaginary part of its
// diagonal, which an update of a Hermitian matrix always sets to zero. Any increments and addresses; x and y do not
// overlap A. Full columns of a real matrix go in pairs if both vectors are contiguous, so that x and y are read once
// for both.
#pragma once

#include "blas/kernels/level2/rank_update.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
TwoVectors<T> factors(T alpha, T of_x, T of_y) {
  return TwoVectors<T>(alpha * conjugate(of_y), conjugate(alpha * of_x));
}

// Contiguous and strided vectors have a loop each, so that neither saves the registers that the other needs.
template <bool contiguous, class T>
[[gnu::noinline]] void update_columns(QtbInt columns, StoredColumns<T> a, T alpha, From<T> x, From<T> y) {
  if constexpr (contiguous) x.inc = y.inc = 1;
  for (; columns > 0; --columns, a.advance()) {
    const QtbInt at = a.diagonal();
    const T of_x = x[a.first + at], of_y = y[a.first + at];
    if (is_zero(of_x) && is_zero(of_y)) {
      if constexpr (is_complex<T>) store_single(a.column + at, real_only(load_single(a.column + at)));
      continue;
    }
    // A Hermitian diagonal is left to the end: it takes real parts only.
    const QtbInt skipped = is_complex<T> ? 1 : 0, off = is_complex<T> && !a.ends_on_diagonal() ? 1 : 0;
    update_column(a.rows - skipped, a.column + off, factors(alpha, of_x, of_y),
                  x.template cursor<contiguous>(a.first + off), y.template cursor<contiguous>(a.first + off));
    if constexpr (is_complex<T>) {
      // Both terms are conjugates of each other, so that their sum is twice the real part of one.
      const T term = of_x * (alpha * conjugate(of_y));
      store_single(a.column + at, T{load_single(a.column + at).re + (term.re + term.re), 0});
    }
  }
}
template <class T>
void update(QtbInt columns, const StoredColumns<T> &a, T alpha, const From<T> &x, const From<T> &y) {
  if (x.inc == 1 && y.inc == 1)
    update_columns<true>(columns, a, alpha, x, y);
  else
    update_columns<false>(columns, a, alpha, x, y);
}

// ---- Pairs of columns ----

// left[i] and right[i] += the multiples of theirs, x and y contiguous.
template <class T>
[[gnu::always_inline]] inline void update_pair(QtbInt rows, T *left, T *right, const TwoVectors<T> &of_left,
                                               const TwoVectors<T> &of_right, const T *x, const T *y) {
  const auto vector = [&](auto target, int k) __attribute__((always_inline)) {
    const Vec<T> from_x = Unaligned<const T>{x}.load(k), from_y = Unaligned<const T>{y}.load(k);
    const Unaligned<T> other{right};
    target.store(k, of_left.add_to(target.load(k), from_x, from_y));
    other.store(k, of_right.add_to(other.load(k), from_x, from_y));
  };
  const auto advance = [&](QtbInt count) __attribute__((always_inline)) {
    left += count, right += count, x += count, y += count;
    rows -= count;
  };
  const auto single = [&]() __attribute__((always_inline)) {
    update_element(left, of_left, x, y);
    update_element(right, of_right, x, y);
    advance(1);
  };
  const auto pass = [&](auto target, auto count) __attribute__((always_inline)) {
    repeat<count.value / lanes<T>>([&](auto k) __attribute__((always_inline)) { vector(target, k.value); });
    advance(count.value);
  };
  constexpr Constant<rows_per_update> whole;
  if (rows >= shortest_updated_by_passes && element_aligned(left)) {
    while (phase(left) != 0) single();
    while (rows >= rows_per_update) pass(Aligned<T>{left}, whole);
  }
  while (rows >= rows_per_update) pass(Unaligned<T>{left}, whole);
  remaining_rows<T>(
      rows, [&](auto count) __attribute__((always_inline)) { pass(Unaligned<T>{left}, count); }, single);
}

template <class T>
[[gnu::noinline]] void update_in_pairs(QtbInt columns, StoredColumns<T> a, T alpha, From<T> x, From<T> y) {
  x.inc = y.inc = 1;
  for (; columns >= 2; columns -= 2) {
    const StoredColumns<T> left = a;
    a.advance();
    const StoredColumns<T> right = a;
    a.advance();
    const QtbInt i = left.first + left.diagonal(), j = right.first + right.diagonal();
    const bool skips_left = is_zero(x[i]) && is_zero(y[i]), skips_right = is_zero(x[j]) && is_zero(y[j]);
    if (skips_left || skips_right) {
      if (!skips_left) update_columns<true>(1, left, alpha, x, y);
      if (!skips_right) update_columns<true>(1, right, alpha, x, y);
      continue;
    }
    const TwoVectors<T> of_left = factors(alpha, x[i], y[i]), of_right = factors(alpha, x[j], y[j]);
    // The one row that the longer column has alone: the diagonal of the right one ("U") or of the left one ("L").
    const QtbInt common = left.rows < right.rows ? left.rows : right.rows, first = right.first;
    if (left.ends_on_diagonal())
      update_element(right.column + common, of_right, x.base + j, y.base + j);
    else
      update_element(left.column, of_left, x.base + i, y.base + i);
    update_pair(common, left.column + (left.rows - common) * left.next_first, right.column, of_left, of_right,
                x.base + first, y.base + first);
  }
  update_columns<true>(columns, a, alpha, x, y);
}

template <class T>
void update_full(QtbInt columns, StoredColumns<T> a, T alpha, From<T> x, From<T> y) {
  if constexpr (!is_complex<T>)
    if (x.inc == 1 && y.inc == 1) return update_in_pairs(columns, a, alpha, x, y);
  update(columns, a, alpha, x, y);
}

}  // namespace
}  // namespace qtb::QTB_TIER
