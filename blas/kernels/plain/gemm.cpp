// gemm: C := alpha*op(A)*op(B) + beta*C, in the tiers below ssse3.
//
// With a beta of 0 C is not read, with an alpha of 0 neither A nor B. A and B do not overlap C.
#include "blas/kernels/plain/product.h"

#if !QTB_TIER_AT_LEAST(ssse3)

namespace qtb::QTB_TIER {
namespace {

template <class T>
QTB_FUNCTION(gemm, T, gemm) {
  scaled_product(*m, *n, *k, *alpha, Matrix<T>{a, *lda, read_op<T>(transa)}, Matrix<T>{b, *ldb, read_op<T>(transb)},
                 *beta, c, *ldc);
}

}  // namespace

QTB_KERNEL(sgemm, gemm, float, gemm<float>)
QTB_KERNEL(dgemm, gemm, double, gemm<double>)
QTB_KERNEL(cgemm, gemm, cfloat, gemm<cfloat>)
QTB_KERNEL(zgemm, gemm, cdouble, gemm<cdouble>)
#if QTB_TIER_IS(def)
QTB_KERNEL(dgemm_def_run_a, gemm, double, gemm<double>)
QTB_KERNEL(dgemm_def_run_b, gemm, double, gemm<double>)
#endif

}  // namespace qtb::QTB_TIER

#endif
