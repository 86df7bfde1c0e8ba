// What the real and the complex dot products share: which operands are contiguous, and how accumulators are joined.
#pragma once

#include "blas/kernels/level1/walk.h"

namespace qtb::QTB_TIER {
namespace {

inline bool dot_is_contiguous(QtbInt incx, QtbInt incy) {
  return backward_is_contiguous_in_dots ? same_unit(incx, incy) : both_one(incx, incy);
}

template <class V>
V join_accumulators(const V (&a)[4]) {
  if constexpr (joining == in_pairs)
    return add(add(a[3], a[2]), add(a[1], a[0]));
  else
    return add(add(add(a[0], a[1]), a[2]), a[3]);
}

}  // namespace
}  // namespace qtb::QTB_TIER
