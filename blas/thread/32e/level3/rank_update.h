// What the front ends and drivers of the updates of a triangle share: syrk, herk, syr2k, her2k.
//
// C := alpha*op(A)*op(B)' + ... + beta*C in one triangle of C, n x n, where a row block of op(A) and op(B) is rows of A
// and B for "N", and columns otherwise.
#pragma once

#include "blas/thread/32e/level3/gemm_slots.h"
#include "blas/thread/drivers.h"

namespace qtb {

// Whether the operands are passed as they are.
constexpr bool update_is_plain(char trans) { return is_letter(trans, 'N'); }

// Where row f of op(A) begins in A.
template <class T>
const T *row_block(const T *a, QtbInt lda, char trans, QtbInt f) {
  return a + (update_is_plain(trans) ? f : f * lda);
}

// A Hermitian update is the one with real factors of complex operands.
template <class T, class Factor>
inline constexpr bool is_hermitian = is_complex<T> && !is_complex<Factor>;

// The operation that an update pairs with "N".
template <class T, class Factor>
inline constexpr char paired_operation = is_hermitian<T, Factor> ? 'C' : 'T';

// A factor as products take it.
template <class T, class Factor>
constexpr T widened_factor(Factor factor) {
  if constexpr (is_hermitian<T, Factor>)
    return {factor, 0};
  else
    return factor;
}

// The front end of a product, which may take threads.
template <class T>
constexpr auto *gemm_front_end = &qtb_blas_sgemm;
template <>
inline constexpr auto *gemm_front_end<double> = &qtb_blas_dgemm;
template <>
inline constexpr auto *gemm_front_end<cfloat> = &qtb_blas_cgemm;
template <>
inline constexpr auto *gemm_front_end<cdouble> = &qtb_blas_zgemm;

// Whether an update changes nothing, or adds nothing.
template <class Alpha>
constexpr bool update_adds_nothing(const Alpha *alpha, const QtbInt *k) {
  return is_zero(*alpha) || *k == 0;
}
template <class Alpha, class Beta>
constexpr bool update_changes_nothing(const Alpha *alpha, const QtbInt *k, const Beta *beta) {
  return update_adds_nothing(alpha, k) && is_one(*beta);
}

// What the sums of a Hermitian update are added to: the triangle times beta, with a real diagonal. The imaginary parts
// that stand on the diagonal are not of the matrix and are not read; a beta of 0 reads nothing.
template <class T>
void scale_hermitian(char uplo, QtbInt n, Real<T> beta, T *c, QtbInt ldc) {
  const bool upper = is_letter(uplo, 'U');
  for (QtbInt j = 0; j < n; j++) {
    T *const column = c + j * ldc;
    const QtbInt first = upper ? 0 : j + 1, end = upper ? j : n;
    if (beta == 0)
      for (QtbInt i = first; i < end; i++) column[i] = {0, 0};
    else if (beta != 1)
      for (QtbInt i = first; i < end; i++) column[i] = {column[i].re * beta, column[i].im * beta};
    column[j] = {beta == 0 ? 0 : column[j].re * beta, 0};
  }
}

}  // namespace qtb
