// The copy routines of the def tier's double-precision families with the 4 x 4 tile, which share their panels.
#include "blas/kernels/level3/gemm/define_copies.h"

namespace qtb::QTB_TIER {

QTB_COPIES_REAL(dgemm_def, double, def_a)

}  // namespace qtb::QTB_TIER
