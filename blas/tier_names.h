// The names of the tiers, by number: as users write and read them.
#pragma once

#include "blas/tiers.h"

namespace qtb {
#define QTB_TIER_TEXT(tier, TIER) #tier,
inline constexpr const char *tier_names[tier_count] = {QTB_FOR_EACH_TIER(QTB_TIER_TEXT)};
#undef QTB_TIER_TEXT
}  // namespace qtb
