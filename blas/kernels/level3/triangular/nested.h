// trmm and trsm of the tiers sse3 and def: two nested loops over blocks of fixed sizes.
//
// The triangle is cut into blocks of 1024 on the diagonal, and each of these into inner ones, which the unblocked
// kernels work on; the rectangle beside a block is a product of the tier, over the rest of its outer block for an inner
// one, over the rest of the triangle for an outer one. Blocks are taken in the direction in which a product finds what
// a block reads unchanged, and a solve finds it solved. B is scaled by alpha at first; an alpha of 0 zeroes it, and
// nothing is read. No buffer is asked for, but by the products.
#pragma once

#include "blas/kernels/level3/gemm/family.h"
#include "blas/kernels/level3/gemm/parts.h"
#include "blas/kernels/level3/gemm/tier_gemm.h"
#include "blas/kernels/level3/triangular/unblocked.h"

namespace qtb::QTB_TIER {
namespace {

constexpr QtbInt outer_block = 1024;

// One call: the triangle and B.
template <bool solves, class T>
struct Nested {
  TriForm form;
  QtbInt others;  // columns of B where the triangle stands on the left, rows where on the right
  const T *a;
  QtbInt lda;
  T *b;
  QtbInt ldb;

  T *b_at(QtbInt along) const { return b + along * (form.left ? 1 : ldb); }

  // Whether the blocks are taken from the first to the last.
  bool goes_up() const { return (is_upper(form) == form.left) != solves; }

  // What the rows or columns from to count on of B get from those from from count on.
  void rectangle(QtbInt to, QtbInt to_count, QtbInt from, QtbInt from_count) const {
    if (to_count == 0 || from_count == 0) return;
    // Of op(T) in front of B, rows to and columns from; of op(T) behind it the other way round.
    const QtbInt row = form.left == (form.op == Op::none) ? to : from, column = row == to ? from : to;
    const T *const panel = a + row + column * lda;
    const T factor = solves ? -one<T> : one<T>;
    if (form.left)
      gemm(form.op, Op::none, to_count, others, from_count, factor, panel, lda, b_at(from), ldb, one<T>, b_at(to), ldb);
    else
      gemm(Op::none, form.op, others, to_count, from_count, factor, b_at(from), ldb, panel, lda, one<T>, b_at(to), ldb);
  }
  void diagonal(QtbInt begin, QtbInt count) const {
    const QtbInt m = form.left ? count : others, n = form.left ? others : count;
    const T *const block = a + begin * (1 + lda);
    if constexpr (solves) {
      trsm_unblocked(form, m, n, block, lda, b_at(begin), ldb);
    } else {
      trmm_unblocked(form, m, n, one<T>, block, lda, b_at(begin), ldb);
    }
  }

  // The blocks of the triangle's part from first to end, each done by work(begin, count). What is read by a block, or
  // by the rectangle beside it, is what stands ahead in a product's direction and behind in a solve's.
  template <QtbInt size, class Work>
  void blocks(QtbInt first, QtbInt end, Work work) const {
    const QtbInt extent = end - first;
    for (QtbInt done = 0; done < extent; done += size) {
      const QtbInt begin = goes_up() ? first + done : first + round_down(extent - 1, size) - done;
      const QtbInt count = smaller(size, end - begin), after = begin + count;
      const bool reads_after = is_upper(form) == form.left;
      const QtbInt from = reads_after ? after : first, from_count = reads_after ? end - after : begin - first;
      if constexpr (solves) rectangle(begin, count, from, from_count);
      work(begin, count);
      if constexpr (!solves) rectangle(begin, count, from, from_count);
    }
  }
};

template <bool solves, QtbInt inner_block, class T>
QTB_FUNCTION(trmm, T, nested_blocks) {
  if (*m <= 0 || *n <= 0) return;
  if (!is_one(*alpha)) scale_columns<T>(m, n, alpha, b, ldb);
  if (is_zero(*alpha)) return;
  const TriForm form = read_form<T>(side, uplo, transa, diag);
  const Nested<solves, T> call{form, form.left ? *n : *m, a, *lda, b, *ldb};
  call.template blocks<outer_block>(0, form.left ? *m : *n, [&](QtbInt outer, QtbInt outer_count) {
    call.template blocks<inner_block>(outer, outer + outer_count,
                                      [&](QtbInt begin, QtbInt count) { call.diagonal(begin, count); });
  });
}

}  // namespace
}  // namespace qtb::QTB_TIER
