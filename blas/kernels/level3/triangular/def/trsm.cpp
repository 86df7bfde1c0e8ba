// trsm of the tiers sse3 and def: B := alpha*op(T)^-1*B or alpha*B*op(T)^-1, in place.
#include "blas/kernels/level3/triangular/nested.h"

namespace qtb::QTB_TIER {
namespace {

constexpr QtbInt inner_block = this_tier == tier_def ? 256 : 128;

template <class T>
QTB_FUNCTION(trmm, T, trsm) {
  nested_blocks<true, inner_block>(side, uplo, transa, diag, m, n, alpha, a, lda, b, ldb);
}

}  // namespace

QTB_KERNEL(strsm, trmm, float, trsm<float>)
QTB_KERNEL(dtrsm, trmm, double, trsm<double>)
QTB_KERNEL(ctrsm, trmm, cfloat, trsm<cfloat>)
QTB_KERNEL(ztrsm, trmm, cdouble, trsm<cdouble>)

}  // namespace qtb::QTB_TIER
