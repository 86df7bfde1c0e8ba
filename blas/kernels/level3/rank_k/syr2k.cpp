// syr2k: C := alpha*A*B' + alpha*B*A' + beta*C (trans "N") or alpha*A'*B + alpha*B'*A + beta*C on one triangle of C,
// where ' is the transpose; her2k: the same with the conjugate transpose for ', conj(alpha) for the second product and
// a real beta.
//
// C is n x n with columns ldc apart. A and B, with columns lda and ldb apart, are n x k, or k x n where trans is not
// "N"; they do not overlap C. Only the triangle is read or written. A beta of 0 stores without reading, an alpha or a k
// of 0 reads neither A nor B. her2k leaves a real diagonal, unless nothing is to be done (alpha or k is 0, and beta is
// 1), when C stays as it is. No alignment is asked for.
//
// The triangle is walked in tiles (tile_triangle.h), of two products each. The buffer of a tile on the diagonal stands
// on the stack: 131,072 bytes in double precision, half of that in single and twice that in double precision of complex
// numbers; less where all of C is smaller than a tile.
#include "blas/kernels/level3/gemm/parts.h"
#include "blas/kernels/level3/gemm/tier_gemm.h"
#include "blas/kernels/level3/rank_k/tile_triangle.h"

namespace qtb::QTB_TIER {
namespace {

constexpr QtbInt rank_2k_tile = 128;

template <class T, bool hermitian>
struct Rank2K {
  bool transposed;
  QtbInt k;
  T alpha;
  const T *a;
  QtbInt lda;
  const T *b;
  QtbInt ldb;

  // to := factor*to + both products over rows from i0 and columns from j0 on, a rectangle.
  void multiply(QtbInt i0, QtbInt rows, QtbInt j0, QtbInt columns, T factor, T *to, QtbInt ldt) const {
    constexpr Op turned = hermitian ? Op::conjugate : Op::transpose;
    const Op left = transposed ? turned : Op::none, right = transposed ? Op::none : turned;
    const QtbInt step_a = transposed ? lda : 1, step_b = transposed ? ldb : 1;
    gemm(left, right, rows, columns, k, alpha, a + i0 * step_a, lda, b + j0 * step_b, ldb, factor, to, ldt);
    gemm(left, right, rows, columns, k, conjugate_if<hermitian>(alpha), b + i0 * step_b, ldb, a + j0 * step_a, lda,
         one<T>, to, ldt);
  }
};

template <bool hermitian, class T, class S>
void rank_2k_update(bool upper, QtbInt n, S beta, T *c, QtbInt ldc, const Rank2K<T, hermitian> &update) {
  if (n <= 0) return;
  const bool only_scales = is_zero(update.alpha) || update.k <= 0;
  // A tile that is all of C is scaled when its products are added.
  const bool one_tile = !only_scales && n <= rank_2k_tile;
  if (!one_tile) scale_triangle<hermitian>(upper, n, beta, c, ldc);
  if (only_scales) return;
  const S left_to_scale = one_tile ? beta : one<S>;

  constexpr std::uint64_t line_bits = 64 * 8;
  const QtbInt order = n < rank_2k_tile ? n : rank_2k_tile, ldt = (order + lanes<T> - 1) / lanes<T> * lanes<T>;
  const std::uint64_t bytes = static_cast<std::uint64_t>(order * ldt) * sizeof(T);
  T *const tile = static_cast<T *>(__builtin_alloca_with_align(bytes, line_bits));
  walk_tiles(
      upper, n, rank_2k_tile,
      [&](QtbInt i0, QtbInt rows, QtbInt j0, QtbInt columns) {
        update.multiply(i0, rows, j0, columns, one<T>, c + i0 + j0 * ldc, ldc);
      },
      [&](QtbInt i0, QtbInt rows) {
        update.multiply(i0, rows, i0, rows, {}, tile, ldt);
        add_tile_triangle<hermitian>(upper, rows, tile, ldt, left_to_scale, c + i0 + i0 * ldc, ldc);
      });
}

template <class T>
QTB_FUNCTION(syr2k, T, syr2k) {
  rank_2k_update<false>(is_letter(*uplo, 'U'), *n, *beta, c, *ldc,
                        Rank2K<T, false>{!is_letter(*trans, 'N'), *k, *alpha, a, *lda, b, *ldb});
}
template <class T>
QTB_FUNCTION(her2k, T, her2k) {
  rank_2k_update<true>(is_letter(*uplo, 'U'), *n, *beta, c, *ldc,
                       Rank2K<T, true>{!is_letter(*trans, 'N'), *k, *alpha, a, *lda, b, *ldb});
}

}  // namespace

QTB_KERNEL(ssyr2k, syr2k, float, syr2k<float>)
QTB_KERNEL(dsyr2k, syr2k, double, syr2k<double>)
QTB_KERNEL(csyr2k, syr2k, cfloat, syr2k<cfloat>)
QTB_KERNEL(zsyr2k, syr2k, cdouble, syr2k<cdouble>)
QTB_KERNEL(cher2k, her2k, cfloat, her2k<cfloat>)
QTB_KERNEL(zher2k, her2k, cdouble, her2k<cdouble>)

}  // namespace qtb::QTB_TIER
