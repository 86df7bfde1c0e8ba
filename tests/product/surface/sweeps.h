// What every routine goes through: random problems of all options. A suite includes this file behind the shapes that it
// tests: the routines of blas/routines.def whose shape has a run() by then are tested.
#pragma once

#include <string>

#include "tests/product/surface/registry.h"

namespace qtb::surface {

template <class S, class T, class R>
class Sweeps {
 public:
  explicit Sweeps(const R &routine) : routine_(routine) {}

  void rounding_problems() const { sweep(times(count), Values::rounding, {}); }
  void exact_problems() const { sweep(times(count / 3), Values::exact, {}); }

  // One or two dimensions beyond the blocks of the kernels, the others so small that the product stays below a limit.
  void large_problems() const {
    Session session(routine_.name(), {});
    for (int number = 0; number < times(6); ++number) {
      Problem p =
          draw_problem(seed_of(routine_.name(), -1 - number), number % 3 == 0 ? Values::exact : Values::rounding);
      Draw draw(p.seed);
      QtbInt *const dimensions[] = {&p.m, &p.n, &p.k};
      for (QtbInt *d : dimensions) *d = draw.one_in(2) ? draw.integer(100, 200) : draw.integer(1, 60);
      *draw.one_of(dimensions) = draw.integer(200, 300);
      constexpr QtbInt most = 1500000;
      while (p.m * p.n * p.k > most) *draw.one_of(dimensions) /= 2;
      if (draw.one_in(2)) p.kl = draw.integer(20, 150), p.ku = draw.integer(20, 150);
      if (!try_one(p, session)) return;
    }
  }

  void rounding_modes() const {
    for (const unsigned rounding : {_MM_ROUND_NEAREST, _MM_ROUND_DOWN, _MM_ROUND_UP, _MM_ROUND_TOWARD_ZERO})
      for (const unsigned flush : {unsigned{_MM_FLUSH_ZERO_OFF}, unsigned{_MM_FLUSH_ZERO_ON}})
        sweep(times(3), Values::rounding, {rounding | flush, 0}, static_cast<int>(1000 + rounding + flush));
  }

  void small_stack() const {
    // The routines that keep a tile on the stack say so; the others work on any thread.
    const std::string name = routine_.name();
    const bool two_factors = name.find("syr2k") == 1 || name.find("her2k") == 1;
    const bool tile = two_factors || name.find("syrk") == 1 || name.find("herk") == 1;
    const bool large_tile = two_factors && name[0] == 'z';
    const std::size_t stack = (large_tile ? std::size_t{384} : tile ? std::size_t{256} : std::size_t{64}) * 1024;
    sweep(times(8), Values::rounding, {0, stack}, 500000);
    // Beyond every tile.
    Session session(routine_.name(), {0, stack});
    for (int number = 0; number < times(2); ++number) {
      Problem p = draw_problem(seed_of(routine_.name(), 600000 + number), Values::rounding);
      p.m = p.n = 140 + number;
      p.k = 9;
      if (!try_one(p, session)) return;
    }
  }

 private:
  static constexpr int count = 240;  // of random problems per routine

  bool try_one(const Problem &p, Session &session) const {
    if (!session.start(p)) return false;
    run<T>(S(), routine_, p, session);
    return true;
  }
  void sweep(int cases, Values values, Surroundings surroundings, int first = 0) const {
    Session session(routine_.name(), surroundings);
    for (int number = 0; number < cases; ++number) {
      const Problem p = draw_problem(seed_of(routine_.name(), first + 2 * number + (values == Values::exact)), values);
      if (!try_one(p, session)) return;
    }
  }

  R routine_;
};

// All sweeps of a routine, if this program tests its shape.
template <ShapeName shape, class T, class R>
void register_routine(const R &routine) {
  if constexpr (requires(Problem p, Session s) { run<T>(Shape<shape>(), routine, p, s); }) {
    const Sweeps<Shape<shape>, T, R> sweeps(routine);
    const char *name = routine.name();
    register_test("results_lie_within_the_bound", name, [=] { sweeps.rounding_problems(); });
    register_test("results_in_whole_numbers_are_exact", name, [=] { sweeps.exact_problems(); });
    register_test("large_problems_lie_within_the_bound", name, [=] { sweeps.large_problems(); });
    if (routine.is_independent()) return;
    register_test("floating_point_state_is_honoured_and_kept", name, [=] { sweeps.rounding_modes(); });
    register_test("little_stack_is_enough", name, [=] { sweeps.small_stack(); });
  }
}

}  // namespace qtb::surface
