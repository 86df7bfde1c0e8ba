// The error reporter: prints which parameter of which routine was illegal, and returns.
//
// name is the routine's name, of which at most min(length, 20) characters are shown and none behind a zero byte; a
// negative length stands for a name that ends at its zero byte. info is read as a 32-bit integer, so that a caller may
// have written only that much. It is a parameter number if positive, the negated number of an internal condition
// otherwise; 1000, 1001 and 1079 are conditions with texts of their own. Nothing ends the process.
#pragma once

#include <cstdint>

#include "blas/types.h"

extern "C" {

// The reporter of this library's own checkers: no handler stands between them and the console.
QTB_HIDDEN void qtb_serv_xerbla(const char *name, const QtbInt *info, std::int32_t length);

// What the exported xerbla calls in place of the reporter, where it is not null. Nothing in the library sets it.
using XerblaHandler = int (*)(const char *name, const QtbInt *info, std::int32_t length);
QTB_HIDDEN extern XerblaHandler qtb_serv_xerbla_handler;

}  // extern "C"
