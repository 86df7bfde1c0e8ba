// repeat<count>(f): f(Constant<0>()) to f(Constant<count - 1>()), written out.
//
// A pass over accumulators is written this way, and not as a loop: indices that are constants from the start let the
// compiler keep an array of accumulators in registers.
//
// What is long and needs no such constant is a loop under QTB_WRITTEN_OUT, which writes out up to 128 turns.
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

// In front of a loop that is written out in full; not where every load is watched, since compilers would need minutes
// for so long a line of checks.
#if defined(QTB_WATCHED)
#define QTB_WRITTEN_OUT _Pragma("GCC unroll 1")
#else
#define QTB_WRITTEN_OUT _Pragma("GCC unroll 128")
#endif
