// The inner kernels of GEMM, as bodies call them.
//
// InnerKernel<T, family>::run: C(0:m, 0:n) += Ap*Bp. m is a multiple of mr, kp of ku, n is any; ap and bp point to
// micro-panels that begin ldap and ldbp elements apart (tiles.h has their format; the width of each micro-panel of B is
// panel_width of the columns that are left). run_aligned does the same where C lies on a 16-byte boundary and ldc is a
// multiple of 16 bytes. stage holds stage_bytes(kp) bytes on a 64-byte boundary, for the kernel's own use.
//
// InPlaceKernel<T, family>::run: C(0:m, 0:n) += Ap*op(B), where b is the first element of the depth x n block of op(B)
// as it lies in memory. The panel of A is filled up with zeros as ever.
//
// Both take the procedures of kernels.def.
#pragma once

#include "blas/kernels/element.h"
#include "blas/kernels/level3/gemm/copies.h"

// The parameters of a tuned kernel, and of one that reads B in place.
#define QTB_INNER_KERNEL_PARAMS(T) \
  QtbInt m, QtbInt n, QtbInt kp, const T *ap, QtbInt ldap, const T *bp, QtbInt ldbp, T *c, QtbInt ldc, T *stage
#define QTB_IN_PLACE_KERNEL_PARAMS(T)                                                                                \
  bool transb, QtbInt m, QtbInt n, QtbInt depth, const T *ap, QtbInt ldap, const T *b, QtbInt ldb, T *c, QtbInt ldc, \
      T *stage

extern "C" {
#define QTB_INNER_KERNEL(tier, T, family, any, aligned, stage)         \
  QTB_HIDDEN void qtb_blas_##tier##_##any(QTB_INNER_KERNEL_PARAMS(T)); \
  QTB_HIDDEN void qtb_blas_##tier##_##aligned(QTB_INNER_KERNEL_PARAMS(T));
#define QTB_IN_PLACE_KERNEL(tier, T, family, any, aligned)                \
  QTB_HIDDEN void qtb_blas_##tier##_##any(QTB_IN_PLACE_KERNEL_PARAMS(T)); \
  QTB_HIDDEN void qtb_blas_##tier##_##aligned(QTB_IN_PLACE_KERNEL_PARAMS(T));
#include "blas/kernels/level3/gemm/kernels.def"
}

namespace qtb::QTB_TIER {
namespace {

template <class T>
using InnerProcedure = void(QTB_INNER_KERNEL_PARAMS(T));
template <class T>
using InPlaceProcedure = void(QTB_IN_PLACE_KERNEL_PARAMS(T));

template <class T, InnerProcedure<T> &any, InnerProcedure<T> &aligned, QtbInt stage_per_k>
struct TunedKernel {
  static void run(QTB_INNER_KERNEL_PARAMS(T)) { any(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage); }
  static void run_aligned(QTB_INNER_KERNEL_PARAMS(T)) { aligned(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage); }
  static constexpr QtbInt stage_bytes(QtbInt kp) { return stage_per_k * kp; }
};

// The kernels by tier: every tier's build sees the whole list and takes its own.
template <ProcessorTier tier, class T, Family family>
struct KernelOf;
#define QTB_INNER_KERNEL(tier, T, family, any, aligned, stage) \
  template <>                                                  \
  struct KernelOf<tier_##tier, T, Family::family>              \
      : TunedKernel<T, qtb_blas_##tier##_##any, qtb_blas_##tier##_##aligned, stage> {};
#include "blas/kernels/level3/gemm/kernels.def"

template <class T, Family family>
struct InnerKernel : KernelOf<this_tier, T, family> {};

// Without a kernel of its own for B in place, a family packs one micro-panel at a time into the stage, ahead of what
// the inner kernel has there. One of its own has the stage of the inner kernel.
template <class T, Family family>
struct StagedKernel {
  static constexpr QtbInt stage_bytes(QtbInt kp) {
    return kp * rules_of<T, family>.nr * static_cast<QtbInt>(sizeof(T)) + InnerKernel<T, family>::stage_bytes(kp);
  }
  template <bool aligned>
  static void run_staged(QTB_IN_PLACE_KERNEL_PARAMS(T)) {
    constexpr GemmRules rules = rules_of<T, family>;
    const QtbInt kp = round_up(depth, rules.ku), ldbp = kp * rules.nr;
    T *const inner_stage = stage + ldbp;
    const auto multiply = [&](QtbInt j0, QtbInt w) __attribute__((always_inline)) {
      copies_of<T, family>.b[transb ? 1 : 0](&depth, &w, transb ? b + j0 : b + j0 * ldb, &ldb, stage, &ldbp, nullptr);
      if constexpr (aligned)
        InnerKernel<T, family>::run_aligned(m, w, kp, ap, ldap, stage, ldbp, c + j0 * ldc, ldc, inner_stage);
      else
        InnerKernel<T, family>::run(m, w, kp, ap, ldap, stage, ldbp, c + j0 * ldc, ldc, inner_stage);
    };
    // A single micro-panel, as small products have it, is spared what goes ahead of the loop.
    if (n == panel_width(rules.nr, n)) return multiply(0, n);
    for (QtbInt j0 = 0, w; j0 < n; j0 += w) {
      w = panel_width(rules.nr, n - j0);
      multiply(j0, w);
    }
  }
  static void run(QTB_IN_PLACE_KERNEL_PARAMS(T)) {
    run_staged<false>(transb, m, n, depth, ap, ldap, b, ldb, c, ldc, stage);
  }
  static void run_aligned(QTB_IN_PLACE_KERNEL_PARAMS(T)) {
    run_staged<true>(transb, m, n, depth, ap, ldap, b, ldb, c, ldc, stage);
  }
};

template <class T, Family family, InPlaceProcedure<T> &any, InPlaceProcedure<T> &aligned>
struct TunedInPlaceKernel {
  static constexpr QtbInt stage_bytes(QtbInt kp) { return InnerKernel<T, family>::stage_bytes(kp); }
  static void run(QTB_IN_PLACE_KERNEL_PARAMS(T)) { any(transb, m, n, depth, ap, ldap, b, ldb, c, ldc, stage); }
  static void run_aligned(QTB_IN_PLACE_KERNEL_PARAMS(T)) {
    aligned(transb, m, n, depth, ap, ldap, b, ldb, c, ldc, stage);
  }
};

template <ProcessorTier tier, class T, Family family>
struct InPlaceKernelOf : StagedKernel<T, family> {};
#define QTB_IN_PLACE_KERNEL(tier, T, family, any, aligned) \
  template <>                                              \
  struct InPlaceKernelOf<tier_##tier, T, Family::family>   \
      : TunedInPlaceKernel<T, Family::family, qtb_blas_##tier##_##any, qtb_blas_##tier##_##aligned> {};
#include "blas/kernels/level3/gemm/kernels.def"

template <class T, Family family>
struct InPlaceKernel : InPlaceKernelOf<this_tier, T, family> {};

}  // namespace
}  // namespace qtb::QTB_TIER
