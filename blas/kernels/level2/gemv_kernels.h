// The inner kernels of GEMV, of the tiers from sse3 on.
//
// y += alpha*op(A)*x for contiguous x and y. A is rows x columns with leading dimension lda; x has as many elements as
// op(A) has columns, y as many as it has rows. The addresses of a, x and y are multiples of 8 bytes, and y overlaps
// neither of the others. rows and columns may be 0.
#pragma once

#include "blas/kernels/element.h"

#define QTB_GEMV_KERNEL_PARAMS(T) \
  const QtbInt *rows, const QtbInt *columns, const T *alpha, const T *a, const QtbInt *lda, const T *x, T *y

namespace qtb::QTB_TIER {
extern "C" {
#define QTB_GEMV_KERNEL(name, T, operation, parity) QTB_HIDDEN void QTB_TIER_NAME(name)(QTB_GEMV_KERNEL_PARAMS(T));
#include "blas/kernels/level2/gemv_kernels.def"
#undef QTB_GEMV_KERNEL
}

namespace {

enum class Parity { even, odd, any };

template <class T>
using GemvKernel = void(QTB_GEMV_KERNEL_PARAMS(T));

template <class T, Op op, Parity parity>
struct GemvKernelOf;
#define QTB_GEMV_KERNEL(name, T, operation, parity)            \
  template <>                                                  \
  struct GemvKernelOf<T, Op::operation, Parity::parity> {      \
    static constexpr GemvKernel<T> *run = QTB_TIER_NAME(name); \
  };
#include "blas/kernels/level2/gemv_kernels.def"
#undef QTB_GEMV_KERNEL

template <Op op, class T>
GemvKernel<T> *kernel_of_parity(QtbInt lda) {
  if constexpr (lanes<T> == 1)
    return GemvKernelOf<T, op, Parity::any>::run;
  else
    return lda % 2 == 0 ? GemvKernelOf<T, op, Parity::even>::run : GemvKernelOf<T, op, Parity::odd>::run;
}

template <class T>
GemvKernel<T> *gemv_kernel(Op op, QtbInt lda) {
  if (op == Op::none) return kernel_of_parity<Op::none, T>(lda);
  if constexpr (is_complex<T>)
    if (op == Op::conjugate) return kernel_of_parity<Op::conjugate, T>(lda);
  return kernel_of_parity<Op::transpose, T>(lda);
}

}  // namespace
}  // namespace qtb::QTB_TIER
