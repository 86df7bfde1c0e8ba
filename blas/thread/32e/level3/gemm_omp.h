// The parallel GEMM driver: qtb_blas_<type>gemm_omp(decision, the routine's arguments).
//
// C := alpha*op(A)*op(B) + beta*C for m and n of at least 1 by decision->threads threads, or by the team that the
// runtime gives, on the road gemm_parallel of gemm_decision.h. Where the decision says so, C is scaled ahead of the
// main region, in one of its own, so that the strategies can add to it. Inside the main region every thread selects the
// strategy for itself, from the team, and runs it; a team of one calls the dispatch slot.
#pragma once

#include "blas/shapes.h"
#include "blas/thread/32e/level3/gemm_decision.h"
#include "blas/thread/32e/level3/gemm_select.h"

extern "C" {
#define QTB_DECLARE_GEMM_OMP(t, T) \
  QTB_HIDDEN void qtb_blas_##t##gemm_omp(const qtb::GemmDecision *decision, QTB_PARAMS_gemm(T));
QTB_FOR_EACH_GEMM(QTB_DECLARE_GEMM_OMP)
#undef QTB_DECLARE_GEMM_OMP
}
