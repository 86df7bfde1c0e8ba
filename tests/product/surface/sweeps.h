// What every routine goes through, and the main program of a suite. A suite includes this file behind the shapes that
// it tests, and registers the routines of blas/routines.def whose shape has a run() by then.
#pragma once

#include <unistd.h>
#include <csignal>
#include <cstdlib>
#include <string>

#include "tests/product/surface/session.h"

namespace qtb::surface {

// ---- counts and seeds ----

inline bool is_long() {
  const char *value = std::getenv("QTB_TEST_LONG");
  return value != nullptr && *value != '\0' && *value != '0';
}
inline int times(int count) { return is_long() ? 20 * count : count; }

// QTB_TEST_SEED starts the draws elsewhere.
inline std::uint64_t first_seed() {
  const char *value = std::getenv("QTB_TEST_SEED");
  return value != nullptr ? std::strtoull(value, nullptr, 10) : 20;
}

// A seed of its own for each routine and case.
inline std::uint64_t seed_of(const char *routine, int number) {
  std::uint64_t seed = first_seed() * 1000003;
  for (const char *c = routine; *c != '\0'; ++c) seed = seed * 131 + static_cast<unsigned char>(*c);
  return seed * 1000003 + static_cast<std::uint64_t>(number);
}

// ---- the sweeps ----

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
    const bool tile =
        name.find("syr2k") == 1 || name.find("her2k") == 1 || name.find("syrk") == 1 || name.find("herk") == 1;
    sweep(times(8), Values::rounding, {0, (tile ? std::size_t{256} : std::size_t{64}) * 1024}, 500000);
  }

 private:
  // Level 3 has more work in a case.
  static constexpr int count = 150;

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

template <class Body>
void register_test(const char *suite, const char *name, Body body) {
  class Test : public testing::Test {
   public:
    explicit Test(Body b) : body_(b) {}
    void TestBody() override { body_(); }

   private:
    Body body_;
  };
  testing::RegisterTest(suite, name, nullptr, nullptr, __FILE__, __LINE__,
                        [body]() -> testing::Test * { return new Test(body); });
}

// All sweeps of a routine, if this program tests its shape.
template <ShapeName shape, class T, class R>
void register_sweeps(const R &routine) {
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

// ---- the program ----

// Names the problem that trapped.
inline void on_trap(int signal) {
  const auto put = [](const char *text) { (void)!write(STDERR_FILENO, text, std::strlen(text)); };
  put("\ntrapped in ");
  put(current_problem);
  put("\n");
  std::signal(signal, SIG_DFL);
  std::raise(signal);
}

inline void report() {
  long cases = 0;
  for (const auto &[routine, tally] : tallies()) {
    std::printf("%-8s %7ld cases, worst error / bound %.3f\n", routine.c_str(), tally.cases, tally.worst);
    cases += tally.cases;
  }
  if (cases == 0) return;
  const char *tier = std::getenv("QTB_DEBUG_CPU_TYPE");
  std::printf("tier %s: %ld cases from seed %llu\n", tier != nullptr ? tier : "(chosen)", cases,
              static_cast<unsigned long long>(first_seed()));
}

}  // namespace qtb::surface
