// The argument shapes: one entry for each list of arguments that the library's procedures share.
//
// A shape is three macros: its result type, its parameters and its argument names, over the element type T. Entries,
// checkers, front ends, slots and tier procedures are all declared and defined from them, so that a list stands once.
// Every argument is a pointer; matrices are column-major, increments and leading dimensions count elements.
#pragma once

#include "blas/types.h"

// The type of a shape, its declaration and the head of its definition under a name.
#define QTB_FUNCTION(shape, T, name) QTB_RESULT_##shape(T) name(QTB_PARAMS_##shape(T))
#define QTB_FUNCTION_TYPE(shape, T) QTB_RESULT_##shape(T)(QTB_PARAMS_##shape(T))
#define QTB_ARGS(shape) QTB_ARGS_##shape

// ---- Level 1 ----
#define QTB_RESULT_axpy(T) void
#define QTB_PARAMS_axpy(T) const QtbInt *n, const T *alpha, const T *x, const QtbInt *incx, T *y, const QtbInt *incy
#define QTB_ARGS_axpy n, alpha, x, incx, y, incy

#define QTB_RESULT_copy(T) void
#define QTB_PARAMS_copy(T) const QtbInt *n, const T *x, const QtbInt *incx, T *y, const QtbInt *incy
#define QTB_ARGS_copy n, x, incx, y, incy

#define QTB_RESULT_swap(T) void
#define QTB_PARAMS_swap(T) const QtbInt *n, T *x, const QtbInt *incx, T *y, const QtbInt *incy
#define QTB_ARGS_swap n, x, incx, y, incy

#define QTB_RESULT_dot(T) T
#define QTB_PARAMS_dot(T) const QtbInt *n, const T *x, const QtbInt *incx, const T *y, const QtbInt *incy
#define QTB_ARGS_dot n, x, incx, y, incy

// A complex dot writes its element through result and returns that pointer.
#define QTB_RESULT_cdot(T) T *
#define QTB_PARAMS_cdot(T) T *result, const QtbInt *n, const T *x, const QtbInt *incx, const T *y, const QtbInt *incy
#define QTB_ARGS_cdot result, n, x, incx, y, incy

#define QTB_RESULT_dsdot(T) double
#define QTB_PARAMS_dsdot(T) const QtbInt *n, const T *x, const QtbInt *incx, const T *y, const QtbInt *incy
#define QTB_ARGS_dsdot n, x, incx, y, incy

#define QTB_RESULT_sdsdot(T) T
#define QTB_PARAMS_sdsdot(T) \
  const QtbInt *n, const T *sb, const T *x, const QtbInt *incx, const T *y, const QtbInt *incy
#define QTB_ARGS_sdsdot n, sb, x, incx, y, incy

#define QTB_RESULT_scal(T) void
#define QTB_PARAMS_scal(T) const QtbInt *n, const T *alpha, T *x, const QtbInt *incx
#define QTB_ARGS_scal n, alpha, x, incx

// A real factor for a complex vector.
#define QTB_RESULT_real_scal(T) void
#define QTB_PARAMS_real_scal(T) const QtbInt *n, const Real<T> *alpha, T *x, const QtbInt *incx
#define QTB_ARGS_real_scal n, alpha, x, incx

#define QTB_RESULT_rot(T) void
#define QTB_PARAMS_rot(T) \
  const QtbInt *n, T *x, const QtbInt *incx, T *y, const QtbInt *incy, const Real<T> *c, const Real<T> *s
#define QTB_ARGS_rot n, x, incx, y, incy, c, s

#define QTB_RESULT_rotg(T) void
#define QTB_PARAMS_rotg(T) T *a, T *b, Real<T> *c, T *s
#define QTB_ARGS_rotg a, b, c, s

#define QTB_RESULT_rotm(T) void
#define QTB_PARAMS_rotm(T) const QtbInt *n, T *x, const QtbInt *incx, T *y, const QtbInt *incy, const T *param
#define QTB_ARGS_rotm n, x, incx, y, incy, param

