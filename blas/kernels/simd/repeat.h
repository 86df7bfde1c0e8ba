// repeat<count>(f): f(Constant<0>()) to f(Constant<count - 1>()), written out.
//
// A pass over accumulators is written this way, and not as a loop: indices that are constants from the start let the
// compiler keep an array of accumulators in registers.
#pragma once

#include "blas/kernels/kernel.h"

namespace qtb::QTB_TIER {
namespace {

template <int k>
struct Constant {
  static constexpr int value = k;
};

template <int count, int k = 0, class F>
[[gnu::always_inline]] inline void repeat(F &&f) {
  if constexpr (k < count) {
    f(Constant<k>());
    repeat<count, k + 1>(f);
  }
}

}  // namespace
}  // namespace qtb::QTB_TIER
