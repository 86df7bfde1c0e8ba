// Walks over the element pairs of two vectors, for operations that read and write both: the rotations.
//
// An operation is a procedure object op(x, y) that changes two elements, and in the same way two vectors of elements.
// x and y must not overlap; each may stand at any address.
#pragma once

#include "blas/kernels/simd/repeat.h"
#include "blas/kernels/simd/vec.h"

namespace qtb::QTB_TIER {
namespace {

// How a vector of elements is read: on its boundary, wherever it is, or as two 8-byte halves.
enum class Load { aligned, unaligned, halves };

template <Load load, class T>
Vec<T> load_by(const T *p) {
  if constexpr (load == Load::aligned)
    return load_aligned(p);
  else if constexpr (load == Load::unaligned)
    return load_unaligned(p);
  else
    return load_halves(p);
}

// Written as it was read, except that two halves are stored as one.
template <Load load, class T>
void store_by(T *p, Vec<T> v) {
  if constexpr (load == Load::aligned)
    store_aligned(p, v);
  else
    store_unaligned(p, v);
}

template <class T, class Op>
void transform_pair(T *x, T *y, const Op &op) {
  T u = load_single(x), v = load_single(y);
  op(u, v);
  store_single(x, u);
  store_single(y, v);
}

// count elements, a vector at a time.
template <QtbInt count, Load load_x, Load load_y, class T, class Op>
void transform_block(T *x, T *y, const Op &op) {
  repeat<count / lanes<T>>([&](auto k) __attribute__((always_inline)) {
    constexpr QtbInt at = k.value * lanes<T>;
    Vec<T> u = load_by<load_x>(x + at), v = load_by<load_y>(y + at);
    op(u, v);
    store_by<load_x>(x + at, u);
    store_by<load_y>(y + at, v);
  });
}

// Passes of block elements as long as n allows; returns how many elements they took.
template <QtbInt block, Load load_x, Load load_y, class T, class Op>
QtbInt transform_blocks(QtbInt n, T *x, T *y, const Op &op) {
  QtbInt i = 0;
  for (; n - i >= block; i += block) transform_block<block, load_x, load_y>(x + i, y + i, op);
  return i;
}

// Contiguous elements. x is brought to a vector boundary by single elements; then go passes of same_phase elements if y
// is on a boundary too, and else of other_phase elements, with y read by other_load. Single elements finish. Short
// vectors, and an x that single elements cannot bring to a boundary, go by single elements throughout.
template <QtbInt same_phase, QtbInt other_phase, Load other_load, class T, class Op>
void transform_contiguous(QtbInt n, T *x, T *y, const Op &op) {
  constexpr QtbInt shortest = 9;  // elements from which on the vector path pays
  QtbInt i = 0;
  if (n >= shortest && element_aligned(x)) {
    for (; phase(x + i) != 0; ++i) transform_pair(x + i, y + i, op);
    if (phase(y + i) == 0) {
      i += transform_blocks<same_phase, Load::aligned, Load::aligned>(n - i, x + i, y + i, op);
      i += transform_blocks<lanes<T>, Load::aligned, Load::aligned>(n - i, x + i, y + i, op);
    } else {
      i += transform_blocks<other_phase, Load::aligned, other_load>(n - i, x + i, y + i, op);
      i += transform_blocks<lanes<T>, Load::aligned, other_load>(n - i, x + i, y + i, op);
    }
  }
  for (; i < n; ++i) transform_pair(x + i, y + i, op);
}

// Any increments: elements of width neighbouring parts each, block elements a pass, in order, so that a zero increment
// applies the operation to the same element again and again. Increments count elements.
template <QtbInt width, QtbInt block, class T, class Op>
void transform_strided(QtbInt n, T *x, QtbInt incx, T *y, QtbInt incy, const Op &op) {
  x = walk_start(x, n, width * incx);
  y = walk_start(y, n, width * incy);
  const auto next = [&] {
    for (QtbInt k = 0; k < width; ++k) transform_pair(x + k, y + k, op);
    x += width * incx;
    y += width * incy;
  };
  for (; n >= block; n -= block)
    for (QtbInt k = 0; k < block; ++k) next();
  for (; n > 0; --n) next();
}

}  // namespace
}  // namespace qtb::QTB_TIER
