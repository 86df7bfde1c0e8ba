// The seventeen routines with a parallel path as values: for each, its driver and its five tier implementations behind
// one argument record, so that a test can go through them all.
#pragma once

#include <type_traits>

#include "blas/dispatch/slots.h"
#include "blas/thread/32e/level1/xf_l1_omp.h"
#include "tests/support/tiers.h"

namespace qtb::test {

enum class Shape { axpy, copy, swap, rot, dot, cdot };

// The arguments of a call of any of the shapes; result is that of a dot.
template <class T>
struct Level1Call {
  QtbInt n, incx, incy;
  T *x, *y;
  T alpha;
  Real<T> c, s;
  T result;
};

template <class T>
struct Level1Routine {
  const char *name;
  Shape shape;
  SlotNumber slot;
  CodePointer targets[tier_count];
  void (*driver)(QtbInt nthreads, Level1Call<T> &call);
  void (*target)(CodePointer target, Level1Call<T> &call);

  void serial(int tier, Level1Call<T> &call) const { target(targets[tier], call); }
  bool is_dot() const { return shape == Shape::dot || shape == Shape::cdot; }
};

// Calls f with the arguments of a shape; before them, or behind a leading result, the thread count if there is one.
template <Shape shape, class T, class F, class... NThreads>
void invoke(F f, Level1Call<T> &call, NThreads... nthreads) {
  if constexpr (shape == Shape::axpy)
    f(nthreads..., &call.n, &call.alpha, call.x, &call.incx, call.y, &call.incy);
  else if constexpr (shape == Shape::rot)
    f(nthreads..., &call.n, call.x, &call.incx, call.y, &call.incy, &call.c, &call.s);
  else if constexpr (shape == Shape::dot)
    call.result = f(nthreads..., &call.n, call.x, &call.incx, call.y, &call.incy);
  else if constexpr (shape == Shape::cdot)
    f(&call.result, nthreads..., &call.n, call.x, &call.incx, call.y, &call.incy);
  else
    f(nthreads..., &call.n, call.x, &call.incx, call.y, &call.incy);
}

// Calls visit(routine) for each routine, a Level1Routine of its type.
template <class Visit>
void for_each_level1_routine(Visit visit) {
#define QTB_TARGET(tier, TIER, name) reinterpret_cast<CodePointer>(&qtb_blas_##tier##_x##name),
#define QTB_VISIT(name, shape, T)                                                                                 \
  visit(Level1Routine<T>{                                                                                         \
      #name,                                                                                                      \
      Shape::shape,                                                                                               \
      slot_##name,                                                                                                \
      {QTB_FOR_EACH_TIER(QTB_TARGET, name)},                                                                      \
      [](QtbInt nthreads, Level1Call<T> &call) { invoke<Shape::shape>(&qtb_blas_##name##_omp, call, nthreads); }, \
      [](CodePointer target, Level1Call<T> &call) {                                                               \
        invoke<Shape::shape>(reinterpret_cast<QTB_RESULT_##shape(T) (*)(QTB_PARAMS_##shape(T))>(target), call);   \
      }});
#define QTB_LEVEL1_SIZED(name, shape, T, ...) QTB_VISIT(name, shape, T)
#define QTB_LEVEL1_PAIR(name, shape, T, min_n) QTB_VISIT(name, shape, T)
#include "blas/thread/32e/level1/xf_l1.def"
#undef QTB_LEVEL1_SIZED
#undef QTB_LEVEL1_PAIR
#undef QTB_VISIT
#undef QTB_TARGET
}

}  // namespace qtb::test
