// The copy routines of the ssse3 tier's two families, in one source: many of the panels are the same, and so is the
// code that compilers then merge.
#include "blas/kernels/level3/gemm/define_copies.h"

namespace qtb::QTB_TIER {

QTB_COPIES_BASE
QTB_COPIES_REAL(sgemm_sse41, float, sse41)
QTB_COPIES_REAL(dgemm_sse41, double, sse41)
QTB_COPIES_COMPLEX(cgemm_sse41, cfloat, sse41)
QTB_COPIES_COMPLEX(zgemm_sse41, cdouble, sse41)

}  // namespace qtb::QTB_TIER
