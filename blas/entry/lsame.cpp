// lsame, LSAME: whether two option characters are equal in either case.

#include "blas/entry/lsame.h"

#include "blas/entry/export.h"

extern "C" {

std::int64_t qtb_serv_lsame(const char *a, const char *b) { return qtb::same_option(*a, *b); }

QTB_EXPORT std::int64_t LSAME(const char *a, const char *b);
std::int64_t LSAME(const char *a, const char *b) { return qtb_serv_lsame(a, b); }
QTB_EXPORT std::int64_t lsame(const char *a, const char *b) QTB_SAME_ROUTINE(LSAME);

}  // extern "C"
