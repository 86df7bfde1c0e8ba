// The C face's functions by argument shape: QTB_CBLAS_<shape>(name, NAME, shape, T, core) defines the one of a routine.
// Their declarations in cblas.h are compared by the compiler.
#pragma once

#include "interfaces/cblas_call.h"

// The lists of arguments below are written in these.
#define QTB_M qtb::face::Int m
#define QTB_N qtb::face::Int n
#define QTB_K qtb::face::Int k
#define QTB_X(T) qtb::face::In<T> x, qtb::face::Int incx
#define QTB_Y(T) qtb::face::In<T> y, qtb::face::Int incy
#define QTB_X_OUT(T) qtb::face::Out<T> x, qtb::face::Int incx
#define QTB_Y_OUT(T) qtb::face::Out<T> y, qtb::face::Int incy
#define QTB_TRIANGLE CBLAS_UPLO uplo, CBLAS_TRANSPOSE trans, CBLAS_DIAG diag
#define QTB_AP(T) qtb::face::In<T> ap
#define QTB_A(T) qtb::face::In<T> a, qtb::face::Int lda
#define QTB_B(T) qtb::face::In<T> b, qtb::face::Int ldb
#define QTB_A_OUT(T) qtb::face::Out<T> a, qtb::face::Int lda
#define QTB_B_OUT(T) qtb::face::Out<T> b, qtb::face::Int ldb
#define QTB_C_OUT(T) qtb::face::Out<T> c, qtb::face::Int ldc
#define QTB_ALPHA(T) qtb::face::Scalar<T> alpha
#define QTB_BETA(T) qtb::face::Scalar<T> beta

