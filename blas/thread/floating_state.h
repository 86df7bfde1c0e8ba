// The caller's floating-point state on every thread of a parallel region.
//
// A runtime keeps its threads, with the state that they had when they were made, while a caller may since have chosen
// another rounding mode, flush to zero, or which exceptions trap. A result must not depend on which thread computed it,
// so each thread of a region takes the caller's choice, and gives its own back at the end.
#pragma once

#include <xmmintrin.h>

namespace qtb {

// Everything in the state but the flags of the exceptions that have occurred, which stay each thread's own.
constexpr unsigned floating_flags = 0x3F;

inline unsigned floating_choice() { return _mm_getcsr() & ~floating_flags; }

// Takes a choice and returns the thread's former one. The state is written only where it differs: a write stalls.
inline unsigned take_floating_choice(unsigned choice) {
  const unsigned state = _mm_getcsr(), former = state & ~floating_flags;
  if (choice != former) _mm_setcsr((state & floating_flags) | choice);
  return former;
}

}  // namespace qtb
