// dgemm, dgemm_def_run_a, dgemm_def_run_b of def: C := alpha*op(A)*op(B) + beta*C.
//
// C is m x n with columns ldc apart, op(A) m x k, op(B) k x n. A beta of 0 stores without reading C, an alpha of 0
// reads neither A nor B. A and B do not overlap C. dgemm chooses: on one processor family the bodies with the 4 x 4
// tile, run_b where a slice of B is small, run_a, which may leave B in place, elsewhere; on all others the body with
// the 2 x 12 tile.
#include "blas/kernels/level3/gemm/body.h"
#include "blas/kernels/level3/gemm/def/buffers.h"
#include "blas/kernels/level3/gemm/def/kernels.h"
#include "service/cpu.h"

namespace qtb::QTB_TIER {
namespace {

template <Family family>
GemmBlocks blocks_of(const Product<double> &p) {
  GemmBlocks blocks{};
  fill_blocks(rules_of<double, family>, p.m, p.n, p.k, nullptr, blocks);
  return blocks;
}

// ---- The 2 x 12 tile ----

constexpr QtbInt fixed_depth = 128;
constexpr QtbInt packed_columns = 4;  // fewer are not packed but left to the small path, at the end
constexpr QtbInt stage_bytes_per_k = 192, slack = 18176;

template <bool one_block>
void walk_wide_blocks(const Product<double> &p, const GemmBlocks &blocks) {
  constexpr GemmRules rules = rules_of<double>;
  const bool a_is_n = read_op<double>(p.transa) == Op::none, b_is_n = read_op<double>(p.transb) == Op::none;
  PanelCopy<double> *const copy_a = copies_of<double, Family::base>.a[a_is_n ? 0 : 1];
  PanelCopy<double> *const copy_b = copies_of<double, Family::base>.b[b_is_n ? 0 : 1];
  const QtbInt full_m = round_down(p.m, rules.mr), full_n = round_down(p.n, packed_columns);
  const GemmBuffers<double> buffers =
      get_buffers_for<double>(blocks.mb, blocks.nb, blocks.kb, stage_bytes_per_k * blocks.kb, slack);
  if (buffers.allocation == nullptr) return add_small(p, a_is_n, b_is_n, 0, 0, p.n, 0, p.k);
  for (QtbInt j0 = 0; j0 < full_n; j0 = next_block<one_block>(j0, blocks.nb, full_n)) {
    const QtbInt n = smaller(blocks.nb, full_n - j0);
    for (QtbInt l0 = 0; l0 < p.k; l0 = next_block<one_block>(l0, blocks.kb, p.k)) {
      const QtbInt depth = smaller(blocks.kb, p.k - l0), kp = round_up(depth, rules.ku);
      const QtbInt step_a = kp * rules.mr, step_b = kp * rules.nr;
      InnerProcedure<double> &kernel = kp == fixed_depth ? qtb_blas_def_dgemm_kernel_128 : qtb_blas_def_dgemm_kernel;
      copy_b(&depth, &n, p.b + (b_is_n ? l0 + j0 * p.ldb : j0 + l0 * p.ldb), &p.ldb, buffers.b, &step_b, nullptr);
      for (QtbInt i0 = 0; i0 < full_m; i0 = next_block<one_block>(i0, blocks.mb, full_m)) {
        const QtbInt m = smaller(blocks.mb, full_m - i0);
        copy_a(&m, &depth, p.a + (a_is_n ? i0 + l0 * p.lda : l0 + i0 * p.lda), &p.lda, buffers.a, &step_a, &p.alpha);
        kernel(m, n, kp, buffers.a, step_a, buffers.b, step_b, p.c + i0 + j0 * p.ldc, p.ldc, buffers.stage);
      }
      if (full_m < p.m) add_small(p, a_is_n, b_is_n, full_m, j0, n, l0, depth);
    }
  }
  free_buffers(buffers);
  if (full_n < p.n) add_small(p, a_is_n, b_is_n, 0, full_n, p.n - full_n, 0, p.k);
}

void add_wide(const Product<double> &p) {
  const GemmBlocks blocks = blocks_of<Family::base>(p);
  if (fit(blocks, p)) return walk_wide_blocks<true>(p, blocks);
  walk_wide_blocks<false>(p, blocks);
}

// ---- The 4 x 4 tile ----

// Bytes of a slice of B of at most so many columns; up to the limit it stays in a cache by itself.
constexpr QtbInt slice_limit = 262144;
constexpr QtbInt slice_bytes(const Product<double> &p, QtbInt most_columns) {
  return smaller(p.k, largest_depth) * smaller(p.n, most_columns) * static_cast<QtbInt>(sizeof(double));
}

void add_a(const Product<double> &p) {
  const GemmBlocks blocks = blocks_of<Family::def_a>(p);
  if (slice_bytes(p, rules_of<double, Family::def_a>.nb.cap) <= slice_limit)
    add_blocks_in_place<double, Family::def_a>(p, blocks);
  else
    add_blocks<double, Family::def_a, false, false>(p, blocks, {}, {});
}

// The panels of both families of this tile are the same.
void add_b(const Product<double> &p) {
  add_blocks<double, Family::def_a, false, false>(p, blocks_of<Family::def_b>(p), {}, {});
}

void add_for_processor(const Product<double> &p) {
  if (qtb_serv_cpu_detect() != tier_def || qtb_serv_cpu_is_amd_family16() == 0) return add_wide(p);
  if (slice_bytes(p, rules_of<double, Family::def_b>.nb.cap) <= slice_limit) return add_b(p);
  add_a(p);
}

template <void (*add)(const Product<double> &)>
QTB_FUNCTION(gemm, double, gemm) {
  const Product<double> p = {transa, transb, *m, *n, *k, *alpha, a, *lda, b, *ldb, c, *ldc};
  if (begin_product(p, beta, limits_of<double, Family::base, BodyForm::full>)) add(p);
}

}  // namespace

QTB_KERNEL(dgemm, gemm, double, gemm<add_for_processor>)
QTB_KERNEL(dgemm_def_run_a, gemm, double, gemm<add_a>)
QTB_KERNEL(dgemm_def_run_b, gemm, double, gemm<add_b>)

}  // namespace qtb::QTB_TIER
