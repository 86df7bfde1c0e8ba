// gemm_blocks: the block sizes of a GEMM family for a problem.
#pragma once

#include "blas/kernels/level3/gemm/family.h"

namespace qtb::QTB_TIER {
namespace {

// mb, nb and kb are in-out: a caller's nonzero value stays, unless the family imposes its
// own. The tile is always written.
template <class T, Family family = Family::base>
QTB_FUNCTION(blocks, T, blocks_of_family) {
  constexpr GemmRules rules = rules_of<T, family>;
  GemmBlocks sizes{};
  if constexpr (rules.walk.callers_blocks_stay) sizes = {*mb, *nb, *kb, 0, 0, 0};
  std::uint32_t caches[cache_size_entries] = {};
  if (reads_caches(rules) && sizes.mb == 0) qtb_serv_get_cache_sizes(caches);
  fill_blocks(rules, *m, *n, *k, caches, sizes);
  *mb = sizes.mb;
  *nb = sizes.nb;
  *kb = sizes.kb;
  *mr = sizes.mr;
  *nr = sizes.nr;
  *ku = sizes.ku;
}

}  // namespace
}  // namespace qtb::QTB_TIER
