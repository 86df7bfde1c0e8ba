// How a product of a general matrix and a vector is cut over a team: along y, so that no two threads share one of its
// elements. The arithmetic of the parallel driver, without threads.
#pragma once

#include "blas/thread/32e/level1/xf_l1_share.h"

namespace qtb {

// y := A*x is cut into rows of A, which keep the alignment of the matrix, its transpose into columns.
enum class GemvSplit { rows, columns };

constexpr GemvSplit gemv_split(char trans) { return is_letter(trans, 'N') ? GemvSplit::rows : GemvSplit::columns; }

// The elements of y that every thread but the last gets.
constexpr QtbInt gemv_chunk(GemvSplit split, QtbInt m, QtbInt n, QtbInt team) {
  return split == GemvSplit::rows ? m / team / level1_grain * level1_grain : n / team;
}

// The share of thread rank, 0 to team - 1, for m and n of at least 1: disjoint, covering y, the last with the
// remainder.
constexpr Level1Share gemv_share(GemvSplit split, QtbInt m, QtbInt n, QtbInt team, QtbInt rank) {
  const QtbInt chunk = gemv_chunk(split, m, n, team), start = chunk * rank;
  return {start, rank == team - 1 ? (split == GemvSplit::rows ? m : n) - start : chunk};
}

}  // namespace qtb
