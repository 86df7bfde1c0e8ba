// The machine class of a parallel GEMM, from the tier and what else of the processor its tables depend on.
#pragma once

#include "blas/thread/32e/level3/gemm_plan.h"
#include "blas/tiers.h"

namespace qtb {

// process answers has_sse41() and is_amd_family16(), which cost a query of the processor and are asked only where the
// class depends on them. cache is the table of service/cache.h.
template <class Process>
GemmMachineClass gemm_machine_class(ProcessorTier tier, const std::uint32_t *cache, Process &&process) {
  switch (tier) {
    case tier_def: return process.is_amd_family16() ? machine_family16 : machine_plain;
    case tier_ssse3:
      if (!process.has_sse41()) return machine_ssse3;
      return cache_is_small(cache, cache_second_size, small_second_cache_bytes) ? machine_sse41_small_l2
                                                                                : machine_sse41_large_l2;
    case tier_sse42: return machine_sse42;
    case tier_avx: return machine_avx;
    default: return machine_plain;
  }
}

}  // namespace qtb
