// trmm of the tiers sse3 and def: B := alpha*op(T)*B or alpha*B*op(T), in place.
#include "blas/kernels/level3/triangular/nested.h"

namespace qtb::QTB_TIER {
namespace {

constexpr QtbInt inner_block = 128;

template <class T>
QTB_FUNCTION(trmm, T, trmm) {
  nested_blocks<false, inner_block>(side, uplo, transa, diag, m, n, alpha, a, lda, b, ldb);
}

}  // namespace

QTB_KERNEL(strmm, trmm, float, trmm<float>)
QTB_KERNEL(dtrmm, trmm, double, trmm<double>)
QTB_KERNEL(ctrmm, trmm, cfloat, trmm<cfloat>)
QTB_KERNEL(ztrmm, trmm, cdouble, trmm<cdouble>)

}  // namespace qtb::QTB_TIER
