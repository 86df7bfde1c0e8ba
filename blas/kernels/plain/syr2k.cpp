// syr2k: C := alpha*A*B^T + alpha*B*A^T + beta*C (trans "N") or alpha*A^T*B + alpha*B^T*A + beta*C on one triangle;
// her2k: the same with conjugate transposes, conj(alpha) in the second product and a real beta.
//
// her2k leaves a real diagonal, unless nothing is to be done (alpha or k is 0, and beta is 1), when C stays as it is.
// A and B do not overlap C.
#include "blas/kernels/plain/product.h"

namespace qtb::QTB_TIER {
namespace {

template <class T, class S>
void rank_2k_update(Part part, bool hermitian, bool transposed, QtbInt n, QtbInt k, T alpha, const T *a, QtbInt lda,
                    const T *b, QtbInt ldb, S beta, T *c, QtbInt ldc) {
  const bool nothing_to_add = is_zero(alpha) || k <= 0;
  if (n <= 0 || (nothing_to_add && is_one(beta))) return;
  // The imaginary parts that stand on the diagonal are not of the matrix, and the scaling would compute with them.
  if (hermitian) clear_imaginary_diagonal(n, c, ldc);
  scale_part(part, n, n, beta, c, ldc);
  if (!nothing_to_add) {
    const Op turn = hermitian ? Op::conjugate : Op::transpose;
    const Op left = transposed ? turn : Op::none, right = transposed ? Op::none : turn;
    const T second = hermitian ? conjugate(alpha) : alpha;
    add_product(part, n, n, k, alpha, Matrix<T>{a, lda, left}, Matrix<T>{b, ldb, right}, c, ldc);
    add_product(part, n, n, k, second, Matrix<T>{b, ldb, left}, Matrix<T>{a, lda, right}, c, ldc);
  }
  if (hermitian) clear_imaginary_diagonal(n, c, ldc);
}

template <class T>
QTB_FUNCTION(syr2k, T, syr2k) {
  rank_2k_update(read_part(uplo), false, !is_letter(*trans, 'N'), *n, *k, *alpha, a, *lda, b, *ldb, *beta, c, *ldc);
}

template <class T>
QTB_FUNCTION(her2k, T, her2k) {
  rank_2k_update(read_part(uplo), true, !is_letter(*trans, 'N'), *n, *k, *alpha, a, *lda, b, *ldb, *beta, c, *ldc);
}

}  // namespace

QTB_KERNEL(ssyr2k, syr2k, float, syr2k<float>)
QTB_KERNEL(dsyr2k, syr2k, double, syr2k<double>)
QTB_KERNEL(csyr2k, syr2k, cfloat, syr2k<cfloat>)
QTB_KERNEL(zsyr2k, syr2k, cdouble, syr2k<cdouble>)
QTB_KERNEL(cher2k, her2k, cfloat, her2k<cfloat>)
QTB_KERNEL(zher2k, her2k, cdouble, her2k<cdouble>)

}  // namespace qtb::QTB_TIER
