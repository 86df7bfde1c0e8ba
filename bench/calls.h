// The calls that benchmarks time: every published routine, of this library or of a peer, on operands of its own.
#pragma once

#include "bench/library.h"
#include "bench/routines.h"

namespace qtb::bench {

struct BoundCall {
  Calls calls;          // empty where the library has no such routine
  bool correct = true;  // whether one call gave the right result, where check.h can tell
};

// The calls of a routine on operands of their own, which live as long as they do. Triangular matrices are near the
// identity, so that what they multiply, or solve for, again and again stays bounded.
BoundCall bind(const Library &library, const Routine &routine, const calls::Problem &problem);

}  // namespace qtb::bench
