// The table of routines, from blas/routines.def.

#include "bench/routines.h"

#include "calls/level1.h"
#include "calls/level3.h"

namespace qtb::bench {
namespace {

using namespace calls;

template <ShapeName shape, class T>
Routine make_routine(std::string_view name) {
  using S = Shape<shape>;
  return {name,
          S::axes,
          S::level,
          S::sparse,
          sizeof(Real<T>) == sizeof(float),
          kind_of<T>(name),
          S::steady_alpha,
          S::steady_beta,
          calls::describe<shape>,
          S::legal_trans};
}

}  // namespace

const std::vector<Routine> routines = {
#define QTB_ROUTINE(name, NAME, shape, T, route) make_routine<#shape, T>(#name),
#include "blas/routines.def"
#undef QTB_ROUTINE
};

std::string_view Routine::options() const {
  const std::size_t first = axes.find_first_of(option_axes);
  if (first == axes.npos) return {};
  return axes.substr(first, axes.find_last_of(option_axes) - first + 1);
}

bool Routine::knows(char axis, char letter) const {
  const bool is_trans = axis == 'A' || axis == 'B';
  if (!is_trans) return true;
  if (letter == 'C' && !kind.complex) return false;  // where T says the same
  return legal_trans(letter, kind) == letter;
}

double call_flops(const Routine &routine, const Problem &problem) {
  return routine.describe(problem, routine.kind).work.flops(routine.kind.complex);
}

double call_bytes(const Routine &routine, const Problem &problem) {
  const Description d = routine.describe(problem, routine.kind);
  return (d.read() + d.written()) * static_cast<double>(routine.element_bytes());
}

}  // namespace qtb::bench
