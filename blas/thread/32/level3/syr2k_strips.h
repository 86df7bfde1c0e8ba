// The one driver of syr2k and her2k: the routine's slot on the diagonal blocks, and two products for each strip.
#pragma once

#include "blas/thread/32e/level3/rank_update.h"
#include "blas/thread/32e/level3/strips.h"

namespace qtb {

// The factor of the second product of a strip.
template <class T, class Beta>
constexpr T second_factor(T alpha) {
  if constexpr (is_hermitian<T, Beta>)
    return {alpha.re, -alpha.im};
  else
    return alpha;
}

template <auto slot, class T, class Beta>
void syr2k_by_strips(QtbInt nthreads, const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k,
                     const T *alpha, const T *a, const QtbInt *lda, const T *b, const QtbInt *ldb, const Beta *beta,
                     T *c, const QtbInt *ldc) {
  constexpr char other = paired_operation<T, Beta>, plain = 'N';
  const bool is_plain = update_is_plain(*trans);
  const char *const op = is_plain ? &plain : &other, *const partner = is_plain ? &other : &plain;
  const T second_alpha = second_factor<T, Beta>(*alpha), first_beta = widened_factor<T>(*beta);
  const T one = widened_factor<T>(Real<T>(1));
  run_strips(
      nthreads, *n, is_letter(*uplo, 'U'), [&] { slot(uplo, trans, n, k, alpha, a, lda, b, ldb, beta, c, ldc); },
      [&](const DiagonalBlock &block) {
        slot(uplo, trans, &block.rows, k, alpha, row_block(a, *lda, *trans, block.operand_row), lda,
             row_block(b, *ldb, *trans, block.operand_row), ldb, beta, c + block.first * (*ldc + 1), ldc);
      },
      [&](const GemmTile &strip) {
        const auto rows = [&](const T *of, QtbInt ld) { return row_block(of, ld, *trans, strip.row); };
        const auto columns = [&](const T *of, QtbInt ld) { return row_block(of, ld, *trans, strip.column); };
        T *const c_strip = c + strip.row + strip.column * *ldc;
        gemm_front_end<T>(op, partner, &strip.rows, &strip.columns, k, alpha, rows(a, *lda), lda, columns(b, *ldb), ldb,
                          &first_beta, c_strip, ldc);
        gemm_front_end<T>(op, partner, &strip.rows, &strip.columns, k, &second_alpha, rows(b, *ldb), ldb,
                          columns(a, *lda), lda, &one, c_strip, ldc);
      });
}

}  // namespace qtb
