// symm, hemm: C := alpha*A*B + beta*C (side "L") or alpha*B*A + beta*C ("R") with a symmetric or Hermitian A.
//
// One triangle of A is read; the diagonal of a Hermitian A counts by its real part. A and B do not overlap C.
#include "blas/kernels/plain/product.h"

namespace qtb::QTB_TIER {
namespace {

template <class T, bool hermitian = false>
QTB_FUNCTION(symm, T, symm) {
  const Symmetric<T> symmetric{a, *lda, is_letter(*uplo, 'U'), hermitian};
  const Matrix<T> other{b, *ldb, Op::none};
  if (is_letter(*side, 'L'))
    scaled_product(*m, *n, *m, *alpha, symmetric, other, *beta, c, *ldc);
  else
    scaled_product(*m, *n, *n, *alpha, other, symmetric, *beta, c, *ldc);
}

}  // namespace

QTB_KERNEL(ssymm, symm, float, symm<float>)
QTB_KERNEL(dsymm, symm, double, symm<double>)
QTB_KERNEL(csymm, symm, cfloat, symm<cfloat>)
QTB_KERNEL(zsymm, symm, cdouble, symm<cdouble>)
QTB_KERNEL(chemm, symm, cfloat, (symm<cfloat, true>))
QTB_KERNEL(zhemm, symm, cdouble, (symm<cdouble, true>))

}  // namespace qtb::QTB_TIER
