// The parallel products with a symmetric matrix. See symm_omp.h.

#include "blas/thread/32/level3/symm_omp.h"
#include "blas/dispatch/slots.h"
#include "blas/thread/32/level3/symm_slabs.h"

extern "C" {
#define QTB_DEFINE_SYMM_OMP(name, T)                                    \
  void qtb_blas_##name##_omp(QtbInt nthreads, QTB_PARAMS_symm(T)) {     \
    qtb::symm_by_slabs<T, &qtb_blas_x##name>(nthreads, QTB_ARGS(symm)); \
  }
QTB_FOR_EACH_SYMM(QTB_DEFINE_SYMM_OMP)
}
