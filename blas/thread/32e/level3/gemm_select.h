// The selectors of a parallel GEMM: which strategy cuts a problem, and how.
//
// A selector reads m, n, k and of the plan the team (nthreads), the machine class and the cache table. It sets nthreads
// to the threads that take part (at most the team), the grid, the block sizes, the kernel and the strategy, in the
// panel set the packing routines, and asks the block query, where the strategy needs one, for the rest. The same
// arguments give the same plan.
#pragma once

#include "blas/thread/32e/level3/gemm_plan.h"

#define QTB_FOR_EACH_GEMM(f) f(s, float) f(d, double) f(c, cfloat) f(z, cdouble)

extern "C" {
#define QTB_DECLARE_GEMM_SELECT(t, T)                                                          \
  QTB_HIDDEN void qtb_blas_##t##gemm_select(const QtbInt *m, const QtbInt *n, const QtbInt *k, \
                                            qtb::GemmPanelSet<T> *panel_set, qtb::GemmPlan<T> *plan);
QTB_FOR_EACH_GEMM(QTB_DECLARE_GEMM_SELECT)
#undef QTB_DECLARE_GEMM_SELECT
}
