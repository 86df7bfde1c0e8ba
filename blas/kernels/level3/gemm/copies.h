// The copy routines of this tier by type and family, as bodies and kernels reach them.
//
// copies_of<T, family>.a[op] and .b[op] are the procedures that define_copies.h defines, of the shape panel_copy, for
// op none, transpose and conjugate; a real type has the transpose for both of the last two. Every tier's build names
// the copies of all families; a family that a tier does not have is not asked for.
#pragma once

#include "blas/kernels/level3/gemm/family.h"

namespace qtb::QTB_TIER {

// Those that no slot has.
extern "C" {
#define QTB_DECLARE_COPY(name, T) QTB_HIDDEN QTB_FUNCTION(panel_copy, T, QTB_TIER_NAME(x##name));
#define QTB_DECLARE_COPIES_REAL(name, T) \
  QTB_DECLARE_COPY(name##_acopy_n, T)    \
  QTB_DECLARE_COPY(name##_acopy_t, T)    \
  QTB_DECLARE_COPY(name##_bcopy_n, T)    \
  QTB_DECLARE_COPY(name##_bcopy_t, T)
#define QTB_DECLARE_ACOPIES_COMPLEX(name, T) \
  QTB_DECLARE_COPY(name##_acopy_n, T)        \
  QTB_DECLARE_COPY(name##_acopy_t, T)        \
  QTB_DECLARE_COPY(name##_acopy_c, T)
QTB_DECLARE_COPIES_REAL(sgemm, float)
QTB_DECLARE_COPIES_REAL(dgemm_def, double)
QTB_DECLARE_ACOPIES_COMPLEX(cgemm, cfloat)
QTB_DECLARE_ACOPIES_COMPLEX(zgemm, cdouble)
#undef QTB_DECLARE_COPY
#undef QTB_DECLARE_COPIES_REAL
#undef QTB_DECLARE_ACOPIES_COMPLEX
}

namespace {

template <class T>
using PanelCopy = QTB_FUNCTION_TYPE(panel_copy, T);
template <class T>
struct PanelCopies {
  PanelCopy<T> *a[3], *b[3];
};

template <class T, Family family>
constexpr PanelCopies<T> copies_of{};
// The start of the procedures' names; the form for op conjugate.
#define QTB_NAME_COPIES(name, T, family, c)                                                                     \
  template <>                                                                                                   \
  constexpr PanelCopies<T> copies_of<T, Family::family> = {                                                     \
      {QTB_TIER_NAME(x##name##_acopy_n), QTB_TIER_NAME(x##name##_acopy_t), QTB_TIER_NAME(x##name##_acopy_##c)}, \
      {QTB_TIER_NAME(x##name##_bcopy_n), QTB_TIER_NAME(x##name##_bcopy_t), QTB_TIER_NAME(x##name##_bcopy_##c)}};
QTB_NAME_COPIES(sgemm, float, base, t)
QTB_NAME_COPIES(dgemm, double, base, t)
QTB_NAME_COPIES(cgemm, cfloat, base, c)
QTB_NAME_COPIES(zgemm, cdouble, base, c)
QTB_NAME_COPIES(sgemm_sse41, float, sse41, t)
QTB_NAME_COPIES(dgemm_sse41, double, sse41, t)
QTB_NAME_COPIES(cgemm_sse41, cfloat, sse41, c)
QTB_NAME_COPIES(zgemm_sse41, cdouble, sse41, c)
QTB_NAME_COPIES(dgemm_def, double, def_a, t)
#undef QTB_NAME_COPIES

}  // namespace
}  // namespace qtb::QTB_TIER
