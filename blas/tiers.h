// The processor tiers: the builds of the kernels that this library holds, one row each, lowest first.
//
// A row's place is its tier's number. The columns:
//
//   tier, TIER   the name, and the set of this tier alone
//   flags        how the compiler is told the tier's instructions; cmake/tiers.cmake reads them here, and the names.
//                -mno-popcnt and its kin keep out what it would add on its own to the set that the tier names
//   processor    the test of the processor: qtb_serv_cpu_has_<word> (service/cpu.cpp)
//   taken        by_itself, where the test passes and no higher tier is taken; if_asked, where QTB_DEBUG_CPU_TYPE asks
//   vectors      the column of Level 1's tables (blas/kernels/level1/tuning.h)
//   threads      how calls of Levels 1 and 2 take threads (VectorThreads, blas/thread/process.h)
//   products     how the machine class of parallel products is found (ClassRule, blas/thread/32e/level3/gemm_class.h)
//   pieces       whether the tier has the building blocks that parallel drivers call (blas/dispatch/slots.def)
//
// A word is told its meaning by the layer that reads the column, and one that it does not know is an error there. What
// else a tier needs, and what says so where it is missing, is told in CONTRIBUTING.md.
#pragma once

#include <cstdint>

// ROW(tier, TIER, flags, processor, taken, vectors, threads, products, pieces, ...) once per tier.
//
// The kernels of avx are those of sse42 but for the double-precision ones of products, whose sources have flags of
// their own (QTB_WIDE_FLAGS in cmake/tiers.cmake).
// clang-format off
#define QTB_TIER_ROWS(ROW, ...) \
  ROW(def,   DEF,   "-march=x86-64",                                   baseline, by_itself, def,   serial,   def,   no  __VA_OPT__(, ) __VA_ARGS__) \
  ROW(sse3,  SSE3,  "-march=x86-64 -msse3",                            sse3,     by_itself, sse3,  serial,   plain, no  __VA_OPT__(, ) __VA_ARGS__) \
  ROW(ssse3, SSSE3, "-march=x86-64 -mssse3",                           ssse3,    by_itself, ssse3, by_cache, ssse3, yes __VA_OPT__(, ) __VA_ARGS__) \
  ROW(sse42, SSE42, "-march=x86-64 -msse4.2 -mno-popcnt -mno-crc32",   sse42,    by_itself, sse42, capped,   sse42, yes __VA_OPT__(, ) __VA_ARGS__) \
  ROW(avx,   AVX,   "-march=x86-64 -msse4.2 -mno-popcnt -mno-crc32",   avx,      if_asked,  sse42, serial,   avx,   yes __VA_OPT__(, ) __VA_ARGS__)
// clang-format on

// X(tier, TIER, ...) once per tier, for what needs no more than the names.
#define QTB_TIER_NAMES(tier, TIER, flags, processor, taken, vectors, threads, products, pieces, X, ...) \
  X(tier, TIER __VA_OPT__(, ) __VA_ARGS__)
#define QTB_FOR_EACH_TIER(X, ...) QTB_TIER_ROWS(QTB_TIER_NAMES, X __VA_OPT__(, ) __VA_ARGS__)

// The number of a tier, as detection returns it and as QTB_DEBUG_CPU_TYPE gives it.
#define QTB_TIER_NUMBER(tier, TIER) tier_##tier,
enum ProcessorTier : std::int32_t { QTB_FOR_EACH_TIER(QTB_TIER_NUMBER) tier_count };
#undef QTB_TIER_NUMBER

namespace qtb {
// The largest number that QTB_DEBUG_CPU_TYPE may have; its values are published. A tier that comes later is not asked
// for by coming.
inline constexpr std::int32_t largest_asked_tier = 4;
static_assert(tier_def == 0 && tier_sse3 == 1 && tier_ssse3 == 2 && tier_sse42 == 3 && tier_avx == 4,
              "blas/tiers.h: the numbers of these tiers are published; write the row of a new one behind them");
}  // namespace qtb

// Sets of tiers, as the list of slots writes them: one tier, all, and those with building blocks.
#define QTB_TIER_BIT(tier, TIER) inline constexpr unsigned TIER = 1U << tier_##tier;
#define QTB_PIECES_no 0U
#define QTB_PIECES_yes 1U
#define QTB_TIER_PIECES(tier, TIER, flags, processor, taken, vectors, threads, products, pieces) \
  | QTB_PIECES_##pieces << tier_##tier
namespace qtb::tier_set {
QTB_FOR_EACH_TIER(QTB_TIER_BIT)
inline constexpr unsigned ALL = (1U << tier_count) - 1;
inline constexpr unsigned PIECES = 0U QTB_TIER_ROWS(QTB_TIER_PIECES);
}  // namespace qtb::tier_set
#undef QTB_TIER_BIT
#undef QTB_PIECES_no
#undef QTB_PIECES_yes
#undef QTB_TIER_PIECES
