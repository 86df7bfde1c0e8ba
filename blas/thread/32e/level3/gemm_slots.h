// The dispatch slots of each element type's GEMM, under names that a template can use.
#pragma once

#include "blas/dispatch/slots.h"

namespace qtb {

template <class T>
struct GemmSlots;

#define QTB_GEMM_SLOTS(t)                                                   \
  static constexpr auto gemm = &qtb_blas_x##t##gemm;                        \
  static constexpr auto scale_c = &qtb_blas_x##t##gemm_scale_c;             \
  static constexpr auto blocks = &qtb_blas_x##t##gemm_blocks;               \
  static constexpr auto sse41 = &qtb_blas_x##t##gemm_sse41;                 \
  static constexpr auto sse41_blocks = &qtb_blas_x##t##gemm_sse41_blocks;   \
  static constexpr auto sse41_packed = &qtb_blas_x##t##gemm_sse41_packed;   \
  static constexpr auto sse41_acopy_n = &qtb_blas_x##t##gemm_sse41_acopy_n; \
  static constexpr auto sse41_acopy_t = &qtb_blas_x##t##gemm_sse41_acopy_t; \
  static constexpr auto sse41_bcopy_n = &qtb_blas_x##t##gemm_sse41_bcopy_n; \
  static constexpr auto sse41_bcopy_t = &qtb_blas_x##t##gemm_sse41_bcopy_t;

#define QTB_GEMM_SLOTS_REAL(t)                                  \
  QTB_GEMM_SLOTS(t)                                             \
  static constexpr auto nobcopy = &qtb_blas_x##t##gemm_nobcopy; \
  /* A real element is its own conjugate. */                    \
  static constexpr decltype(sse41_acopy_t) sse41_acopy_c = nullptr, sse41_bcopy_c = nullptr;

#define QTB_GEMM_SLOTS_COMPLEX(t)                                           \
  QTB_GEMM_SLOTS(t)                                                         \
  static constexpr auto bpacked = &qtb_blas_x##t##gemm_bpacked;             \
  static constexpr auto bcopy_n = &qtb_blas_x##t##gemm_bcopy_n;             \
  static constexpr auto bcopy_t = &qtb_blas_x##t##gemm_bcopy_t;             \
  static constexpr auto bcopy_c = &qtb_blas_x##t##gemm_bcopy_c;             \
  static constexpr auto sse41_acopy_c = &qtb_blas_x##t##gemm_sse41_acopy_c; \
  static constexpr auto sse41_bcopy_c = &qtb_blas_x##t##gemm_sse41_bcopy_c;

template <>
struct GemmSlots<float> {
  QTB_GEMM_SLOTS_REAL(s)
};
template <>
struct GemmSlots<double> {
  QTB_GEMM_SLOTS_REAL(d)
};
template <>
struct GemmSlots<cfloat> {
  QTB_GEMM_SLOTS_COMPLEX(c)
};
template <>
struct GemmSlots<cdouble> {
  QTB_GEMM_SLOTS_COMPLEX(z)
};

#undef QTB_GEMM_SLOTS
#undef QTB_GEMM_SLOTS_REAL
#undef QTB_GEMM_SLOTS_COMPLEX

}  // namespace qtb
