// The two-stage cut of an update of a triangle: its diagonal blocks on the threads of a team, and behind the region the
// rectangles beside them, one after another, each as a product that may take all threads again.
//
// With n rows and a team of t, block p has n/t rows, the last one the rest, and strip i is all of the triangle that is
// right of block i, or below it.
#pragma once

#include "blas/thread/32e/level3/gemm_share.h"
#include "blas/thread/process.h"
#include "blas/thread/team.h"

namespace qtb {

// Up to this order the caller's thread does it.
inline constexpr QtbInt strips_serial_order = 16;

// The number of threads to ask for, for n of at least 1; 1 is the dispatch slot on the whole problem. Of the process
// it asks max_threads, and that of larger orders only.
template <class Process>
QtbInt strip_threads(QtbInt n, Process &&process) {
  if (n <= strips_serial_order) return 1;
  const QtbInt threads = process.max_threads();
  return threads > 1 ? threads : 1;
}

// A diagonal block: its rows and columns, and the row of the operands that it begins with, which lies in them even
// where there is no row left.
struct DiagonalBlock {
  QtbInt first, rows, operand_row;
};
constexpr DiagonalBlock diagonal_block(QtbInt n, QtbInt team, QtbInt p) {
  const GemmRange rows = gemm_range(n, team, p);
  return {n / team * p, rows.count, rows.first};
}

// Strip i, 0 to team - 2.
constexpr GemmTile strip_tile(QtbInt n, QtbInt team, QtbInt i, bool upper) {
  const QtbInt share = n / team, first = i * share, behind = first + share, rest = n - behind;
  return upper ? GemmTile{first, share, behind, rest} : GemmTile{behind, rest, first, share};
}

// whole() in a team of one; otherwise diagonal(block) on each thread of the team, and then strip(tile) on the caller's.
template <class Whole, class Diagonal, class Strip>
void run_strips(QtbInt nthreads, QtbInt n, bool upper, const Whole &whole, const Diagonal &diagonal,
                const Strip &strip) {
  QtbInt size = 1;
  run_team(nthreads, [&](const Team &team) {
    if (team.rank == 0) size = team.size;
    if (team.size == 1) return whole();
    diagonal(diagonal_block(n, team.size, team.rank));
  });
  for (QtbInt i = 0; i < size - 1; i++) strip(strip_tile(n, size, i, upper));
}

}  // namespace qtb
