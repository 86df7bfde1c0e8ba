// strsm, dtrsm, ctrsm and ztrsm of the tiers with level tables, their level walks and their base kernels.
#include "blas/kernels/level3/triangular/entry.h"

namespace qtb::QTB_TIER {

QTB_TRIANGULAR(trsm, strsm, float)
QTB_TRIANGULAR(trsm, dtrsm, double)
QTB_TRIANGULAR(trsm, ctrsm, cfloat)
QTB_TRIANGULAR(trsm, ztrsm, cdouble)

}  // namespace qtb::QTB_TIER
