// The calls that benchmarks time: every published routine, of this library or of a peer, on operands of its own.
#pragma once

#include <string_view>
#include <vector>

#include "bench/library.h"
#include "calls/shapes.h"

namespace qtb::bench {

struct BoundCall {
  Calls calls;          // empty where the library has no such routine
  bool correct = true;  // whether one call gave the right result, where check.h can tell
};

// A published routine, as the descriptions of its shape have it.
struct Routine {
  std::string_view name, axes;
  int level;
  bool is_sparse, is_single;
  calls::Kind kind;
  calls::Scalar steady_alpha, steady_beta;  // by which values stay bounded over any number of calls
  calls::Description (*describe)(calls::Problem, const calls::Kind &);
  char (*legal_trans)(char trans, const calls::Kind &);
  BoundCall (*bind)(const Library &, const Routine &, const calls::Problem &);

  // The letters of its options, of axes.
  std::string_view options() const;
  // Whether a letter of one of them is legal, and not another name of a letter before it.
  bool knows(char axis, char letter) const;
  std::size_t element_bytes() const { return (is_single ? 4U : 8U) * (kind.complex ? 2U : 1U); }
};

extern const std::vector<Routine> routines;

double call_flops(const Routine &routine, const calls::Problem &problem);
double call_bytes(const Routine &routine, const calls::Problem &problem);

// The calls of a routine on operands of their own, which live as long as they do. Triangular matrices are near the
// identity, so that what they multiply, or solve for, again and again stays bounded.
BoundCall bind(const Library &library, const Routine &routine, const calls::Problem &problem);

}  // namespace qtb::bench
