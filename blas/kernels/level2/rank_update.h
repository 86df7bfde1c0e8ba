// Rank-1 and rank-2 updates of a triangle, full or packed, column by column: the frame of syr, her, spr, hpr and of
// their relatives with two vectors.
//
// x and y have any increments and addresses and do not overlap the triangle. Of a column, its stored rows alone are
// read and written, each once. An element's bits depend on the element alone, not on its place or the alignment.
#pragma once

#include "blas/kernels/element.h"
#include "blas/kernels/simd/cursors.h"
#include "blas/kernels/simd/repeat.h"

namespace qtb::QTB_TIER {
namespace {

// ---- Columns of a triangle ----

// The stored part of one column after another: rows elements from column on, the first of which meets element first of
// the vectors.
template <class T>
struct StoredColumns {
  T *column;
  QtbInt rows, first;
  QtbInt step, growth;        // elements to the next column, and by how much that distance grows
  QtbInt longer, next_first;  // what the next column adds to rows and first

  bool ends_on_diagonal() const { return longer > 0; }
  QtbInt diagonal() const { return ends_on_diagonal() ? rows - 1 : 0; }
  void advance() {
    column += step;
    step += growth;
    rows += longer;
    first += next_first;
  }
};

// The order columns of a full triangle, with a rectangle of other rows above ("U") or below ("L") it; and those of a
// packed triangle, which follow one another.
template <class T>
StoredColumns<T> full_triangle(const char *uplo, T *a, QtbInt lda, QtbInt order, QtbInt other) {
  if (is_letter(*uplo, 'U')) return {a, other + 1, 0, lda, 0, 1, 0};
  return {a, order + other, 0, lda + 1, 0, -1, 1};
}
template <class T>
StoredColumns<T> packed_triangle(const char *uplo, T *ap, QtbInt order) {
  if (is_letter(*uplo, 'U')) return {ap, 1, 0, 1, 1, 1, 0};
  return {ap, order, 0, order, -1, -1, 1};
}

// ---- A column ----

constexpr QtbInt shortest_updated_by_passes = 9;  // rows from which on it pays to bring a column to a boundary
constexpr int rows_per_update = 8;

// a + factor*x.
template <class T>
struct OneVector {
  Factor<T> factor;
  explicit OneVector(T f) : factor(f) {}
  Vec<T> add_to(Vec<T> a, Vec<T> x) const { return add(a, factor.times(x)); }
};
// a + of_x*x + of_y*y.
template <class T>
struct TwoVectors {
  Factor<T> of_x, of_y;
  TwoVectors(T fx, T fy) : of_x(fx), of_y(fy) {}
  Vec<T> add_to(Vec<T> a, Vec<T> x, Vec<T> y) const { return add(add(a, of_x.times(x)), of_y.times(y)); }
};

// One element, filling the vector, so that no lane computes anything else.
template <class T>
Vec<T> load_filling(const T *p) {
  if constexpr (is_complex<T>)
    return load_repeated(p);
  else
    return broadcast(load_single(p));
}

// What is left of a column, less than a pass: half of one in vectors and half of that, if they fill vectors, then
// single rows. pass and single take their rows off.
template <class T, class Pass, class Single>
[[gnu::always_inline]] inline void remaining_rows(const QtbInt &rows, Pass pass, Single single) {
  constexpr int half = rows_per_update / 2, quarter = half / 2;
  if ((rows & half) != 0) pass(Constant<half>());
  if constexpr (quarter >= lanes<T>)
    if ((rows & quarter) != 0) pass(Constant<quarter>());
  while (rows > 0) single();
}

// One element := work(the element, the vectors' elements).
template <class T, class Work, class... From>
[[gnu::always_inline]] inline void update_element(T *element, const Work &work, const From *...from) {
  store_lowest(element, work.add_to(load_filling(element), load_filling(from)...));
}

// column[i] := work(column[i], the vectors' elements i). The vectors are cursors.
template <class T, class Work, class... From>
[[gnu::always_inline]] inline void update_column(QtbInt rows, T *column, const Work &work, From... from) {
  const auto advance = [&](QtbInt count) __attribute__((always_inline)) {
    column += count;
    rows -= count;
    (from.advance(count), ...);
  };
  const auto single = [&]() __attribute__((always_inline)) {
    update_element(column, work, from.p...);
    advance(1);
  };
  const auto vector = [&](auto target, int k) __attribute__((always_inline)) {
    target.store(k, work.add_to(target.load(k), from.load(k)...));
  };
  const auto pass = [&](auto target, auto count) __attribute__((always_inline)) {
    repeat<count.value / lanes<T>>([&](auto k) __attribute__((always_inline)) { vector(target, k.value); });
    advance(count.value);
  };
  constexpr Constant<rows_per_update> whole;
  if (rows >= shortest_updated_by_passes && element_aligned(column)) {
    while (phase(column) != 0) single();
    while (rows >= rows_per_update) pass(Aligned<T>{column}, whole);
  }
  while (rows >= rows_per_update) pass(Unaligned<T>{column}, whole);
  remaining_rows<T>(
      rows, [&](auto count) __attribute__((always_inline)) { pass(Unaligned<T>{column}, count); }, single);
}

// ---- Vectors ----

// The vector of the interface from its logical first element on.
template <class T>
struct From {
  const T *base;
  QtbInt inc;
  From(const T *x, QtbInt n, QtbInt incx) : base(walk_start(x, n, incx)), inc(incx) {}
  T operator[](QtbInt i) const { return load_single(base + i * inc); }
  // A cursor at element first; contiguous says that the increment is 1.
  template <bool contiguous>
  auto cursor(QtbInt first) const {
    if constexpr (contiguous)
      return Unaligned<const T>{base + first};
    else
      return Strided<const T>{base + first * inc, inc};
  }
  // Where a routine of the interface expects count elements from first on.
  const T *argument(QtbInt first, QtbInt count) const { return base + (inc < 0 ? first + count - 1 : first) * inc; }
};

}  // namespace
}  // namespace qtb::QTB_TIER
