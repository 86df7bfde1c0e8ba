// Walks over one or two vectors: what the basic vector kernels share.
//
// A walk knows the way over the elements: peeling to a vector boundary, passes of many elements, shorter passes, single
// elements, by the kernel's row of the tuning table. A kernel gives the work, a body with
//
//   template <int k, class X, class Y> void vector(X &x, Y &y)   vector k of a pass, through the operands' cursors
//   void single(x, y)                                            one element, at any address
//   static constexpr bool gathers                                whether strided passes go through vectors
//   static constexpr bool updates                                whether y is read and then stored
//
// and, if it gains by loading ahead of a store,
//
//   template <int k, class X, class Y> void two_vectors(X &x, Y &y)   vectors k and k + 1 of a pass
//
// Nothing outside the operands is read, not even in a vector that is then cut. Addresses need not be multiples of the
// element width: where peeling cannot reach a boundary, the passes are unaligned or the elements go singly.
#pragma once

#include "blas/kernels/level1/tuning.h"
#include "blas/kernels/simd/cursors.h"
#include "blas/kernels/simd/repeat.h"

namespace qtb::QTB_TIER {
namespace {

// ---- Cursors ----
//
// beyond is the number of elements that a load takes from behind its own vector.

// An operand offset bytes above a boundary. Each aligned vector of memory is loaded once and joined with its
// predecessor; the first of them, which begins before the operand, is put together from the operand's own parts.
template <class T, int offset>
struct Rejoined {
  static constexpr QtbInt size = static_cast<QtbInt>(sizeof(T));
  static constexpr QtbInt bytes_in_first = vector_bytes - offset;
  static constexpr QtbInt parts_in_first = bytes_in_first * parts_per_vector<T> / vector_bytes;
  static constexpr QtbInt beyond = (bytes_in_first + size - 1) / size;
  T *p;
  Vec<T> before;
  explicit Rejoined(T *operand) : p(operand), before(load_highest<parts_in_first>(parts(operand))) {}
  auto load(int k) {
    Vec<T> next = load_aligned(parts(p) + k * parts_per_vector<T> + parts_in_first);
    keep_in_place(next);  // or it would be loaded twice
    const Vec<T> joined = join<offset>(before, next);
    before = next;
    return joined;
  }
  void store(int k, Vec<T> v) const { store_unaligned(p + k * lanes<T>, v); }
  void advance(QtbInt elements) { p += elements; }
};

// ---- Passes ----

// What is left of a walk: n elements from x and y on.
template <class X, class Y>
struct Walk {
  QtbInt n;
  X *x;
  QtbInt incx;
  Y *y;
  QtbInt incy;
};

template <int vectors, class X, class Y, class CursorX, class CursorY, class Body>
[[gnu::always_inline]] inline void passes_of(Walk<X, Y> &walk, CursorX &x, CursorY &y, Body &body) {
  constexpr QtbInt count = vectors * lanes<Y>;
  constexpr QtbInt reach = count + CursorX::beyond;
  if (walk.n < reach) return;
  // Counted from where the last pass fits: one subtraction then is the test as well.
  walk.n -= reach;
  do {
    if constexpr (vectors % 2 == 0 && requires { body.template two_vectors<0>(x, y); })
      repeat<vectors / 2>([&](auto k) __attribute__((always_inline)) { body.template two_vectors<2 * k.value>(x, y); });
    else
      repeat<vectors>([&](auto k) __attribute__((always_inline)) { body.template vector<k.value>(x, y); });
    x.advance(count);
    y.advance(count);
    walk.n -= count;
  } while (walk.n >= 0);
  walk.n += reach;
}

// Passes of count elements, then at most half as many and no more than four vectors, then single vectors.
template <QtbInt count, class X, class Y, class CursorX, class CursorY, class Body>
[[gnu::always_inline]] inline void vector_passes(Walk<X, Y> &walk, CursorX x, CursorY y, Body &body) {
  constexpr int vectors = static_cast<int>(count / lanes<Y>);
  static_assert(vectors * lanes<Y> == count);
  constexpr int fewer = vectors / 2 < 4 ? vectors / 2 : 4;
  passes_of<vectors>(walk, x, y, body);
  if constexpr (fewer > 1) passes_of<fewer>(walk, x, y, body);
  if constexpr (vectors > 1) passes_of<1>(walk, x, y, body);
  walk.x = x.p;
  walk.y = y.p;
}

// Passes of count single elements, in order.
template <int count, class X, class Y, class Body>
[[gnu::always_inline]] inline void single_passes(Walk<X, Y> &walk, Body &body) {
  for (; walk.n >= count; walk.n -= count)
    repeat<count>([&](auto) __attribute__((always_inline)) {
      body.single(walk.x, walk.y);
      walk.x += walk.incx;
      walk.y += walk.incy;
    });
}

// ---- Ways ----

template <Row row, class X, class Y, class Body>
[[gnu::always_inline]] inline void rejoined_passes(Walk<X, Y> &walk, Body &body) {
  constexpr QtbInt count = tuning<row>.different;
  // The shortest pass with the largest reach: below it the parts of the first vector may not be there.
  if (walk.n < 2 * lanes<Y>) return;
  const Aligned<Y> y{walk.y};
  switch (phase(walk.x)) {
    case 8: return vector_passes<count>(walk, Rejoined<X, 8>(walk.x), y, body);
    case 4:
      if constexpr (sizeof(Y) == sizeof(float)) return vector_passes<count>(walk, Rejoined<X, 4>(walk.x), y, body);
      break;
    case 12:
      if constexpr (sizeof(Y) == sizeof(float)) return vector_passes<count>(walk, Rejoined<X, 12>(walk.x), y, body);
      break;
    default: break;
  }
  vector_passes<count>(walk, Unaligned<X>{walk.x}, y, body);
}

// Operands side by side in memory, in the tier's sizes. What is left is the caller's: less than a vector, or what the
// tier does singly.
template <Row row, class X, class Y, class Body>
[[gnu::always_inline]] inline void contiguous_passes(Walk<X, Y> &walk, Body &body) {
  constexpr Tuning sizes = tuning<row>;
  if constexpr (sizes.treatment == no_peel) {
    vector_passes<sizes.same>(walk, Unaligned<X>{walk.x}, Unaligned<Y>{walk.y}, body);
    return;
  }
  if (!element_aligned(walk.y)) {
    if constexpr (sizes.treatment == one_operand)
      vector_passes<sizes.same>(walk, Unaligned<X>{walk.x}, Unaligned<Y>{walk.y}, body);
    if constexpr (sizes.treatment == halves || sizes.treatment == unaligned || sizes.treatment == rejoin)
      vector_passes<sizes.different>(walk, Unaligned<X>{walk.x}, Unaligned<Y>{walk.y}, body);
    return;
  }
  for (; walk.n > 0 && phase(walk.y) != 0; --walk.n) body.single(walk.x++, walk.y++);
  const QtbInt distance = phase(walk.x);
  if (sizes.treatment == one_operand || distance == 0)
    vector_passes<sizes.same>(walk, Aligned<X>{walk.x}, Aligned<Y>{walk.y}, body);
  else if constexpr (sizes.treatment == scalar_moves)
    single_passes<sizes.different>(walk, body);
  else if constexpr (sizes.treatment == halves)
    vector_passes<sizes.different>(walk, Halves<X>{walk.x}, Aligned<Y>{walk.y}, body);
  else if constexpr (sizes.treatment == unaligned)
    vector_passes<sizes.different>(walk, Unaligned<X>{walk.x}, Aligned<Y>{walk.y}, body);
  else if constexpr (sizes.treatment == rejoin)
    rejoined_passes<row>(walk, body);
  else if constexpr (sizes.treatment == halves_at_8) {
    if (distance == 8) vector_passes<sizes.different>(walk, Halves<X>{walk.x}, Aligned<Y>{walk.y}, body);
  }
}

// Operands with increments. A step that fills vectors is gathered into them, if the kernel computes; what moves only,
// or adds to one and the same element over and over, goes in single elements.
template <Row row, class X, class Y, class Body>
[[gnu::always_inline]] inline void strided_passes(Walk<X, Y> &walk, Body &body) {
  constexpr QtbInt count = tuning<row>.strided;
  if constexpr (Body::gathers && count > 1 && count % lanes<Y> == 0) {
    if (Body::updates && walk.incy == 0) return;
    vector_passes<count>(walk, Strided<X>{walk.x, walk.incx}, Strided<Y>{walk.y, walk.incy}, body);
  } else if constexpr (count > 1) {
    single_passes<count>(walk, body);
  }
}

// All but the last single elements of a walk from the operands' lowest addresses, if contiguous, or from where the
// published convention has it. single_passes<1> with the same or another body does the rest.
template <Row row, bool contiguous, class X, class Y, class Body>
[[gnu::always_inline]] inline void passes(Walk<X, Y> &walk, Body &body) {
  constexpr Tuning sizes = tuning<row>;
  if constexpr (contiguous) {
    walk.incx = walk.incy = 1;
  } else {
    walk.x = walk_start(walk.x, walk.n, walk.incx);
    walk.y = walk_start(walk.y, walk.n, walk.incy);
  }
  if constexpr (sizes.short_limit > 0)
    if (walk.n < sizes.short_limit || !element_aligned(walk.x) || !element_aligned(walk.y)) return;
  if constexpr (contiguous)
    contiguous_passes<row>(walk, body);
  else
    strided_passes<row>(walk, body);
}

// A kernel that stores element by element: all of its walk, with a body made from the factor, if it has one. Each form
// is a procedure of its own, so that the contiguous one does not save the registers that the strided one needs.
template <Row row, bool contiguous, class Body, class X, class Y, class... Alpha>
[[gnu::noinline]] void all_elements(QtbInt n, X *x, QtbInt incx, Y *y, QtbInt incy, const Alpha *...alpha) {
  Walk<X, Y> walk{n, x, incx, y, incy};
  Body body{*alpha...};
  passes<row, contiguous>(walk, body);
  single_passes<1>(walk, body);
}
template <Row row, class Body, class X, class Y, class... Alpha>
[[gnu::always_inline]] inline void elementwise(bool contiguous, QtbInt n, X *x, QtbInt incx, Y *y, QtbInt incy,
                                               const Alpha *...alpha) {
  if (contiguous)
    all_elements<row, true, Body>(n, x, incx, y, incy, alpha...);
  else
    all_elements<row, false, Body>(n, x, incx, y, incy, alpha...);
}

// Whether two increments are both 1 or both -1. Their product would say the same but for overflow.
inline bool same_unit(QtbInt incx, QtbInt incy) { return incx == incy && (incx == 1 || incx == -1); }
inline bool both_one(QtbInt incx, QtbInt incy) { return incx == 1 && incy == 1; }

}  // namespace
}  // namespace qtb::QTB_TIER
