// Every published routine, as benchmarks know it.
#pragma once

#include <string_view>
#include <vector>

#include "calls/shapes.h"

namespace qtb::bench {

// A published routine, as the descriptions of its shape have it.
struct Routine {
  std::string_view name, axes;
  int level;
  bool is_sparse, is_single;
  calls::Kind kind;
  calls::Scalar steady_alpha, steady_beta;  // by which values stay bounded over any number of calls
  calls::Description (*describe)(calls::Problem, const calls::Kind &);
  char (*legal_trans)(char trans, const calls::Kind &);

  // Whether one of these letters is among what varies.
  bool has_axis(std::string_view letters) const { return axes.find_first_of(letters) != axes.npos; }
  // The letters of its options, of axes.
  std::string_view options() const;
  // Whether a letter of one of them is legal, and not another name of a letter before it.
  bool knows(char axis, char letter) const;
  std::size_t element_bytes() const { return (is_single ? 4U : 8U) * (kind.complex ? 2U : 1U); }
};

extern const std::vector<Routine> routines;

double call_flops(const Routine &routine, const calls::Problem &problem);
double call_bytes(const Routine &routine, const calls::Problem &problem);

}  // namespace qtb::bench
