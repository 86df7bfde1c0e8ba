// syrk and herk of the tiers that split (update.h tells what is computed): five strips, each of whose blocks on the
// diagonal is cut into three, whose blocks go to the body. In double precision a block of four rows has a kernel.
//
// Each element is scaled by beta where it is computed. Nothing is allocated here.
#include "blas/kernels/level3/rank_k/split.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
using Syrk = QTB_FUNCTION_TYPE(syrk, T);
template <class T>
using Herk = QTB_FUNCTION_TYPE(herk, T);
template <class Update>
constexpr void *body = nullptr;
template <>
constexpr Syrk<float> *body<RankK<float, false>> = QTB_TIER_NAME(xssyrk_body);
template <>
constexpr Syrk<double> *body<RankK<double, false>> = QTB_TIER_NAME(xdsyrk_body);
template <>
constexpr Syrk<cfloat> *body<RankK<cfloat, false>> = QTB_TIER_NAME(xcsyrk_body);
template <>
constexpr Syrk<cdouble> *body<RankK<cdouble, false>> = QTB_TIER_NAME(xzsyrk_body);
template <>
constexpr Herk<cfloat> *body<RankK<cfloat, true>> = QTB_TIER_NAME(xcherk_body);
template <>
constexpr Herk<cdouble> *body<RankK<cdouble, true>> = QTB_TIER_NAME(xzherk_body);

// Where a block of four rows has a kernel of its own.
constexpr QtbInt rows_of_kernel = 4;
template <class Update>
constexpr bool has_kernel = false;
template <>
constexpr bool has_kernel<RankK<double, false>> = true;

template <class Procedure, class Update>
void call(Procedure *procedure, const Update &u) {
  const char uplo = u.upper ? 'U' : 'L', trans = u.transposed ? (Update::hermitian ? 'C' : 'T') : 'N';
  procedure(&uplo, &trans, &u.n, &u.k, &u.alpha, u.a, &u.lda, &u.beta, u.c, &u.ldc);
}

template <class Update>
void update_block(const Update &u) {
  if constexpr (has_kernel<Update>)
    if (u.n == rows_of_kernel) return call(QTB_TIER_NAME(xdsyrk_n4), u);
  call(body<Update>, u);
}

template <class Update>
void update_by_strips(const Update &u) {
  if (u.k <= 0) return call(body<Update>, u);
  split(u, strips::equal_strips(u.n, strips::wide_strips), [](const Update &wide) {
    split(wide, strips::equal_strips(wide.n, strips::narrow_strips), [](const Update &block) { update_block(block); });
  });
}

template <class T>
QTB_FUNCTION(syrk, T, syrk) {
  update_by_strips(rank_k<false>(uplo, trans, n, k, alpha, a, lda, beta, c, ldc));
}
template <class T>
QTB_FUNCTION(herk, T, herk) {
  update_by_strips(rank_k<true>(uplo, trans, n, k, alpha, a, lda, beta, c, ldc));
}

}  // namespace

QTB_KERNEL(ssyrk, syrk, float, syrk<float>)
QTB_KERNEL(dsyrk, syrk, double, syrk<double>)
QTB_KERNEL(csyrk, syrk, cfloat, syrk<cfloat>)
QTB_KERNEL(zsyrk, syrk, cdouble, syrk<cdouble>)
QTB_KERNEL(cherk, herk, cfloat, herk<cfloat>)
QTB_KERNEL(zherk, herk, cdouble, herk<cdouble>)

}  // namespace qtb::QTB_TIER
