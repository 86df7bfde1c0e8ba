// How the strategies of a parallel GEMM cut it: which rows and columns of C each thread of a team computes.
//
// Shares are truncated quotients, in multiples of the kernel's register tile where a kernel packs; the last thread of a
// row or column takes the rest. Here t is the number of threads taking part and i a thread's number below it.
#pragma once

#include "blas/types.h"

namespace qtb {

struct GemmRange {
  QtbInt first, count;
};

// A rectangle of C.
struct GemmTile {
  QtbInt row, rows, column, columns;
};

constexpr QtbInt at_least_0(QtbInt v) { return v > 0 ? v : 0; }
constexpr QtbInt at_most(QtbInt v, QtbInt limit) { return v < limit ? v : limit; }
constexpr QtbInt multiple_below(QtbInt v, QtbInt unit) { return v / unit * unit; }
constexpr QtbInt multiple_above(QtbInt v, QtbInt unit) { return multiple_below(v + unit - 1, unit); }

// One dimension of extent n in t slabs of share each, the last with the rest. Where the share is 0 all but the last
// have none, at an address that still lies in the matrix.
constexpr GemmRange gemm_slab(QtbInt n, QtbInt share, QtbInt t, QtbInt i) {
  return {at_most(share * i, at_least_0(n - 1)), i < t - 1 ? share : at_least_0(n - share * i)};
}
// The same, cut anywhere.
constexpr GemmRange gemm_range(QtbInt n, QtbInt t, QtbInt i) { return gemm_slab(n, n / t, t, i); }

// The column share of a grid is a multiple of this, whatever the kernel's tile.
constexpr QtbInt gemm_grid_columns = 4;

// A grid of rows x cols threads that run down its columns, for m x n with row shares in multiples of mu and column
// shares in multiples of column_unit.
constexpr GemmTile gemm_grid_tile(QtbInt m, QtbInt n, QtbInt rows, QtbInt cols, QtbInt mu, QtbInt column_unit,
                                  QtbInt i) {
  const QtbInt row_share = multiple_below(m / rows, mu), column_share = multiple_below(n / cols, column_unit);
  const QtbInt column = i / rows, row = i % rows;
  return {row * row_share, row < rows - 1 ? row_share : at_least_0(m - row * row_share), column * column_share,
          column < cols - 1 ? column_share : at_least_0(n - column * column_share)};
}

// A pass over width columns, rows or depths in cols places: place p has a share, the last one the rest.
constexpr GemmRange gemm_place(QtbInt width, QtbInt share, QtbInt cols, QtbInt p) {
  return {p * share, p < cols - 1 ? share : at_least_0(width - p * share)};
}
constexpr QtbInt gemm_place_share(QtbInt width, QtbInt cols, QtbInt unit) {
  return multiple_below(at_least_0(width) / cols, unit);
}

// Pairs that share a panel of B: pair i / 2 owns columns, of which the last pair takes the rest, and its two threads
// split the rows.
struct GemmPairs {
  QtbInt rows, share, last;  // the rows of an even thread, the columns of a pair, and of the last one
};
constexpr GemmPairs gemm_pairs(QtbInt m, QtbInt n, QtbInt pairs, QtbInt mu, QtbInt nu) {
  const QtbInt share = multiple_below(n / pairs, nu);
  return {multiple_below(m / 2, mu), share, n - (pairs - 1) * share};
}

// Row shares in multiples of mu. The last thread takes the rest: at least as many rows as the others.
constexpr GemmRange gemm_rows(QtbInt m, QtbInt t, QtbInt mu, QtbInt i) {
  const QtbInt share = multiple_below(m / t, mu);
  return {i * share, i < t - 1 ? share : m - i * share};
}

}  // namespace qtb
