// Whether a GEMM takes threads, and how many: a pure function of the shape and of what the process answers. process.h
// has the answers of this process.
//
// Asked in this order, and only of a problem that is not tiny: max_threads, tier, cache_sizes, what the machine class
// depends on, and in_parallel where a single thread's problem may be cut.
#pragma once

#include "blas/thread/32e/level3/gemm_class.h"
#include "blas/thread/process.h"

namespace qtb {

// m, n and k below or at these stay on the caller's thread whatever the machine: too little work for a second thread.
constexpr QtbInt gemm_serial_k = 4, gemm_serial_half_m = 2, gemm_serial_size = 16;

constexpr bool gemm_is_tiny(QtbInt m, QtbInt n, QtbInt k) {
  return k <= gemm_serial_k || m / 2 <= gemm_serial_half_m ||
         (m <= gemm_serial_size && n <= gemm_serial_size && k <= gemm_serial_size);
}

// The worth test of one type, on the machine classes with a tuned set of strategies: a measure of the work and one of
// the traffic of a pair of threads, and the depth, each with its limit. Where the limits are shared, they are divided
// by half the number of threads.
struct GemmWorth {
  QtbInt least_half_m;  // of rows, below which threads do not pay; 0 for no such test
  bool least_columns;   // whether a column for each pair of threads is not enough
  int work_shift;       // the work is half_m*columns*k over 2^work_shift
  int traffic_shift;    // the traffic over 2^traffic_shift
  QtbInt work_limit, traffic_limit, depth_limit;
  bool limits_shared;
};
template <class T>
constexpr GemmWorth gemm_worth = {};
// The limits in single precision do not shrink with the number of threads.
template <>
inline constexpr GemmWorth gemm_worth<float> = {5, true, 9, 8, 18, 24, 256, false};
template <>
inline constexpr GemmWorth gemm_worth<double> = {0, true, 9, 7, 36, 48, 512, true};
template <>
inline constexpr GemmWorth gemm_worth<cfloat> = {0, false, 7, 7, 48, 48, 256, true};
template <>
inline constexpr GemmWorth gemm_worth<cdouble> = {0, false, 7, 6, 24, 24, 256, true};

// For m, n, k of at least 1 and at least 2 threads. Products wrap round where they leave 64 bits: no matrix of such a
// size fits a memory.
template <class T>
constexpr bool gemm_threads_pay(QtbInt m, QtbInt n, QtbInt k, QtbInt threads) {
  constexpr GemmWorth worth = gemm_worth<T>;
  const QtbInt pairs = threads / 2 > 1 ? threads / 2 : 1;
  const QtbInt half_m = m / 2, columns = n / pairs;
  if (half_m < worth.least_half_m || (worth.least_columns && columns <= 1)) return false;

  const auto u_half_m = static_cast<std::uint64_t>(half_m), u_columns = static_cast<std::uint64_t>(columns),
             u_k = static_cast<std::uint64_t>(k);
  const auto work = static_cast<QtbInt>(u_half_m * u_columns * u_k) >> worth.work_shift;
  QtbInt traffic;
  if constexpr (is_complex<T>)
    traffic = static_cast<QtbInt>(((u_half_m + u_columns) * u_k + u_half_m * u_columns) >> worth.traffic_shift);
  else
    traffic = static_cast<QtbInt>((u_half_m + u_k) * u_columns + u_half_m * u_k) >> worth.traffic_shift;

  const QtbInt share = worth.limits_shared ? pairs : 1;
  return work > worth.work_limit / share || traffic > worth.traffic_limit / share || k > worth.depth_limit / share;
}

enum GemmRoad {
  gemm_serial,     // one call of the dispatch slot, with the caller's own arguments
  gemm_in_slices,  // the same in slices of rows
  gemm_parallel
};

struct GemmDecision {
  GemmRoad road;
  QtbInt threads;  // to ask for; at least 2 on the parallel road
  GemmMachineClass machine_class;
  bool tuned;  // the class has tuned strategies, which add to C: it is scaled ahead of them
  std::uint32_t cache[cache_size_entries];
};

// For m and n of at least 1 and a problem that is not tiny.
template <class T, class Process>
GemmDecision gemm_decision(QtbInt m, QtbInt n, QtbInt k, Process &&process) {
  GemmDecision decision{};
  decision.threads = process.max_threads();
  const ProcessorTier tier = process.tier();
  process.cache_sizes(decision.cache);
  decision.machine_class = gemm_machine_class(tier, decision.cache, process);
  if (decision.threads <= 1) {
    // Only in real arithmetic, inside a parallel region of the caller's, on the one class that gains by it.
    if constexpr (!is_complex<T>)
      if (decision.machine_class == machine_sse41_small_l2 && process.in_parallel()) decision.road = gemm_in_slices;
    return decision;
  }
  decision.tuned = gemm_class_is_tuned(decision.machine_class);
  // Where strategies are not tuned, threads always pay.
  if (!decision.tuned || gemm_threads_pay<T>(m, n, k, decision.threads)) decision.road = gemm_parallel;
  return decision;
}

}  // namespace qtb
