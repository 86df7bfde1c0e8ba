// Sweeps: one walk down the rows of up to four columns at once, beside contiguous vectors.
//
//   add_columns     y[i] += factor[0]*column[0][i] + ...                 y may be a column too: a rank update
//   dot_columns     sum[j] += sum over i of column[j][i]*x[i]            or of its conjugate
//
// 0 <= i < rows. Columns and x stand at any address and are not changed; y overlaps none of them. Nothing outside the
// rows is touched. y (x in a dot) is brought to a vector boundary by single rows; then go passes of eight rows, and
// what is left goes singly. Few rows, and a vector that single rows cannot bring to a boundary, go singly throughout.
//
// The element sums of a dot are kept in vectors, one for each column: single rows are added to the lowest lanes, and
// the lanes are added at the end. An element of y takes its products in the order of the columns. Products of complex
// elements are never made one by one: two sets of accumulators hold those with the real and those with the imaginary
// parts of the factors, and their join at the end knows about signs, so that a product and a conjugated one share
// their loops.
//
// The pieces (Columns, ColumnFactors, ColumnSums) serve other walks too: symmetric_sweep.h has the one that does both.
#pragma once

#include "blas/kernels/element.h"
#include "blas/kernels/simd/cursors.h"
#include "blas/kernels/simd/repeat.h"

namespace qtb::QTB_TIER {
namespace {

// ---- Columns ----

// The next row of each column. Even and Odd are the cursors of columns 0, 2 and 1, 3: with an odd leading dimension
// they stand on different boundaries.
template <class T, int count, template <class> class Even, template <class> class Odd>
struct Columns {
  const T *p[count];

  explicit Columns(const T *const (&columns)[count]) {
    repeat<count>([&](auto j) __attribute__((always_inline)) { p[j.value] = columns[j.value]; });
  }
  // Side by side in a matrix.
  Columns(const T *a, QtbInt lda) {
    repeat<count>([&](auto j) __attribute__((always_inline)) { p[j.value] = a + j.value * lda; });
  }
  template <int j>
  const T *row() const {
    return p[j];
  }
  template <int j>
  auto vector(int k) const {
    if constexpr (j % 2 == 0)
      return Even<const T>{p[j]}.load(k);
    else
      return Odd<const T>{p[j]}.load(k);
  }
  [[gnu::always_inline]] void advance(QtbInt rows) {
    repeat<count>([&](auto j) __attribute__((always_inline)) { p[j.value] += rows; });
  }
};

// ---- Single rows ----

// An element at any address, in its parts: as a whole, a complex one would pass through integer registers.
template <class T>
T load_element(const T *p) {
  if constexpr (is_complex<T>)
    return {load_single(parts(p)), load_single(parts(p) + 1)};
  else
    return load_single(p);
}
// The parts together, in one store: a vector load that follows is then served by it, and need not wait for memory.
inline void store_element(float *p, float v) { store_single(p, v); }
inline void store_element(double *p, double v) { store_single(p, v); }
inline void store_element(cfloat *p, cfloat v) { store_lowest(p, _mm_unpacklo_ps(_mm_set_ss(v.re), _mm_set_ss(v.im))); }
inline void store_element(cdouble *p, cdouble v) { store_lowest(p, _mm_set_pd(v.im, v.re)); }

// One element of an update: of a complex one the whole vector is filled with it, so that no lane computes anything
// else.
template <class T>
Vec<T> load_row(const T *p) {
  if constexpr (is_complex<T>)
    return load_repeated(p);
  else
    return load_lowest(p);
}

// ---- Factors: what is added to y ----

template <class T, int count>
struct ColumnFactors {
  Vec<T> factor[count];

