// gemm: C := alpha*op(A)*op(B) + beta*C, and the forms of it that parallel drivers call, in the tiers from ssse3 on.
//
// C is m x n with columns ldc apart, op(A) m x k, op(B) k x n. A beta of 0 stores without reading C, an alpha of 0
// reads neither A nor B. A and B do not overlap C. gemm chooses a body; nobcopy reads B in place; bpacked, apacked and
// packed get B, A or both as panels in the format of the family, A with alpha folded in, for one block of the depth.
//
// The ssse3 tier has two families, of which the one with the shuffles of later processors is taken where SSE4.1 is.
#include "blas/kernels/level3/gemm/body.h"
#include "service/cpu.h"

#if QTB_TIER_AT_LEAST(ssse3)

namespace qtb::QTB_TIER {
namespace {

// What a double-precision family asks of the memory service, with both panels, B alone, A alone and neither.
template <Family family>
consteval bool asks_for(QtbInt both, QtbInt b, QtbInt a, QtbInt neither) {
  constexpr QtbInt stage = InnerKernel<double, family>::stage_bytes(largest_depth);
  constexpr QtbInt kb = largest_depth;
  return buffer_bytes<double, family>(1, 1, kb, stage) == both && buffer_bytes<double, family>(0, 1, kb, stage) == b &&
         buffer_bytes<double, family>(1, 0, kb, stage) == a && buffer_bytes<double, family>(0, 0, kb, stage) == neither;
}
#if QTB_TIER_IS(sse42)
static_assert(asks_for<Family::base>(11588864, 10269952, 1340160, 21248));
#elif QTB_TIER_IS(ssse3)
static_assert(asks_for<Family::base>(21566720, 20509952, 1078016, 21248));
static_assert(asks_for<Family::sse41>(22557952, 20501760, 2069248, 13056));
#endif

// The arguments of the shape gemm as a Product.
template <class T>
Product<T> product(const char *transa, const char *transb, const QtbInt *m, const QtbInt *n, const QtbInt *k,
                   const T *alpha, const T *a, const QtbInt *lda, const T *b, const QtbInt *ldb, T *c,
                   const QtbInt *ldc) {
  return {transa, transb, *m, *n, *k, *alpha, a, *lda, b, *ldb, c, *ldc};
}

template <class T, Family family>
void multiply(const Product<T> &p, const T *beta) {
  if (begin_product(p, beta, limits_of<T, family, BodyForm::full>))
    add_blocks<T, family, false, false>(p, body_blocks<T, family>(p), {}, {});
}

template <class T, Family family>
void multiply_in_place(const Product<T> &p, const T *beta) {
  if (!begin_product(p, beta, limits_of<T, family, BodyForm::b_in_place>)) return;
  GemmBlocks blocks = body_blocks<T, family>(p);
  if constexpr (family == Family::sse41) {
    // This body's own rows, whatever the family's rule says.
    constexpr QtbInt rows = 600, rows_for_small_l2 = 448;
    blocks.mb = rows_for_small_l2;
    if (p.m > rows_for_small_l2) {
      std::uint32_t caches[cache_size_entries];
      qtb_serv_get_cache_sizes(caches);
      if (!level_is_small(caches, cache_second_size, small_l2_bytes)) blocks.mb = rows;
    }
  }
  add_blocks_in_place<T, family>(p, blocks);
}

// Whether a body reads B in place: a slice of B this small stays in a cache by itself.
struct InPlaceRule {
  char kind;
  unsigned tiers;
  QtbInt columns, most_bytes;
};
constexpr InPlaceRule in_place_rules[] = {
    {'s', tiers_from_sse42, 5000, 262144},
    {'s', tier_set::SSSE3, 5000, 2097152},
    {'d', tier_set::SSSE3, 10000, 2097152},
};
consteval QtbInt find_in_place_rule(char kind, ProcessorTier tier) {
  QtbInt i = 0;
  for (const InPlaceRule &row : in_place_rules) {
    if (row.kind == kind && (row.tiers >> tier & 1U) != 0) return i;
    i++;
  }
  return -1;
}

template <class T, Family family>
void multiply_by_slice(const Product<T> &p, const T *beta) {
  constexpr QtbInt found = find_in_place_rule(kind_of<T>, this_tier);
  if constexpr (found >= 0) {
    constexpr InPlaceRule rule = in_place_rules[found];
    const QtbInt slice = smaller(p.k, largest_depth) * smaller(p.n, rule.columns) * static_cast<QtbInt>(sizeof(T));
    if (slice <= rule.most_bytes) return multiply_in_place<T, family>(p, beta);
  }
  multiply<T, family>(p, beta);
}

template <class T>
QTB_FUNCTION(gemm, T, gemm) {
  const Product<T> p = product(transa, transb, m, n, k, alpha, a, lda, b, ldb, c, ldc);
#if QTB_TIER_IS(ssse3)
  // Small to all bodies, these being the least of the limits: the processor need not be asked.
  constexpr SmallLimits least = limits_of<T, Family::base, BodyForm::b_in_place>;
  if (is_small(p, least)) {
    begin_product(p, beta, least);
    return;
  }
  if (qtb_serv_cpu_has_sse41() != 0) return multiply_by_slice<T, Family::sse41>(p, beta);
#endif
  multiply_by_slice<T, Family::base>(p, beta);
}

template <class T, Family family>
QTB_FUNCTION(gemm, T, gemm_in_place) {
  multiply_in_place<T, family>(product(transa, transb, m, n, k, alpha, a, lda, b, ldb, c, ldc), beta);
}

// With one panel or both from the caller.
template <class T, Family family, BodyForm form, bool a_given, bool b_given>
void gemm_with_panels(const Product<T> &p, const T *beta, CallersPanel<T> a, CallersPanel<T> b) {
  if (begin_product(p, beta, limits_of<T, family, form>))
    add_blocks<T, family, a_given, b_given>(p, body_blocks<T, family>(p), a, b);
}

template <class T, Family family = Family::base>
QTB_FUNCTION(gemm_bpacked, T, bpacked) {
  gemm_with_panels<T, family, BodyForm::full, false, true>(
      product(transa, transb, m, n, k, alpha, a, lda, b, ldb, c, ldc), beta, {}, {bp, *ldbp});
}

#if QTB_TIER_IS(sse42)
template <class T>
QTB_FUNCTION(gemm_apacked, T, apacked) {
  gemm_with_panels<T, Family::base, BodyForm::a_packed, true, false>(
      product(transa, transb, m, n, k, alpha, a, lda, b, ldb, c, ldc), beta, {ap, *ldap}, {});
}
#endif

#if QTB_TIER_IS(ssse3)
template <class T>
QTB_FUNCTION(gemm_packed, T, packed) {
  gemm_with_panels<T, Family::sse41, BodyForm::full, true, true>(
      product(transa, transb, m, n, k, alpha, a, lda, b, ldb, c, ldc), beta, {ap, *ldap}, {bp, *ldbp});
}
#endif

}  // namespace

QTB_KERNEL(sgemm, gemm, float, gemm<float>)
QTB_KERNEL(dgemm, gemm, double, gemm<double>)
QTB_KERNEL(cgemm, gemm, cfloat, gemm<cfloat>)
QTB_KERNEL(zgemm, gemm, cdouble, gemm<cdouble>)
QTB_KERNEL(dgemm_bpacked, gemm_bpacked, double, bpacked<double>)
QTB_KERNEL(cgemm_bpacked, gemm_bpacked, cfloat, bpacked<cfloat>)
QTB_KERNEL(zgemm_bpacked, gemm_bpacked, cdouble, bpacked<cdouble>)
QTB_KERNEL(sgemm_nobcopy, gemm, float, (gemm_in_place<float, Family::base>))
#if QTB_TIER_IS(ssse3) || QTB_TIER_IS(sse42)
QTB_KERNEL(dgemm_nobcopy, gemm, double, (gemm_in_place<double, Family::base>))
#endif
#if QTB_TIER_IS(sse42)
QTB_KERNEL(dgemm_apacked, gemm_apacked, double, apacked<double>)
#endif
#if QTB_TIER_IS(ssse3)
QTB_KERNEL(sgemm_sse41, gemm, float, (gemm_in_place<float, Family::sse41>))
QTB_KERNEL(dgemm_sse41, gemm, double, (gemm_in_place<double, Family::sse41>))
QTB_KERNEL(cgemm_sse41, gemm_bpacked, cfloat, (bpacked<cfloat, Family::sse41>))
QTB_KERNEL(zgemm_sse41, gemm_bpacked, cdouble, (bpacked<cdouble, Family::sse41>))
QTB_KERNEL(sgemm_sse41_packed, gemm_packed, float, packed<float>)
QTB_KERNEL(dgemm_sse41_packed, gemm_packed, double, packed<double>)
QTB_KERNEL(cgemm_sse41_packed, gemm_packed, cfloat, packed<cfloat>)
QTB_KERNEL(zgemm_sse41_packed, gemm_packed, cdouble, packed<cdouble>)
#endif

}  // namespace qtb::QTB_TIER

#endif
