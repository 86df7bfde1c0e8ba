// The reporters of bad arguments, and what the two faces tell each other through them.
//
// A program may define xerbla_ or cblas_xerbla itself; its own is then called in place of the library's, which print
// through the message service and return.
#pragma once

#include <cstddef>

#include "interfaces/face.h"

// The build defines CBLAS_ILP64 where the integer of the face has 64 bits.
#pragma GCC visibility push(default)
#include "include/qtb/cblas.h"
#pragma GCC visibility pop

#define QTB_C_NAME(name) QTB_FACE_EXPAND(cblas_, name, QTB_FACE_SUFFIX)

// In a face of suffixed names each function has two: cblas_dgemm_64 and cblas_dgemm64_.
#ifdef QTB_FACE_SECOND_NAMES
#define QTB_SECOND_NAME(name)                          \
  extern decltype(cblas_##name##64_) cblas_##name##64_ \
      __attribute__((visibility("default"), alias("cblas_" #name "_64")));
#else
#define QTB_SECOND_NAME(name)
#endif

extern "C" {

// Set while the C face reports: that the Fortran reporter was called from C, and that the layout was row-major. The
// numbers that a reporter then gets are those of the call on transposes.
QTB_EXPORT extern int QTB_FACE_EXPAND(CBLAS_CallFromC, QTB_FACE_SUFFIX, );
QTB_EXPORT extern int QTB_FACE_EXPAND(RowMajorStrg, QTB_FACE_SUFFIX, );

}  // extern "C"

namespace qtb::face {

// The parameter number of a rule of the routine that the C face calls by its Fortran name.
void report_rule(bool row_major, const char *fortran_name, QtbInt number);
// An option at a position of a C call that has none of the legal values.
void report_option(bool row_major, int position, const char *c_name, const char *what, int value);
void report_no_memory(const char *c_name);

}  // namespace qtb::face
