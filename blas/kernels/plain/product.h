// C := C + alpha*A*B, whole or one triangle of it: the core of every plain Level-3 product.
//
// An operand is anything with at(i, j): a matrix under op, a symmetric one of which a triangle is stored, a packed
// panel. A is read a small block at a time into the stack, so that the loops run over contiguous elements whatever A
// is; the columns of C take multiples of the block's columns.
#pragma once

#include "blas/kernels/element.h"

namespace qtb::QTB_TIER {
namespace {

// The elements of C that a routine reads and writes.
enum class Part { whole, upper, lower };

inline Part read_part(const char *uplo) { return is_letter(*uplo, 'U') ? Part::upper : Part::lower; }

// op(A).
template <class T>
struct Matrix {
  const T *a;
  QtbInt ld;
  Op op;
  T at(QtbInt i, QtbInt j) const {
    if (op == Op::none) return a[i + j * ld];
    const T v = a[j + i * ld];
    return op == Op::conjugate ? conjugate(v) : v;
  }
};

// A symmetric or Hermitian matrix of which one triangle is stored.
template <class T>
struct Symmetric {
  const T *a;
  QtbInt ld;
  bool upper, hermitian;
  T at(QtbInt i, QtbInt j) const {
    if (i == j) return hermitian ? real_only(a[i + j * ld]) : a[i + j * ld];
    if ((i < j) == upper) return a[i + j * ld];
    return hermitian ? conjugate(a[j + i * ld]) : a[j + i * ld];
  }
};

// C is m x n, A m x k, B k x n. alpha may be real where the elements are complex.
template <class T, class S, class A, class B>
void add_product(Part part, QtbInt m, QtbInt n, QtbInt k, S alpha, A a, B b, T *c, QtbInt ldc) {
  constexpr QtbInt block_bytes = 16384;  // half of the smallest first-level cache, and no burden for a small stack
  constexpr QtbInt block_rows = 32;
  constexpr QtbInt block_depth = block_bytes / (block_rows * static_cast<QtbInt>(sizeof(T)));
  T block[block_rows * block_depth];

  for (QtbInt l0 = 0; l0 < k; l0 += block_depth) {
    const QtbInt depth = k - l0 < block_depth ? k - l0 : block_depth;
    for (QtbInt i0 = 0; i0 < m; i0 += block_rows) {
      const QtbInt rows = m - i0 < block_rows ? m - i0 : block_rows;
      for (QtbInt l = 0; l < depth; l++)
        for (QtbInt i = 0; i < rows; i++) block[i + l * block_rows] = a.at(i0 + i, l0 + l);
      for (QtbInt j = 0; j < n; j++) {
        const QtbInt begin = part == Part::lower && j > i0 ? j - i0 : 0;
        const QtbInt end = part == Part::upper && j < i0 + rows ? j + 1 - i0 : rows;
        if (begin >= end) continue;
        T *column = c + i0 + j * ldc;
        for (QtbInt l = 0; l < depth; l++) {
          const T factor = alpha * b.at(l0 + l, j);
          for (QtbInt i = begin; i < end; i++) column[i] += factor * block[i + l * block_rows];
        }
      }
    }
  }
}

// C := beta*C on a part of C. A beta of 0 stores without reading, a beta of 1 does nothing.
template <class T, class S>
void scale_part(Part part, QtbInt m, QtbInt n, S beta, T *c, QtbInt ldc) {
  if (is_one(beta)) return;
  for (QtbInt j = 0; j < n; j++) {
    const QtbInt begin = part == Part::lower ? j : 0, end = part == Part::upper ? j + 1 : m;
    scale(end - begin, beta, c + begin + j * ldc);
  }
}

// C := alpha*A*B + beta*C. An alpha of 0 reads neither operand.
template <class T, class A, class B>
void scaled_product(QtbInt m, QtbInt n, QtbInt k, T alpha, A a, B b, T beta, T *c, QtbInt ldc) {
  if (m <= 0 || n <= 0) return;
  scale_part(Part::whole, m, n, beta, c, ldc);
  if (!is_zero(alpha)) add_product(Part::whole, m, n, k, alpha, a, b, c, ldc);
}

// The diagonal of a Hermitian matrix is real. Nothing is read.
template <class T>
void clear_imaginary_diagonal(QtbInt n, T *c, QtbInt ldc) {
  if constexpr (is_complex<T>)
    for (QtbInt j = 0; j < n; j++) c[j + j * ldc].im = 0;
}

}  // namespace
}  // namespace qtb::QTB_TIER
