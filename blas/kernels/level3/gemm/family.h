// The families of this build's tier, out of the table of all (tiles.h).
#pragma once

#include "blas/kernels/kernel.h"
#include "blas/kernels/level3/gemm/tiles.h"

namespace qtb::QTB_TIER {
namespace {

using namespace tiles;

template <class T, Family family = Family::base>
constexpr GemmRules rules_of = find_rules(kind_of<T>, this_tier, family);

}  // namespace
}  // namespace qtb::QTB_TIER
