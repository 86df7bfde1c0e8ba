// Which form the complex routines of a band triangle take: the general one, with the arithmetic inline, or a call of
// the tier's dot product or AXPY for each column.
//
// A call pays where columns are long, and no longer where a wide band leaves the cache between them: where each pays
// was found tier by tier. The tables stand here for all tiers, so that anyone can ask them.
#pragma once

#include "blas/tiers.h"
#include "blas/types.h"

namespace qtb {

enum class BandRoutine { ctbmv, ctbsv, ztbmv, ztbsv };

struct BandCall {
  bool upper, plain;  // uplo is "U", trans is "N"
  QtbInt n, k;        // the order, and the diagonals beside the main one
};

// Whether a tier has the form of calls at all.
[[gnu::always_inline]] constexpr bool has_column_calls(ProcessorTier tier) { return tier >= tier_ssse3; }

[[gnu::always_inline]] constexpr bool takes_general_form(BandRoutine routine, ProcessorTier tier, const BandCall &c) {
  if (!has_column_calls(tier)) return true;
  if (tier == tier_avx) return false;
  const bool is_sse42 = tier == tier_sse42, is_wide = c.n >= 1001 && c.k > 500;
  switch (routine) {
    case BandRoutine::ctbmv:
      if (is_sse42) return c.upper || (c.plain && c.n < 64) || is_wide;
      return c.n < 64 || (c.upper && c.plain && c.n < 256) || is_wide;
    case BandRoutine::ctbsv: return c.n < 64 || (c.plain && c.n < 256) || is_wide;
    case BandRoutine::ztbmv: return c.n < (is_sse42 ? 128 : 64);
    case BandRoutine::ztbsv: return c.n < 64 || is_wide;
  }
  return true;
}

}  // namespace qtb
