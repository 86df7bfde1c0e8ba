// The parallel triangular products and solves: qtb_blas_<routine>_omp(decision, the routine's arguments).
//
// n is at least 1; m may be 0. A driver asks for the decision's threads and cuts B over the team that it gets, in
// multiples of the decision's unit (slabs.h).
#pragma once

#include "blas/shapes.h"
#include "blas/thread/32e/level3/trmm_decision.h"

extern "C" {
#define QTB_DECLARE_TRMM_OMP(name, T) \
  QTB_HIDDEN void qtb_blas_##name##_omp(const qtb::TrmmDecision *decision, QTB_PARAMS_trmm(T));
QTB_FOR_EACH_TRMM(QTB_DECLARE_TRMM_OMP)
QTB_FOR_EACH_TRSM(QTB_DECLARE_TRMM_OMP)
#undef QTB_DECLARE_TRMM_OMP
}
