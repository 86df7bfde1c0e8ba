// The drivers of a matrix that meets a triangular or symmetric one: trmm, trsm, symm, hemm.
//
// The square matrix is never divided. Every thread reads all of it, and has a slab of the other: columns where the
// square one stands left, rows where it stands right. No slab depends on another, so that nothing waits but the end of
// the region, and a result depends on the team only by what the slot makes of a slab's shape.
#pragma once

#include "blas/thread/32e/level3/gemm_share.h"
#include "blas/thread/team.h"

namespace qtb {

// Which dimension of the m x n matrix is cut, and what the order of the square one is.
constexpr QtbInt slab_extent(bool left, QtbInt m, QtbInt n) { return left ? n : m; }
constexpr QtbInt slab_order(bool left, QtbInt m, QtbInt n) { return left ? m : n; }

// The share of each thread of a team: a multiple of unit, the last thread's with the rest.
constexpr QtbInt slab_share(QtbInt extent, QtbInt unit, QtbInt team) { return multiple_below(extent / team, unit); }

// The slab of thread rank: all of the matrix where the team has one thread.
constexpr GemmRange slab_of(QtbInt extent, QtbInt unit, QtbInt team, QtbInt rank) {
  return gemm_slab(extent, slab_share(extent, unit, team), team, rank);
}

// Asks for a team and calls call(slab) on each of its threads.
template <class Call>
void run_slabs(QtbInt nthreads, QtbInt extent, QtbInt unit, const Call &call) {
  run_team(nthreads, [&](const Team &team) { call(slab_of(extent, unit, team.size, team.rank)); });
}

}  // namespace qtb