  explicit ColumnFactors(const T (&f)[count]) {
    repeat<count>([&](auto j) __attribute__((always_inline)) { factor[j.value] = broadcast(f[j.value]); });
  }
  // y + the products; column(Constant<j>()) is what stands in column j.
  template <class Column>
  [[gnu::always_inline]] Vec<T> add_to(Vec<T> y, Column column) const {
    repeat<count>([&](auto j) __attribute__((always_inline)) { y = add(y, mul(factor[j.value], column(j))); });
    return y;
  }
  template <class Column>
  [[gnu::always_inline]] Vec<T> add_to_lowest(Vec<T> y, Column column) const {
    repeat<count>([&](auto j)
                      __attribute__((always_inline)) { y = add_lowest(y, mul_lowest(column(j), factor[j.value])); });
    return y;
  }
};

template <class R, int count>
struct ColumnFactors<Complex<R>, count> {
  using V = Vec<R>;
  V re[count], im[count];

  explicit ColumnFactors(const Complex<R> (&f)[count]) {
    repeat<count>([&](auto j) __attribute__((always_inline)) {
      re[j.value] = broadcast(f[j.value].re);
      // Exchanged, the parts of a column meet the imaginary part of the factor, negative for the real part.
      im[j.value] = alternate(f[j.value].im, -f[j.value].im);
    });
  }
  template <class Column>
  [[gnu::always_inline]] V add_to(V y, Column column) const {
    V exchanged;
    repeat<count>([&](auto j) __attribute__((always_inline)) {
      V c = column(j);
      keep_in_place(c);
      y = add(y, mul(re[j.value], c));
      if constexpr (j.value == 0)
        exchanged = mul(c, im[0]);
      else
        exchanged = add(exchanged, mul(c, im[j.value]));
    });
    return add(y, swap_parts(exchanged));
  }
  template <class Column>
  [[gnu::always_inline]] V add_to_lowest(V y, Column column) const {
    return add_to(y, column);
  }
};

// ---- Sums: the dot products of the columns with x ----

// A vector of x, ready for all columns.
template <class T>
struct RowFactor {
  Vec<T> x;
  explicit RowFactor(Vec<T> v) : x(v) {}
};
template <class R>
struct RowFactor<Complex<R>> {
  Vec<R> re, im;
  explicit RowFactor(Vec<R> v) : re(real_parts(v)), im(imaginary_parts(v)) {}
};

template <class T, int count>
struct ColumnSums {
  Vec<T> sum[count];

  ColumnSums() {
    repeat<count>([&](auto j) __attribute__((always_inline)) { sum[j.value] = zero<T>(); });
  }
  template <int j>
  [[gnu::always_inline]] void add_product(Vec<T> column, const RowFactor<T> &x) {
    sum[j] = add(sum[j], mul(column, x.x));
    keep_in_place(sum[j]);
  }
  template <int j>
  [[gnu::always_inline]] void add_lowest_product(Vec<T> column, const RowFactor<T> &x) {
    sum[j] = add_lowest(sum[j], mul_lowest(column, x.x));
  }
  template <bool conjugated>
  [[gnu::always_inline]] T total(int j) const {
    return sum_lanes(sum[j]);
  }
  // Two columns as one: the vectors are added before their lanes.
  void join_first_two() { sum[0] = add(sum[0], sum[1]); }
};

// The sum of a vector's complex elements.
inline cfloat sum_complex(__m128 v) {
  const __m128 s = _mm_add_ps(v, _mm_movehl_ps(v, v));
  return {_mm_cvtss_f32(s), _mm_cvtss_f32(_mm_shuffle_ps(s, s, 1))};
}
inline cdouble sum_complex(__m128d v) { return {_mm_cvtsd_f64(v), _mm_cvtsd_f64(_mm_unpackhi_pd(v, v))}; }

template <class R, int count>
struct ColumnSums<Complex<R>, count> {
  using V = Vec<R>;
  V by_re[count], by_im[count];  // (cr xr, ci xr) and (cr xi, ci xi)

