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

// Levels 1 and 2 have a parallel path on these tiers only.
inline bool tier_has_parallel_vectors(ProcessorTier tier) { return tier == tier_ssse3 || tier == tier_sse42; }

}  // namespace qtb
