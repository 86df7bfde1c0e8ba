// A group of columns of a symmetric or Hermitian matrix: the triangle that they have on the diagonal and a rectangle of
// rows above ("U") or below ("L") it, in one sweep. Every element is read once and serves its own row and its mirror
// image's:
//
//   y[i] += alpha * (the sum over the columns j of column[j][i]*x[j] and, on the group's own rows, the mirror images)
//
// Of the group's rows, column j takes factor[j] = alpha*x[j] to y, and gathers sum[j], of conj(column[j][i])*x[i]
// without the conjugate for a real matrix, which y takes last, times alpha. The diagonal of a Hermitian matrix counts
// by its real part. Of two columns of a band, one may have a row alone at the far end of the rectangle.
//
// Columns stand at any address; x and y are contiguous at any address, or strided, and do not overlap. Nothing outside
// the rows is touched.
//
// From shortest_mirrored rows on, rows of the rectangle go eight a pass in vectors. A contiguous y is brought to a
// vector boundary by single rows first; where they cannot, and for what is left, rows go singly, into the lowest lanes
// of the same sums. Elements that fill a vector need none of that. Vectors of strided elements are gathered and
// scattered. The sums are kept as in sweep.h. A prefetch may name what stands behind a column; it touches nothing.
#pragma once

#include "blas/kernels/level2/sweep.h"

namespace qtb::QTB_TIER {
namespace {

constexpr QtbInt shortest_mirrored = 9;  // rows from which on vectors pay

// Columns of so many rows of doubles belong to a matrix beyond the caches: a pass asks for what it will need so far
// ahead. With floats the passes are no slower than the memory.
constexpr QtbInt shortest_asked_for = 1024;
constexpr QtbInt bytes_ahead = 512;

// Vectors per turn of the loop over passes: where a vector takes many instructions, a pass takes several turns.
template <class T, bool strided>
constexpr int vectors_per_turn = strided         ? 1
                                 : is_complex<T> ? 2
                                                 : static_cast<int>(rows_per_pass / lanes<T>);

// Element i of an operand from its cursor on.
template <class Cursor>
auto *element_at(const Cursor &cursor, QtbInt i) {
  if constexpr (requires { cursor.inc; })
    return cursor.p + i * cursor.inc;
  else
    return cursor.p + i;
}

// The lowest lanes of as many vectors as one has lanes; rows for columns in as many; a vector with another lowest lane.
inline __m128d lowest_of(const __m128d *v) { return _mm_unpacklo_pd(v[0], v[1]); }
inline __m128 lowest_of(const __m128 *v) {
  return _mm_movelh_ps(_mm_unpacklo_ps(v[0], v[1]), _mm_unpacklo_ps(v[2], v[3]));
}
[[gnu::always_inline]] inline void transpose(__m128d *v) {
  const __m128d first = _mm_unpacklo_pd(v[0], v[1]);
  v[1] = _mm_unpackhi_pd(v[0], v[1]);
  v[0] = first;
}
[[gnu::always_inline]] inline void transpose(__m128 *v) { _MM_TRANSPOSE4_PS(v[0], v[1], v[2], v[3]); }
inline __m128d with_lowest(__m128d v, __m128d lowest) { return _mm_move_sd(v, lowest); }
inline __m128 with_lowest(__m128 v, __m128 lowest) { return _mm_move_ss(v, lowest); }
// Lane k as the lowest one.
template <int k>
__m128d lane(__m128d v) {
  return k == 0 ? v : _mm_unpackhi_pd(v, v);
}
template <int k>
__m128 lane(__m128 v) {
  return k == 0 ? v : _mm_shuffle_ps(v, v, k);
}

template <class T, int count, class X, class Y>
struct MirroredRows {
  const T (&factor)[count];
  AnyColumns<T, count> columns;
  X x;
  Y y;
  ColumnFactors<T, count> factors;
  ColumnSums<T, count> sums;

  template <int vectors>
  [[gnu::always_inline]] void pass() {
    repeat<vectors>([&](auto k) __attribute__((always_inline)) {
      const RowFactor<T> row(x.load(k.value));
      const auto from_column = [&](auto j) __attribute__((always_inline)) {
        Vec<T> c = columns.template vector<j.value>(k.value);
        keep_in_place(c);  // or each of its products would load it
        sums.template add_product<j.value>(c, row);
        if constexpr (!is_complex<T>) keep_in_place(sums.sum[j.value]);  // or it would wait, and be spilled, for others
        return c;
      };
      y.store(k.value, factors.add_to(y.load(k.value), from_column));
    });
    advance(vectors * lanes<T>);
  }

