// dsyrk_n4: the rank-k update of a triangle of four rows in double precision (update.h tells what is computed).
//
// The ten sums stay in registers while the depth passes once: five vectors where op(A) has its rows side by side, ten
// vectors of two sums each where it has its depth so. Then C := beta*C + alpha*sum, pair by pair.
#include "blas/kernels/level3/gemm/small.h"
#include "blas/kernels/level3/rank_k/tile_triangle.h"
#include "blas/kernels/level3/rank_k/update.h"
#include "blas/kernels/simd/lanes.h"

namespace qtb::QTB_TIER {
namespace {

// Sums (i, j) of the triangle, two to a vector.
struct FourSums {
  __m128d ii_00_11, ii_22_33, ij_01_23, ij_02_13, ij_03_12;
};

// Rows side by side: columns of A are lda apart.
inline FourSums sum_rows(QtbInt k, const double *a, QtbInt lda) {
  FourSums s = {zero<double>(), zero<double>(), zero<double>(), zero<double>(), zero<double>()};
  for (; k > 0; k--, a += lda) {
    const __m128d low = load_unaligned(a), high = load_unaligned(a + 2);
    const __m128d even = interleaved_low(low, high), odd = interleaved_high(low, high);
    s.ii_00_11 = add(s.ii_00_11, mul(low, low));
    s.ii_22_33 = add(s.ii_22_33, mul(high, high));
    s.ij_01_23 = add(s.ij_01_23, mul(even, odd));
    s.ij_02_13 = add(s.ij_02_13, mul(low, high));
    s.ij_03_12 = add(s.ij_03_12, mul(low, exchanged(high)));
  }
  return s;
}

// Depth side by side: rows of op(A) are lda apart.
inline FourSums sum_depth(QtbInt k, const double *a, QtbInt lda) {
  __m128d s00 = zero<double>(), s11 = s00, s22 = s00, s33 = s00, s01 = s00, s23 = s00, s02 = s00, s13 = s00, s03 = s00,
          s12 = s00;
  const auto step = [&](auto load) __attribute__((always_inline)) {
    const __m128d a0 = load(a), a1 = load(a + lda), a2 = load(a + 2 * lda), a3 = load(a + 3 * lda);
    s00 = add(s00, mul(a0, a0)), s11 = add(s11, mul(a1, a1)), s22 = add(s22, mul(a2, a2)), s33 = add(s33, mul(a3, a3));
    s01 = add(s01, mul(a0, a1)), s23 = add(s23, mul(a2, a3)), s02 = add(s02, mul(a0, a2)), s13 = add(s13, mul(a1, a3));
    s03 = add(s03, mul(a0, a3)), s12 = add(s12, mul(a1, a2));
  };
  for (; k >= lanes<double>; k -= lanes<double>, a += lanes<double>)
    step([](const double *p) { return load_unaligned(p); });
  if (k > 0) step([](const double *p) { return load_lowest(p); });
  return {neighbour_sums(s00, s11), neighbour_sums(s22, s33), neighbour_sums(s01, s23), neighbour_sums(s02, s13),
          neighbour_sums(s03, s12)};
}

inline void store_sums(const RankK<double, false> &u, const FourSums &s) {
  const Finish<double> finish(u.alpha, u.beta);
  const auto pair = [&](QtbInt i, QtbInt j, __m128d sum) {
    double *const c = u.at(i, j);
    store_unaligned(c, finish(sum, [=] { return load_unaligned(c); }));
  };
  const auto single = [&](QtbInt i, QtbInt j, __m128d sum) {
    double *const c = u.at(i, j);
    store_lowest(c, finish(sum, [=] { return load_lowest(c); }));
  };
  if (u.upper) {
    single(0, 0, s.ii_00_11);
    pair(0, 1, even_odd(s.ij_01_23, s.ii_00_11));
    pair(0, 2, even_odd(s.ij_02_13, s.ij_03_12));
    single(2, 2, s.ii_22_33);
    pair(0, 3, even_odd(s.ij_03_12, s.ij_02_13));
    pair(2, 3, interleaved_high(s.ij_01_23, s.ii_22_33));
  } else {
    pair(0, 0, interleaved_low(s.ii_00_11, s.ij_01_23));
    pair(2, 0, interleaved_low(s.ij_02_13, s.ij_03_12));
    single(1, 1, exchanged(s.ii_00_11));
    pair(2, 1, interleaved_high(s.ij_03_12, s.ij_02_13));
    pair(2, 2, even_odd(s.ii_22_33, s.ij_01_23));
    single(3, 3, exchanged(s.ii_22_33));
  }
}

inline void update_four(const RankK<double, false> &u) {
  if (u.only_scales()) return scale_triangle<false>(u.upper, u.n, u.beta, u.c, u.ldc);
  store_sums(u, u.transposed ? sum_depth(u.k, u.a, u.lda) : sum_rows(u.k, u.a, u.lda));
}

template <class T>
QTB_FUNCTION(syrk, T, syrk_of_four) {
  update_four(rank_k<false>(uplo, trans, n, k, alpha, a, lda, beta, c, ldc));
}

}  // namespace

QTB_KERNEL(dsyrk_n4, syrk, double, syrk_of_four<double>)

}  // namespace qtb::QTB_TIER