  ColumnSums() {
    repeat<count>([&](auto j) __attribute__((always_inline)) { by_re[j.value] = by_im[j.value] = zero<R>(); });
  }
  template <int j>
  [[gnu::always_inline]] void add_product(V column, const RowFactor<Complex<R>> &x) {
    V copy = column;
    keep_in_place(copy);
    by_re[j] = add(by_re[j], mul(column, x.re));
    by_im[j] = add(by_im[j], mul(copy, x.im));
    keep_in_place(by_re[j]);
    keep_in_place(by_im[j]);
  }
  // Zeros in the upper lanes add nothing.
  template <int j>
  [[gnu::always_inline]] void add_lowest_product(V column, const RowFactor<Complex<R>> &x) {
    add_product<j>(column, x);
  }
  void join_first_two() {
    by_re[0] = add(by_re[0], by_re[1]);
    by_im[0] = add(by_im[0], by_im[1]);
  }
  template <bool conjugated>
  [[gnu::always_inline]] Complex<R> total(int j) const {
    const Complex<R> a = sum_complex(by_re[j]), b = sum_complex(by_im[j]);
    if constexpr (conjugated)
      return {a.re + b.im, b.re - a.im};
    else
      return {a.re - b.im, a.im + b.re};
  }
};

// The totals of two doubles or four floats at once, in the order in which sum_lanes() adds lanes.
inline __m128d sum_lanes_of(const __m128d *v) { return add(_mm_unpacklo_pd(v[0], v[1]), _mm_unpackhi_pd(v[0], v[1])); }
inline __m128 sum_lanes_of(const __m128 *v) {
  const __m128 a = add(_mm_unpacklo_ps(v[0], v[1]), _mm_unpackhi_ps(v[0], v[1]));
  const __m128 b = add(_mm_unpacklo_ps(v[2], v[3]), _mm_unpackhi_ps(v[2], v[3]));
  return add(_mm_movelh_ps(a, b), _mm_movehl_ps(b, a));
}

// y[j] += alpha * the total of column j.
template <int count, class T>
[[gnu::always_inline]] inline void add_totals(const ColumnSums<T, count> &sums, bool conjugated, T alpha, T *y) {
  if constexpr (!is_complex<T> && count % lanes<T> == 0) {
    repeat<count / lanes<T>>([&](auto k) __attribute__((always_inline)) {
      constexpr int at = k.value * lanes<T>;
      store_halves(y + at, add(load_halves(y + at), mul(broadcast(alpha), sum_lanes_of(sums.sum + at))));
    });
  } else {
    repeat<count>([&](auto j) __attribute__((always_inline)) {
      const T sum = conjugated ? sums.template total<true>(j.value) : sums.template total<false>(j.value);
      store_element(y + j.value, load_element(y + j.value) + alpha * sum);
    });
  }
}

// ---- Walks ----
//
// A walk has pass<vectors>(), which takes that many vectors of rows and goes on behind them, and single().

template <class T, class C, class Y, class F>
struct AddingRows {
  C columns;
  Y y;
  const F &factors;

  template <int vectors>
  [[gnu::always_inline]] void pass() {
    repeat<vectors>([&](auto k) __attribute__((always_inline)) {
      y.store(k.value, factors.add_to(
                           y.load(k.value), [&](auto j) __attribute__((always_inline)) {
                             return columns.template vector<j.value>(k.value);
                           }));
    });
    advance(vectors * lanes<T>);
  }
  [[gnu::always_inline]] void single() {
    store_lowest(y.p, factors.add_to_lowest(
                          load_row(y.p), [&](auto j) __attribute__((always_inline)) {
                            return load_row(columns.template row<j.value>());
                          }));
    advance(1);
  }
  [[gnu::always_inline]] void advance(QtbInt rows) {
    columns.advance(rows);
    y.advance(rows);
  }
};

template <class T, int count, class C, class X>
struct DotRows {
  C columns;
  X x;
  ColumnSums<T, count> &sums;

