// The blocked loops of a GEMM body: C := alpha*op(A)*op(B) + beta*C on one thread, in the tiers from ssse3 on.
//
// A small problem takes the small path whole. Otherwise C is scaled by beta, and everything after that adds: over
// blocks of nb columns and, inside, of kb of the depth, a block of op(B) is packed, and over blocks of mb rows one of
// op(A) with alpha folded in, on which the inner kernel works. Rows beyond a multiple of mr take the small path, block
// by block. A body may get A, B or both as panels that its caller has packed, or read B in place; of an operand that
// the caller has packed the matrix itself is read only by the small path.
#pragma once

#include "blas/kernels/level3/gemm/buffers.h"
#include "blas/kernels/level3/gemm/kernels.h"
#include "blas/kernels/level3/gemm/parts.h"
#include "service/cache.h"

namespace qtb::QTB_TIER {
namespace {

// A problem with m, n or k below these takes the small path.
struct SmallLimits {
  QtbInt m, n, k;
};

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

// A form without a row of its own has the limits of the full body.
consteval SmallLimits find_limits(char kind, ProcessorTier tier, Family family, BodyForm form) {
  for (const LimitRow &row : limit_rows)
    if (row.kind == kind && (row.tiers >> tier & 1U) != 0 && row.family == family && row.form == form)
      return row.limits;
  return find_limits(kind, tier, family, BodyForm::full);
}
template <class T, Family family, BodyForm form>
constexpr SmallLimits limits_of = find_limits(kind_of<T>, this_tier, family, form);

// One call, with its matrices as they lie in memory.
template <class T>
struct Product {
  const char *transa, *transb;
  QtbInt m, n, k;
  T alpha;
  const T *a;
  QtbInt lda;
  const T *b;
  QtbInt ldb;
  T *c;
  QtbInt ldc;
};

// A panel that the caller has packed; no panels where it has not.
template <class T>
struct CallersPanel {
  const T *panels = nullptr;
  QtbInt ldp = 0;
};

template <class T>
bool is_small(const Product<T> &p, SmallLimits limits) {
  return p.m < limits.m || p.n < limits.n || p.k < limits.k;
}

constexpr float one_of(float) { return 1; }
constexpr double one_of(double) { return 1; }
template <class R>
constexpr Complex<R> one_of(Complex<R>) {
  return {1, 0};
}

// C := beta*C + alpha*op(A)*op(B) over rows i0 and up, columns j0 to j0 + n and depth l0 to l0 + k, without packing.
template <class T>
void run_small(const Product<T> &p, bool a_is_n, bool b_is_n, QtbInt i0, QtbInt j0, QtbInt n, QtbInt l0, QtbInt k,
               T beta) {
  const QtbInt m = p.m - i0;
  small_path<T>(p.transa, p.transb, &m, &n, &k, &p.alpha, p.a + (a_is_n ? i0 + l0 * p.lda : l0 + i0 * p.lda), &p.lda,
                p.b + (b_is_n ? l0 + j0 * p.ldb : j0 + l0 * p.ldb), &p.ldb, &beta, p.c + i0 + j0 * p.ldc, &p.ldc);
}
template <class T>
void add_small(const Product<T> &p, bool a_is_n, bool b_is_n, QtbInt i0, QtbInt j0, QtbInt n, QtbInt l0, QtbInt k) {
  run_small(p, a_is_n, b_is_n, i0, j0, n, l0, k, one_of(p.alpha));
}

// Scales C. False where nothing is left to do: no rows or columns, an alpha of 0, which reads neither A nor B, or a
// small problem, which takes the small path whole.
template <class T>
bool begin_product(const Product<T> &p, const T *beta, SmallLimits limits) {
  if (p.m < 1 || p.n < 1) return false;
  const bool multiplies = !is_zero(p.alpha);
  if (multiplies && is_small(p, limits)) {
    run_small(p, read_op<T>(p.transa) == Op::none, read_op<T>(p.transb) == Op::none, 0, 0, p.n, 0, p.k, *beta);
    return false;
  }
  if (!is_one(*beta)) scale_columns<T>(&p.m, &p.n, beta, p.c, &p.ldc);
  return multiplies;
}

// Bytes of a panel of A that stay in the second cache level beside what else passes through it, B and C.
constexpr QtbInt resident_bytes = 384 * 1024;

// Rows of a panel that the kernel takes at a time: all of them, or about equal slices that stay in the cache while the
// columns pass.
template <class T, Family family>
QtbInt rows_at_a_time(QtbInt m, QtbInt kp) {
  const QtbInt bytes = m * kp * static_cast<QtbInt>(sizeof(T));
  if (bytes <= resident_bytes) return m;
  const QtbInt slices = (bytes + resident_bytes - 1) / resident_bytes;
  return round_up((m + slices - 1) / slices, rules_of<T, family>.mr);
}

template <class T, Family family>
void run_kernel(bool aligned, QTB_INNER_KERNEL_PARAMS(T)) {
  const auto kernel = aligned ? InnerKernel<T, family>::run_aligned : InnerKernel<T, family>::run;
  const QtbInt step = rows_at_a_time<T, family>(m, kp);
  for (QtbInt i0 = 0; i0 < m; i0 += step)
    kernel(smaller(step, m - i0), n, kp, ap + i0 / rules_of<T, family>.mr * ldap, ldap, bp, ldbp, c + i0, ldc, stage);
}

// The kernel on a slice of the depth, l0 to l0 + kp, of panels that hold more. ap and bp are the whole panels; the edge
// micro-panels of B have widths, and so offsets, of their own.
template <class T, Family family>
void run_kernel_on_slice(bool aligned, QtbInt l0, QTB_INNER_KERNEL_PARAMS(T)) {
  constexpr QtbInt mr = rules_of<T, family>.mr, nr = rules_of<T, family>.nr;
  ap += l0 * mr;
  const QtbInt full = round_down(n, nr);
  if (full > 0) run_kernel<T, family>(aligned, m, full, kp, ap, ldap, bp + l0 * nr, ldbp, c, ldc, stage);
  bp += full / nr * ldbp;
  for (QtbInt j0 = full, w; j0 < n; j0 += w, bp += ldbp) {
    w = panel_width(nr, n - j0);
    run_kernel<T, family>(aligned, m, w, kp, ap, ldap, bp + l0 * w, ldbp, c + j0 * ldc, ldc, stage);
  }
}

// Whether every column of C begins on a 16-byte boundary.
template <class T>
bool columns_aligned(const T *c, QtbInt ldc) {
  return phase(c) == 0 && ldc * static_cast<QtbInt>(sizeof(T)) % vector_bytes == 0;
}

// The block sizes of a body. More rows than a problem has are as good as any, so that the caches are asked only where
// the reduced number of rows would cut it.
template <class T, Family family>
GemmBlocks body_blocks(const Product<T> &p) {
  constexpr GemmRules rules = rules_of<T, family>;
  std::uint32_t caches[cache_size_entries] = {};
  GemmBlocks blocks{};
  if constexpr (reads_caches(rules)) {
    if (p.m <= rules.mb.reduced_or_step)
      blocks.mb = rules.mb.reduced_or_step;
    else
      qtb_serv_get_cache_sizes(caches);
  }
  fill_blocks(rules, p.m, p.n, p.k, caches, blocks);
  return blocks;
}

// Whether one block holds the whole problem.
template <class T>
bool fit(const GemmBlocks &blocks, const Product<T> &p) {
  return p.m <= blocks.mb && p.n <= blocks.nb && p.k <= blocks.kb;
}

// Where the block after that at first begins. One block that holds all has none after it: compilers see that there is
// no loop, and small problems, which have one block, are spared what goes ahead of loops.
template <bool one_block>
QtbInt next_block(QtbInt first, QtbInt step, QtbInt total) {
  return one_block ? total : first + step;
}

// C += alpha*op(A)*op(B), with B packed here or by the caller, and A likewise.
template <class T, Family family, bool a_given, bool b_given, bool one_block>
void walk_blocks(const Product<T> &p, GemmBlocks blocks, CallersPanel<T> given_a, CallersPanel<T> given_b) {
  constexpr GemmRules rules = rules_of<T, family>;
  const Op op_a = read_op<T>(p.transa), op_b = read_op<T>(p.transb);
  const bool a_is_n = op_a == Op::none, b_is_n = op_b == Op::none, aligned = columns_aligned(p.c, p.ldc);
  const QtbInt full_m = round_down(p.m, rules.mr), depth_step = blocks.kb;
  const QtbInt column_step = b_given ? p.n : blocks.nb, row_step = a_given ? full_m : blocks.mb;
  if (full_m == 0) return add_small(p, a_is_n, b_is_n, 0, 0, p.n, 0, p.k);
  PanelCopy<T> *const copy_a = copies_of<T, family>.a[static_cast<int>(op_a)];
  PanelCopy<T> *const copy_b = copies_of<T, family>.b[static_cast<int>(op_b)];

  const GemmBuffers<T> buffers = get_buffers<T, family>(a_given ? 0 : blocks.mb, b_given ? 0 : blocks.nb, blocks.kb,
                                                        InnerKernel<T, family>::stage_bytes(largest_depth));
  if (buffers.allocation == nullptr) return add_small(p, a_is_n, b_is_n, 0, 0, p.n, 0, p.k);
  for (QtbInt j0 = 0; j0 < p.n; j0 = next_block<one_block>(j0, column_step, p.n)) {
    const QtbInt n = smaller(column_step, p.n - j0);
    for (QtbInt l0 = 0; l0 < p.k; l0 = next_block<one_block>(l0, depth_step, p.k)) {
      const QtbInt k = smaller(depth_step, p.k - l0), kp = round_up(k, rules.ku);
      const QtbInt step_a = kp * rules.mr, step_b = kp * rules.nr;
      if constexpr (!b_given)
        copy_b(&k, &n, p.b + (b_is_n ? l0 + j0 * p.ldb : j0 + l0 * p.ldb), &p.ldb, buffers.b, &step_b, nullptr);
      for (QtbInt i0 = 0; i0 < full_m; i0 = next_block<one_block>(i0, row_step, full_m)) {
        const QtbInt m = smaller(row_step, full_m - i0);
        T *const c = p.c + i0 + j0 * p.ldc;
        if constexpr (!a_given)
          copy_a(&m, &k, p.a + (a_is_n ? i0 + l0 * p.lda : l0 + i0 * p.lda), &p.lda, buffers.a, &step_a, &p.alpha);
        if constexpr (!a_given && !b_given)
          run_kernel<T, family>(aligned, m, n, kp, buffers.a, step_a, buffers.b, step_b, c, p.ldc, buffers.stage);
        else if constexpr (a_given && !b_given)
          run_kernel<T, family>(aligned, m, n, kp, given_a.panels + l0 * rules.mr, given_a.ldp, buffers.b, step_b, c,
                                p.ldc, buffers.stage);
        else if constexpr (!a_given)
          // The slice of a panel of A that was packed here begins at the panel's start.
          run_kernel_on_slice<T, family>(aligned, l0, m, n, kp, buffers.a - l0 * rules.mr, step_a, given_b.panels,
                                         given_b.ldp, c, p.ldc, buffers.stage);
        else
          run_kernel_on_slice<T, family>(aligned, l0, m, n, kp, given_a.panels, given_a.ldp, given_b.panels,
                                         given_b.ldp, c, p.ldc, buffers.stage);
      }
      if (full_m < p.m) add_small(p, a_is_n, b_is_n, full_m, j0, n, l0, k);
    }
  }
  free_buffers(buffers);
}
template <class T, Family family, bool a_given, bool b_given>
void add_blocks(const Product<T> &p, GemmBlocks blocks, CallersPanel<T> given_a, CallersPanel<T> given_b) {
  if constexpr (!a_given && !b_given)
    if (fit(blocks, p)) return walk_blocks<T, family, false, false, true>(p, blocks, given_a, given_b);
  walk_blocks<T, family, a_given, b_given, false>(p, blocks, given_a, given_b);
}

// C += alpha*op(A)*op(B), with B in place: over blocks of the depth and of rows, A packed and all columns at once.
template <class T, Family family, bool one_block>
void walk_blocks_in_place(const Product<T> &p, GemmBlocks blocks) {
  constexpr GemmRules rules = rules_of<T, family>;
  const Op op_a = read_op<T>(p.transa), op_b = read_op<T>(p.transb);
  const bool a_is_n = op_a == Op::none, b_is_n = op_b == Op::none, aligned = columns_aligned(p.c, p.ldc);
  const QtbInt full_m = round_down(p.m, rules.mr);
  if (full_m == 0) return add_small(p, a_is_n, b_is_n, 0, 0, p.n, 0, p.k);
  PanelCopy<T> *const copy_a = copies_of<T, family>.a[static_cast<int>(op_a)];

  const GemmBuffers<T> buffers =
      get_buffers<T, family>(blocks.mb, 0, blocks.kb, InPlaceKernel<T, family>::stage_bytes(largest_depth));
  if (buffers.allocation == nullptr) return add_small(p, a_is_n, b_is_n, 0, 0, p.n, 0, p.k);
  for (QtbInt l0 = 0; l0 < p.k; l0 = next_block<one_block>(l0, blocks.kb, p.k)) {
    const QtbInt k = smaller(blocks.kb, p.k - l0), step_a = round_up(k, rules.ku) * rules.mr;
    const T *const b = p.b + (b_is_n ? l0 : l0 * p.ldb);
    for (QtbInt i0 = 0; i0 < full_m; i0 = next_block<one_block>(i0, blocks.mb, full_m)) {
      const QtbInt m = smaller(blocks.mb, full_m - i0);
      copy_a(&m, &k, p.a + (a_is_n ? i0 + l0 * p.lda : l0 + i0 * p.lda), &p.lda, buffers.a, &step_a, &p.alpha);
      if (aligned)
        InPlaceKernel<T, family>::run_aligned(!b_is_n, m, p.n, k, buffers.a, step_a, b, p.ldb, p.c + i0, p.ldc,
                                              buffers.stage);
      else
        InPlaceKernel<T, family>::run(!b_is_n, m, p.n, k, buffers.a, step_a, b, p.ldb, p.c + i0, p.ldc, buffers.stage);
    }
    if (full_m < p.m) add_small(p, a_is_n, b_is_n, full_m, 0, p.n, l0, k);
  }
  free_buffers(buffers);
}
template <class T, Family family>
void add_blocks_in_place(const Product<T> &p, GemmBlocks blocks) {
  blocks.nb = p.n;
  if (fit(blocks, p)) return walk_blocks_in_place<T, family, true>(p, blocks);
  walk_blocks_in_place<T, family, false>(p, blocks);
}

}  // namespace
}  // namespace qtb::QTB_TIER
