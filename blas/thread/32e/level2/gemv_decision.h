// How many threads a product of a general matrix and a vector gets: a pure function of the routine's limits, the shape
// and what the process answers to two questions. process.h has the answers of this process.
//
// Asked in this order, and only when the answer counts: tier, max_threads.
#pragma once

#include "blas/thread/32e/level2/gemv_share.h"
#include "blas/thread/process.h"

namespace qtb {

// From how much work per thread on a split pays, in elements of the matrix; less is asked of narrow shares.
struct GemvSplitLimits {
  QtbInt wide_chunk;   // shares of at least so many rows or columns are wide
  QtbInt work_wide;    // needed of wide shares
  QtbInt work_narrow;  // needed of narrower ones
};

struct GemvLimits {
  QtbInt small_dim;     // with m and n both below, the caller's thread does it, on every tier
  QtbInt serial_chunk;  // row shares of just so many rows never pay, however many columns there are
  GemvSplitLimits rows, columns;
};

namespace gemv_limits {
inline constexpr QtbInt none = -1;  // an absent rule: no share has this size
#define QTB_GEMV(name, T, small_dim, serial_chunk, row_chunk, row_wide, row_narrow, col_chunk, col_wide, col_narrow) \
  inline constexpr GemvLimits name = {                                                                               \
      small_dim, serial_chunk, {row_chunk, row_wide, row_narrow}, {col_chunk, col_wide, col_narrow}};
#include "blas/thread/32e/level2/gemv.def"
#undef QTB_GEMV
}  // namespace gemv_limits

// One thread: the dispatch slot on the whole problem. The driver is never asked for it.
inline constexpr QtbInt gemv_serial = 1;

// Whether shares of so many threads are worth their region.
constexpr bool gemv_threads_pay(const GemvLimits &limits, GemvSplit split, QtbInt m, QtbInt n, QtbInt threads) {
  const bool rows = split == GemvSplit::rows;
  const GemvSplitLimits &of_split = rows ? limits.rows : limits.columns;
  const QtbInt chunk = gemv_chunk(split, m, n, threads);
  if (rows && chunk == limits.serial_chunk) return false;
  const QtbInt work = chunk * (rows ? n : m);
  return work >= (chunk >= of_split.wide_chunk ? of_split.work_wide : of_split.work_narrow);
}

// The number of threads for a call with m and n of at least 1: gemv_serial or more.
template <class Process>
QtbInt gemv_threads(const GemvLimits &limits, GemvSplit split, QtbInt m, QtbInt n, Process &&process) {
  if (m < limits.small_dim && n < limits.small_dim) return gemv_serial;
  if (!tier_has_parallel_vectors(process.tier())) return gemv_serial;
  const QtbInt threads = process.max_threads();
  if (threads < 2) return gemv_serial;
  return gemv_threads_pay(limits, split, m, n, threads) ? threads : gemv_serial;
}

}  // namespace qtb
