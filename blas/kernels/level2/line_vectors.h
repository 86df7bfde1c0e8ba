// LineVector: a vector of a product with a band or packed matrix.
//
// It counts elements along the vector's direction from its first one on, at any address, and has
//
//   get, set    one element
//   add         element i += sum_j factor[j]*column[j][i - first]               first <= i < first + rows
//   dot         sum[j] += sum over i of op(column[j][i - first])*element i      op conjugates where told
//
// where the columns, of any alignment, overlap the vector nowhere. Elements side by side go by vectors once there are
// enough rows; those that stand apart are indexed one by one. A dot product of one or two columns has two accumulators
// for each sum, which rows go to in turn, so that an addition need not wait for the one before; four columns keep the
// adder busy with one each.
#pragma once

#include "blas/kernels/level2/sweep.h"

namespace qtb::QTB_TIER {
namespace {

// ---- Dot products of few columns ----

template <class T, int count>
struct FewDots {
  static constexpr QtbInt rows_of_pass = 8;
  const T *column[count];
  const T *x;
  ColumnSums<T, 2 * count> sums;  // 2*j and 2*j + 1 of column j

  [[gnu::always_inline]] void pass() {
    repeat<rows_of_pass / lanes<T>>([&](auto k) __attribute__((always_inline)) {
      const RowFactor<T> row(Aligned<const T>{x}.load(k.value));
      repeat<count>([&](auto j) __attribute__((always_inline)) {
        sums.template add_product<2 * j.value + k.value % 2>(Unaligned<const T>{column[j.value]}.load(k.value), row);
      });
    });
    advance(rows_of_pass);
  }
  // A row to the first or the second sum of each column.
  template <int which>
  [[gnu::always_inline]] void single() {
    const RowFactor<T> row(load_lowest(x));
    repeat<count>([&](auto j) __attribute__((always_inline)) {
      sums.template add_lowest_product<2 * j.value + which>(load_lowest(column[j.value]), row);
    });
    advance(1);
  }
  [[gnu::always_inline]] void advance(QtbInt rows) {
    repeat<count>([&](auto j) __attribute__((always_inline)) { column[j.value] += rows; });
    x += rows;
  }
  template <bool conjugated, int j>
  [[gnu::always_inline]] T total() {
    if constexpr (is_complex<T>) {
      sums.by_re[2 * j] = add(sums.by_re[2 * j], sums.by_re[2 * j + 1]);
      sums.by_im[2 * j] = add(sums.by_im[2 * j], sums.by_im[2 * j + 1]);
    } else {
      sums.sum[2 * j] = add(sums.sum[2 * j], sums.sum[2 * j + 1]);
    }
    return sums.template total<conjugated>(2 * j);
  }
};

template <bool conjugated, int count, class T>
[[gnu::noinline]] void dot_few_columns(QtbInt rows, const T *const (&columns)[count], const T *x, T (&sums)[count]) {
  FewDots<T, count> walk;
  repeat<count>([&](auto j) __attribute__((always_inline)) { walk.column[j.value] = columns[j.value]; });
  walk.x = x;
  if (sweeps_by_vectors(rows, x)) {
    for (; phase(walk.x) != 0; --rows) walk.template single<0>();
    for (; rows >= walk.rows_of_pass; rows -= walk.rows_of_pass) walk.pass();
  }
  for (; rows >= 2; rows -= 2) {
    walk.template single<0>();
    walk.template single<1>();
  }
  if (rows > 0) walk.template single<0>();
  repeat<count>([&](auto j) __attribute__((always_inline)) {
    store_element(sums + j.value, load_element(sums + j.value) + walk.template total<conjugated, j.value>());
  });
}

// ---- Elements apart ----

template <int count, class T>
[[gnu::noinline]] void add_apart(QtbInt rows, const T *const (&columns)[count], const T (&factors)[count], T *y,
                                 QtbInt incy) {
  for (QtbInt i = 0; i < rows; ++i, y += incy) {
    T sum = load_element(y);
    repeat<count>([&](auto j)
                      __attribute__((always_inline)) { sum += factors[j.value] * load_element(columns[j.value] + i); });
    store_element(y, sum);
  }
}

template <bool conjugated, int count, class T>
[[gnu::noinline]] void dot_apart(QtbInt rows, const T *const (&columns)[count], const T *x, QtbInt incx,
                                 T (&sums)[count]) {
  T sum[count] = {};
  for (QtbInt i = 0; i < rows; ++i, x += incx) {
    const T element = load_element(x);
    repeat<count>([&](auto j) __attribute__((always_inline)) {
      sum[j.value] += conjugate_if<conjugated>(load_element(columns[j.value] + i)) * element;
    });
  }
  repeat<count>([&](auto j) __attribute__((always_inline)) {
    store_element(sums + j.value, load_element(sums + j.value) + sum[j.value]);
  });
}

// ---- The vector ----

// swept tells that its elements stand side by side and that add and dot may go by vectors.
template <class T, class P = T *>
struct LineVector {
  P start;
  QtbInt inc;
  bool swept;

