// The inner kernels of GEMM in def and sse3.
//
// Those of s, c and z: C(0:m, 0:n) := beta*C + Ap*Bp on the panels of gemm/kernels.h. kernel_112 (s) and kernel_64
// (c, z) take a kp of just that, the depth of a block, and a beta of 1; kernel any kp and a beta of 1; kernel_0 a beta
// of 0, and so does not read C; kernel_b any beta, by BetaLanes (tile.h). stage holds kp*64 bytes (s) or kp*128 (c, z).
//
// Those of d in def: C += Ap*Bp, n a multiple of 4. dgemm_kernel_128 takes a kp of 128, dgemm_kernel any; stage holds
// kp*192 bytes. The kernels of the 4 x 4 family, dgemm_def_kernel and _in_place, stand in gemm/kernels.def.
//
// Those of d in sse3: C(0:m, 0:n) := beta*C + A*op(B), for any m and n. The a forms read A and B from panels, lda and
// ldb apart, the last micro-panel of A filled up to 4 rows with zeros. The n and t forms read both where they are, A
// not transposed, B not (n) or so (t), and multiply by alpha, which the a forms do not read. 112: a k of 112 and a beta
// of 1, in a112 with m and n multiples of 4; k: any k, in panels a multiple of 4; _b and _0 as above. alpha and
// beta_lanes point to two equal values on a 16-byte boundary.
#pragma once

#include "blas/kernels/level3/gemm/kernels.h"

#define QTB_BETA_KERNEL_PARAMS(T) QTB_INNER_KERNEL_PARAMS(T), const Real<T> *beta_lanes
#define QTB_EDGE_KERNEL_PARAMS                                                                                   \
  QtbInt m, QtbInt n, QtbInt k, const double *a, QtbInt lda, const double *b, QtbInt ldb, double *c, QtbInt ldc, \
      const double *alpha, const double *beta_lanes

// X(name) for each d kernel of sse3.
#define QTB_SSE3_DGEMM_KERNELS(X) \
  X(a112) X(a112e) X(ak) X(ak_b) X(ak_0) X(n112) X(t112) X(nk) X(tk) X(nk_b) X(tk_b) X(nk_0) X(tk_0)

extern "C" {
#define QTB_FOLDING_KERNELS(tier, T, t, fixed)                                            \
  QTB_HIDDEN void qtb_blas_##tier##_##t##gemm_kernel(QTB_INNER_KERNEL_PARAMS(T));         \
  QTB_HIDDEN void qtb_blas_##tier##_##t##gemm_kernel_##fixed(QTB_INNER_KERNEL_PARAMS(T)); \
  QTB_HIDDEN void qtb_blas_##tier##_##t##gemm_kernel_0(QTB_INNER_KERNEL_PARAMS(T));       \
  QTB_HIDDEN void qtb_blas_##tier##_##t##gemm_kernel_b(QTB_BETA_KERNEL_PARAMS(T));
QTB_FOLDING_KERNELS(def, float, s, 112)
QTB_FOLDING_KERNELS(def, cfloat, c, 64)
QTB_FOLDING_KERNELS(def, cdouble, z, 64)
QTB_FOLDING_KERNELS(sse3, float, s, 112)
QTB_FOLDING_KERNELS(sse3, cfloat, c, 64)
QTB_FOLDING_KERNELS(sse3, cdouble, z, 64)
#undef QTB_FOLDING_KERNELS

QTB_HIDDEN void qtb_blas_def_dgemm_kernel(QTB_INNER_KERNEL_PARAMS(double));
QTB_HIDDEN void qtb_blas_def_dgemm_kernel_128(QTB_INNER_KERNEL_PARAMS(double));

#define QTB_SSE3_KERNEL(name) QTB_HIDDEN void qtb_blas_sse3_dgemm_kernel_##name(QTB_EDGE_KERNEL_PARAMS);
QTB_SSE3_DGEMM_KERNELS(QTB_SSE3_KERNEL)
#undef QTB_SSE3_KERNEL
}