// ---- Level 1: the arguments in their order, scalars by value ----
#define QTB_CBLAS_VECTORS(name, shape, core, ...)                                     \
  void QTB_C_NAME(name)(__VA_ARGS__) { qtb::face::value_of(core, QTB_ARGS_##shape); } \
  QTB_SECOND_NAME(name)
#define QTB_CBLAS_VALUE(R, name, shape, core, ...)                                        \
  R QTB_C_NAME(name)(__VA_ARGS__) { return qtb::face::value_of(core, QTB_ARGS_##shape); } \
  QTB_SECOND_NAME(name)

#define QTB_CBLAS_axpy(name, NAME, shape, T, core) \
  QTB_CBLAS_VECTORS(name, shape, core, QTB_N, QTB_ALPHA(T), QTB_X(T), QTB_Y_OUT(T))
#define QTB_CBLAS_copy(name, NAME, shape, T, core) QTB_CBLAS_VECTORS(name, shape, core, QTB_N, QTB_X(T), QTB_Y_OUT(T))
#define QTB_CBLAS_swap(name, NAME, shape, T, core) \
  QTB_CBLAS_VECTORS(name, shape, core, QTB_N, QTB_X_OUT(T), QTB_Y_OUT(T))
#define QTB_CBLAS_scal(name, NAME, shape, T, core) \
  QTB_CBLAS_VECTORS(name, shape, core, QTB_N, QTB_ALPHA(T), QTB_X_OUT(T))
#define QTB_CBLAS_real_scal(name, NAME, shape, T, core) \
  QTB_CBLAS_VECTORS(name, shape, core, QTB_N, Real<T> alpha, QTB_X_OUT(T))
#define QTB_CBLAS_rot(name, NAME, shape, T, core) \
  QTB_CBLAS_VECTORS(name, shape, core, QTB_N, QTB_X_OUT(T), QTB_Y_OUT(T), Real<T> c, Real<T> s)
#define QTB_CBLAS_rotg(name, NAME, shape, T, core) \
  QTB_CBLAS_VECTORS(name, shape, core, qtb::face::Out<T> a, qtb::face::Out<T> b, Real<T> *c, qtb::face::Out<T> s)
#define QTB_CBLAS_rotm(name, NAME, shape, T, core) \
  QTB_CBLAS_VECTORS(name, shape, core, QTB_N, QTB_X_OUT(T), QTB_Y_OUT(T), const T *param)
#define QTB_CBLAS_rotmg(name, NAME, shape, T, core) \
  QTB_CBLAS_VECTORS(name, shape, core, T *d1, T *d2, T *x1, T y1, T *param)
#define QTB_CBLAS_dot(name, NAME, shape, T, core) QTB_CBLAS_VALUE(T, name, shape, core, QTB_N, QTB_X(T), QTB_Y(T))
#define QTB_CBLAS_dsdot(name, NAME, shape, T, core) \
  QTB_CBLAS_VALUE(double, name, shape, core, QTB_N, QTB_X(T), QTB_Y(T))
#define QTB_CBLAS_sdsdot(name, NAME, shape, T, core) \
  QTB_CBLAS_VALUE(T, name, shape, core, QTB_N, T sb, QTB_X(T), QTB_Y(T))
#define QTB_CBLAS_norm(name, NAME, shape, T, core) QTB_CBLAS_VALUE(Real<T>, name, shape, core, QTB_N, QTB_X(T))
#define QTB_CBLAS_cabs1(name, NAME, shape, T, core) QTB_CBLAS_VALUE(Real<T>, name, shape, core, const void *z)
#define QTB_CBLAS_cdot(name, NAME, shape, T, core)                       \
  void QTB_C_NAME(name##_sub)(QTB_N, QTB_X(T), QTB_Y(T), void *result) { \
    *static_cast<T *>(result) = qtb::face::value_of(core, QTB_ARGS_dot); \
  }                                                                      \
  QTB_SECOND_NAME(name##_sub)
// A position from 0 on, and 0 where there is none.
#define QTB_CBLAS_search(name, NAME, shape, T, core)                     \
  CBLAS_INDEX QTB_C_NAME(name)(QTB_N, QTB_X(T)) {                        \
    const QtbInt position = qtb::face::value_of(core, QTB_ARGS_##shape); \
    return position > 0 ? static_cast<CBLAS_INDEX>(position - 1) : 0;    \
  }                                                                      \
  QTB_SECOND_NAME(name)

// ---- Levels 2 and 3: a layout ahead of the arguments; the body is the function template of the shape's name ----
#define QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, ...)                                                \
  void QTB_C_NAME(name)(CBLAS_LAYOUT layout, __VA_ARGS__) {                                              \
    static constexpr qtb::RoutineName padded_name = qtb::padded(#NAME);                                  \
    const qtb::face::Routine f(core, qtb::first_broken_##shape<T>, padded_name, "cblas_" #name, layout); \
    qtb::face::shape<T>(f, QTB_ARGS_##shape);                                                            \
  }                                                                                                      \
  QTB_SECOND_NAME(name)
#define QTB_CBLAS_gemv(name, NAME, shape, T, core)                                                                    \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, CBLAS_TRANSPOSE trans, QTB_M, QTB_N, QTB_ALPHA(T), QTB_A(T), QTB_X(T), \
                   QTB_BETA(T), QTB_Y_OUT(T))
#define QTB_CBLAS_gbmv(name, NAME, shape, T, core)                                                     \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, CBLAS_TRANSPOSE trans, QTB_M, QTB_N, qtb::face::Int kl, \
                   qtb::face::Int ku, QTB_ALPHA(T), QTB_A(T), QTB_X(T), QTB_BETA(T), QTB_Y_OUT(T))
#define QTB_CBLAS_ger(name, NAME, shape, T, core) \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, QTB_M, QTB_N, QTB_ALPHA(T), QTB_X(T), QTB_Y(T), QTB_A_OUT(T))
#define QTB_CBLAS_symv(name, NAME, shape, T, core)                                                                    \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, CBLAS_UPLO uplo, QTB_N, QTB_ALPHA(T), QTB_A(T), QTB_X(T), QTB_BETA(T), \
                   QTB_Y_OUT(T))
#define QTB_CBLAS_sbmv(name, NAME, shape, T, core)                                                              \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, CBLAS_UPLO uplo, QTB_N, QTB_K, QTB_ALPHA(T), QTB_A(T), QTB_X(T), \
                   QTB_BETA(T), QTB_Y_OUT(T))
#define QTB_CBLAS_spmv(name, NAME, shape, T, core)                                                                     \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, CBLAS_UPLO uplo, QTB_N, QTB_ALPHA(T), QTB_AP(T), QTB_X(T), QTB_BETA(T), \
                   QTB_Y_OUT(T))
#define QTB_CBLAS_her(name, NAME, shape, T, core) \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, CBLAS_UPLO uplo, QTB_N, Real<T> alpha, QTB_X(T), QTB_A_OUT(T))
#define QTB_CBLAS_hpr(name, NAME, shape, T, core) \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, CBLAS_UPLO uplo, QTB_N, Real<T> alpha, QTB_X(T), qtb::face::Out<T> ap)
#define QTB_CBLAS_syr2(name, NAME, shape, T, core) \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, CBLAS_UPLO uplo, QTB_N, QTB_ALPHA(T), QTB_X(T), QTB_Y(T), QTB_A_OUT(T))
#define QTB_CBLAS_spr2(name, NAME, shape, T, core)                                                       \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, CBLAS_UPLO uplo, QTB_N, QTB_ALPHA(T), QTB_X(T), QTB_Y(T), \
                   qtb::face::Out<T> ap)
#define QTB_CBLAS_trmv(name, NAME, shape, T, core) \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, QTB_TRIANGLE, QTB_N, QTB_A(T), QTB_X_OUT(T))
#define QTB_CBLAS_tbmv(name, NAME, shape, T, core) \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, QTB_TRIANGLE, QTB_N, QTB_K, QTB_A(T), QTB_X_OUT(T))
#define QTB_CBLAS_tpmv(name, NAME, shape, T, core) \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, QTB_TRIANGLE, QTB_N, QTB_AP(T), QTB_X_OUT(T))
#define QTB_CBLAS_gemm(name, NAME, shape, T, core)                                                                  \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, CBLAS_TRANSPOSE transa, CBLAS_TRANSPOSE transb, QTB_M, QTB_N, QTB_K, \
                   QTB_ALPHA(T), QTB_A(T), QTB_B(T), QTB_BETA(T), QTB_C_OUT(T))
#define QTB_CBLAS_symm(name, NAME, shape, T, core)                                                                     \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, CBLAS_SIDE side, CBLAS_UPLO uplo, QTB_M, QTB_N, QTB_ALPHA(T), QTB_A(T), \
                   QTB_B(T), QTB_BETA(T), QTB_C_OUT(T))
#define QTB_CBLAS_syrk(name, NAME, shape, T, core)                                                                 \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, CBLAS_UPLO uplo, CBLAS_TRANSPOSE trans, QTB_N, QTB_K, QTB_ALPHA(T), \
                   QTB_A(T), QTB_BETA(T), QTB_C_OUT(T))
