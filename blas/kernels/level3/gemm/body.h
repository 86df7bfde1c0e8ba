// The GEMM bodies: C := alpha*op(A)*op(B) + beta*C on one thread.
//
// C is m x n with columns ldc apart, op(A) m x k, op(B) k x n. A beta of 0 stores without reading C, an alpha of 0
// reads neither A nor B. A and B do not overlap C. A small problem takes the small path whole; any other is scaled by
// beta, where the family's kernels do not apply it, and goes to the walk over its blocks.
#pragma once

#include "blas/kernels/level3/gemm/limits.h"
#include "blas/kernels/level3/gemm/walk.h"

namespace qtb::QTB_TIER {
namespace {

// The arguments of the shape gemm as a Product.
template <class T>
Product<T> product(const char *transa, const char *transb, const QtbInt *m, const QtbInt *n, const QtbInt *k,
                   const T *alpha, const T *a, const QtbInt *lda, const T *b, const QtbInt *ldb, T *c,
                   const QtbInt *ldc) {
  return {transa, transb, *m, *n, *k, *alpha, a, *lda, b, *ldb, c, *ldc};
}

template <class T, Family family, BodyForm form>
constexpr SmallLimits limits_of = find_limits(kind_of<T>, this_tier, family, form);

constexpr BodyForm form_of(Source a, Source b) {
  if (b == Source::in_place) return BodyForm::b_in_place;
  return a == Source::given && b == Source::packed ? BodyForm::a_packed : BodyForm::full;
}

// False where nothing is left to multiply: no rows or columns, an alpha of 0, a small problem.
template <class T, Family family, BodyForm form = BodyForm::full>
bool begin_product(const Product<T> &p, const T *beta) {
  constexpr SmallLimits limits = limits_of<T, family, form>;
  static_assert(limits.k > 0, "blas/kernels/level3/gemm/limits.h: write a k of 1 or more, the least that is walked");
  if (p.m < 1 || p.n < 1) return false;
  const bool multiplies = !is_zero(p.alpha);
  if (multiplies && (p.m < limits.m || p.n < limits.n || p.k < limits.k)) {
    small_path<T>(p.transa, p.transb, &p.m, &p.n, &p.k, &p.alpha, p.a, &p.lda, p.b, &p.ldb, beta, p.c, &p.ldc);
    return false;
  }
  const bool kernels_scale = multiplies && rules_of<T, family>.walk.kernels_apply_beta;
  if (!kernels_scale && !is_one(*beta)) scale_columns<T>(&p.m, &p.n, beta, p.c, &p.ldc);
  return multiplies;
}

// The block sizes of a body. More rows than a problem has are as good as any, so that the caches are asked only where
// the reduced number of rows would cut it.
template <class T, Family family, Source source_b = Source::packed>
GemmBlocks body_blocks(const Product<T> &p) {
  constexpr GemmRules rules = with_rows_in_place(rules_of<T, family>, source_b == Source::in_place);
  std::uint32_t caches[cache_size_entries] = {};
  GemmBlocks blocks{};
  if constexpr (reads_caches(rules)) {
    if (p.m <= rules.mb.reduced_or_step)
      blocks.mb = rules.mb.reduced_or_step;
    else
      qtb_serv_get_cache_sizes(caches);
  }
  fill_blocks(rules, p.m, p.n, p.k, caches, blocks);
  if constexpr (source_b == Source::in_place) blocks.nb = p.n;
  return blocks;
}

// Whether C lies on a 16-byte boundary with all its columns.
template <class T>
bool columns_aligned(const T *c, QtbInt ldc) {
  return phase(c) == 0 && ldc * static_cast<QtbInt>(sizeof(T)) % vector_bytes == 0;
}

// Bytes of a panel of A that stay in the second cache level beside what else passes through it, B and C.
constexpr QtbInt resident_bytes = 384 * 1024;

// Rows of a larger panel that a kernel takes at a time: about equal slices that stay in the cache while the columns
// pass.
template <class T>
QtbInt rows_at_a_time(QtbInt m, QtbInt kp, QtbInt mr) {
  const QtbInt bytes = m * kp * static_cast<QtbInt>(sizeof(T));
  const QtbInt slices = (bytes + resident_bytes - 1) / resident_bytes;
  return round_up((m + slices - 1) / slices, mr);
}

// The kernels of kernels.def, which add.
template <class T, Family family, Source source_b>
struct AddingKernels {
  static constexpr auto inner = inner_kernel<T, family>;
  static constexpr auto in_place = in_place_kernel<T, family>;
  static constexpr QtbInt stage_per_k = source_b == Source::in_place ? in_place.stage_per_k : inner.stage_per_k;

  bool b_is_n, aligned;
  AddingKernels(const Product<T> &p, T)
      : b_is_n(read_op<T>(p.transb) == Op::none), aligned(columns_aligned(p.c, p.ldc)) {}