#define QTB_RESULT_rotmg(T) void
#define QTB_PARAMS_rotmg(T) T *d1, T *d2, T *x1, const T *y1, T *param
#define QTB_ARGS_rotmg d1, d2, x1, y1, param

// Norms and sums of magnitudes.
#define QTB_RESULT_norm(T) Real<T>
#define QTB_PARAMS_norm(T) const QtbInt *n, const T *x, const QtbInt *incx
#define QTB_ARGS_norm n, x, incx

#define QTB_RESULT_search(T) QtbInt
#define QTB_PARAMS_search(T) const QtbInt *n, const T *x, const QtbInt *incx
#define QTB_ARGS_search n, x, incx

#define QTB_RESULT_cabs1(T) Real<T>
#define QTB_PARAMS_cabs1(T) const T *z
#define QTB_ARGS_cabs1 z

// ---- Sparse Level 1 ----
#define QTB_RESULT_axpyi(T) void
#define QTB_PARAMS_axpyi(T) const QtbInt *nz, const T *a, const T *x, const QtbInt *indx, T *y
#define QTB_ARGS_axpyi nz, a, x, indx, y

#define QTB_RESULT_doti(T) T
#define QTB_PARAMS_doti(T) const QtbInt *nz, const T *x, const QtbInt *indx, const T *y
#define QTB_ARGS_doti nz, x, indx, y

#define QTB_RESULT_cdoti(T) T *
#define QTB_PARAMS_cdoti(T) T *result, const QtbInt *nz, const T *x, const QtbInt *indx, const T *y
#define QTB_ARGS_cdoti result, nz, x, indx, y

#define QTB_RESULT_gthr(T) void
#define QTB_PARAMS_gthr(T) const QtbInt *nz, const T *y, T *x, const QtbInt *indx
#define QTB_ARGS_gthr nz, y, x, indx

#define QTB_RESULT_gthrz(T) void
#define QTB_PARAMS_gthrz(T) const QtbInt *nz, T *y, T *x, const QtbInt *indx
#define QTB_ARGS_gthrz nz, y, x, indx

#define QTB_RESULT_sctr(T) void
#define QTB_PARAMS_sctr(T) const QtbInt *nz, const T *x, const QtbInt *indx, T *y
#define QTB_ARGS_sctr nz, x, indx, y

#define QTB_RESULT_roti(T) void
#define QTB_PARAMS_roti(T) const QtbInt *nz, T *x, const QtbInt *indx, T *y, const T *c, const T *s
#define QTB_ARGS_roti nz, x, indx, y, c, s

// ---- Level 2 ----
#define QTB_RESULT_gemv(T) void
#define QTB_PARAMS_gemv(T)                                                                                        \
  const char *trans, const QtbInt *m, const QtbInt *n, const T *alpha, const T *a, const QtbInt *lda, const T *x, \
      const QtbInt *incx, const T *beta, T *y, const QtbInt *incy
#define QTB_ARGS_gemv trans, m, n, alpha, a, lda, x, incx, beta, y, incy

#define QTB_RESULT_gbmv(T) void
#define QTB_PARAMS_gbmv(T)                                                                                             \
  const char *trans, const QtbInt *m, const QtbInt *n, const QtbInt *kl, const QtbInt *ku, const T *alpha, const T *a, \
      const QtbInt *lda, const T *x, const QtbInt *incx, const T *beta, T *y, const QtbInt *incy
#define QTB_ARGS_gbmv trans, m, n, kl, ku, alpha, a, lda, x, incx, beta, y, incy

#define QTB_RESULT_ger(T) void
#define QTB_PARAMS_ger(T)                                                                                           \
  const QtbInt *m, const QtbInt *n, const T *alpha, const T *x, const QtbInt *incx, const T *y, const QtbInt *incy, \
      T *a, const QtbInt *lda
#define QTB_ARGS_ger m, n, alpha, x, incx, y, incy, a, lda

// symv and hemv.
#define QTB_RESULT_symv(T) void
#define QTB_PARAMS_symv(T)                                                                                          \
  const char *uplo, const QtbInt *n, const T *alpha, const T *a, const QtbInt *lda, const T *x, const QtbInt *incx, \
      const T *beta, T *y, const QtbInt *incy
