// Front ends that only forward to the dispatch slot: the routine runs on the caller's thread.

#include "blas/dispatch/slots.h"
#include "blas/thread/drivers.h"

extern "C" {

#define QTB_FORWARD(name, shape, T) \
  QTB_FUNCTION(shape, T, qtb_blas_##name) { return qtb_blas_x##name(QTB_ARGS(shape)); }

QTB_FORWARD(csrot, rot, cfloat)
QTB_FORWARD(zdrot, rot, cdouble)
QTB_FORWARD(ssymm, symm, float)
QTB_FORWARD(dsymm, symm, double)
QTB_FORWARD(csymm, symm, cfloat)
QTB_FORWARD(zsymm, symm, cdouble)
QTB_FORWARD(chemm, symm, cfloat)
QTB_FORWARD(zhemm, symm, cdouble)
QTB_FORWARD(ssyrk, syrk, float)
QTB_FORWARD(dsyrk, syrk, double)
QTB_FORWARD(csyrk, syrk, cfloat)
QTB_FORWARD(zsyrk, syrk, cdouble)
QTB_FORWARD(cherk, herk, cfloat)
QTB_FORWARD(zherk, herk, cdouble)
QTB_FORWARD(ssyr2k, syr2k, float)
QTB_FORWARD(dsyr2k, syr2k, double)
QTB_FORWARD(csyr2k, syr2k, cfloat)
QTB_FORWARD(zsyr2k, syr2k, cdouble)
QTB_FORWARD(cher2k, her2k, cfloat)
QTB_FORWARD(zher2k, her2k, cdouble)
QTB_FORWARD(strmm, trmm, float)
QTB_FORWARD(dtrmm, trmm, double)
QTB_FORWARD(ctrmm, trmm, cfloat)
QTB_FORWARD(ztrmm, trmm, cdouble)
QTB_FORWARD(strsm, trmm, float)
QTB_FORWARD(dtrsm, trmm, double)
QTB_FORWARD(ctrsm, trmm, cfloat)
QTB_FORWARD(ztrsm, trmm, cdouble)

}  // extern "C"