  template <int vectors>
  [[gnu::always_inline]] void pass() {
    repeat<vectors>([&](auto k) __attribute__((always_inline)) {
      const RowFactor<T> row(x.load(k.value));
      repeat<count>([&](auto j) __attribute__((always_inline)) {
        sums.template add_product<j.value>(columns.template vector<j.value>(k.value), row);
      });
    });
    advance(vectors * lanes<T>);
  }
  [[gnu::always_inline]] void single() {
    const RowFactor<T> row(load_lowest(x.p));
    repeat<count>([&](auto j) __attribute__((always_inline)) {
      sums.template add_lowest_product<j.value>(load_lowest(columns.template row<j.value>()), row);
    });
    advance(1);
  }
  [[gnu::always_inline]] void advance(QtbInt rows) {
    columns.advance(rows);
    x.advance(rows);
  }
};

// ---- The two sweeps ----

// Rows from which on vectors pay.
template <class T>
constexpr QtbInt shortest_sweep = sizeof(T) == sizeof(float) ? 11 : 9;

// Whether a sweep over so many rows goes by vectors, with p on a boundary after some single rows.
template <class T>
bool sweeps_by_vectors(QtbInt rows, const T *p) {
  return rows >= shortest_sweep<T> && element_aligned(p);
}

constexpr QtbInt rows_per_pass = 8;

// Passes as long as there are rows for one; returns how many rows are left.
template <class T, class Walk>
[[gnu::always_inline]] inline QtbInt passes(QtbInt rows, Walk &walk) {
  for (; rows >= rows_per_pass; rows -= rows_per_pass) walk.template pass<rows_per_pass / lanes<T>>();
  return rows;
}
template <class T, class Walk>
[[gnu::always_inline]] inline QtbInt vector_rows(QtbInt rows, Walk &walk) {
  for (; rows >= lanes<T>; rows -= lanes<T>) walk.template pass<1>();
  return rows;
}
template <class Walk>
[[gnu::always_inline]] inline void single_rows(QtbInt rows, Walk &walk) {
  for (; rows > 0; --rows) walk.single();
}
template <class Walk, class Cursor>
[[gnu::always_inline]] inline QtbInt rows_to_boundary(QtbInt rows, Walk &walk, const Cursor &cursor) {
  for (; phase(cursor.p) != 0; --rows) walk.single();
  return rows;
}

template <class T, int count>
using AnyColumns = Columns<T, count, Unaligned, Unaligned>;

// An element of y does not depend on how its row is taken, so that few rows may go by vectors as well.
template <int count, class T>
[[gnu::always_inline]] inline void add_sweep(QtbInt rows, const AnyColumns<T, count> &columns,
                                             const ColumnFactors<T, count> &factors, T *y) {
  using Factors = ColumnFactors<T, count>;
  if (!sweeps_by_vectors(rows, y)) {
    AddingRows<T, AnyColumns<T, count>, Unaligned<T>, Factors> few{columns, {y}, factors};
    return single_rows(vector_rows<T>(rows, few), few);
  }
  AddingRows<T, AnyColumns<T, count>, Aligned<T>, Factors> walk{columns, {y}, factors};
  rows = passes<T>(rows_to_boundary(rows, walk, walk.y), walk);
  single_rows(vector_rows<T>(rows, walk), walk);
}

template <int count, class T>
[[gnu::always_inline]] inline void dot_sweep(QtbInt rows, const AnyColumns<T, count> &columns, const T *x,
                                             ColumnSums<T, count> &sums) {
  DotRows<T, count, AnyColumns<T, count>, Aligned<const T>> walk{columns, {x}, sums};
  if (sweeps_by_vectors(rows, x)) rows = vector_rows<T>(passes<T>(rows_to_boundary(rows, walk, walk.x), walk), walk);
  single_rows(rows, walk);
}

template <int count, class T>
[[gnu::noinline]] void add_columns(QtbInt rows, const T *const (&columns)[count], const T (&factors)[count], T *y) {
  add_sweep(rows, AnyColumns<T, count>(columns), ColumnFactors<T, count>(factors), y);
}

template <int count, bool conjugated, class T>
[[gnu::noinline]] void dot_columns(QtbInt rows, const T *const (&columns)[count], const T *x, T (&sums)[count]) {
  ColumnSums<T, count> s;
  dot_sweep(rows, AnyColumns<T, count>(columns), x, s);
  repeat<count>([&](auto j) __attribute__((always_inline)) {
    store_element(sums + j.value, load_element(sums + j.value) + s.template total<conjugated>(j.value));
  });
}

}  // namespace
}  // namespace qtb::QTB_TIER
