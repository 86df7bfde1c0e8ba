// gemm: C := alpha*op(A)*op(B) + beta*C; gemm_scale_c: C := beta*C; and the bodies of gemm that a tier has for some
// sizes, which compute the same.
//
// With a beta of 0 C is not read, with an alpha of 0 neither A nor B. A and B do not overlap C.
#include "blas/kernels/plain/product.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
QTB_FUNCTION(gemm, T, gemm) {
  scaled_product(*m, *n, *k, *alpha, Matrix<T>{a, *lda, read_op<T>(transa)}, Matrix<T>{b, *ldb, read_op<T>(transb)},
                 *beta, c, *ldc);
}

template <class T>
QTB_FUNCTION(scale_c, T, scale_c) {
  scale_part(Part::whole, *m, *n, *beta, c, *ldc);
}

}  // namespace

QTB_KERNEL(sgemm, gemm, float, gemm<float>)
QTB_KERNEL(dgemm, gemm, double, gemm<double>)
QTB_KERNEL(cgemm, gemm, cfloat, gemm<cfloat>)
QTB_KERNEL(zgemm, gemm, cdouble, gemm<cdouble>)
QTB_KERNEL(sgemm_scale_c, scale_c, float, scale_c<float>)
QTB_KERNEL(dgemm_scale_c, scale_c, double, scale_c<double>)
QTB_KERNEL(cgemm_scale_c, scale_c, cfloat, scale_c<cfloat>)
QTB_KERNEL(zgemm_scale_c, scale_c, cdouble, scale_c<cdouble>)
#if QTB_TIER_AT_LEAST(ssse3)
QTB_KERNEL(sgemm_nobcopy, gemm, float, gemm<float>)
#endif
#if QTB_TIER_IS(ssse3) || QTB_TIER_IS(sse42)
QTB_KERNEL(dgemm_nobcopy, gemm, double, gemm<double>)
#endif
#if QTB_TIER_IS(ssse3)
QTB_KERNEL(sgemm_sse41, gemm, float, gemm<float>)
QTB_KERNEL(dgemm_sse41, gemm, double, gemm<double>)
#endif
#if QTB_TIER_IS(def)
QTB_KERNEL(dgemm_def_run_a, gemm, double, gemm<double>)
QTB_KERNEL(dgemm_def_run_b, gemm, double, gemm<double>)
#endif

}  // namespace qtb::QTB_TIER
