// Cursors: an operand of a pass over many elements, and how its vectors are reached.
//
// T is const for an operand that is only read. p is the next element, at(k) the first one of vector k of the pass.
// Nothing but the vectors themselves is touched: beyond, the number of elements that a load takes from behind its own
// vector, is 0.
#pragma once

#include "blas/kernels/simd/vec.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
struct Aligned {
  static constexpr QtbInt beyond = 0;
  T *p;
  T *at(int k) const { return p + k * lanes<T>; }
  auto load(int k) const { return load_aligned(at(k)); }
  void store(int k, Vec<T> v) const { store_aligned(at(k), v); }
  void advance(QtbInt elements) { p += elements; }
};

template <class T>
struct Unaligned {
  static constexpr QtbInt beyond = 0;
  T *p;
  T *at(int k) const { return p + k * lanes<T>; }
  auto load(int k) const { return load_unaligned(at(k)); }
  void store(int k, Vec<T> v) const { store_unaligned(at(k), v); }
  void advance(QtbInt elements) { p += elements; }
};

// By two moves of 8 bytes each.
template <class T>
struct Halves {
  static constexpr QtbInt beyond = 0;
  T *p;
  auto load(int k) const { return load_halves(parts(p + k * lanes<T>)); }
  void store(int k, Vec<T> v) const { store_halves(parts(p + k * lanes<T>), v); }
  void advance(QtbInt elements) { p += elements; }
};

inline void scatter(float *p, QtbInt inc, __m128 v) {
  store_single(p, _mm_cvtss_f32(v));
  store_single(p + inc, _mm_cvtss_f32(_mm_shuffle_ps(v, v, 1)));
  store_single(p + 2 * inc, _mm_cvtss_f32(_mm_shuffle_ps(v, v, 2)));
  store_single(p + 3 * inc, _mm_cvtss_f32(_mm_shuffle_ps(v, v, 3)));
}

// Elements inc apart, gathered and scattered.
template <class T>
struct Strided {
  static constexpr QtbInt beyond = 0;
  T *p;
  QtbInt inc;
  auto load(int k) const { return gather(p + k * lanes<T> * inc, inc); }
  void store(int k, Vec<T> v) const { scatter(p + k * lanes<T> * inc, inc, v); }
  void advance(QtbInt elements) { p += elements * inc; }
};

}  // namespace
}  // namespace qtb::QTB_TIER
