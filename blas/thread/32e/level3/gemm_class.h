// The machine class of a parallel GEMM, from the tier and what else of the processor its tables depend on.
#pragma once

#include "blas/thread/32e/level3/gemm_plan.h"
#include "blas/tiers.h"

namespace qtb {

// How the class is found, by the tier's row in blas/tiers.h.
enum class ClassRule {
  plain,  // a class of no tuned strategies
  def,    // that one, but for a processor family with kernels of its own
  ssse3,  // by SSE4.1, and with it by the second cache level
  sse42,
  avx,
};

// process answers has_sse41() and is_amd_family16(), which cost a query of the processor and are asked only where the
// class depends on them. cache is the table of service/cache.h.
template <class Process>
GemmMachineClass gemm_machine_class(ProcessorTier tier, const std::uint32_t *cache, Process &&process) {
#define QTB_TIER_CLASS(tier, TIER, flags, processor, taken, vectors, threads, products, ...) ClassRule::products,
  constexpr ClassRule rules[tier_count] = {QTB_TIER_ROWS(QTB_TIER_CLASS)};
#undef QTB_TIER_CLASS
  if (tier < 0 || tier >= tier_count) return machine_plain;
  switch (rules[tier]) {
    case ClassRule::plain: break;
    case ClassRule::def: return process.is_amd_family16() ? machine_family16 : machine_plain;
    case ClassRule::ssse3:
      if (!process.has_sse41()) return machine_ssse3;
      return cache_is_small(cache, cache_second_size, small_second_cache_bytes) ? machine_sse41_small_l2
                                                                                : machine_sse41_large_l2;
    case ClassRule::sse42: return machine_sse42;
    case ClassRule::avx: return machine_avx;
  }
  return machine_plain;
}

// Whether a class has tuned strategies, for which threads have to pay.
constexpr bool gemm_class_is_tuned(GemmMachineClass machine_class) {
  switch (machine_class) {
    case machine_ssse3:
    case machine_sse41_large_l2:
    case machine_sse42:
    case machine_sse41_small_l2: return true;
    case machine_plain:
    case machine_avx:
    case machine_family16: return false;
    case machine_class_count: break;
  }
  return false;
}

}  // namespace qtb
