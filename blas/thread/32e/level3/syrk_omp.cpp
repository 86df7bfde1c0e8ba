// The parallel rank-k updates. See syrk_omp.h.

#include "blas/thread/32e/level3/syrk_omp.h"

#include "blas/thread/32e/level3/rank_update.h"
#include "blas/thread/32e/level3/strips.h"
#include "blas/thread/32e/level3/syrk_tiles.h"

namespace qtb {
namespace {

// Nothing is shared and no thread waits for another: the end of the region is all.
template <auto slot, class T, class Factor>
void syrk_by_tiles(QtbInt nthreads, const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k,
                   const Factor *alpha, const T *a, const QtbInt *lda, const Factor *beta, T *c, const QtbInt *ldc) {
  constexpr char other = is_hermitian<T, Factor> || !is_complex<T> ? 'C' : 'T', plain = 'N';
  const char *const partner = update_is_plain(*trans) ? &other : &plain;
  const T wide_alpha = widened_factor<T>(*alpha), wide_beta = widened_factor<T>(*beta);
  run_team(nthreads, [&](const Team &team) {
    if (team.size == 1) return slot(uplo, trans, n, k, alpha, a, lda, beta, c, ldc);
    for_each_syrk_piece(syrk_tiles(*n, team.size), is_letter(*uplo, 'U'), team.rank, [&](const GemmTile &tile) {
      const T *const rows = row_block(a, *lda, *trans, tile.row);
      T *const c_tile = c + tile.row + tile.column * *ldc;
      if (tile.row == tile.column)
        slot(uplo, trans, &tile.rows, k, alpha, rows, lda, beta, c_tile, ldc);
      else
        GemmSlots<T>::gemm(trans, partner, &tile.rows, &tile.columns, k, &wide_alpha, rows, lda,
                           row_block(a, *lda, *trans, tile.column), lda, &wide_beta, c_tile, ldc);
    });
  });
}

template <auto slot, class T, class Factor>
void syrk_by_strips(QtbInt nthreads, const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k,
                    const Factor *alpha, const T *a, const QtbInt *lda, const Factor *beta, T *c, const QtbInt *ldc) {
  constexpr char other = paired_operation<T, Factor>, plain = 'N';
  const bool is_plain = update_is_plain(*trans);
  const T wide_alpha = widened_factor<T>(*alpha), wide_beta = widened_factor<T>(*beta);
  run_strips(
      nthreads, *n, is_letter(*uplo, 'U'), [&] { slot(uplo, trans, n, k, alpha, a, lda, beta, c, ldc); },
      [&](const DiagonalBlock &block) {
        slot(uplo, trans, &block.rows, k, alpha, row_block(a, *lda, *trans, block.operand_row), lda, beta,
             c + block.first * (*ldc + 1), ldc);
      },
      [&](const GemmTile &strip) {
        gemm_front_end<T>(is_plain ? &plain : &other, is_plain ? &other : &plain, &strip.rows, &strip.columns, k,
                          &wide_alpha, row_block(a, *lda, *trans, strip.row), lda,
                          row_block(a, *lda, *trans, strip.column), lda, &wide_beta,
                          c + strip.row + strip.column * *ldc, ldc);
      });
}

}  // namespace
}  // namespace qtb

extern "C" {
#define QTB_DEFINE_SYRK_OMP(name, shape, T)                                   \
  void qtb_blas_##name##_omp(QtbInt nthreads, QTB_PARAMS_##shape(T)) {        \
    qtb::syrk_by_tiles<&qtb_blas_x##name>(nthreads, QTB_ARGS(shape));         \
  }                                                                           \
  void qtb_blas_##name##_strips_omp(QtbInt nthreads, QTB_PARAMS_##shape(T)) { \
    qtb::syrk_by_strips<&qtb_blas_x##name>(nthreads, QTB_ARGS(shape));        \
  }
QTB_FOR_EACH_SYRK(QTB_DEFINE_SYRK_OMP)
}
