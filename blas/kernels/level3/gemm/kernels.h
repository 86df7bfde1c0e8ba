// The inner kernels of GEMM by tier, type and family, as bodies call them (kernels.def has the list).
//
// inner_kernel<T, family>: C(0:m, 0:n) += Ap*Bp by any, and by aligned where C lies on a 16-byte boundary and ldc is a
// multiple of 16 bytes. m is a multiple of mr, kp of ku, n is any; ap and bp point to micro-panels that begin ldap and
// ldbp elements apart (tiles.h has their format; the width of each micro-panel of B is panel_width of the columns that
// are left). stage holds kp*stage_per_k bytes on a 64-byte boundary, for the kernel's own use.
//
// in_place_kernel<T, family>: C(0:m, 0:n) += Ap*op(B), where b is the first element of the depth x n block of op(B) as
// it lies in memory. The panel of A is filled up with zeros as ever; stage_per_k is per step of the depth filled up.
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
#define QTB_INNER_KERNEL(tier, T, family, any, aligned, stage, step)   \
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

template <class Procedure>
struct KernelRecord {
  Procedure *any, *aligned;
  QtbInt stage_per_k = -1;  // where there is no kernel: addresses are no constants to instrumented builds
};

// Every tier's build sees the whole list and takes its own.
template <ProcessorTier tier, class T, Family family>
constexpr KernelRecord<InnerProcedure<T>> inner_kernel_in{};
#define QTB_INNER_KERNEL(tier, T, family, any, aligned, stage, step)                            \
  template <>                                                                                   \
  constexpr KernelRecord<InnerProcedure<T>> inner_kernel_in<tier_##tier, T, Family::family> = { \
      qtb_blas_##tier##_##any, qtb_blas_##tier##_##aligned, stage};
#include "blas/kernels/level3/gemm/kernels.def"

template <class T, Family family>
consteval KernelRecord<InnerProcedure<T>> find_inner_kernel() {
  constexpr KernelRecord<InnerProcedure<T>> record = inner_kernel_in<this_tier, T, family>;
  static_assert(record.stage_per_k >= 0,
                "blas/kernels/level3/gemm/kernels.def: write the inner kernel of this family, type and tier");
  return record;
}
template <class T, Family family>
constexpr KernelRecord<InnerProcedure<T>> inner_kernel = find_inner_kernel<T, family>();

// A family without a kernel of its own for B in place: one micro-panel at a time is packed into the stage, ahead of
// what the inner kernel has there.
template <class T, Family family, bool aligned>
void run_staged(QTB_IN_PLACE_KERNEL_PARAMS(T)) {
  constexpr GemmRules rules = rules_of<T, family>;
  constexpr KernelRecord<InnerProcedure<T>> kernel = inner_kernel<T, family>;
  const QtbInt kp = round_up(depth, rules.ku), ldbp = kp * rules.nr;
  T *const inner_stage = rules.in_place.kernel_has_stage ? stage + ldbp : nullptr;
  const auto multiply = [&](QtbInt j0, QtbInt w) __attribute__((always_inline)) {
    copies_of<T, family>.b[transb ? 1 : 0](&depth, &w, transb ? b + j0 : b + j0 * ldb, &ldb, stage, &ldbp, nullptr);
    (aligned ? kernel.aligned : kernel.any)(m, w, kp, ap, ldap, stage, ldbp, c + j0 * ldc, ldc, inner_stage);
  };
  // A single micro-panel, as small products have it, is spared what goes ahead of the loop.
  if (n == panel_width(rules.nr, n)) return multiply(0, n);
  for (QtbInt j0 = 0, w; j0 < n; j0 += w) {
    w = panel_width(rules.nr, n - j0);
    multiply(j0, w);
  }
}

template <ProcessorTier tier, class T, Family family>
constexpr KernelRecord<InPlaceProcedure<T>> in_place_kernel_in = {
    run_staged<T, family, false>, run_staged<T, family, true>,
    rules_of<T, family>.nr *static_cast<QtbInt>(sizeof(T)) +
        (rules_of<T, family>.in_place.kernel_has_stage ? inner_kernel<T, family>.stage_per_k : 0)};
#define QTB_IN_PLACE_KERNEL(tier, T, family, any, aligned)                                           \
  template <>                                                                                        \
  constexpr KernelRecord<InPlaceProcedure<T>> in_place_kernel_in<tier_##tier, T, Family::family> = { \
      qtb_blas_##tier##_##any, qtb_blas_##tier##_##aligned,                                          \
      inner_kernel_in<tier_##tier, T, Family::family>.stage_per_k};
#include "blas/kernels/level3/gemm/kernels.def"

template <class T, Family family>
constexpr KernelRecord<InPlaceProcedure<T>> in_place_kernel = in_place_kernel_in<this_tier, T, family>;

}  // namespace
}  // namespace qtb::QTB_TIER
