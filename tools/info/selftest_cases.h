// The self-test of the routines of some shapes: a source includes the tests of its shapes (tests/product/surface) and
// then this file, and defines its part with QTB_SELFTEST_PART.
#pragma once

#include <algorithm>
#include <cstdio>
#include <string>

#include "tests/product/surface/session.h"
#include "tools/info/selftest.h"

namespace qtb::info {

using calls::ShapeName;
using surface::Draw;
using surface::Problem;
using surface::Values;

// A seed of its own for each routine and case, the same on every machine.
inline std::uint64_t seed_of(const char *routine, int number) {
  std::uint64_t seed = 15;
  for (const char *c = routine; *c != '\0'; ++c) seed = seed * 131 + static_cast<unsigned char>(*c);
  return seed * 1000003 + static_cast<std::uint64_t>(number);
}

// Sizes at which several blocks of a kernel take part, and where threads are asked for, several threads.
inline Problem large_problem(const char *routine, int number) {
  Problem p = surface::draw_problem(seed_of(routine, -1 - number), number % 2 == 0 ? Values::rounding : Values::exact);
  Draw draw(p.seed);
  QtbInt *const dimensions[] = {&p.m, &p.n, &p.k};
  for (QtbInt *d : dimensions) *d = draw.integer(70, 110);
  constexpr QtbInt most = 600000;
  while (p.m * p.n * p.k > most) *draw.one_of(dimensions) -= 8;
  return p;
}

template <ShapeName shape, class T, class R>
void test_routine(const R &routine, const Plan &plan) {
  surface::Session session(routine.name(), {});
  const auto try_one = [&](const Problem &p) {
    if (session.start(p)) run<T>(calls::Shape<shape>(), routine, p, session);
  };
  for (int number = 0; number < plan.small; ++number)
    try_one(surface::draw_problem(seed_of(routine.name(), number), number % 3 == 0 ? Values::exact : Values::rounding));
  for (int number = 0; number < plan.large; ++number) try_one(large_problem(routine.name(), number));
}

// Tests a routine if this source has the tests of its shape.
template <ShapeName shape, class T, class Function>
void test_if_known(const char *name, const char *upper_name, const Library &library, const Plan &plan, Result &result) {
  if constexpr (requires(Problem p, surface::Session s, surface::Routine<Function> r) {
                  run<T>(calls::Shape<shape>(), r, p, s);
                }) {
    const calls::Kind kind = calls::kind_of<T>(name);
    ++result.routines;
    if (library.is_published()) {
      const auto lower = reinterpret_cast<Function *>(library.symbol(name));
      const auto upper = reinterpret_cast<Function *>(library.symbol(upper_name));
      if (lower == nullptr || upper == nullptr) return result.fail(name, "the library lacks it");
      test_routine<shape, T>(surface::Routine<Function>(name, kind, lower, upper), plan);
    } else {
      void *const independent = library.symbol((std::string(name) + "_").c_str());
      if (independent == nullptr) return void(--result.routines);
      test_routine<shape, T>(surface::Routine<Function>(name, kind, independent), plan);
    }
  }
}

#define QTB_SELFTEST_ROUTINE(name, NAME, shape, T, route) \
  qtb::info::test_if_known<#shape, T, QTB_FUNCTION_TYPE(shape, T)>(#name, #NAME, library, plan, result);

}  // namespace qtb::info
