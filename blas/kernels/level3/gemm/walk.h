// The walk over blocks of n, k and m that every GEMM body takes: C := beta*C + alpha*op(A)*op(B).
//
// Over blocks of nb columns and, inside, of kb of the depth, a block of op(B) is packed, and over blocks of mb rows one
// of op(A) with alpha folded in, on which the kernels work. Rows that the kernels leave out take the small path, block
// by block, columns at the end. What differs between bodies stands in the family's row (tiles.h), in where an operand
// comes from, and in the kernels, an object that is made of the product and beta:
//
//   stage_per_k        bytes of the staging region per step of depth
//   run(block, first)  C += A*B over a block. Where the family's kernels apply beta they do so where it is of the first
//                      block of the depth.
#pragma once

#include "blas/kernels/level3/gemm/buffers.h"
#include "blas/kernels/level3/gemm/kernels.h"
#include "blas/kernels/level3/gemm/parts.h"

namespace qtb::QTB_TIER {
namespace {

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

// Where a walk finds an operand: in panels that it packs or that its caller has packed, or where the matrix is. Of one
// that the caller has packed the matrix itself is read only by the small path.
enum class Source { packed, given, in_place };

// A panel that the caller has packed; no panels where it has not.
template <class T>
struct CallersPanel {
  const T *panels = nullptr;
  QtbInt ldp = 0;
};

// A block of each operand: of one in panels the first micro-panel and the distance to the next, of one in place its
// first element and its leading dimension. kp is the depth filled up. Given panels of B are the whole ones, in which
// the block begins at l0_of_b of the depth: their edge micro-panels have widths, and so offsets, of their own.
template <class T>
struct Block {
  QtbInt m, n, depth, kp;
  const T *a;
  QtbInt lda;
  const T *b;
  QtbInt ldb, l0_of_b;
  T *c;
  QtbInt ldc;
  T *stage;
};

// C := beta*C + alpha*op(A)*op(B) over rows i0 and up, columns j0 to j0 + n and depth l0 to l0 + k, without packing.
template <class T>
void run_small(const Product<T> &p, bool a_is_n, bool b_is_n, QtbInt i0, QtbInt j0, QtbInt n, QtbInt l0, QtbInt k,
               const T *beta) {
  const QtbInt m = p.m - i0;
  small_path<T>(p.transa, p.transb, &m, &n, &k, &p.alpha, p.a + (a_is_n ? i0 + l0 * p.lda : l0 + i0 * p.lda), &p.lda,
                p.b + (b_is_n ? l0 + j0 * p.ldb : j0 + l0 * p.ldb), &p.ldb, beta, p.c + i0 + j0 * p.ldc, &p.ldc);
}

// Where the block after that at first begins. One block that holds all has none after it: compilers see that there is
// no loop, and small problems, which have one block, are spared what goes ahead of loops.
template <bool one_block>
QtbInt next_block(QtbInt first, QtbInt step, QtbInt total) {
  return one_block ? total : first + step;
}

template <class T, Family family, Source source_a, Source source_b, class Kernels, bool one_block>
void walk_blocks(const Product<T> &p, const GemmBlocks &blocks, const T *beta, CallersPanel<T> given_a,
                 CallersPanel<T> given_b) {
  constexpr GemmRules rules = rules_of<T, family>;
  constexpr bool packs_a = source_a == Source::packed, packs_b = source_b == Source::packed;
  const Op op_a = read_op<T>(p.transa), op_b = read_op<T>(p.transb);
  const bool a_is_n = op_a == Op::none, b_is_n = op_b == Op::none;
  const QtbInt full_m = rules.walk.kernels_take_edges ? p.m : round_down(p.m, rules.mr);
  const QtbInt full_n = round_down(p.n, rules.walk.columns);
  const QtbInt row_step = packs_a ? blocks.mb : full_m, column_step = packs_b ? blocks.nb : full_n;
  if (full_m == 0 || full_n == 0) return run_small(p, a_is_n, b_is_n, 0, 0, p.n, 0, p.k, beta);

  constexpr bool has_buffers = source_a != Source::in_place || source_b != Source::in_place;
  GemmBuffers<T> buffers{};
  if constexpr (has_buffers) {
    buffers = get_buffers<T, family>(packs_a ? blocks.mb : 0, packs_b ? blocks.nb : 0, blocks.kb, Kernels::stage_per_k);
    if (buffers.allocation == nullptr) return run_small(p, a_is_n, b_is_n, 0, 0, p.n, 0, p.k, beta);
  }
  PanelCopy<T> *const copy_a = copies_of<T, family>.a[static_cast<int>(op_a)];
  PanelCopy<T> *const copy_b = copies_of<T, family>.b[static_cast<int>(op_b)];
  const Kernels kernels(p, *beta);
  for (QtbInt j0 = 0; j0 < full_n; j0 = next_block<one_block>(j0, column_step, full_n)) {
    const QtbInt n = smaller(column_step, full_n - j0);
    QtbInt next = 0;
    for (QtbInt l0 = 0; l0 < p.k; l0 = next) {
      const QtbInt depth = l0 == 0 ? first_depth(rules.kb, blocks.kb, p.k) : smaller(blocks.kb, p.k - l0);
      next = next_block<one_block>(l0, depth, p.k);
      const QtbInt kp = round_up(depth, rules.ku), step_a = kp * rules.mr, step_b = kp * rules.nr;
      const T *const block_beta = rules.walk.kernels_apply_beta && l0 == 0 ? beta : &one<T>;
      const T *const b = p.b + (b_is_n ? l0 + j0 * p.ldb : j0 + l0 * p.ldb);
      if constexpr (packs_b) copy_b(&depth, &n, b, &p.ldb, buffers.b, &step_b, nullptr);
      for (QtbInt i0 = 0; i0 < full_m; i0 = next_block<one_block>(i0, row_step, full_m)) {
        const QtbInt m = smaller(row_step, full_m - i0);
        const T *const a = p.a + (a_is_n ? i0 + l0 * p.lda : l0 + i0 * p.lda);
        if constexpr (packs_a) copy_a(&m, &depth, a, &p.lda, buffers.a, &step_a, &p.alpha);
        Block<T> block{m, n, depth, kp, a, p.lda, b, p.ldb, 0, p.c + i0 + j0 * p.ldc, p.ldc, buffers.stage};
        if constexpr (packs_a) block.a = buffers.a, block.lda = step_a;
        if constexpr (packs_b) block.b = buffers.b, block.ldb = step_b;
        if constexpr (source_a == Source::given) block.a = given_a.panels + l0 * rules.mr, block.lda = given_a.ldp;
        if constexpr (source_b == Source::given) block.b = given_b.panels, block.ldb = given_b.ldp, block.l0_of_b = l0;
        kernels.run(block, l0 == 0);
      }
      if (full_m < p.m) run_small(p, a_is_n, b_is_n, full_m, j0, n, l0, depth, block_beta);
    }
  }
  if constexpr (has_buffers) free_buffers(buffers);
  if (full_n < p.n) run_small(p, a_is_n, b_is_n, 0, full_n, p.n - full_n, 0, p.k, beta);
}

}  // namespace
}  // namespace qtb::QTB_TIER
