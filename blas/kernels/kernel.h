// How a kernel source names what it defines.
//
// Every source below blas/kernels is compiled once per tier, with QTB_TIER set to the tier's name. All of it stands in
// namespace qtb::QTB_TIER { namespace { ... } }, except the named procedures, which QTB_KERNEL defines.
#pragma once

#include "blas/shapes.h"
#include "blas/tiers.h"

#if !defined(QTB_TIER)
#error "a kernel source is compiled per tier: QTB_TIER names the tier"
#endif

#define QTB_TIER_PASTE(left, tier, right) left##tier##right
#define QTB_TIER_EXPAND(left, tier, right) QTB_TIER_PASTE(left, tier, right)

// qtb_blas_<tier>_<name>.
#define QTB_TIER_NAME(name) QTB_TIER_EXPAND(qtb_blas_, QTB_TIER, _##name)

namespace qtb::QTB_TIER {

// What the dispatch slots call of this tier. Kernels call each other by these declarations. They stand in the namespace
// of the definitions, so that one whose shape or element type is not its slot's is an error.
extern "C" {
#define QTB_SLOT(name, shape, T, tiers) QTB_HIDDEN QTB_FUNCTION(shape, T, QTB_TIER_NAME(x##name));
#include "blas/dispatch/slots.def"
#undef QTB_SLOT
}

namespace {
// The tier of this build, for if constexpr.
constexpr ProcessorTier this_tier = QTB_TIER_EXPAND(tier_, QTB_TIER, );
}  // namespace
}  // namespace qtb::QTB_TIER

// Defines the procedure qtb_blas_<tier>_x<name> of a shape and type; its body is a call of body with the same
// arguments. In parentheses a body may hold commas: QTB_KERNEL(daxpy, axpy, double, (update<double, 4>)).
#define QTB_KERNEL(name, shape, T, body)                                \
  extern "C" QTB_HIDDEN QTB_FUNCTION(shape, T, QTB_TIER_NAME(x##name)); \
  extern "C" QTB_FUNCTION(shape, T, QTB_TIER_NAME(x##name)) { return body(QTB_ARGS(shape)); }

// This tier's procedure under the name of another tier, whose build has none of its own.
#define QTB_TIER_TEXT_OF(tier) #tier
#define QTB_TIER_TEXT_EXPAND(tier) QTB_TIER_TEXT_OF(tier)
#define QTB_KERNEL_SHARED(other, name, shape, T)                           \
  extern "C" QTB_HIDDEN QTB_FUNCTION(shape, T, qtb_blas_##other##_x##name) \
      __attribute__((alias("qtb_blas_" QTB_TIER_TEXT_EXPAND(QTB_TIER) "_x" #name)));
