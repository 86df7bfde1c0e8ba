// ger, geru, gerc by the tier's own AXPY (ger.h): of all tiers but def.
#include "blas/kernels/level2/ger.h"

namespace qtb::QTB_TIER {

QTB_KERNEL(sger, ger, float, (ger_by_axpy<float, QTB_TIER_NAME(xsaxpy)>))
QTB_KERNEL(dger, ger, double, (ger_by_axpy<double, QTB_TIER_NAME(xdaxpy)>))
QTB_KERNEL(cgeru, ger, cfloat, (ger_by_axpy<cfloat, QTB_TIER_NAME(xcaxpy)>))
QTB_KERNEL(zgeru, ger, cdouble, (ger_by_axpy<cdouble, QTB_TIER_NAME(xzaxpy)>))
QTB_KERNEL(cgerc, ger, cfloat, (ger_by_axpy<cfloat, QTB_TIER_NAME(xcaxpy), true>))
QTB_KERNEL(zgerc, ger, cdouble, (ger_by_axpy<cdouble, QTB_TIER_NAME(xzaxpy), true>))

}  // namespace qtb::QTB_TIER
