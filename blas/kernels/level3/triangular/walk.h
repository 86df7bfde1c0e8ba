// The level walks of trmm and trsm (levels.h), and the calls that begin them.
//
// A walk cuts T into blocks on the diagonal and the panels beside them. A panel is a product of the tier, a block the
// same walk one level down, and at last a base kernel; of trmm from the right, a small right kernel where the block has
// at most eight columns, as of trsm.
#pragma once

#include "blas/kernels/level3/gemm/buffers.h"
#include "blas/kernels/level3/gemm/tier_gemm.h"
#include "blas/kernels/level3/triangular/base.h"
#include "blas/kernels/level3/triangular/small_right.h"
#include "service/cpu.h"

namespace qtb::QTB_TIER {

#define QTB_DECLARE_LEVELS(name, T)                                          \
  extern "C" {                                                               \
  QTB_HIDDEN void QTB_TIER_NAME(x##name##_level_left)(QTB_LEVEL_PARAMS(T));  \
  QTB_HIDDEN void QTB_TIER_NAME(x##name##_level_right)(QTB_LEVEL_PARAMS(T)); \
  QTB_HIDDEN void QTB_TIER_NAME(x##name##_base_left)(QTB_BASE_PARAMS(T));    \
  }
#define QTB_DECLARE_TYPE(t, T) QTB_DECLARE_LEVELS(t##trmm, T) QTB_DECLARE_LEVELS(t##trsm, T)
QTB_PARTS(QTB_DECLARE_TYPE)
#undef QTB_DECLARE_TYPE
#undef QTB_DECLARE_LEVELS

namespace {

using levels::LevelPlan;
using levels::LevelRow;
using levels::Sse41;
using levels::TriLevel;
using levels::whole;

// The named procedures by routine and type.
template <class T>
struct LevelProcedures {
  void (*left)(QTB_LEVEL_PARAMS(T)), (*right)(QTB_LEVEL_PARAMS(T));
  void (*base_left)(QTB_BASE_PARAMS(T));
};
template <Routine routine, class T>
constexpr LevelProcedures<T> level_procedures{};
#define QTB_NAME_LEVELS(routine, name, T)                             \
  template <>                                                         \
  constexpr LevelProcedures<T> level_procedures<Routine::routine, T>{ \
      QTB_TIER_NAME(x##name##_level_left), QTB_TIER_NAME(x##name##_level_right), QTB_TIER_NAME(x##name##_base_left)};
#define QTB_NAME_TYPE(t, T) QTB_NAME_LEVELS(trmm, t##trmm, T) QTB_NAME_LEVELS(trsm, t##trsm, T)
QTB_PARTS(QTB_NAME_TYPE)
#undef QTB_NAME_TYPE
#undef QTB_NAME_LEVELS

template <Routine routine, bool left, class T>
void run_block(const TriForm &form, QtbInt m, QtbInt n, T alpha, const T *a, QtbInt lda, T *b, QtbInt ldb,
               const TriLevel<T> &level) {
  if constexpr (left) {
    const bool not_trans = form.op == Op::none, is_transpose = form.op == Op::transpose;
    const char *const diag = form.unit ? "U" : "N";
    level_procedures<routine, T>.base_left(&not_trans, &form.upper, &is_transpose, diag, &m, &n, a, &lda, b, &ldb,
                                           level.a_buffer, level.b_buffer);
  } else if (n > most_small_columns) {
    run_base<routine, left>(form, m, n, alpha, a, lda, b, ldb, level.a_buffer, level.b_buffer);
  } else if constexpr (routine == Routine::trmm) {
    trmm_small_right(form, m, n, alpha, a, lda, b, ldb);
  } else {
    trsm_small_right(form, m, n, a, lda, b, ldb);
  }
}

// The panel that T stores beside its columns begin to begin + width. It spreads the block of B over the others, or
// gathers the others into it.
template <Routine routine, bool left, class T>
void run_panel(const TriForm &form, QtbInt begin, QtbInt width, QtbInt size, QtbInt others, T alpha, const T *a,
               QtbInt lda, T *b, QtbInt ldb) {
  const QtbInt first = form.upper ? 0 : begin + width, count = form.upper ? begin : size - first;
  if (count == 0) return;
  const T factor = routine == Routine::trsm ? -one<T> : alpha;
  const bool spread = spreads(left, form.op == Op::none);
  const QtbInt step = left ? 1 : ldb, to = spread ? count : width, from = spread ? width : count;
  const T *const panel = a + first + begin * lda;
  T *const block = b + begin * step, *const rest = b + first * step;
  if constexpr (left)
    gemm(form.op, Op::none, to, others, from, factor, panel, lda, spread ? block : rest, ldb, one<T>,
         spread ? rest : block, ldb);
  else
    gemm(Op::none, form.op, others, to, from, factor, spread ? block : rest, ldb, panel, lda, one<T>,
         spread ? rest : block, ldb);
}

template <Routine routine, bool left, class T>
void walk_level(const TriForm &form, QtbInt m, QtbInt n, T alpha, const T *a, QtbInt lda, T *b, QtbInt ldb,
                QtbInt number, QtbInt last, const TriLevel<T> *table) {
  const TriLevel<T> &level = table[number];
  const QtbInt size = left ? m : n, all = left ? n : m;
  const bool descends = number != last && size > table[number + 1].tri_block;
  const bool up = levels::walks_up(routine, left, form.upper, form.op == Op::none);
  const QtbInt step = level.other_block == whole ? all : level.other_block;
  for (QtbInt j = 0; j < all; j += step) {
    const QtbInt others = smaller(step, all - j);
    T *const part = b + j * (left ? ldb : 1);
    for (QtbInt s = 0; s < size; s += level.tri_block) {
      const QtbInt begin = up ? s : round_down(size - 1, level.tri_block) - s;
      const QtbInt width = smaller(level.tri_block, size - begin);
      if (level.gemm_first) run_panel<routine, left>(form, begin, width, size, others, alpha, a, lda, part, ldb);
      const T *const block_a = a + begin * (1 + lda);
      T *const block_b = part + begin * (left ? 1 : ldb);
      const QtbInt block_m = left ? width : others, block_n = left ? others : width;
      if (descends)
        walk_level<routine, left>(form, block_m, block_n, alpha, block_a, lda, block_b, ldb, number + 1, last, table);
      else
        run_block<routine, left>(form, block_m, block_n, alpha, block_a, lda, block_b, ldb, level);
      if (!level.gemm_first) run_panel<routine, left>(form, begin, width, size, others, alpha, a, lda, part, ldb);
    }
  }
}

template <bool left, class T>
TriForm form_of_flags(bool not_trans, bool upper, bool is_transpose, char diag) {
  const Op op = not_trans ? Op::none : is_complex<T> && !is_transpose ? Op::conjugate : Op::transpose;
  return {left, upper, op, is_letter(diag, 'U')};
}

template <Routine routine, bool left, class T>
void level_walk(QTB_LEVEL_PARAMS(T)) {
  const TriForm form = form_of_flags<left, T>(*not_trans, *upper, *is_transpose, *diag);
  walk_level<routine, left>(form, *m, *n, *alpha, a, *lda, b, *ldb, *level, *last, table);
}

template <Routine routine, class T>
void base_left(QTB_BASE_PARAMS(T)) {
  const TriForm form = form_of_flags<true, T>(*not_trans, *upper, *is_transpose, *diag);
  run_base<routine, true>(form, *m, *n, one<T>, a, *lda, b, *ldb, a_buffer, b_buffer);
}

}  // namespace
}  // namespace qtb::QTB_TIER
