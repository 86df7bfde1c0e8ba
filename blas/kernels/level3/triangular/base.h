// The base kernels: a block on the diagonal of trmm and trsm, in place, by the packed triangle.
//
// B := alpha*op(T)*B or alpha*B*op(T) for trmm, B := op(T)^-1*B or B*op(T)^-1 for trsm, B m x n. As many rows and
// columns of T as make multiples of four are packed into a_buffer and work on strips of B, a multiple of four rows or
// columns again, which pass through b_buffer. The rest of T goes to the unblocked kernels and its rectangle to the
// small path of the products; what is left of B goes to the unblocked kernels, at the end. So does all where nothing is
// to be packed, or where there are no buffers.
//
// a_buffer, on a vector boundary, has room for a packed triangle of the block, b_buffer for four strips of 32 bytes a
// row.
#pragma once

#include "blas/kernels/level3/gemm/parts.h"
#include "blas/kernels/level3/triangular/strip.h"
#include "blas/kernels/level3/triangular/unblocked.h"

namespace qtb::QTB_TIER {
namespace {

using levels::acts_as_upper;
using levels::spreads;
using levels::walks_up;
using tiles::round_down;

template <Routine routine, class T>
void unblocked(const TriForm &form, QtbInt m, QtbInt n, T alpha, const T *a, QtbInt lda, T *b, QtbInt ldb) {
  if constexpr (routine == Routine::trmm)
    trmm_unblocked(form, m, n, alpha, a, lda, b, ldb);
  else
    trsm_unblocked(form, m, n, a, lda, b, ldb);
}

// n rows of the triangle and the strips of B on which it acts, others elements across.
template <Routine routine, bool left, bool lower, class T>
void run_packed(const TriForm &form, QtbInt n, QtbInt others, T alpha, const T *a, QtbInt lda, T *b, QtbInt ldb,
                T *a_buffer, T *b_buffer) {
  const PackedForm<T> packed{form.op == Op::conjugate, form.unit, alpha};
  if (spreads(left, form.op == Op::none))
    pack_triangle<routine, lower, true>(packed, n, a, lda, parts(a_buffer));
  else
    pack_triangle<routine, lower, false>(packed, n, a, lda, parts(a_buffer));
  run_all_strips<routine, lower, left>(n, others, parts(a_buffer), form.unit, b, ldb, parts(b_buffer));
}

// The rectangle of T beside its first t rows and columns, rest of them: what the one part of B gives to the other.
template <Routine routine, bool left, class T>
void run_rectangle(const TriForm &form, QtbInt t, QtbInt rest, QtbInt others, T alpha, const T *a, QtbInt lda, T *b,
                   QtbInt ldb) {
  const char *const op = letter(form.op), *const none = letter(Op::none);
  const T *const rectangle = form.upper ? a + t * lda : a + t;
  T *const far = b + t * (left ? 1 : ldb);
  const T factor = routine == Routine::trsm ? -one<T> : alpha;
  const bool to_near = acts_as_upper(left, form.upper, form.op == Op::none);
  const QtbInt to = to_near ? t : rest, from = to_near ? rest : t;
  if constexpr (left)
    small_path<T>(op, none, &to, &others, &from, &factor, rectangle, &lda, to_near ? far : b, &ldb, &one<T>,
                  to_near ? b : far, &ldb);
  else
    small_path<T>(none, op, &others, &to, &from, &factor, to_near ? far : b, &ldb, rectangle, &lda, &one<T>,
                  to_near ? b : far, &ldb);
}

template <Routine routine, bool left, class T>
void run_base(const TriForm &form, QtbInt m, QtbInt n, T alpha, const T *a, QtbInt lda, T *b, QtbInt ldb, T *a_buffer,
              T *b_buffer) {
  const QtbInt size = left ? m : n, all = left ? n : m;
  const QtbInt t = round_down(size, tile_rows), others = round_down(all, tile_rows);
  if (t == 0 || others == 0 || a_buffer == nullptr) return unblocked<routine>(form, m, n, alpha, a, lda, b, ldb);

  const bool not_trans = form.op == Op::none;
  const bool lower = !acts_as_upper(left, form.upper, not_trans);
  const auto packed = [&] {
    if (lower)
      run_packed<routine, left, true>(form, t, others, alpha, a, lda, b, ldb, a_buffer, b_buffer);
    else
      run_packed<routine, left, false>(form, t, others, alpha, a, lda, b, ldb, a_buffer, b_buffer);
  };
  const QtbInt rest = size - t;
  const auto unpacked = [&] {
    unblocked<routine>(form, left ? rest : others, left ? others : rest, alpha, a + t * (1 + lda), lda,
                       b + t * (left ? 1 : ldb), ldb);
  };
  if (rest == 0) {
    packed();
  } else if (walks_up(routine, left, form.upper, not_trans)) {
    packed();
    run_rectangle<routine, left>(form, t, rest, others, alpha, a, lda, b, ldb);
    unpacked();
  } else {
    unpacked();
    run_rectangle<routine, left>(form, t, rest, others, alpha, a, lda, b, ldb);
    packed();
  }
  if (others < all)
    unblocked<routine>(form, left ? m : all - others, left ? all - others : n, alpha, a, lda,
                       b + others * (left ? ldb : 1), ldb);
}

}  // namespace
}  // namespace qtb::QTB_TIER
