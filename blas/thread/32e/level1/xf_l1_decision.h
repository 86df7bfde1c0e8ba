// How many threads a Level-1 call gets: a pure function of the routine's limits, the length, the increments and what
// the process answers to four questions. process.h has the answers of this process.
//
// Asked in this order, and only when the answer counts: tier, max_threads, dynamic, cache_sizes.
#pragma once

#include <cstdint>

#include "blas/thread/process.h"

namespace qtb {

// The limits of one routine, in elements. A comparison is always of n below the limit.
struct Level1Limits {
  QtbInt min_n;        // shorter vectors run on the caller's thread, on every tier,
  QtbInt min_n_ssse3;  // and on tier ssse3
  // tier sse42
  QtbInt sse42_cap_n;  // below: 4 threads at most
  QtbInt sse42_two_n;  // below: 2 threads do not pay
  // tier ssse3, second-level cache known and small
  QtbInt wide_n;   // below: 4 threads at most
  QtbInt cap16_n;  // from wide_n to here: 16 threads at most
  QtbInt two_n;    // below: 2 threads do not pay
  // tier ssse3, any other second-level cache
  QtbInt low_n;  // below: 2 threads at most
  QtbInt mid_n;  // from low_n to here: 4 threads at most
};

// The limit of the routines that take two threads or one, whatever the length and the number of threads.
struct Level1PairLimits {
  QtbInt min_n;  // shorter vectors run on the caller's thread
};

namespace level1_limits {
// An absent rule: no length that passed min_n is below it. With ccopy, scopy and drot the cap at 16 threads is absent
// although their kin have one; those three use all threads for long vectors.
inline constexpr QtbInt none = 0;

#define QTB_LEVEL1_SIZED(name, shape, T, ...) inline constexpr Level1Limits name = {__VA_ARGS__};
#define QTB_LEVEL1_PAIR(name, shape, T, min_n) inline constexpr Level1PairLimits name = {min_n};
#include "blas/thread/32e/level1/xf_l1.def"
#undef QTB_LEVEL1_SIZED
#undef QTB_LEVEL1_PAIR
}  // namespace level1_limits

// One thread: the dispatch slot on the whole problem. The driver is never asked for it.
inline constexpr QtbInt level1_serial = 1;

// A second-level cache of at most this size, in bytes, takes the limits for a small one.
inline constexpr std::int32_t small_second_level_cache = 3 * 1024 * 1024;

// A table of no levels tells nothing. Sizes are compared as signed numbers.
inline bool has_small_second_level(const std::uint32_t *cache_table) {
  return cache_table[cache_count] != 0 &&
         static_cast<std::int32_t>(cache_table[cache_second_size]) <= small_second_level_cache;
}

inline QtbInt level1_threads_sse42(const Level1Limits &limits, QtbInt n, QtbInt threads) {
  if (n < limits.sse42_cap_n && threads > 4) return 4;
  if (n < limits.sse42_two_n && threads == 2) return level1_serial;
  return threads;
}

inline QtbInt level1_threads_small_cache(const Level1Limits &limits, QtbInt n, QtbInt threads) {
  if (n < limits.wide_n && threads > 4) return 4;
  if (n < limits.cap16_n && threads > 16) return 16;
  if (n < limits.two_n && threads == 2) return level1_serial;
  return threads;
}

inline QtbInt level1_threads_large_cache(const Level1Limits &limits, QtbInt n, QtbInt threads) {
  if (n < limits.low_n && threads > 2) return 2;
  if (n < limits.mid_n && threads > 4) return 4;
  return threads;
}

// The number of threads for a call, level1_serial or more. With dynamic mode off the user's count holds as it is.
template <class Process>
QtbInt level1_threads(const Level1Limits &limits, QtbInt n, QtbInt incx, QtbInt incy, Process &&process) {
  if (n < limits.min_n) return level1_serial;
  const VectorThreads rule = vector_threads(process.tier());
  if (rule == VectorThreads::serial) return level1_serial;
  if (rule == VectorThreads::by_cache && n < limits.min_n_ssse3) return level1_serial;
  if (incx == 0 || incy == 0) return level1_serial;
  const QtbInt threads = process.max_threads();
  if (threads < 2) return level1_serial;
  if (!process.dynamic()) return threads;
  switch (rule) {
    case VectorThreads::serial: break;
    case VectorThreads::capped: return level1_threads_sse42(limits, n, threads);
    case VectorThreads::by_cache: {
      std::uint32_t cache_table[cache_size_entries];
      process.cache_sizes(cache_table);
      return has_small_second_level(cache_table) ? level1_threads_small_cache(limits, n, threads)
                                                 : level1_threads_large_cache(limits, n, threads);
    }
  }
  return level1_serial;
}

// With dynamic mode off these routines run on one thread, the reverse of the others.
template <class Process>
QtbInt level1_threads(const Level1PairLimits &limits, QtbInt n, QtbInt incx, QtbInt incy, Process &&process) {
  if (n < limits.min_n) return level1_serial;
  if (!tier_has_parallel_vectors(process.tier())) return level1_serial;
  if (incx == 0 || incy == 0) return level1_serial;
  if (process.max_threads() < 2) return level1_serial;
  if (!process.dynamic()) return level1_serial;
  return 2;
}

}  // namespace qtb
