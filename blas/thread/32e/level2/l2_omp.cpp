// The parallel symmetric and triangular Level-2 routines. See l2_omp.h for their contract and l2_share.h for the cuts.

#include "blas/thread/32e/level2/l2_omp.h"

#include <cstring>

#include "blas/dispatch/slots.h"
#include "blas/thread/32e/level2/l2_share.h"
#include "blas/thread/team.h"
#include "service/memory.h"

namespace qtb {
namespace {

// Block row b of y := alpha*A*x + y without its diagonal block, which is left of it and right of it. One triangle is
// stored, so that each part lies in it either as it is or transposed.
template <class T, auto gemv>
void add_block_row(const SymvBlocks &cut, QtbInt b, char uplo, const T *alpha, const T *a, QtbInt lda, const T *x,
                   QtbInt incx, T *y, const QtbInt *incy) {
  const T one = 1;
  const Level1Share rows = cut.block(b);
  const bool upper = is_letter(uplo, 'U');
  for (const bool is_left : {true, false}) {
    if (b == (is_left ? 0 : cut.blocks - 1)) continue;
    const Level1Share columns = is_left ? cut.left(b) : cut.right(b);
    const T *const from = x + level1_offset(columns, cut.n, incx);
    if (is_left == upper)
      gemv("T", &columns.len, &rows.len, alpha, a + columns.start + rows.start * lda, &lda, from, &incx, &one, y, incy);
    else
      gemv("N", &rows.len, &columns.len, alpha, a + rows.start + columns.start * lda, &lda, from, &incx, &one, y, incy);
  }
}

// The diagonal blocks apply beta to all of y; behind the barrier each block of y is its owner's alone. Which thread
// takes a diagonal block is the team's matter, so that only the barrier keeps it apart from the owner's sums.
template <class T, auto slot, auto gemv>
void symv(QtbInt nthreads, QTB_PARAMS_symv(T)) {
  run_team(nthreads, [=](const Team &team) {
    if (team.size == 1) return slot(QTB_ARGS(symv));
    const SymvBlocks cut = symv_blocks(*n, team.size);
    for (const QtbInt b : team.shares(cut.blocks)) {
      const Level1Share share = cut.block(b);
      slot(uplo, &share.len, alpha, a + share.start * (*lda + 1), lda, x + level1_offset(share, *n, *incx), incx, beta,
           y + level1_offset(share, *n, *incy), incy);
    }
    team.meet();
    for (const QtbInt b : team.shares(cut.blocks))
      add_block_row<T, gemv>(cut, b, *uplo, alpha, a, *lda, x, *incx, y + level1_offset(cut.block(b), *n, *incy), incy);
  });
}

// What a thread of syr and syr2 changes: the columns of its share, which are a triangle with a rectangle of other rows
// above or below it. rows is the part of the vectors that they take.
struct TrianglePiece {
  Level1Share columns, rows;
  QtbInt other;
  QtbInt origin(QtbInt lda) const { return rows.start + columns.start * lda; }
};

TrianglePiece triangle_piece(char uplo, QtbInt n, QtbInt team, QtbInt rank) {
  const Level1Share columns = triangle_share(n, syr_first_are_short(uplo), team, rank);
  const QtbInt end = columns.start + columns.len;
  if (is_letter(uplo, 'U')) return {columns, {0, end}, columns.start};
  return {columns, {columns.start, n - columns.start}, n - end};
}

template <class T, auto slot, auto block>
void syr(QtbInt nthreads, QTB_PARAMS_syr(T)) {
  run_team(nthreads, [=](const Team &team) {
    if (team.size == 1) return slot(QTB_ARGS(syr));
    const TrianglePiece piece = triangle_piece(*uplo, *n, team.size, team.rank);
    block(uplo, &piece.columns.len, alpha, x + level1_offset(piece.rows, *n, *incx), incx, a + piece.origin(*lda), lda,
          &piece.other);
  });
}

template <class T, auto slot, auto block>
void syr2(QtbInt nthreads, QTB_PARAMS_syr2(T)) {
  run_team(nthreads, [=](const Team &team) {
    if (team.size == 1) return slot(QTB_ARGS(syr2));
    const TrianglePiece piece = triangle_piece(*uplo, *n, team.size, team.rank);
    block(uplo, &piece.columns.len, alpha, x + level1_offset(piece.rows, *n, *incx), incx,
          y + level1_offset(piece.rows, *n, *incy), incy, a + piece.origin(*lda), lda, &piece.other);
  });
}

// Vectors from this length on are copied by a team, of few threads since the memory is soon busy.
constexpr QtbInt trmv_copy_region_n = 3000, trmv_copy_team = 4;

// work := x, contiguous and in logical order. x may lie at any address.
template <class T>
void copy_vector(QtbInt nthreads, QtbInt n, const T *x, QtbInt incx, T *work) {
  if (incx == 1 && n >= trmv_copy_region_n) {
    run_team(nthreads < trmv_copy_team ? nthreads : trmv_copy_team, [=](const Team &team) {
      const Level1Share share = trmv_copy_share(n, team.size, team.rank);
      std::memcpy(work + share.start, x + share.start, static_cast<std::size_t>(share.len) * sizeof(T));
    });
  } else if (incx == 1) {
    std::memcpy(work, x, static_cast<std::size_t>(n) * sizeof(T));
  } else {
    const T *from = incx < 0 ? x + (1 - n) * incx : x;
    for (QtbInt i = 0; i < n; i++, from += incx) std::memcpy(work + i, from, sizeof(T));
  }
}

constexpr std::int32_t trmv_copy_alignment = 128;

// Each element of the result needs others of the old x, which the threads read from a copy.
template <class T, auto slot, auto block>
void trmv(QtbInt nthreads, QTB_PARAMS_trmv(T)) {
  T *const work = static_cast<T *>(qtb_serv_malloc(static_cast<std::uint64_t>(*n) * sizeof(T), trmv_copy_alignment));
  if (work == nullptr) return slot(QTB_ARGS(trmv));
  copy_vector(nthreads, *n, x, *incx, work);
  run_team(nthreads, [=](const Team &team) {
    if (team.size == 1) return slot(QTB_ARGS(trmv));
    const Level1Share share = triangle_share(*n, trmv_first_are_short(*uplo, *trans), team.size, team.rank);
    const TrmvReach reach = trmv_reach(*n, *uplo, *trans, share);
    block(uplo, trans, diag, &reach.x.len, a + reach.row + reach.column * *lda, lda,
          x + level1_offset(share, *n, *incx), incx, &share.len, work + reach.x.start);
  });
  qtb_serv_free(work);
}

// The slots that the drivers of each shape call beside the routine's own.
template <class T>
constexpr auto *gemv_slot = &qtb_blas_xsgemv;
template <>
constexpr auto *gemv_slot<double> = &qtb_blas_xdgemv;
#define QTB_LEVEL2_PART_symv(name, T) qtb::gemv_slot<T>
#define QTB_LEVEL2_PART_syr(name, T) &qtb_blas_x##name##_block
#define QTB_LEVEL2_PART_syr2(name, T) &qtb_blas_x##name##_block
#define QTB_LEVEL2_PART_trmv(name, T) &qtb_blas_x##name##_block

}  // namespace
}  // namespace qtb

extern "C" {
#define QTB_LEVEL2(name, shape, T, ...)                                                            \
  void qtb_blas_##name##_omp(QtbInt nthreads, QTB_PARAMS_##shape(T)) {                             \
    qtb::shape<T, &qtb_blas_x##name, QTB_LEVEL2_PART_##shape(name, T)>(nthreads, QTB_ARGS(shape)); \
  }
#include "blas/thread/32e/level2/l2.def"
#undef QTB_LEVEL2
}
