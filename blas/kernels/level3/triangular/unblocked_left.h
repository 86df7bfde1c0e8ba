// Products and solves from the left without packing, for a triangle of any size.
//
// Rows are counted so that a row takes from those before it: from the first row of B down where op(T) is a lower
// triangle, from the last one up where it is an upper one. A product goes through them backward, a solve forward. Tiles
// of some rows by a few columns of B sum in registers what the rows before them contribute, then their corner on the
// diagonal works on the tile's rows as vectors. The rows that fill no tile are the first, with nothing before them.
//
// Where T is not transposed, sums are vectors along the rows, of columns of T times elements of B; where it is, they
// are dot products of columns of T and of B. B goes by some columns at a time, which stay in the cache.
#pragma once

#include "blas/kernels/level3/gemm/parts.h"
#include "blas/kernels/level3/triangular/corner.h"
#include "blas/kernels/level3/triangular/form.h"
#include "blas/kernels/level3/triangular/lines_at_once.h"
#include "blas/kernels/level3/triangular/row_tile.h"

namespace qtb::QTB_TIER {
namespace {

// The rows before a tile and what of T meets them: by columns, or where T is transposed by its rows, which are dot
// products with the columns of T.
template <class T>
struct Before {
  QtbInt depth;
  const T *a;  // of T, where row 0 of the tile meets the first of these rows in the order of memory
  QtbInt
      lda;  // from there to what row 1 of the tile meets, where T is transposed; otherwise to what the next row meets
  const T *b;  // the first of these rows, in the first column
  bool conjugated;
};

// ---- T as it is ----

template <bool solves, bool backward, int vectors, int columns, class T>
[[gnu::always_inline]] inline void left_tile(const Corner<solves, T, vectors * whole_vector<T>> &corner,
                                             const Before<T> &before, T *b, QtbInt ldb) {
  Sums<vectors, columns, whole_vector<T>, T> sums;
  sums.clear();
  for (QtbInt l = 0; l < before.depth; l++) sums.add_step(before.a + l * before.lda, before.b + l, ldb);
  Vec<T> column[vectors][columns], x[vectors * lanes<T>][vectors_of_row<T, columns>];
  each_column_vector<vectors, columns>([&](auto v, auto e) __attribute__((always_inline)) {
    Vec<T> &own = column[v.value][e.value];
    own = load_unaligned(b + v.value * lanes<T> + e.value * ldb);
    if constexpr (solves) own = sub(own, sums.total(v.value, e.value, false, false));
  });
  to_rows<backward, T>(column, x);
  corner.apply(x);
  to_columns<backward, T>(x, column);
  each_column_vector<vectors, columns>([&](auto v, auto e) __attribute__((always_inline)) {
    Vec<T> &own = column[v.value][e.value];
    if constexpr (!solves) own = add(own, sums.total(v.value, e.value, false, false));
    store_unaligned(b + v.value * lanes<T> + e.value * ldb, own);
  });
}

// ---- T transposed ----

// Dot products of some columns of T with one or two of B.
template <int rows, int columns, class T>
[[gnu::always_inline]] inline void dot_products(const Before<T> &before, const T *y, QtbInt ldb,
                                                DotSum<T> (&sum)[rows][columns]) {
  const T *x = before.a;
  const auto step = [&](auto load) __attribute__((always_inline)) {
    Vec<T> a[rows];
    repeat<rows>([&](auto r) __attribute__((always_inline)) { a[r.value] = load(x + r.value * before.lda); });
    repeat<columns>([&](auto e) __attribute__((always_inline)) {
      const Vec<T> v = load(y + e.value * ldb);
      Vec<T> crossed = v;
      if constexpr (is_complex<T>) crossed = swap_parts(v);
      repeat<rows>([&](auto r)
                       __attribute__((always_inline)) { sum[r.value][e.value].add_step(a[r.value], v, crossed); });
    });
  };
  QtbInt l = 0;
  for (; l + lanes<T> <= before.depth; l += lanes<T>, x += lanes<T>, y += lanes<T>)
    step([](const T *p) __attribute__((always_inline)) { return load_unaligned(p); });
  for (; l < before.depth; l++, x++, y++)
    step([](const T *p) __attribute__((always_inline)) { return load_lowest(p); });
}

// The dot products of a row of the tile as vectors along the row.
template <int columns>
[[gnu::always_inline]] inline void total_row(const DotSum<float> (&sum)[columns], bool, __m128 (&row)[1]) {
  const auto direct = [&](int e) { return e < columns ? sum[e < columns ? e : 0].direct : _mm_setzero_ps(); };
  __m128 x[4] = {direct(0), direct(1), direct(2), direct(3)};
  _MM_TRANSPOSE4_PS(x[0], x[1], x[2], x[3]);
  row[0] = add(add(x[0], x[2]), add(x[1], x[3]));
}
template <int columns>
[[gnu::always_inline]] inline void total_row(const DotSum<double> (&sum)[columns], bool,
                                             __m128d (&row)[(columns + 1) / 2]) {
  repeat<(columns + 1) / 2>([&](auto g) __attribute__((always_inline)) {
    constexpr int e = 2 * g.value;
    __m128d second = _mm_setzero_pd();
    if constexpr (e + 1 < columns) second = sum[e + 1].direct;
    row[g.value] = add(_mm_unpacklo_pd(sum[e].direct, second), _mm_unpackhi_pd(sum[e].direct, second));
  });
}
template <int columns>
[[gnu::always_inline]] inline void total_row(const DotSum<cfloat> (&sum)[columns], bool conjugated, __m128 (&row)[1]) {
  if constexpr (columns == 1)
    row[0] = _mm_movelh_ps(sum[0].total(conjugated), _mm_setzero_ps());
  else
    row[0] = _mm_movelh_ps(sum[0].total(conjugated), sum[1].total(conjugated));
}
template <int columns>
[[gnu::always_inline]] inline void total_row(const DotSum<cdouble> (&sum)[columns], bool conjugated,
                                             __m128d (&row)[columns]) {
  repeat<columns>([&](auto e) __attribute__((always_inline)) { row[e.value] = sum[e.value].total(conjugated); });
}

template <bool solves, bool backward, int vectors, int columns, class T>
[[gnu::always_inline]] inline void left_transposed_tile(const Corner<solves, T, vectors * whole_vector<T>> &corner,
                                                        const Before<T> &before, T *b, QtbInt ldb) {
  constexpr int rows = vectors * whole_vector<T>, at_once = columns < 2 ? 1 : 2,
                row_vectors = vectors_of_row<T, columns>;
  Vec<T> column[vectors][columns], x[rows][row_vectors], total[rows][row_vectors];
  // Two columns at a time, for as many sums as there are registers for.
  DotSum<T> sums[rows][columns];
  repeat<columns / at_once>([&](auto pass) __attribute__((always_inline)) {
    DotSum<T> some[rows][at_once];
    dot_products<rows, at_once>(before, before.b + pass.value * at_once * ldb, ldb, some);
    repeat<rows>([&](auto r) __attribute__((always_inline)) {
      repeat<at_once>([&](auto e) __attribute__((always_inline)) {
        sums[r.value][pass.value * at_once + e.value] = some[r.value][e.value];
      });
    });
  });
  repeat<rows>([&](auto r) __attribute__((always_inline)) {
    total_row<columns>(sums[r.value], before.conjugated, total[r.value]);
  });
  each_column_vector<vectors, columns>([&](auto v, auto e) __attribute__((always_inline)) {
    column[v.value][e.value] = load_unaligned(b + v.value * lanes<T> + e.value * ldb);
  });
  to_rows<backward, T>(column, x);
  const auto each = [&](auto f) __attribute__((always_inline)) {
    each_column_vector<row_vectors, rows>([&](auto v, auto r) __attribute__((always_inline)) {
      x[r.value][v.value] = f(x[r.value][v.value], total[r.value][v.value]);
    });
  };
  if constexpr (solves) each([](Vec<T> p, Vec<T> q) __attribute__((always_inline)) { return sub(p, q); });
  corner.apply(x);
  if constexpr (!solves) each([](Vec<T> p, Vec<T> q) __attribute__((always_inline)) { return add(p, q); });
  to_columns<backward, T>(x, column);
  each_column_vector<vectors, columns>([&](auto v, auto e) __attribute__((always_inline)) {
    store_unaligned(b + v.value * lanes<T> + e.value * ldb, column[v.value][e.value]);
  });
}

// ---- The walk over tiles ----

// A corner of some rows in columns of B, n of them.
template <bool solves, bool transposed, bool backward, int vectors, class T>
[[gnu::noinline]] void left_rows(const ByElement<T> &t, bool unit, const Before<T> &before, QtbInt n, T *b,
                                 QtbInt ldb) {
  Corner<solves, T, vectors * whole_vector<T>> corner;
  corner.load(t, unit, nullptr);
  Before<T> now = before;
  const auto take = [&](auto columns) __attribute__((always_inline)) {
    if constexpr (transposed)
      left_transposed_tile<solves, backward, vectors, columns.value>(corner, now, b, ldb);
    else
      left_tile<solves, backward, vectors, columns.value>(corner, now, b, ldb);
    n -= columns.value;
    now.b += columns.value * ldb;
    b += columns.value * ldb;
  };
  constexpr int group = columns_at_once<T>;
  while (n >= group) take(Constant<group>());
  if constexpr (group > 2)
    if (n >= 2) take(Constant<2>());
  if (n > 0) take(Constant<1>());
}

// The first rows, fewer than a vector has, across as many columns of B as a vector has lanes.
template <bool solves, bool backward, int rows, class T>
[[gnu::noinline]] void left_short_rows(const ByElement<T> &t, bool unit, QtbInt n, T *b, QtbInt ldb) {
  Corner<solves, T, rows> corner;
  corner.load(t, unit, nullptr);
  const auto take = [&](auto columns) __attribute__((always_inline)) {
    Vec<T> x[rows][1];
    repeat<rows>([&](auto r) __attribute__((always_inline)) {
      x[r.value][0] =
          gather_part<columns.value>(static_cast<const T *>(b + (backward ? rows - 1 - r.value : r.value)), ldb);
    });
    corner.apply(x);
    repeat<rows>([&](auto r) __attribute__((always_inline)) {
      scatter_part<columns.value>(b + (backward ? rows - 1 - r.value : r.value), ldb, x[r.value][0]);
    });
    n -= columns.value;
    b += columns.value * ldb;
  };
  constexpr int whole = whole_vector<T>;
  while (n >= whole) take(Constant<whole>());
  if constexpr (whole > 1)
    if (n > 0) with_count<whole - 1>(n, take);
}

// backward: op(T) is an upper triangle.
template <bool solves, bool transposed, bool backward, class T>
void unblocked_left_walk(bool conjugated, bool unit, QtbInt m, QtbInt n, const T *a, QtbInt lda, T *b, QtbInt ldb) {
  constexpr int tall = transposed && lanes<T> == 4 ? 1 : 2;  // vectors of rows in a tile
  constexpr QtbInt whole = lanes<T>, step = tall * whole;
  const auto first_row = [&](QtbInt p, QtbInt rows) { return backward ? m - p - rows : p; };
  // Element (l, e) of a corner at place p: what row l gives to row e.
  const auto corner_at = [&](QtbInt p) {
    const QtbInt row = first_row(p, 1), way = backward ? -1 : 1;
    return ByElement<T>{a + row * (1 + lda), way * (transposed ? 1 : lda), way * (transposed ? lda : 1), conjugated};
  };
  const auto take = [&](auto vectors, QtbInt p) {
    const QtbInt rows = vectors.value * whole, row = first_row(p, rows), from = backward ? m - p : 0;
    const T *const beside = transposed ? a + from + first_row(p, 1) * lda : a + row + from * lda;
    const Before<T> before{p, beside, transposed && backward ? -lda : lda, b + from, conjugated};
    left_rows<solves, transposed, backward, vectors.value>(corner_at(p), unit, before, n, b + row, ldb);
  };
  const QtbInt rest = m % whole, tiles_at = rest + (m - rest) % step;
  const auto take_first = [&] {
    if constexpr (whole > 1)
      if (rest > 0)
        with_count<static_cast<int>(whole) - 1>(rest, [&](auto rows) {
          left_short_rows<solves, backward, rows.value>(corner_at(0), unit, n, b + first_row(0, rows.value), ldb);
        });
  };
  if (solves) {
    take_first();
    if (tiles_at > rest) take(Constant<1>(), rest);
    for (QtbInt p = tiles_at; p < m; p += step) take(Constant<tall>(), p);
  } else {
    for (QtbInt p = m - step; p >= tiles_at; p -= step) take(Constant<tall>(), p);
    if (tiles_at > rest) take(Constant<1>(), rest);
    take_first();
  }
}

template <bool solves, class T>
void unblocked_from_left(const TriForm &form, QtbInt m, QtbInt n, const T *a, QtbInt lda, T *b, QtbInt ldb) {
  constexpr QtbInt least_columns = 4 * columns_at_once<T>;
  const QtbInt columns_now = n <= least_columns ? n : lines_at_once<T>(m, least_columns);
  const bool conjugated = form.op == Op::conjugate, transposed = form.op != Op::none, backward = is_upper(form);
  for (QtbInt j = 0; j < n; j += columns_now) {
    const QtbInt columns = smaller(columns_now, n - j);
    T *const part = b + j * ldb;
    if (transposed && backward)
      unblocked_left_walk<solves, true, true>(conjugated, form.unit, m, columns, a, lda, part, ldb);
    else if (transposed)
      unblocked_left_walk<solves, true, false>(conjugated, form.unit, m, columns, a, lda, part, ldb);
    else if (backward)
      unblocked_left_walk<solves, false, true>(conjugated, form.unit, m, columns, a, lda, part, ldb);
    else
      unblocked_left_walk<solves, false, false>(conjugated, form.unit, m, columns, a, lda, part, ldb);
  }
}

}  // namespace
}  // namespace qtb::QTB_TIER
