// The form of the small path for a depth of a few steps: C := beta*C + alpha*op(A)*op(B), column by column.
//
// An element of C costs more to reach than to compute. So the elements of op(B) that a column needs stay in registers
// while its rows pass, and C is walked as it lies in memory. The rows of op(A) lie side by side: as they are, or a
// block of rows at a time as a transposed copy on the stack.
//
// The sum of an element is that of the longer forms. Column updates add the steps one after the other; dot products add
// by lanes, whole vectors of depth first, what is left in the lowest lane, and then the lanes in the order of
// sum_lanes.
#pragma once

#include "blas/kernels/level3/gemm/small.h"

namespace qtb::QTB_TIER {
namespace {

// The longest depth: what there are registers for, of the depths that the limits of bodies send to the small path. In
// the order of dot products, where the other form wastes most of its vectors, it pays a little longer.
constexpr QtbInt longest_in_sequence = 4;
template <class T>
constexpr int longest_short_depth = this_tier <= tier_sse3 && sizeof(Real<T>) == sizeof(float) ? 7 : 4;

// Rows that are copied at a time, a cache line or more of each column of C.
constexpr QtbInt copied_rows = 64;

// The steps of depth of one column: an element, or part of an element, of y in all lanes.
template <class T, int depth>
struct Column {
  Vec<T> part[depth];
  void load(const ByElement<T> &y) {
    repeat<depth>([&](auto l) { part[l.value] = broadcast(load_single(y.y + l.value * y.by_depth)); });
  }
};
template <class R, int depth>
struct Column<Complex<R>, depth> {
  Vec<R> re[depth], im[depth];
  void load(const ByElement<Complex<R>> &y) {
    repeat<depth>([&](auto l) {
      const R *element = parts(y.y + l.value * y.by_depth);
      re[l.value] = broadcast(load_single(element));
      im[l.value] = broadcast(load_single(element + 1));
    });
  }
};

// The sum of x[l]*y[l] over the depth, in the order of sums that are kept apart by lanes.
template <class T, int sums, int depth>
[[gnu::always_inline]] inline Vec<T> sum_products(const Vec<T> (&x)[depth], const Vec<T> (&y)[depth]) {
  constexpr int whole = depth / sums * sums, used = whole > 0 ? sums : 1;
  Vec<T> sum[used];
  repeat<depth>([&](auto l) __attribute__((always_inline)) {
    constexpr int lane = l.value < whole ? l.value % sums : 0;
    const Vec<T> product = mul(x[l.value], y[l.value]);
    // One addition to zero makes a sum of nothing but negative zeros positive.
    if constexpr (l.value >= used)
      sum[lane] = add(sum[lane], product);
    else
      sum[lane] = lane == 0 ? add(zero<T>(), product) : product;
  });
  if constexpr (used == 4)
    return add(add(sum[0], sum[2]), add(sum[1], sum[3]));
  else if constexpr (used == 2)
    return add(sum[0], sum[1]);
  else
    return sum[0];
}

// Rows of one column of C; count elements to a vector.
template <int count, int sums, class T, int depth>
[[gnu::always_inline]] inline void update_vector(const SideBySide<T> &x, QtbInt i, const Column<T, depth> &column,
                                                 bool y_conjugated, const Finish<T> &finish, T *c) {
  Vec<T> rows[depth];
  repeat<depth>([&](auto l)
                    __attribute__((always_inline)) { rows[l.value] = load_part<count>(x.x + i + l.value * x.ld); });
  Vec<T> sum;
  if constexpr (is_complex<T>)
    sum = join_products<T>(sum_products<T, sums>(rows, column.re), sum_products<T, sums>(rows, column.im), x.conjugated,
                           y_conjugated);
  else
    sum = sum_products<T, sums>(rows, column.part);
  store_part<count>(c + i, finish(sum, [&] { return load_part<count>(c + i); }));
}

template <int sums, int depth, class T>
[[gnu::noinline]] void update_columns(QtbInt rows, QtbInt columns, SideBySide<T> x, ByElement<T> y, Finish<T> finish,
                                      T *c, QtbInt ldc) {
  constexpr QtbInt whole = lanes<T>;
  for (; columns > 0; columns--, y.y += y.by_element, c += ldc) {
    Column<T, depth> column;
    column.load(y);
    QtbInt i = 0;
    for (; i + whole <= rows; i += whole)
      update_vector<static_cast<int>(whole), sums>(x, i, column, y.conjugated, finish, c);
    if constexpr (whole > 1)
      if (i < rows)
        with_count<static_cast<int>(whole) - 1>(
            rows - i, [&](auto count) { update_vector<count.value, sums>(x, i, column, y.conjugated, finish, c); });
  }
}

// op(A) with rows side by side, A of no option.
template <class T>
void multiply_short(QtbInt rows, QtbInt columns, QtbInt depth, SideBySide<T> x, ByElement<T> y, const Finish<T> &finish,
                    T *c, QtbInt ldc) {
  with_count<longest_short_depth<T>>(depth,
                                     [&](auto k) { update_columns<1, k.value>(rows, columns, x, y, finish, c, ldc); });
}

// A transposed: its columns ldx apart. by_lanes: in the order of dot products.
template <class T>
void multiply_short_transposed(QtbInt rows, QtbInt columns, QtbInt depth, const T *x, QtbInt ldx, bool x_conjugated,
                               bool by_lanes, ByElement<T> y, const Finish<T> &finish, T *c, QtbInt ldc) {
  alignas(vector_bytes) T copy[longest_short_depth<T> * copied_rows];
  for (QtbInt i0 = 0; i0 < rows; i0 += copied_rows) {
    const QtbInt count = smaller(copied_rows, rows - i0);
    for (QtbInt i = 0; i < count; i++)
      for (QtbInt l = 0; l < depth; l++) store_bits(copy + i + l * copied_rows, load_bits(x + l + (i0 + i) * ldx));
    const SideBySide<T> side_by_side{copy, copied_rows, x_conjugated};
    with_count<longest_short_depth<T>>(depth, [&](auto k) {
      if (by_lanes)
        update_columns<static_cast<int>(lanes<T>), k.value>(count, columns, side_by_side, y, finish, c + i0, ldc);
      else
        update_columns<1, k.value>(count, columns, side_by_side, y, finish, c + i0, ldc);
    });
  }
}

}  // namespace
}  // namespace qtb::QTB_TIER