  void run_inner(QTB_INNER_KERNEL_PARAMS(T)) const {
    constexpr QtbInt mr = rules_of<T, family>.mr;
    const auto kernel = aligned ? inner.aligned : inner.any;
    if (m * kp * static_cast<QtbInt>(sizeof(T)) <= resident_bytes)
      return kernel(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage);
    const QtbInt step = rows_at_a_time<T>(m, kp, mr);
    for (QtbInt i0 = 0; i0 < m; i0 += step)
      kernel(smaller(step, m - i0), n, kp, ap + i0 / mr * ldap, ldap, bp, ldbp, c + i0, ldc, stage);
  }
  void run(const Block<T> &x, bool) const {
    if constexpr (source_b == Source::packed) {
      run_inner(x.m, x.n, x.kp, x.a, x.lda, x.b, x.ldb, x.c, x.ldc, x.stage);
    } else if constexpr (source_b == Source::in_place) {
      if (aligned)
        in_place.aligned(!b_is_n, x.m, x.n, x.depth, x.a, x.lda, x.b, x.ldb, x.c, x.ldc, x.stage);
      else
        in_place.any(!b_is_n, x.m, x.n, x.depth, x.a, x.lda, x.b, x.ldb, x.c, x.ldc, x.stage);
    } else {
      run_on_slice(x);
    }
  }
  void run_on_slice(const Block<T> &x) const {
    constexpr QtbInt nr = rules_of<T, family>.nr;
    const QtbInt full = round_down(x.n, nr);
    if (full > 0) run_inner(x.m, full, x.kp, x.a, x.lda, x.b + x.l0_of_b * nr, x.ldb, x.c, x.ldc, x.stage);
    const T *bp = x.b + full / nr * x.ldb;
    for (QtbInt j0 = full, w; j0 < x.n; j0 += w, bp += x.ldb) {
      w = panel_width(nr, x.n - j0);
      run_inner(x.m, w, x.kp, x.a, x.lda, bp + x.l0_of_b * w, x.ldb, x.c + j0 * x.ldc, x.ldc, x.stage);
    }
  }
};

// C := beta*C + alpha*op(A)*op(B) by the walk of a family; beta is 1 where C is scaled. Where one block holds all of a
// problem the walk is one without loops, unless panels come from a caller, who cuts large problems only.
template <class T, Family family, Source source_a, Source source_b, class Kernels = AddingKernels<T, family, source_b>>
void add_blocks(const Product<T> &p, const GemmBlocks &blocks, const T *beta, CallersPanel<T> given_a = {},
                CallersPanel<T> given_b = {}) {
  if constexpr (source_a != Source::given && source_b != Source::given)
    if (p.m <= blocks.mb && p.n <= blocks.nb && p.k <= blocks.kb)
      return walk_blocks<T, family, source_a, source_b, Kernels, true>(p, blocks, beta, given_a, given_b);
  walk_blocks<T, family, source_a, source_b, Kernels, false>(p, blocks, beta, given_a, given_b);
}

// A whole product by a family whose kernels add.
template <class T, Family family, Source source_a, Source source_b>
void multiply(const Product<T> &p, const T *beta, CallersPanel<T> given_a = {}, CallersPanel<T> given_b = {}) {
  if (begin_product<T, family, form_of(source_a, source_b)>(p, beta))
    add_blocks<T, family, source_a, source_b>(p, body_blocks<T, family, source_b>(p), &one<T>, given_a, given_b);
}

// Bytes of the slice of B that a block of a family holds at most.
constexpr QtbInt slice_bytes(const GemmRules &rules, QtbInt width, QtbInt n, QtbInt k) {
  return smaller(k, largest_depth) * smaller(n, rules.nb.cap) * width;
}

// The same with B in place where the family reads so small a slice there.
template <class T, Family family>
void multiply_by_slice(const Product<T> &p, const T *beta) {
  constexpr GemmRules rules = rules_of<T, family>;
  if constexpr (rules.in_place.most_bytes > 0)
    if (slice_bytes(rules, sizeof(T), p.n, p.k) <= rules.in_place.most_bytes)
      return multiply<T, family, Source::packed, Source::in_place>(p, beta);
  multiply<T, family, Source::packed, Source::packed>(p, beta);
}

// ---- The procedures of a family ----

template <class T, Family family = Family::base>
QTB_FUNCTION(gemm, T, gemm_by_slice) {
  multiply_by_slice<T, family>(product(transa, transb, m, n, k, alpha, a, lda, b, ldb, c, ldc), beta);
}

template <class T, Family family = Family::base>
QTB_FUNCTION(gemm, T, gemm_in_place) {
  multiply<T, family, Source::packed, Source::in_place>(product(transa, transb, m, n, k, alpha, a, lda, b, ldb, c, ldc),
                                                        beta);
}

template <class T, Family family = Family::base>
QTB_FUNCTION(gemm_bpacked, T, gemm_of_packed_b) {
  multiply<T, family, Source::packed, Source::given>(product(transa, transb, m, n, k, alpha, a, lda, b, ldb, c, ldc),
                                                     beta, {}, {bp, *ldbp});
}

template <class T, Family family = Family::base>
QTB_FUNCTION(gemm_apacked, T, gemm_of_packed_a) {
  multiply<T, family, Source::given, Source::packed>(product(transa, transb, m, n, k, alpha, a, lda, b, ldb, c, ldc),
                                                     beta, {ap, *ldap});
}

template <class T, Family family = Family::base>
QTB_FUNCTION(gemm_packed, T, gemm_of_packed) {
  multiply<T, family, Source::given, Source::given>(product(transa, transb, m, n, k, alpha, a, lda, b, ldb, c, ldc),
                                                    beta, {ap, *ldap}, {bp, *ldbp});
}

}  // namespace
}  // namespace qtb::QTB_TIER
