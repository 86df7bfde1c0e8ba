// The parallel front ends: qtb_blas_<routine>, one per routine that has or may have a parallel path.
//
// A front end takes the routine's arguments, which the checker has passed, and decides between the dispatch slot on the
// whole problem and the routine's parallel driver.
#pragma once

#include "blas/shapes.h"

extern "C" {
#define QTB_FRONT_END_SLOT(name, shape, T)
#define QTB_FRONT_END_CHECK_SLOT(name, shape, T)
#define QTB_FRONT_END_DRIVER(name, shape, T) QTB_HIDDEN QTB_FUNCTION(shape, T, qtb_blas_##name);
#define QTB_FRONT_END_CHECK_DRIVER(name, shape, T) QTB_FRONT_END_DRIVER(name, shape, T)
#define QTB_ROUTINE(name, NAME, shape, T, route) QTB_FRONT_END_##route(name, shape, T)
#include "blas/routines.def"
#undef QTB_ROUTINE
}