  // A core that does two products with every element keeps no more than a few lines of each column on their way from
  // memory by itself, and none across the boundary of a page.
  [[gnu::always_inline]] void ask_for_columns() const {
    repeat<count>([&](auto j) __attribute__((always_inline)) {
      _mm_prefetch(reinterpret_cast<const char *>(columns.template row<j.value>()) + bytes_ahead, _MM_HINT_T0);
    });
  }

  // One row of the columns begin to end - 1, and of the diagonal, if it is one of them.
  template <int begin, int end, int diagonal = -1>
  [[gnu::always_inline]] void single() {
    store_lowest(y.p, row_of_y<begin, end, diagonal>());
    advance(1);
  }
  template <int begin, int end, int diagonal>
  [[gnu::always_inline]] Vec<T> row_of_y() {
    const RowFactor<T> row(load_lowest(x.p));
    Vec<T> of_y = load_row(y.p);
    repeat<count>([&](auto j) __attribute__((always_inline)) {
      const T *const c = columns.template row<j.value>();
      if constexpr (j.value == diagonal) {
        add_diagonal<j.value>(of_y, c);
      } else if constexpr (j.value >= begin && j.value < end) {
        sums.template add_lowest_product<j.value>(load_lowest(c), row);
        add_lowest<j.value>(of_y, load_row(c));
      }
    });
    return of_y;
  }

  // As many rows as a vector has lanes, with the values and in the order of single rows: an element of y takes one
  // column after another, lane for lane; the lowest lanes of the sums stand side by side and take one row after
  // another.
  static constexpr bool takes_blocks = count == 4 && !is_complex<T> && !requires { y.inc; };
  static constexpr int own_vectors = takes_blocks ? count / lanes<T> : 1;  // of the group's own rows
  [[gnu::always_inline]] QtbInt blocks(QtbInt rows) {
    if (rows < lanes<T>) return rows;
    Vec<T> lowest[count / lanes<T>];
    repeat<count / lanes<T>>([&](auto k) __attribute__((always_inline)) {
      lowest[k.value] = lowest_of(sums.sum + k.value * lanes<T>);
    });
    for (; rows >= lanes<T>; rows -= lanes<T>) {
      Vec<T> c[count], of_y = load_unaligned(y.p);
      repeat<count>([&](auto j) __attribute__((always_inline)) {
        c[j.value] = columns.template vector<j.value>(0);
        keep_in_place(c[j.value]);  // or both of its uses would load it
        of_y = add(of_y, mul(factors.factor[j.value], c[j.value]));
      });
      store_unaligned(y.p, of_y);
      repeat<count / lanes<T>>([&](auto k) __attribute__((always_inline)) {
        transpose(c + k.value * lanes<T>);
        repeat<lanes<T>>([&](auto i) __attribute__((always_inline)) {
          lowest[k.value] =
              add(lowest[k.value], mul(c[k.value * lanes<T> + i.value], broadcast(load_single(x.p + i.value))));
        });
      });
      advance(lanes<T>);
    }
    repeat<count>([&](auto j) __attribute__((always_inline)) {
      constexpr int k = j.value / lanes<T>;
      sums.sum[j.value] = with_lowest(sums.sum[j.value], lane<j.value % lanes<T>>(lowest[k]));
    });
    return rows;
  }

  [[gnu::always_inline]] void rectangle(QtbInt rows) {
    constexpr bool fills_vector = sizeof(T) == vector_bytes, strided = requires { y.inc; };
    constexpr bool peels = !fills_vector && !strided;
    constexpr int turn = vectors_per_turn<T, strided>;
    if constexpr (fills_vector) {
      for (; rows >= turn; rows -= turn) pass<turn>();
      if (rows > 0) pass<1>();
      return;
    }
    if (rows >= shortest_mirrored && (!peels || element_aligned(y.p))) {
      if constexpr (peels)
        for (; phase(y.p) != 0; --rows) single<0, count>();
      QtbInt left = rows / rows_per_pass * (rows_per_pass / lanes<T> / turn);
      if constexpr (!strided && !is_complex<T> && sizeof(T) == sizeof(double))
        for (; rows >= shortest_asked_for && left > 0; --left) {
          ask_for_columns();
          pass<turn>();
        }
      for (; left > 0; --left) pass<turn>();
      rows %= rows_per_pass;
    }
    if constexpr (takes_blocks) rows = blocks(rows);
    for (; rows > 0; --rows) single<0, count>();
  }

