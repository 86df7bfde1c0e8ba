// sscal (scal.h) of the tiers that have one to themselves.
#include "blas/kernels/level1/scal.h"

namespace qtb::QTB_TIER {

QTB_KERNEL(sscal, scal, float, scal<row_sscal>)

}  // namespace qtb::QTB_TIER
