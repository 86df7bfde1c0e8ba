// strmm, dtrmm, ctrmm and ztrmm of the tiers with level tables, their level walks and their base kernels.
#include "blas/kernels/level3/triangular/entry.h"

namespace qtb::QTB_TIER {

QTB_TRIANGULAR(trmm, strmm, float)
QTB_TRIANGULAR(trmm, dtrmm, double)
QTB_TRIANGULAR(trmm, ctrmm, cfloat)
QTB_TRIANGULAR(trmm, ztrmm, cdouble)

}  // namespace qtb::QTB_TIER
