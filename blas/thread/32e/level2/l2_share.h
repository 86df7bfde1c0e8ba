// How a symmetric or triangular matrix is cut over a team: the arithmetic of the parallel Level-2 drivers, without
// threads. All sizes are rows or columns of the matrix, n is at least 1, and a team has at least 2 threads.
#pragma once

#include "blas/thread/32e/level1/xf_l1_share.h"

namespace qtb {

// symv: the matrix in blocks x blocks squares, the last row and column of them with the remainder. Each block of y has
// one owner, and an odd team one thread without a block.
struct SymvBlocks {
  QtbInt n, blocks, chunk;

  Level1Share block(QtbInt b) const { return {chunk * b, b == blocks - 1 ? n - chunk * b : chunk}; }
  // The part of x that block row b meets to the left of its diagonal block, and to the right.
  Level1Share left(QtbInt b) const { return {0, chunk * b}; }
  Level1Share right(QtbInt b) const { return {chunk * (b + 1), n - chunk * (b + 1)}; }
};

constexpr SymvBlocks symv_blocks(QtbInt n, QtbInt team) {
  const QtbInt blocks = team / 2 * 2;
  return {n, blocks, n / blocks / level1_grain * level1_grain};
}

// The others cut the columns, of which those of one end are short. Half of the team takes the first part, the other
// half the rest, each in equal shares.
//
// The first part: half of a small matrix; of a larger one the third with the long columns, or the two with the short.
constexpr QtbInt triangle_first_part(QtbInt n, bool first_are_short) {
  constexpr QtbInt smallest_uneven = 1025;
  if (n < smallest_uneven) return n / 2;
  return first_are_short ? 2 * n / 3 : n / 3;
}
// Of the columns that a rank-1 or rank-2 update changes, and of the elements of op(A)*x by the products behind them.
constexpr bool syr_first_are_short(char uplo) { return is_letter(uplo, 'U'); }
constexpr bool trmv_first_are_short(char uplo, char trans) { return is_letter(uplo, 'U') != is_letter(trans, 'N'); }

// The share of thread rank, 0 to team - 1: disjoint and covering all n, in multiples of the grain but for the last.
constexpr Level1Share triangle_share(QtbInt n, bool first_are_short, QtbInt team, QtbInt rank) {
  const QtbInt half = team / 2;
  const QtbInt first = triangle_first_part(n, first_are_short) / half / level1_grain * level1_grain;
  if (rank < half) return {rank * first, first};
  const QtbInt rest = (n - half * first) / (team - half) / level1_grain * level1_grain;
  const QtbInt start = half * first + (rank - half) * rest;
  return {start, rank == team - 1 ? n - start : rest};
}

// What a thread's share of trmv reads: which part of the old x, and from which element of A on.
struct TrmvReach {
  Level1Share x;
  QtbInt row, column;
};

constexpr TrmvReach trmv_reach(QtbInt n, char uplo, char trans, Level1Share share) {
  const QtbInt end = share.start + share.len;
  const bool upper = is_letter(uplo, 'U'), plain = is_letter(trans, 'N');
  if (upper == plain) return {{share.start, n - share.start}, share.start, share.start};
  return {{0, end}, plain ? share.start : 0, plain ? 0 : share.start};
}

// How the copy of x is cut that trmv reads: equal shares, the last with the remainder.
constexpr Level1Share trmv_copy_share(QtbInt n, QtbInt team, QtbInt rank) {
  const QtbInt chunk = n / team, start = chunk * rank;
  return {start, rank == team - 1 ? n - start : chunk};
}

}  // namespace qtb