#define QTB_ARGS_symv uplo, n, alpha, a, lda, x, incx, beta, y, incy

// sbmv and hbmv.
#define QTB_RESULT_sbmv(T) void
#define QTB_PARAMS_sbmv(T)                                                                                       \
  const char *uplo, const QtbInt *n, const QtbInt *k, const T *alpha, const T *a, const QtbInt *lda, const T *x, \
      const QtbInt *incx, const T *beta, T *y, const QtbInt *incy
#define QTB_ARGS_sbmv uplo, n, k, alpha, a, lda, x, incx, beta, y, incy

// spmv and hpmv.
#define QTB_RESULT_spmv(T) void
#define QTB_PARAMS_spmv(T)                                                                                             \
  const char *uplo, const QtbInt *n, const T *alpha, const T *ap, const T *x, const QtbInt *incx, const T *beta, T *y, \
      const QtbInt *incy
#define QTB_ARGS_spmv uplo, n, alpha, ap, x, incx, beta, y, incy

#define QTB_RESULT_syr(T) void
#define QTB_PARAMS_syr(T) \
  const char *uplo, const QtbInt *n, const T *alpha, const T *x, const QtbInt *incx, T *a, const QtbInt *lda
#define QTB_ARGS_syr uplo, n, alpha, x, incx, a, lda

#define QTB_RESULT_her(T) void
#define QTB_PARAMS_her(T) \
  const char *uplo, const QtbInt *n, const Real<T> *alpha, const T *x, const QtbInt *incx, T *a, const QtbInt *lda
#define QTB_ARGS_her uplo, n, alpha, x, incx, a, lda

#define QTB_RESULT_spr(T) void
#define QTB_PARAMS_spr(T) const char *uplo, const QtbInt *n, const T *alpha, const T *x, const QtbInt *incx, T *ap
#define QTB_ARGS_spr uplo, n, alpha, x, incx, ap

#define QTB_RESULT_hpr(T) void
#define QTB_PARAMS_hpr(T) const char *uplo, const QtbInt *n, const Real<T> *alpha, const T *x, const QtbInt *incx, T *ap
#define QTB_ARGS_hpr uplo, n, alpha, x, incx, ap

// syr2 and her2.
#define QTB_RESULT_syr2(T) void
#define QTB_PARAMS_syr2(T)                                                                                           \
  const char *uplo, const QtbInt *n, const T *alpha, const T *x, const QtbInt *incx, const T *y, const QtbInt *incy, \
      T *a, const QtbInt *lda
#define QTB_ARGS_syr2 uplo, n, alpha, x, incx, y, incy, a, lda

// spr2 and hpr2.
#define QTB_RESULT_spr2(T) void
#define QTB_PARAMS_spr2(T)                                                                                           \
  const char *uplo, const QtbInt *n, const T *alpha, const T *x, const QtbInt *incx, const T *y, const QtbInt *incy, \
      T *ap
#define QTB_ARGS_spr2 uplo, n, alpha, x, incx, y, incy, ap

// trmv and trsv.
#define QTB_RESULT_trmv(T) void
#define QTB_PARAMS_trmv(T)                                                                                     \
  const char *uplo, const char *trans, const char *diag, const QtbInt *n, const T *a, const QtbInt *lda, T *x, \
      const QtbInt *incx
#define QTB_ARGS_trmv uplo, trans, diag, n, a, lda, x, incx

// tbmv and tbsv.
#define QTB_RESULT_tbmv(T) void
#define QTB_PARAMS_tbmv(T)                                                                             \
  const char *uplo, const char *trans, const char *diag, const QtbInt *n, const QtbInt *k, const T *a, \
      const QtbInt *lda, T *x, const QtbInt *incx
#define QTB_ARGS_tbmv uplo, trans, diag, n, k, a, lda, x, incx

