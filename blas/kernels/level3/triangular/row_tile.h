// A tile of B as vectors along its rows: element (r, e) of B is lane e of vector x[r], or lies in one of several
// vectors, where the tile has more columns than a vector has lanes. Lanes beyond the columns hold zeros.
//
// Columns of B lie side by side, so that a tile is loaded by columns and turned around. Rows are counted upward, or
// downward where backward.
#pragma once

#include "blas/kernels/level3/gemm/sums.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
constexpr int whole_vector = static_cast<int>(lanes<T>);

// Vectors in a row of a tile.
template <class T, int columns>
constexpr int vectors_of_row = (columns + whole_vector<T> - 1) / whole_vector<T>;

// As many vectors as one has elements: rows become columns.
template <class T>
[[gnu::always_inline]] inline void turn_around(Vec<T> (&x)[lanes<T>]) {
  if constexpr (lanes<T> == 4) {
    _MM_TRANSPOSE4_PS(x[0], x[1], x[2], x[3]);
  } else if constexpr (lanes<T> == 2 && !is_complex<T>) {
    const Vec<T> low = _mm_unpacklo_pd(x[0], x[1]);
    x[1] = _mm_unpackhi_pd(x[0], x[1]);
    x[0] = low;
  } else if constexpr (lanes<T> == 2) {
    const Vec<T> low = _mm_movelh_ps(x[0], x[1]);
    x[1] = _mm_movehl_ps(x[1], x[0]);
    x[0] = low;
  }
}

// Columns in vectors, v rows to a vector, become rows; and back.
template <bool backward, class T, int vectors, int columns, int row_vectors>
[[gnu::always_inline]] inline void to_rows(const Vec<T> (&column)[vectors][columns],
                                           Vec<T> (&x)[vectors * lanes<T>][row_vectors]) {
  constexpr int whole = whole_vector<T>, rows = vectors * whole;
  repeat<vectors * row_vectors>([&](auto block) __attribute__((always_inline)) {
    constexpr int v = block.value / row_vectors, g = block.value % row_vectors;
    Vec<T> square[lanes<T>];
    repeat<whole>([&](auto k) __attribute__((always_inline)) {
      constexpr int e = g * whole + k.value;
      if constexpr (e < columns)
        square[k.value] = column[v][e];
      else
        square[k.value] = zero<T>();
    });
    turn_around<T>(square);
    repeat<whole>([&](auto k) __attribute__((always_inline)) {
      constexpr int r = v * whole + k.value;
      x[backward ? rows - 1 - r : r][g] = square[k.value];
    });
  });
}
template <bool backward, class T, int vectors, int columns, int row_vectors>
[[gnu::always_inline]] inline void to_columns(const Vec<T> (&x)[vectors * lanes<T>][row_vectors],
                                              Vec<T> (&column)[vectors][columns]) {
  constexpr int whole = whole_vector<T>, rows = vectors * whole;
  repeat<vectors * row_vectors>([&](auto block) __attribute__((always_inline)) {
    constexpr int v = block.value / row_vectors, g = block.value % row_vectors;
    Vec<T> square[lanes<T>];
    repeat<whole>([&](auto k) __attribute__((always_inline)) {
      constexpr int r = v * whole + k.value;
      square[k.value] = x[backward ? rows - 1 - r : r][g];
    });
    turn_around<T>(square);
    repeat<whole>([&](auto k) __attribute__((always_inline)) {
      constexpr int e = g * whole + k.value;
      if constexpr (e < columns) column[v][e] = square[k.value];
    });
  });
}

// f(vector, column) for each vector of rows of each column.
template <int vectors, int columns, class F>
[[gnu::always_inline]] inline void each_column_vector(F &&f) {
  repeat<columns>([&](auto e) __attribute__((always_inline)) {
    repeat<vectors>([&](auto v) __attribute__((always_inline)) { f(v, e); });
  });
}

}  // namespace
}  // namespace qtb::QTB_TIER
