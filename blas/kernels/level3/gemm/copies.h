// The copy routines of this tier by type and family, as bodies and kernels reach them.
//
// copies_of<T, family>.a[op] and .b[op] are the procedures that pack.cpp defines, of the shape panel_copy, for op none,
// transpose and conjugate; a real type has the transpose for both of the last two.
#pragma once

#include "blas/kernels/level3/gemm/tiles.h"

// X(name, T, family) for each family of this tier; name is the start of the procedures' names.
#define QTB_COPY_FAMILIES_BASE(REAL, COMPLEX) \
  REAL(sgemm, float, base)                    \
  REAL(dgemm, double, base)                   \
  COMPLEX(cgemm, cfloat, base)                \
  COMPLEX(zgemm, cdouble, base)
#if QTB_TIER_IS(ssse3)
#define QTB_COPY_FAMILIES(REAL, COMPLEX) \
  QTB_COPY_FAMILIES_BASE(REAL, COMPLEX)  \
  REAL(sgemm_sse41, float, sse41)        \
  REAL(dgemm_sse41, double, sse41)       \
  COMPLEX(cgemm_sse41, cfloat, sse41)    \
  COMPLEX(zgemm_sse41, cdouble, sse41)
#elif QTB_TIER_IS(def)
#define QTB_COPY_FAMILIES(REAL, COMPLEX) \
  QTB_COPY_FAMILIES_BASE(REAL, COMPLEX)  \
  REAL(dgemm_def, double, def_a)
#else
#define QTB_COPY_FAMILIES(REAL, COMPLEX) QTB_COPY_FAMILIES_BASE(REAL, COMPLEX)
#endif

namespace qtb::QTB_TIER {

#define QTB_DECLARE_COPIES_NT(name, T, family)                                         \
  extern "C" QTB_HIDDEN QTB_FUNCTION(panel_copy, T, QTB_TIER_NAME(x##name##_acopy_n)); \
  extern "C" QTB_HIDDEN QTB_FUNCTION(panel_copy, T, QTB_TIER_NAME(x##name##_acopy_t)); \
  extern "C" QTB_HIDDEN QTB_FUNCTION(panel_copy, T, QTB_TIER_NAME(x##name##_bcopy_n)); \
  extern "C" QTB_HIDDEN QTB_FUNCTION(panel_copy, T, QTB_TIER_NAME(x##name##_bcopy_t));
#define QTB_DECLARE_COPIES_NTC(name, T, family)                                        \
  QTB_DECLARE_COPIES_NT(name, T, family)                                               \
  extern "C" QTB_HIDDEN QTB_FUNCTION(panel_copy, T, QTB_TIER_NAME(x##name##_acopy_c)); \
  extern "C" QTB_HIDDEN QTB_FUNCTION(panel_copy, T, QTB_TIER_NAME(x##name##_bcopy_c));
QTB_COPY_FAMILIES(QTB_DECLARE_COPIES_NT, QTB_DECLARE_COPIES_NTC)

namespace {

template <class T>
using PanelCopy = QTB_FUNCTION_TYPE(panel_copy, T);
template <class T>
struct PanelCopies {
  PanelCopy<T> *a[3], *b[3];
};

template <class T, Family family>
constexpr PanelCopies<T> copies_of{};
#define QTB_COPIES_NT(name, T, family)                                                                        \
  template <>                                                                                                 \
  constexpr PanelCopies<T> copies_of<T, Family::family> = {                                                   \
      {QTB_TIER_NAME(x##name##_acopy_n), QTB_TIER_NAME(x##name##_acopy_t), QTB_TIER_NAME(x##name##_acopy_t)}, \
      {QTB_TIER_NAME(x##name##_bcopy_n), QTB_TIER_NAME(x##name##_bcopy_t), QTB_TIER_NAME(x##name##_bcopy_t)}};
#define QTB_COPIES_NTC(name, T, family)                                                                       \
  template <>                                                                                                 \
  constexpr PanelCopies<T> copies_of<T, Family::family> = {                                                   \
      {QTB_TIER_NAME(x##name##_acopy_n), QTB_TIER_NAME(x##name##_acopy_t), QTB_TIER_NAME(x##name##_acopy_c)}, \
      {QTB_TIER_NAME(x##name##_bcopy_n), QTB_TIER_NAME(x##name##_bcopy_t), QTB_TIER_NAME(x##name##_bcopy_c)}};
QTB_COPY_FAMILIES(QTB_COPIES_NT, QTB_COPIES_NTC)

}  // namespace
}  // namespace qtb::QTB_TIER