  T get(QtbInt i) const { return load_element(start + i * inc); }
  void set(QtbInt i, T v) const { store_element(start + i * inc, v); }
  template <int count>
  [[gnu::always_inline]] void add(QtbInt first, QtbInt rows, const T *const (&columns)[count],
                                  const T (&factors)[count]) const {
    if (swept)
      add_columns(rows, columns, factors, start + first);
    else
      add_apart(rows, columns, factors, start + first * inc, inc);
  }
  template <bool conjugated, int count>
  [[gnu::always_inline]] void dot(QtbInt first, QtbInt rows, const T *const (&columns)[count], T (&sums)[count]) const {
    const T *const x = start + first * inc;
    if (!swept)
      dot_apart<conjugated>(rows, columns, x, inc, sums);
    else if constexpr (count > 2)
      dot_columns<count, conjugated>(rows, columns, x, sums);
    else
      dot_few_columns<conjugated>(rows, columns, x, sums);
  }
};

template <class T>
LineVector<T> line_vector(T *x, QtbInt n, QtbInt inc) {
  return {walk_start(x, n, inc), inc, inc == 1};
}

// ---- Rows of one, two or four columns side by side ----

// The columns share rows begin to end - 1. Of two columns of a band, the first may have one row more before these, and
// the last one more behind.
struct GroupRows {
  QtbInt first, begin, end, last;
};

template <int count, class T>
struct Group {
  const T *column[count];  // row 0 of each, even where it has none

  void at(QtbInt row, const T *(&columns)[count]) const {
    repeat<count>([&](auto j) __attribute__((always_inline)) { columns[j.value] = column[j.value] + row; });
  }
};

template <int count, class T, class V>
[[gnu::always_inline]] inline void add_group(const Group<count, T> &group, const GroupRows &rows,
                                             const T (&factors)[count], const V &y) {
  constexpr int right = count - 1;
  if constexpr (count == 2)
    if (rows.first < rows.begin)
      y.set(rows.first, y.get(rows.first) + factors[0] * load_element(group.column[0] + rows.first));
  if (rows.begin < rows.end) {
    const T *columns[count];
    group.at(rows.begin, columns);
    y.add(rows.begin, rows.end - rows.begin, columns, factors);
  }
  if constexpr (count == 2)
    if (rows.end < rows.last)
      y.set(rows.end, y.get(rows.end) + factors[right] * load_element(group.column[right] + rows.end));
}

template <bool conjugated, int count, class T, class V>
[[gnu::always_inline]] inline void dot_group(const Group<count, T> &group, const GroupRows &rows, const V &x,
                                             T (&sums)[count]) {
  constexpr int right = count - 1;
  if (rows.begin < rows.end) {
    const T *columns[count];
    group.at(rows.begin, columns);
    x.template dot<conjugated>(rows.begin, rows.end - rows.begin, columns, sums);
  }
  if constexpr (count == 2) {
    if (rows.first < rows.begin)
      sums[0] += conjugate_if<conjugated>(load_element(group.column[0] + rows.first)) * x.get(rows.first);
    if (rows.end < rows.last)
      sums[right] += conjugate_if<conjugated>(load_element(group.column[right] + rows.end)) * x.get(rows.end);
  }
}

}  // namespace
}  // namespace qtb::QTB_TIER
