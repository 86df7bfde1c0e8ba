// The argument checkers of Levels 2 and 3, one per routine: qtb_blas_errchk_<routine>.
//
// A checker takes the routine's arguments and returns 0 if they are legal. Otherwise it reports the lowest illegal
// parameter number through qtb_serv_xerbla and returns 1. It writes none of the caller's memory.
#pragma once

#include "blas/shapes.h"

extern "C" {
#define QTB_CHECKER_SLOT(name, shape, T)
#define QTB_CHECKER_DRIVER(name, shape, T)
#define QTB_CHECKER_CHECK_SLOT(name, shape, T) QTB_HIDDEN std::int32_t qtb_blas_errchk_##name(QTB_PARAMS_##shape(T));
#define QTB_CHECKER_CHECK_DRIVER(name, shape, T) QTB_CHECKER_CHECK_SLOT(name, shape, T)
#define QTB_ROUTINE(name, NAME, shape, T, route) QTB_CHECKER_##route(name, shape, T)
#include "blas/routines.def"
#undef QTB_ROUTINE
}
