// How many threads a symmetric or triangular Level-2 call gets: a pure function of the routine's limits, the order and
// what the process answers to two questions. process.h has the answers of this process.
//
// Asked in this order, and only when the answer counts: tier, max_threads.
#pragma once

#include <cstdint>

#include "blas/thread/process.h"

namespace qtb {

struct Level2Limits {
  QtbInt min_n;         // smaller matrices are the caller's thread's, on every tier
  QtbInt large_team_n;  // with more than 8 threads, matrices up to this order too
  QtbInt small_team_n;  // with up to 8 threads, matrices above this order too: the memory alone sets their speed
};

namespace level2_limits {
inline constexpr QtbInt none = 0, no_cap = INT64_MAX;  // absent rules: no order is as small, or as large
#define QTB_LEVEL2(name, shape, T, ...) inline constexpr Level2Limits name = {__VA_ARGS__};
#include "blas/thread/32e/level2/l2.def"
#undef QTB_LEVEL2
}  // namespace level2_limits

// One thread: the dispatch slot on the whole problem. The driver is never asked for it.
inline constexpr QtbInt level2_serial = 1;

inline constexpr QtbInt level2_small_team = 8;

// The number of threads for a call, level2_serial or more.
template <class Process>
QtbInt level2_threads(const Level2Limits &limits, QtbInt n, Process &&process) {
  if (n < limits.min_n) return level2_serial;
  if (!tier_has_parallel_vectors(process.tier())) return level2_serial;
  const QtbInt threads = process.max_threads();
  if (threads < 2) return level2_serial;
  const bool serial = threads > level2_small_team ? n <= limits.large_team_n : n > limits.small_team_n;
  return serial ? level2_serial : threads;
}

}  // namespace qtb
