// The GEMM of this tier, as the kernels that are built on it call it: by value, and with op as a type.
//
// letter(op): the option of op, at an address that lasts.
// gemm(op_a, op_b, ...): C := alpha*op(A)*op(B) + beta*C by the procedure of the slot x<t>gemm. C is m x n, op(A) m x
// k, op(B) k x n; A and B do not overlap C. A beta of 0 stores without reading C, an alpha of 0 reads neither A nor B.
#pragma once

#include "blas/kernels/element.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
using TierGemm = QTB_FUNCTION_TYPE(gemm, T);
template <class T>
constexpr TierGemm<T> *tier_gemm = nullptr;
template <>
constexpr TierGemm<float> *tier_gemm<float> = QTB_TIER_NAME(xsgemm);
template <>
constexpr TierGemm<double> *tier_gemm<double> = QTB_TIER_NAME(xdgemm);
template <>
constexpr TierGemm<cfloat> *tier_gemm<cfloat> = QTB_TIER_NAME(xcgemm);
template <>
constexpr TierGemm<cdouble> *tier_gemm<cdouble> = QTB_TIER_NAME(xzgemm);

inline const char *letter(Op op) {
  static constexpr char letters[] = {'N', 'T', 'C'};
  return &letters[static_cast<int>(op)];
}

template <class T>
void gemm(Op op_a, Op op_b, QtbInt m, QtbInt n, QtbInt k, T alpha, const T *a, QtbInt lda, const T *b, QtbInt ldb,
          T beta, T *c, QtbInt ldc) {
  tier_gemm<T>(letter(op_a), letter(op_b), &m, &n, &k, &alpha, a, &lda, b, &ldb, &beta, c, &ldc);
}

}  // namespace
}  // namespace qtb::QTB_TIER