#define QTB_CBLAS_herk(name, NAME, shape, T, core)                                                                  \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, CBLAS_UPLO uplo, CBLAS_TRANSPOSE trans, QTB_N, QTB_K, Real<T> alpha, \
                   QTB_A(T), Real<T> beta, QTB_C_OUT(T))
#define QTB_CBLAS_syr2k(name, NAME, shape, T, core)                                                                \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, CBLAS_UPLO uplo, CBLAS_TRANSPOSE trans, QTB_N, QTB_K, QTB_ALPHA(T), \
                   QTB_A(T), QTB_B(T), QTB_BETA(T), QTB_C_OUT(T))
#define QTB_CBLAS_her2k(name, NAME, shape, T, core)                                                                \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, CBLAS_UPLO uplo, CBLAS_TRANSPOSE trans, QTB_N, QTB_K, QTB_ALPHA(T), \
                   QTB_A(T), QTB_B(T), Real<T> beta, QTB_C_OUT(T))
#define QTB_CBLAS_trmm(name, NAME, shape, T, core)                                                       \
  QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, CBLAS_SIDE side, CBLAS_UPLO uplo, CBLAS_TRANSPOSE transa, \
                   CBLAS_DIAG diag, QTB_M, QTB_N, QTB_ALPHA(T), QTB_A(T), QTB_B_OUT(T))
#define QTB_CBLAS_syr(name, NAME, shape, T, core) QTB_CBLAS_her(name, NAME, shape, T, core)
#define QTB_CBLAS_spr(name, NAME, shape, T, core) QTB_CBLAS_hpr(name, NAME, shape, T, core)
