// sscal (scal.h) of sse42, which the avx tier shares.
#include "blas/kernels/level1/scal.h"

namespace qtb::QTB_TIER {

QTB_KERNEL(sscal, scal, float, scal<row_sscal>)
QTB_KERNEL_SHARED(avx, sscal, scal, float)

}  // namespace qtb::QTB_TIER
