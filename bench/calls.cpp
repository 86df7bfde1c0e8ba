// What binds a routine to memory and to a procedure of a library.

#include "bench/calls.h"

#include <algorithm>
#include <memory>
#include <random>
#include <type_traits>

#include "bench/bound.h"
#include "bench/check.h"
#include "calls/level1.h"

namespace qtb::bench {
namespace {

using namespace calls;

// Positions of a sparse vector: all of y once, in a fixed random order within blocks that stay in cache.
std::vector<QtbInt> make_index(QtbInt n) {
  std::vector<QtbInt> index(static_cast<std::size_t>(n));
  for (std::size_t i = 0; i < index.size(); ++i) index[i] = static_cast<QtbInt>(i) + 1;
  std::mt19937 random(54321);
  constexpr std::ptrdiff_t block = 256;
  for (auto first = index.begin(); first < index.end();) {
    const auto last = first + std::min<std::ptrdiff_t>(block, index.end() - first);
    std::shuffle(first, last, random);
    first = last;
  }
  return index;
}

// A procedure of a library: addresses in, and a result, if any, that nobody looks at. The caller of a procedure with
// other types of pointers and another result passes the same registers.
struct Procedure {
  void *symbol;

  template <class... A>
  void operator()(A... arguments) const {
    reinterpret_cast<void (*)(std::conditional_t<true, const void *, A>...)>(symbol)(arguments...);
  }
};
// A peer's procedure that gives a complex number in registers, where this library takes the address of the result.
struct ComplexFunction {
  Procedure procedure;

  template <class... A>
  void operator()(Argument, A... arguments) const {
    procedure(arguments...);
  }
};

template <ShapeName shape, class T, class P>
Calls repeated(const std::shared_ptr<Bound<shape, T>> &bound, P procedure) {
  return [bound, procedure, call = typename Shape<shape>::Call(bound->arguments)](long count) {
    const Scalars<T> first = bound->scalars;
    for (long i = 0; i < count; ++i) {
      if constexpr (Shape<shape>::changes_scalars) {
        Scalars<T> &s = bound->scalars;
        s.alpha = first.alpha, s.beta = first.beta, s.d1 = first.d1, s.d2 = first.d2, s.x1 = first.x1;
      }
      call(procedure);
    }
  };
}

template <ShapeName shape, class T>
BoundCall bind_as(const Library &library, const Routine &routine, const Problem &problem) {
  void *symbol = library.find(std::string(routine.name));
  if (symbol == nullptr) return {};
  Problem with_index = problem;
  std::vector<QtbInt> index;
  if (routine.is_sparse) index = make_index(problem.n);
  with_index.index = index.data();  // where it is from now on, since a vector that moves keeps its memory
  const auto bound = std::make_shared<Bound<shape, T>>(with_index, routine.kind, std::move(index));
  if (!library.wide) {
    bound->narrow_index.assign(bound->index.begin(), bound->index.end());
    bound->arguments.indx = bound->narrow_index.data();
  }
  Calls repeated_calls;
  constexpr bool gives_complex =
      std::is_same_v<typename Shape<shape>::template Function<T>, QTB_FUNCTION_TYPE(cdot, T)> ||
      std::is_same_v<typename Shape<shape>::template Function<T>, QTB_FUNCTION_TYPE(cdoti, T)>;
  if (gives_complex && !library.wide)
    repeated_calls = repeated<shape, T>(bound, ComplexFunction{{symbol}});
  else
    repeated_calls = repeated<shape, T>(bound, Procedure{symbol});
  const bool correct = is_correct(Shape<shape>(), *bound, [&] { repeated_calls(1); });
  for (Operand<T> *operand : {&bound->a, &bound->b, &bound->c, &bound->x, &bound->y}) operand->fill();
  return {repeated_calls, correct};
}

// In the order of the routines.
using Binder = BoundCall (*)(const Library &, const Routine &, const Problem &);
constexpr Binder binders[] = {
#define QTB_ROUTINE(name, NAME, shape, T, route) bind_as<#shape, T>,
#include "blas/routines.def"
#undef QTB_ROUTINE
};

}  // namespace

BoundCall bind(const Library &library, const Routine &routine, const Problem &problem) {
  return binders[&routine - routines.data()](library, routine, problem);
}

}  // namespace qtb::bench