// tpmv and tpsv.
#define QTB_RESULT_tpmv(T) void
#define QTB_PARAMS_tpmv(T) \
  const char *uplo, const char *trans, const char *diag, const QtbInt *n, const T *ap, T *x, const QtbInt *incx
#define QTB_ARGS_tpmv uplo, trans, diag, n, ap, x, incx

// ---- Level 3 ----
#define QTB_RESULT_gemm(T) void
#define QTB_PARAMS_gemm(T)                                                                                   \
  const char *transa, const char *transb, const QtbInt *m, const QtbInt *n, const QtbInt *k, const T *alpha, \
      const T *a, const QtbInt *lda, const T *b, const QtbInt *ldb, const T *beta, T *c, const QtbInt *ldc
#define QTB_ARGS_gemm transa, transb, m, n, k, alpha, a, lda, b, ldb, beta, c, ldc

// symm and hemm.
#define QTB_RESULT_symm(T) void
#define QTB_PARAMS_symm(T)                                                                                             \
  const char *side, const char *uplo, const QtbInt *m, const QtbInt *n, const T *alpha, const T *a, const QtbInt *lda, \
      const T *b, const QtbInt *ldb, const T *beta, T *c, const QtbInt *ldc
#define QTB_ARGS_symm side, uplo, m, n, alpha, a, lda, b, ldb, beta, c, ldc

#define QTB_RESULT_syrk(T) void
#define QTB_PARAMS_syrk(T)                                                                           \
  const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const T *alpha, const T *a, \
      const QtbInt *lda, const T *beta, T *c, const QtbInt *ldc
#define QTB_ARGS_syrk uplo, trans, n, k, alpha, a, lda, beta, c, ldc

#define QTB_RESULT_herk(T) void
#define QTB_PARAMS_herk(T)                                                                                 \
  const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const Real<T> *alpha, const T *a, \
      const QtbInt *lda, const Real<T> *beta, T *c, const QtbInt *ldc
#define QTB_ARGS_herk uplo, trans, n, k, alpha, a, lda, beta, c, ldc

#define QTB_RESULT_syr2k(T) void
#define QTB_PARAMS_syr2k(T)                                                                          \
  const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const T *alpha, const T *a, \
      const QtbInt *lda, const T *b, const QtbInt *ldb, const T *beta, T *c, const QtbInt *ldc
#define QTB_ARGS_syr2k uplo, trans, n, k, alpha, a, lda, b, ldb, beta, c, ldc

#define QTB_RESULT_her2k(T) void
#define QTB_PARAMS_her2k(T)                                                                          \
  const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const T *alpha, const T *a, \
      const QtbInt *lda, const T *b, const QtbInt *ldb, const Real<T> *beta, T *c, const QtbInt *ldc
#define QTB_ARGS_her2k uplo, trans, n, k, alpha, a, lda, b, ldb, beta, c, ldc

// trmm and trsm.
#define QTB_RESULT_trmm(T) void
#define QTB_PARAMS_trmm(T)                                                                                    \
  const char *side, const char *uplo, const char *transa, const char *diag, const QtbInt *m, const QtbInt *n, \
      const T *alpha, const T *a, const QtbInt *lda, T *b, const QtbInt *ldb
#define QTB_ARGS_trmm side, uplo, transa, diag, m, n, alpha, a, lda, b, ldb

// ---- Building blocks of Level 2, for the parallel drivers ----

// A rank-1 update of len columns of a triangle, together with a rectangle of other rows above ("U") or below ("L") it.
#define QTB_RESULT_syr_block(T) void
#define QTB_PARAMS_syr_block(T)                                                                                 \
  const char *uplo, const QtbInt *len, const T *alpha, const T *x, const QtbInt *incx, T *a, const QtbInt *lda, \
      const QtbInt *other
#define QTB_ARGS_syr_block uplo, len, alpha, x, incx, a, lda, other

#define QTB_RESULT_syr2_block(T) void
#define QTB_PARAMS_syr2_block(T)                                                                                       \
  const char *uplo, const QtbInt *len, const T *alpha, const T *x, const QtbInt *incx, const T *y, const QtbInt *incy, \
      T *a, const QtbInt *lda, const QtbInt *other
