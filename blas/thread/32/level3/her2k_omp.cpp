// The parallel Hermitian rank-2k updates. See syr2k_omp.h.

#include "blas/thread/32/level3/syr2k_omp.h"

#include "blas/thread/32/level3/syr2k_strips.h"

extern "C" {
#define QTB_DEFINE_HER2K_OMP(name, T)                                   \
  void qtb_blas_##name##_omp(QtbInt nthreads, QTB_PARAMS_her2k(T)) {    \
    qtb::syr2k_by_strips<&qtb_blas_x##name>(nthreads, QTB_ARGS(her2k)); \
  }
QTB_FOR_EACH_HER2K(QTB_DEFINE_HER2K_OMP)
}
