// The processor tiers: the five builds of the kernels that this library holds, lowest first.
//
// This list and the flags in cmake/tiers.cmake are the only places that know them; every table over tiers expands it.
#pragma once

#include <cstdint>

// X(tier, TIER, ...) once per tier, in the order of their numbers.
#define QTB_FOR_EACH_TIER(X, ...)            \
  X(def, DEF __VA_OPT__(, ) __VA_ARGS__)     \
  X(sse3, SSE3 __VA_OPT__(, ) __VA_ARGS__)   \
  X(ssse3, SSSE3 __VA_OPT__(, ) __VA_ARGS__) \
  X(sse42, SSE42 __VA_OPT__(, ) __VA_ARGS__) \
  X(avx, AVX __VA_OPT__(, ) __VA_ARGS__)

// The number of a tier, as detection returns it and as QTB_DEBUG_CPU_TYPE gives it.
#define QTB_TIER_NUMBER(tier, TIER) tier_##tier,
enum ProcessorTier : std::int32_t { QTB_FOR_EACH_TIER(QTB_TIER_NUMBER) tier_count };
#undef QTB_TIER_NUMBER

// A set of tiers, as the list of slots writes it.
#define QTB_TIER_BIT(tier, TIER) inline constexpr unsigned TIER = 1U << tier_##tier;
namespace qtb::tier_set {
QTB_FOR_EACH_TIER(QTB_TIER_BIT)
inline constexpr unsigned ALL = (1U << tier_count) - 1;
inline constexpr unsigned AVX_RUNS_SSE42 = 1U << tier_count;  // added to a set: the avx tier runs the body of sse42
}  // namespace qtb::tier_set
#undef QTB_TIER_BIT
