// The exported names of the published routines, in both cases.
//
// An entry tests the arguments where the routine has a checker, and calls the slot or the parallel front end with what
// it was given. The upper-case name is the same routine under a second symbol. Callers whose compiler appends the
// lengths of character arguments may pass them: they stand behind the last argument and nothing reads them.

#include "blas/dispatch/slots.h"
#include "blas/entry/checks.h"
#include "blas/entry/export.h"
#include "blas/thread/drivers.h"

extern "C" {

#define QTB_CALL_SLOT(name, shape) return qtb_blas_x##name(QTB_ARGS(shape));
#define QTB_CALL_DRIVER(name, shape) return qtb_blas_##name(QTB_ARGS(shape));
#define QTB_CALL_CHECK_SLOT(name, shape) \
  if (qtb_blas_errchk_##name(QTB_ARGS(shape)) == 0) qtb_blas_x##name(QTB_ARGS(shape));
#define QTB_CALL_CHECK_DRIVER(name, shape) \
  if (qtb_blas_errchk_##name(QTB_ARGS(shape)) == 0) qtb_blas_##name(QTB_ARGS(shape));

#define QTB_ROUTINE(name, NAME, shape, T, route)                  \
  QTB_EXPORT QTB_FUNCTION(shape, T, name);                        \
  QTB_EXPORT QTB_FUNCTION(shape, T, NAME) QTB_SAME_ROUTINE(name); \
  QTB_FUNCTION(shape, T, name) { QTB_CALL_##route(name, shape) }
#include "blas/routines.def"
#undef QTB_ROUTINE

}  // extern "C"
