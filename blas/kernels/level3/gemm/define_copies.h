// gemm_acopy, gemm_bcopy: packing of a block of op(A) or op(B) into the panel of its GEMM family (pack.h).
//
// rows x cols is the block of op(A) or op(B), src its first element as it lies in memory, ldp the step of the
// micro-panels. A B copy does not read alpha. Fewer than one row or column: nothing is written.
#pragma once

#include "blas/kernels/level3/gemm/copies.h"
#include "blas/kernels/level3/gemm/pack.h"

namespace qtb::QTB_TIER {
namespace {

template <class T, Op op, Family family>
QTB_FUNCTION(panel_copy, T, copy_a) {
  pack_a<T, op, family>(*rows, *cols, src, *ld, dst, *ldp, *alpha);
}

template <class T, Op op, Family family>
void copy_b(const QtbInt *rows, const QtbInt *cols, const T *src, const QtbInt *ld, T *dst, const QtbInt *ldp,
            const T *) {
  pack_b<T, op, family>(*rows, *cols, src, *ld, dst, *ldp);
}

}  // namespace
}  // namespace qtb::QTB_TIER

// The copies of a family, real or complex; name is the start of the procedures' names.
#define QTB_COPIES_REAL(name, T, family)                                                \
  QTB_KERNEL(name##_acopy_n, panel_copy, T, (copy_a<T, Op::none, Family::family>))      \
  QTB_KERNEL(name##_acopy_t, panel_copy, T, (copy_a<T, Op::transpose, Family::family>)) \
  QTB_KERNEL(name##_bcopy_n, panel_copy, T, (copy_b<T, Op::none, Family::family>))      \
  QTB_KERNEL(name##_bcopy_t, panel_copy, T, (copy_b<T, Op::transpose, Family::family>))
#define QTB_COPIES_COMPLEX(name, T, family)                                             \
  QTB_COPIES_REAL(name, T, family)                                                      \
  QTB_KERNEL(name##_acopy_c, panel_copy, T, (copy_a<T, Op::conjugate, Family::family>)) \
  QTB_KERNEL(name##_bcopy_c, panel_copy, T, (copy_b<T, Op::conjugate, Family::family>))

// The base families of a tier.
#define QTB_COPIES_BASE                   \
  QTB_COPIES_REAL(sgemm, float, base)     \
  QTB_COPIES_REAL(dgemm, double, base)    \
  QTB_COPIES_COMPLEX(cgemm, cfloat, base) \
  QTB_COPIES_COMPLEX(zgemm, cdouble, base)
