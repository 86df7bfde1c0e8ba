// A call bound to memory of its own.
#pragma once

#include <vector>

#include "bench/operand.h"
#include "calls/shapes.h"

namespace qtb::bench {

// Everything that the arguments of a call point to. Integers have 64 bits; a procedure with 32-bit integers finds its
// value in the lower half of each, which comes first.
template <calls::ShapeName shape, class T>
struct Bound {
  Bound(const calls::Problem &problem, const calls::Kind &of_routine, std::vector<QtbInt> positions)
      : index(std::move(positions)),
        kind(of_routine),
        description(calls::describe<shape>(problem, kind)),
        scalars(description) {
    calls::Shape<shape>::set_steady(scalars);
    arguments = scalars.template arguments<shape>(a.data(), b.data(), c.data(), x.data(), y.data(), index.data());
  }

  std::vector<QtbInt> index;
  std::vector<std::int32_t> narrow_index;
  calls::Kind kind;
  calls::Description description;
  calls::Scalars<T> scalars;
  Operand<T> a{description.a}, b{description.b}, c{description.c}, x{description.x}, y{description.y};
  calls::Arguments arguments;
};

}  // namespace qtb::bench
