// From which size on the bodies of the GEMM families pack: a problem with m, n or k below its limits takes the small
// path whole.
#pragma once

#include "blas/kernels/level3/gemm/tiles.h"

namespace qtb::tiles {
namespace {

struct SmallLimits {
  QtbInt m, n, k;
};

// The limits of a body depend on what it packs.
enum class BodyForm { full, b_in_place, a_packed };

struct LimitRow {
  char kind;
  unsigned tiers;
  Family family;
  BodyForm form;
  SmallLimits limits;
};

// clang-format off
constexpr LimitRow limit_rows[] = {
  {'d', tier_set::AVX,    Family::base,  BodyForm::full,       {3, 3, 3}},
  {'d', tier_set::SSE42,  Family::base,  BodyForm::full,       {3, 5, 5}},
  {'d', tier_set::SSE42,  Family::base,  BodyForm::a_packed,   {2, 4, 4}},
  {'d', tier_set::SSSE3,  Family::base,  BodyForm::full,       {3, 3, 3}},
  {'d', tier_set::SSSE3,  Family::base,  BodyForm::b_in_place, {2, 2, 2}},
  {'d', tier_set::SSSE3,  Family::sse41, BodyForm::full,       {5, 5, 5}},
  {'d', tier_set::SSSE3,  Family::sse41, BodyForm::b_in_place, {4, 4, 4}},
  {'s', tiers_from_sse42, Family::base,  BodyForm::full,       {5, 5, 5}},
  {'s', tiers_from_sse42, Family::base,  BodyForm::b_in_place, {4, 4, 4}},
  {'s', tier_set::SSSE3,  Family::base,  BodyForm::full,       {9, 3, 3}},
  {'s', tier_set::SSSE3,  Family::base,  BodyForm::b_in_place, {8, 2, 2}},
  {'s', tier_set::SSSE3,  Family::sse41, BodyForm::full,       {9, 5, 5}},
  {'s', tier_set::SSSE3,  Family::sse41, BodyForm::b_in_place, {8, 4, 4}},
  {'c', tiers_from_sse42, Family::base,  BodyForm::full,       {3, 5, 5}},
  {'c', tier_set::SSSE3,  Family::base,  BodyForm::full,       {5, 3, 3}},
  {'c', tier_set::SSSE3,  Family::sse41, BodyForm::full,       {5, 3, 5}},
  {'z', tiers_from_sse42, Family::base,  BodyForm::full,       {3, 5, 5}},
  {'z', tier_set::SSSE3,  Family::base,  BodyForm::full,       {3, 3, 3}},
  {'z', tier_set::SSSE3,  Family::sse41, BodyForm::full,       {3, 3, 5}},
  {'d', tier_set::SSE3,   Family::base,  BodyForm::full,       {3, 3, 3}},
  {'d', tier_set::DEF,    Family::base,  BodyForm::full,       {2, 2, 2}},
  {'d', tier_set::DEF,    Family::def_a, BodyForm::full,       {2, 2, 2}},
  {'s', tiers_to_sse3,    Family::base,  BodyForm::full,       {8, 8, 8}},
  {'c', tiers_to_sse3,    Family::base,  BodyForm::full,       {4, 8, 8}},
  {'z', tiers_to_sse3,    Family::base,  BodyForm::full,       {4, 8, 8}},
};
// clang-format on

consteval bool every_tier_has_limits() {
  constexpr char kinds[] = {'s', 'd', 'c', 'z'};
  for (const char kind : kinds) {
    unsigned found = 0;
    for (const LimitRow &row : limit_rows)
      if (row.kind == kind && row.family == Family::base && row.form == BodyForm::full) found |= row.tiers;
    if (found != tier_set::ALL) return false;
  }
  return true;
}
static_assert(every_tier_has_limits(),
              "blas/kernels/level3/gemm/limits.h: write every tier into a row of the full body of each type");

// A form without a row of its own has the limits of the full body.
consteval SmallLimits find_limits(char kind, ProcessorTier tier, Family family, BodyForm form) {
  for (const LimitRow &row : limit_rows)
    if (row.kind == kind && (row.tiers >> tier & 1U) != 0 && row.family == family && row.form == form)
      return row.limits;
  if (form == BodyForm::full) __builtin_unreachable();
  return find_limits(kind, tier, family, BodyForm::full);
}

}  // namespace
}  // namespace qtb::tiles
