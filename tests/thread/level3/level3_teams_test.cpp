// The Level-3 routines beside gemm from their front ends down, on real teams of made-up machines, one for each family
// of kernels: random problems of all options, of sizes around what a team takes, against the oracle. Memory is
// recorded, and runs out where a test says so.
//
// ctest sets a thread limit of 11, so that the largest teams are smaller than asked for.

#include <omp.h>

#include "blas/thread/drivers.h"
#include "tests/product/surface/level3_shapes.h"
#include "tests/product/surface/registry.h"
#include "tests/thread/level3/gemm_machines.h"

namespace qtb::surface {
namespace {

constexpr int teams = 16;
constexpr std::size_t little_stack = 256 * 1024;

// Random options, and sizes from which on a team of this size has shares and tiles of its own.
Problem team_problem(const char *routine, int team, int number) {
  Problem p =
      draw_problem(seed_of(routine, 1000 * number + team), (team + number) % 2 == 0 ? Values::exact : Values::rounding);
  Draw draw(p.seed);
  p.m = draw.integer(1, 45);
  p.n = 8 * team + draw.integer(0, 20);
  p.k = draw.integer(0, 12);
  if (draw.one_in(2)) std::swap(p.m, p.n);
  return p;
}

template <class S, class T, class R>
class Teams {
 public:
  explicit Teams(const R &routine) : routine_(routine) {}

  void every_size_of_team() const {
    Session session(routine_.name(), {});
    for (int team = 1; team <= teams; ++team)
      for (int number = 0; number < times(1); ++number) one(session, team, number);
  }

  void inside_regions() const {
    for (const int levels : {1, 2}) {
      omp_set_max_active_levels(levels);
#pragma omp parallel num_threads(3)
#pragma omp critical
      {
        Session session(routine_.name(), {});
        one(session, 3, 100 * levels + omp_get_thread_num());
      }
    }
    omp_set_max_active_levels(1);
  }

  void little_stack_of_the_caller() const {
    Session session(routine_.name(), {0, little_stack});
    for (const int team : {2, 5}) one(session, team, 10);
  }

  void memory_runs_out() const {
    Session session(routine_.name(), {});
    for (const long first : {0, 1, 2, 4}) {
      test::recorded_memory.forget();
      test::recorded_memory.fails = [=](long number, int, int) { return number >= first; };
      one(session, 4, 20);
      test::recorded_memory.forget();
      test::recorded_memory.fails = [=](long number, int, int) { return number == first; };
      one(session, 4, 20);
    }
    test::recorded_memory.fails = {};
    EXPECT_TRUE(test::recorded_memory.held.empty());
  }

 private:
  void one(Session &session, int team, int number) const {
    omp_set_num_threads(team);
    const Problem p = team_problem(routine_.name(), team, number);
    if (session.start(p)) run<T>(S(), routine_, p, session);
  }

  R routine_;
};

template <ShapeName shape, class T, class R>
void register_routine(const R &routine) {
  if constexpr (Shape<shape>::level == 3) {
    if (std::string_view(routine.name()).substr(1) == "gemm") return;
    const Teams<Shape<shape>, T, R> tests(routine);
    const char *name = routine.name();
    register_test("every_size_of_team_computes_the_result", name, [=] { tests.every_size_of_team(); });
    register_test("inside_regions_of_the_caller", name, [=] { tests.inside_regions(); });
    register_test("little_stack_of_the_caller_is_enough", name, [=] { tests.little_stack_of_the_caller(); });
    register_test("where_memory_runs_out_the_result_is_the_same", name, [=] { tests.memory_runs_out(); });
  }
}

}  // namespace
}  // namespace qtb::surface

int main(int argc, char **argv) {
  using namespace qtb::surface;
  testing::InitGoogleTest(&argc, argv);
#define QTB_TEAMS_SLOT(name, shape, T)
#define QTB_TEAMS_CHECK_SLOT(name, shape, T)
#define QTB_TEAMS_DRIVER(name, shape, T)
#define QTB_TEAMS_CHECK_DRIVER(name, shape, T) \
  register_routine<#shape, T>(                 \
      Routine<QTB_FUNCTION_TYPE(shape, T)>(#name, qtb::calls::kind_of<T>(#name), &qtb_blas_##name, &qtb_blas_##name));
#define QTB_ROUTINE(name, NAME, shape, T, route) QTB_TEAMS_##route(name, shape, T)
#include "blas/routines.def"
#undef QTB_ROUTINE
  std::signal(SIGSEGV, on_trap);
  std::signal(SIGFPE, on_trap);
  std::signal(SIGILL, on_trap);
  const int result = RUN_ALL_TESTS();
  report();
  return result;
}
