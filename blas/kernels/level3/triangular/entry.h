// trmm and trsm on one thread: B := alpha*op(T)*B or alpha*B*op(T), and the same with op(T)^-1, in place.
//
// B is m x n. An alpha of 0 zeroes B and reads neither operand; a unit diagonal and the other triangle are never read;
// T does not overlap B. A zero on the diagonal of a solve gives infinities or NaNs. Without a work buffer the blocks on
// the diagonal go to the unblocked kernels.
#pragma once

#include "blas/kernels/level3/triangular/walk.h"

namespace qtb::QTB_TIER {
namespace {

// A walk over the levels of a row.
template <Routine routine, char side, Sse41 sse41, class T>
void begin_walk(const TriForm &form, const char *diag, const QtbInt *m, const QtbInt *n, const T *alpha, const T *a,
                const QtbInt *lda, T *b, const QtbInt *ldb, const GemmBuffers<T> &buffers) {
  constexpr LevelRow row = levels::find_levels(routine, side, kind_of<T>, this_tier, sse41);
  const LevelPlan plan = levels::plan_levels(row, *m, *n);
  const bool not_trans = form.op == Op::none, is_transpose = form.op == Op::transpose;
  const bool has_buffers = buffers.allocation != nullptr;
  TriLevel<T> table[row.count];
  for (int level = 0; level < row.count; level++)
    table[level] = {plan.tri_block[level], plan.other_block, levels::gemm_comes_first(routine, form.left, not_trans),
                    has_buffers ? buffers.a : nullptr, has_buffers ? buffers.b : nullptr};
  constexpr auto walk = side == 'L' ? level_procedures<routine, T>.left : level_procedures<routine, T>.right;
  walk(&not_trans, &form.upper, &is_transpose, diag, m, n, alpha, a, lda, b, ldb, &plan.entry, &plan.last, table);
}

// Where the rows of a tier differ by SSE4.1, the processor decides.
template <Routine routine, char side, class T>
void begin_walk(const TriForm &form, const char *diag, const QtbInt *m, const QtbInt *n, const T *alpha, const T *a,
                const QtbInt *lda, T *b, const QtbInt *ldb, const GemmBuffers<T> &buffers) {
  if constexpr (levels::find_levels(routine, side, kind_of<T>, this_tier, Sse41::present).sse41 != Sse41::any)
    if (qtb_serv_cpu_takes_sse41() == 0)
      return begin_walk<routine, side, Sse41::absent>(form, diag, m, n, alpha, a, lda, b, ldb, buffers);
  begin_walk<routine, side, Sse41::present>(form, diag, m, n, alpha, a, lda, b, ldb, buffers);
}

template <Routine routine, class T>
QTB_FUNCTION(trmm, T, triangular) {
  if (*m < 1 || *n < 1) return;
  if (is_zero(*alpha)) return scale_columns<T>(m, n, alpha, b, ldb);
  const TriForm form{is_letter(*side, 'L'), is_letter(*uplo, 'U'), read_op<T>(transa), is_letter(*diag, 'U')};
  constexpr auto request = levels::find_buffers(routine, this_tier);
  const GemmBuffers<T> buffers = get_buffers<T, Family::base>(request.mb, request.nb, request.kb, 0);
  if (routine == Routine::trmm && !form.left) {
    if (*n <= most_small_columns)
      trmm_small_right(form, *m, *n, *alpha, a, *lda, b, *ldb);
    else
      begin_walk<routine, 'R'>(form, diag, m, n, alpha, a, lda, b, ldb, buffers);
  } else {
    if (!is_one(*alpha)) scale_columns<T>(m, n, alpha, b, ldb);
    if (form.left)
      begin_walk<routine, 'L'>(form, diag, m, n, &one<T>, a, lda, b, ldb, buffers);
    else
      begin_walk<routine, 'R'>(form, diag, m, n, &one<T>, a, lda, b, ldb, buffers);
  }
  free_buffers(buffers);
}

}  // namespace

// The entries of a routine and the procedures under them.
#define QTB_TRIANGULAR(routine, name, T)                                                                      \
  QTB_KERNEL(name, trmm, T, (triangular<Routine::routine, T>))                                                \
  extern "C" {                                                                                                \
  void QTB_TIER_NAME(x##name##_level_left)(QTB_LEVEL_PARAMS(T)) {                                             \
    level_walk<Routine::routine, true>(QTB_LEVEL_ARGS);                                                       \
  }                                                                                                           \
  void QTB_TIER_NAME(x##name##_level_right)(QTB_LEVEL_PARAMS(T)) {                                            \
    level_walk<Routine::routine, false>(QTB_LEVEL_ARGS);                                                      \
  }                                                                                                           \
  void QTB_TIER_NAME(x##name##_base_left)(QTB_BASE_PARAMS(T)) { base_left<Routine::routine>(QTB_BASE_ARGS); } \
  }

}  // namespace qtb::QTB_TIER