  template <bool upper>
  [[gnu::always_inline]] void triangle() {
    repeat<count>([&](auto p) __attribute__((always_inline)) {
      constexpr int begin = upper ? p.value + 1 : 0, end = upper ? count : p.value;
      single<begin, end, p.value>();
    });
  }
  // The same, with the group's own elements of y in vectors, and not stored yet: what loads four elements at once waits
  // long for four stores.
  template <bool upper>
  [[gnu::always_inline]] void triangle(Vec<T> (&own)[own_vectors]) {
    Vec<T> of_y[count];
    repeat<count>([&](auto p) __attribute__((always_inline)) {
      constexpr int begin = upper ? p.value + 1 : 0, end = upper ? count : p.value;
      of_y[p.value] = row_of_y<begin, end, p.value>();
      advance(1);
    });
    repeat<own_vectors>([&](auto k)
                            __attribute__((always_inline)) { own[k.value] = lowest_of(of_y + k.value * lanes<T>); });
  }

 private:
  template <int j>
  [[gnu::always_inline]] void add_lowest(Vec<T> &of_y, Vec<T> c) const {
    if constexpr (is_complex<T>) {
      keep_in_place(c);
      of_y = add(add(of_y, mul(c, factors.re[j])), swap_parts(mul(c, factors.im[j])));
    } else {
      of_y = qtb::QTB_TIER::add_lowest(of_y, mul_lowest(c, factors.factor[j]));
    }
  }
  template <int j>
  [[gnu::always_inline]] void add_diagonal(Vec<T> &of_y, const T *c) const {
    if constexpr (is_complex<T>)
      of_y = add(of_y, mul(broadcast(load_single(parts(c))), load_repeated(&factor[j])));
    else
      add_lowest<j>(of_y, load_lowest(c));
  }
  [[gnu::always_inline]] void advance(QtbInt rows) {
    columns.advance(rows);
    x.advance(rows);
    y.advance(rows);
  }
};

// The group whose rectangle and triangle start, in order of their rows, at the row of column, x and y. The next column
// stands step elements on, and that distance grows by growth. edge tells whether the first column of two ("U") has a
// row before the rectangle, or the second ("L") one behind it. Y is Unaligned where elements fill a vector, else
// Aligned, or Strided.
template <bool upper, int count, class X, class Y, class T>
[[gnu::noinline]] void add_group(QtbInt rows, bool edge, const T *column, QtbInt step, QtbInt growth, T alpha, X x,
                                 Y y) {
  const QtbInt to_triangle = upper ? rows + edge : 0;
  T factor[count];
  repeat<count>([&](auto j) __attribute__((always_inline)) {
    factor[j.value] = alpha * load_single(element_at(x, to_triangle + j.value));
  });
  const T *columns[count];
  repeat<count>([&](auto j) __attribute__((always_inline)) {
    columns[j.value] = column;
    column += step;
    step += growth;
  });
  using Walk = MirroredRows<T, count, X, Y>;
  Walk walk{factor, AnyColumns<T, count>(columns), x, y, ColumnFactors<T, count>(factor), {}};
  if constexpr (Walk::takes_blocks) {
    Vec<T> own[Walk::own_vectors];
    if constexpr (upper) walk.rectangle(rows);
    walk.template triangle<upper>(own);
    if constexpr (!upper) walk.rectangle(rows);
    repeat<Walk::own_vectors>([&](auto k) __attribute__((always_inline)) {
      constexpr int at = k.value * lanes<T>;
      const Vec<T> totals = sum_lanes_of(walk.sums.sum + at);
      store_unaligned(y.p + to_triangle + at, add(own[k.value], mul(broadcast(alpha), totals)));
    });
    return;
  }
  if constexpr (upper) {
    if constexpr (count == 2)
      if (edge) walk.template single<0, 1>();
    walk.rectangle(rows);
  }
  walk.template triangle<upper>();
  if constexpr (!upper) {
    walk.rectangle(rows);
    if constexpr (count == 2)
      if (edge) walk.template single<1, 2>();
  }
  repeat<count>([&](auto j) __attribute__((always_inline)) {
    T *const own = element_at(y, to_triangle + j.value);
    const T sum = walk.sums.template total<is_complex<T>>(j.value);
    store_single(own, load_single(own) + alpha * sum);
  });
}

}  // namespace
}  // namespace qtb::QTB_TIER
