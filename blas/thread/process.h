// What the front ends ask of this process.
//
// A decision about threads is a pure function: a template over the process, which it asks one question at a time, in
// the order that its family fixes and only where the answer counts, since some questions read the environment, visit
// every processor or query it. A small problem asks nothing at all. Tests hand in a process of their own making.
#pragma once

#include <omp.h>

#include "service/cache.h"
#include "service/cpu.h"
#include "service/threads.h"

namespace qtb {

struct ThisProcess {
  static ProcessorTier tier() { return qtb_serv_cpu_detect(); }
  // The largest number of threads that this call may use, at least 1.
  static QtbInt max_threads() { return qtb_serv_get_max_threads(domain_blas); }
  // Whether the library may lower that number to what pays.
  static bool dynamic() { return qtb_serv_get_dynamic() == 1; }
  // Fills cache_size_entries numbers.
  static void cache_sizes(std::uint32_t *table) { qtb_serv_get_cache_sizes(table); }
  static bool has_sse41() { return qtb_serv_cpu_takes_sse41() != 0; }
  static bool is_amd_family16() { return qtb_serv_cpu_is_amd_family16() != 0; }
  // Whether the calling thread works inside a parallel region already.
  static bool in_parallel() { return omp_in_parallel() != 0; }
};

// How calls of Levels 1 and 2 take threads, by the tier's row in blas/tiers.h. Level 1 has a rule of limits for each of
// the others (level1_threads); Level 2 has one for both.
enum class VectorThreads {
  serial,    // never
  by_cache,  // from larger vectors on; how many, by the second-level cache as well
  capped,    // how many, by the length alone
};

inline VectorThreads vector_threads(ProcessorTier tier) {
#define QTB_TIER_THREADS(tier, TIER, flags, processor, taken, vectors, threads, ...) VectorThreads::threads,
  static constexpr VectorThreads of_tier[tier_count] = {QTB_TIER_ROWS(QTB_TIER_THREADS)};
#undef QTB_TIER_THREADS
  return of_tier[tier];
}

inline bool tier_has_parallel_vectors(ProcessorTier tier) { return vector_threads(tier) != VectorThreads::serial; }

// Whether a tier has the building blocks that parallel drivers call.
constexpr bool tier_has_pieces(ProcessorTier tier) { return (tier_set::PIECES >> tier & 1) != 0; }

}  // namespace qtb