#define QTB_ARGS_syr2_block uplo, len, alpha, x, incx, y, incy, a, lda, other

// len elements of a triangular product from extent elements of the contiguous copy work of the old x.
#define QTB_RESULT_trmv_block(T) void
#define QTB_PARAMS_trmv_block(T)                                                                                    \
  const char *uplo, const char *trans, const char *diag, const QtbInt *extent, const T *a, const QtbInt *lda, T *x, \
      const QtbInt *incx, const QtbInt *len, const T *work
#define QTB_ARGS_trmv_block uplo, trans, diag, extent, a, lda, x, incx, len, work

// ---- Building blocks of GEMM, for the parallel drivers ----

// C := beta*C.
#define QTB_RESULT_scale_c(T) void
#define QTB_PARAMS_scale_c(T) const QtbInt *m, const QtbInt *n, const T *beta, T *c, const QtbInt *ldc
#define QTB_ARGS_scale_c m, n, beta, c, ldc

// Block sizes: mb, nb and kb are in-out (a nonzero value stays), mr, nr and ku are out.
#define QTB_RESULT_blocks(T) void
#define QTB_PARAMS_blocks(T)                                                                                     \
  const QtbInt *m, const QtbInt *n, const QtbInt *k, QtbInt *mb, QtbInt *nb, QtbInt *kb, QtbInt *mr, QtbInt *nr, \
      QtbInt *ku
#define QTB_ARGS_blocks m, n, k, mb, nb, kb, mr, nr, ku

// Packing of rows x cols of op(A) or op(B) at src into micro-panels that start ldp elements apart. A copies multiply by
// alpha; B copies do not read it.
#define QTB_RESULT_panel_copy(T) void
#define QTB_PARAMS_panel_copy(T) \
  const QtbInt *rows, const QtbInt *cols, const T *src, const QtbInt *ld, T *dst, const QtbInt *ldp, const T *alpha
#define QTB_ARGS_panel_copy rows, cols, src, ld, dst, ldp, alpha

// gemm with B packed outside: bp is the panel, ldbp the step of its micro-panels.
#define QTB_RESULT_gemm_bpacked(T) void
#define QTB_PARAMS_gemm_bpacked(T)                                                                                  \
  const char *transa, const char *transb, const QtbInt *m, const QtbInt *n, const QtbInt *k, const T *alpha,        \
      const T *a, const QtbInt *lda, const T *b, const QtbInt *ldb, const T *bp, const QtbInt *ldbp, const T *beta, \
      T *c, const QtbInt *ldc
#define QTB_ARGS_gemm_bpacked transa, transb, m, n, k, alpha, a, lda, b, ldb, bp, ldbp, beta, c, ldc

// gemm with A packed outside, alpha folded in.
#define QTB_RESULT_gemm_apacked(T) void
#define QTB_PARAMS_gemm_apacked(T)                                                                                  \
  const char *transa, const char *transb, const QtbInt *m, const QtbInt *n, const QtbInt *k, const T *alpha,        \
      const T *a, const QtbInt *lda, const T *ap, const QtbInt *ldap, const T *b, const QtbInt *ldb, const T *beta, \
      T *c, const QtbInt *ldc
#define QTB_ARGS_gemm_apacked transa, transb, m, n, k, alpha, a, lda, ap, ldap, b, ldb, beta, c, ldc

// gemm with both packed outside.
#define QTB_RESULT_gemm_packed(T) void
#define QTB_PARAMS_gemm_packed(T)                                                                                 \
  const char *transa, const char *transb, const QtbInt *m, const QtbInt *n, const QtbInt *k, const T *alpha,      \
      const T *a, const QtbInt *lda, const T *ap, const QtbInt *ldap, const T *b, const QtbInt *ldb, const T *bp, \
      const QtbInt *ldbp, const T *beta, T *c, const QtbInt *ldc
#define QTB_ARGS_gemm_packed transa, transb, m, n, k, alpha, a, lda, ap, ldap, b, ldb, bp, ldbp, beta, c, ldc
