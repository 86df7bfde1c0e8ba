// Front ends that only forward to the dispatch slot: the routine runs on the caller's thread.

#include "blas/dispatch/slots.h"
#include "blas/thread/drivers.h"

extern "C" {

#define QTB_FORWARD(name, shape, T) \
  QTB_FUNCTION(shape, T, qtb_blas_##name) { return qtb_blas_x##name(QTB_ARGS(shape)); }

QTB_FORWARD(csrot, rot, cfloat)
QTB_FORWARD(zdrot, rot, cdouble)

}  // extern "C"
