/*
 * The C interface of the Basic Linear Algebra Subprograms, as the companions of QTB have it: libblas.so.3 (integers of
 * 32 bits), libblas64.so.3 (the same names with 64 bits) and libqtb64.so (64 bits, names that end in _64 or 64_).
 * For C from C99 on and C++.
 *
 *   #include <qtb/cblas.h>                                    int32_t and cblas_dgemm
 *   #define CBLAS_ILP64 ahead of it                           int64_t and cblas_dgemm, for libblas64.so.3
 * and in both cases cblas_dgemm_64 and cblas_dgemm64_ with int64_t, for libqtb64.so.
 *
 * An illegal argument, counted from 1 with the layout, is reported by cblas_xerbla, and the routine returns with its
 * outputs untouched.
 *
 * Source: Blackford et al.: An updated set of basic linear algebra subprograms. ACM TOMS 28, 2002; Basic Linear Algebra
 * Subprograms Technical Forum Standard, 2001, annex on legacy BLAS.
 */
#ifndef QTB_CBLAS_H
#define QTB_CBLAS_H

#include <stddef.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

enum CBLAS_LAYOUT { CblasRowMajor = 101, CblasColMajor = 102 };
enum CBLAS_TRANSPOSE { CblasNoTrans = 111, CblasTrans = 112, CblasConjTrans = 113 };
enum CBLAS_UPLO { CblasUpper = 121, CblasLower = 122 };
enum CBLAS_DIAG { CblasNonUnit = 131, CblasUnit = 132 };
enum CBLAS_SIDE { CblasLeft = 141, CblasRight = 142 };
typedef enum CBLAS_LAYOUT CBLAS_LAYOUT;
typedef enum CBLAS_TRANSPOSE CBLAS_TRANSPOSE;
typedef enum CBLAS_UPLO CBLAS_UPLO;
typedef enum CBLAS_DIAG CBLAS_DIAG;
typedef enum CBLAS_SIDE CBLAS_SIDE;
#define CBLAS_ORDER CBLAS_LAYOUT /* its former name */

/* A position in a vector, from 0 on. */
#define CBLAS_INDEX size_t

#ifdef CBLAS_ILP64
#define CBLAS_INT int64_t
#else
#define CBLAS_INT int32_t
#endif
#define QTB_CBLAS(name) cblas_##name
#include "cblas_routines.def"
#undef QTB_CBLAS
#undef CBLAS_INT

#define CBLAS_INT int64_t
#define QTB_CBLAS(name) cblas_##name##_64
#include "cblas_routines.def"
#undef QTB_CBLAS
#define QTB_CBLAS(name) cblas_##name##64_
#include "cblas_routines.def"
#undef QTB_CBLAS
#undef CBLAS_INT

/* The integer of the names without a suffix. */
#ifdef CBLAS_ILP64
#define CBLAS_INT int64_t
#else
#define CBLAS_INT int32_t
#endif

#ifdef __cplusplus
}
#endif

#endif
