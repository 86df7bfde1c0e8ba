// Every tier's implementation of a routine, for tests that call tiers directly.
#pragma once

#include "blas/dispatch/slots.h"
#include "blas/tier_names.h"

namespace qtb::test {

inline const char *tier_name(int tier) { return tier_names[tier]; }

// Whether this processor has the instructions of a tier, whatever its vendor: the compiler's own test for each word of
// the list of tiers.
inline bool processor_runs(int tier) {
  constexpr auto baseline = [] { return true; };
  constexpr auto sse3 = [] { return __builtin_cpu_supports("sse3") != 0; };
  constexpr auto ssse3 = [] { return __builtin_cpu_supports("ssse3") != 0; };
  constexpr auto sse42 = [] { return __builtin_cpu_supports("sse4.2") != 0; };
  constexpr auto avx = [] { return __builtin_cpu_supports("avx") != 0; };
#define QTB_TIER_SUPPORTED(tier, TIER, flags, processor, ...) processor,
  static constexpr bool (*supported[tier_count])() = {QTB_TIER_ROWS(QTB_TIER_SUPPORTED)};
#undef QTB_TIER_SUPPORTED
  return supported[tier]();
}

// f(tier) for each tier that this processor runs.
template <class F>
void in_every_tier(F f) {
  for (int tier = 0; tier < tier_count; ++tier)
    if (processor_runs(tier)) f(tier);
}

// QTB_ALL_TIERS(daxpy): an initialiser of an array over tiers with the five implementations of a routine that all tiers
// have. Only the named procedures are linked.
#define QTB_TIER_PROCEDURE(tier, TIER, name) qtb_blas_##tier##_x##name,
#define QTB_ALL_TIERS(name) \
  { QTB_FOR_EACH_TIER(QTB_TIER_PROCEDURE, name) }

}  // namespace qtb::test
