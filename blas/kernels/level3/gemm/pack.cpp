// The copy routines of the base families.
#include "blas/kernels/level3/gemm/define_copies.h"

namespace qtb::QTB_TIER {

QTB_COPIES_BASE

}  // namespace qtb::QTB_TIER
