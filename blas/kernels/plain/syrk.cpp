// syrk: C := alpha*A*A^T + beta*C (trans "N") or alpha*A^T*A + beta*C on one triangle; herk: the same with A^H and real
// alpha and beta; and the pieces of them that a tier has, which compute the same.
//
// herk leaves a real diagonal, unless nothing is to be done (alpha or k is 0, and beta is 1), when C stays as it is.
// A does not overlap C.
#include "blas/kernels/plain/product.h"

namespace qtb::QTB_TIER {
namespace {

template <class T, class S>
void rank_k_update(Part part, bool hermitian, bool transposed, QtbInt n, QtbInt k, S alpha, const T *a, QtbInt lda,
                   S beta, T *c, QtbInt ldc) {
  const bool nothing_to_add = is_zero(alpha) || k <= 0;
  if (n <= 0 || (nothing_to_add && is_one(beta))) return;
  // The imaginary parts that stand on the diagonal are not of the matrix, and the scaling would compute with them.
  if (hermitian) clear_imaginary_diagonal(n, c, ldc);
  scale_part(part, n, n, beta, c, ldc);
  if (!nothing_to_add) {
    const Matrix<T> plain{a, lda, Op::none}, turned{a, lda, hermitian ? Op::conjugate : Op::transpose};
    add_product(part, n, n, k, alpha, transposed ? turned : plain, transposed ? plain : turned, c, ldc);
  }
  if (hermitian) clear_imaginary_diagonal(n, c, ldc);
}

template <class T>
QTB_FUNCTION(syrk, T, syrk) {
  rank_k_update(read_part(uplo), false, !is_letter(*trans, 'N'), *n, *k, *alpha, a, *lda, *beta, c, *ldc);
}

template <class T>
QTB_FUNCTION(herk, T, herk) {
  rank_k_update(read_part(uplo), true, !is_letter(*trans, 'N'), *n, *k, *alpha, a, *lda, *beta, c, *ldc);
}

}  // namespace

QTB_KERNEL(ssyrk, syrk, float, syrk<float>)
QTB_KERNEL(dsyrk, syrk, double, syrk<double>)
QTB_KERNEL(csyrk, syrk, cfloat, syrk<cfloat>)
QTB_KERNEL(zsyrk, syrk, cdouble, syrk<cdouble>)
QTB_KERNEL(cherk, herk, cfloat, herk<cfloat>)
QTB_KERNEL(zherk, herk, cdouble, herk<cdouble>)
QTB_KERNEL(ssyrk_body, syrk, float, syrk<float>)
QTB_KERNEL(dsyrk_body, syrk, double, syrk<double>)
QTB_KERNEL(csyrk_body, syrk, cfloat, syrk<cfloat>)
QTB_KERNEL(zsyrk_body, syrk, cdouble, syrk<cdouble>)
QTB_KERNEL(cherk_body, herk, cfloat, herk<cfloat>)
QTB_KERNEL(zherk_body, herk, cdouble, herk<cdouble>)
QTB_KERNEL(dsyrk_n4, syrk, double, syrk<double>)

}  // namespace qtb::QTB_TIER
