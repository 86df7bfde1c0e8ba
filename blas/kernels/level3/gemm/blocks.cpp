// gemm_blocks: the block sizes of a GEMM family for a problem. mb, nb and kb are in-out: a caller's nonzero value
// stays. The tile is always written. The double-precision family of the avx tier imposes its own mb, nb and kb.
#include "blas/kernels/level3/gemm/tiles.h"
#include "service/cache.h"

#if QTB_TIER_AT_LEAST(ssse3) || QTB_TIER_IS(def)

namespace qtb::QTB_TIER {
namespace {

template <class T, Family family = Family::base>
QTB_FUNCTION(blocks, T, blocks) {
  constexpr GemmRules rules = rules_of<T, family>;
  constexpr bool imposed = this_tier == tier_avx && kind_of<T> == 'd';
  GemmBlocks sizes{};
  if constexpr (!imposed) sizes = {*mb, *nb, *kb, 0, 0, 0};
  std::uint32_t caches[5] = {};
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

#if QTB_TIER_AT_LEAST(ssse3)
QTB_KERNEL(sgemm_blocks, blocks, float, blocks<float>)
QTB_KERNEL(dgemm_blocks, blocks, double, blocks<double>)
QTB_KERNEL(cgemm_blocks, blocks, cfloat, blocks<cfloat>)
QTB_KERNEL(zgemm_blocks, blocks, cdouble, blocks<cdouble>)
#endif
#if QTB_TIER_IS(ssse3)
QTB_KERNEL(sgemm_sse41_blocks, blocks, float, (blocks<float, Family::sse41>))
QTB_KERNEL(dgemm_sse41_blocks, blocks, double, (blocks<double, Family::sse41>))
QTB_KERNEL(cgemm_sse41_blocks, blocks, cfloat, (blocks<cfloat, Family::sse41>))
QTB_KERNEL(zgemm_sse41_blocks, blocks, cdouble, (blocks<cdouble, Family::sse41>))
#endif
#if QTB_TIER_IS(def)
QTB_KERNEL(dgemm_def_blocks_a, blocks, double, (blocks<double, Family::def_a>))
QTB_KERNEL(dgemm_def_blocks_b, blocks, double, (blocks<double, Family::def_b>))
#endif

}  // namespace qtb::QTB_TIER

#endif
