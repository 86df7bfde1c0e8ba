// The parallel GEMM and the OpenMP runtime, on the real operating system: teams smaller than asked for, many callers,
// callers inside regions, forked children, many calls. A suite of each tier, told by QTB_DEBUG_CPU_TYPE; what the
// environment decides once per process runs in a further process of this program.

#include <gtest/gtest.h>
#include <malloc.h>
#include <omp.h>
#include <unistd.h>

#include <atomic>
#include <cstdlib>
#include <map>
#include <string>
#include <vector>

#include "service/memory.h"
#include "tests/product/program.h"
#include "tests/support/child.h"
#include "tests/support/run.h"
#include "tests/support/together.h"
#include "tests/thread/level3/gemm_problem.h"

#if defined(__SANITIZE_THREAD__) || defined(__SANITIZE_ADDRESS__)
#define QTB_TEST_WATCHED 1
#elif defined(__has_feature)
#if __has_feature(thread_sanitizer) || __has_feature(address_sanitizer)
#define QTB_TEST_WATCHED 1
#endif
#endif

namespace qtb::test {
namespace {

constexpr unsigned most_seconds = 250;  // a deadlock ends here

class Process : public testing::Environment {
  void SetUp() override {
    if (!processor_runs_forced_tier()) std::exit(exit_skipped);
    alarm(most_seconds);
    qtb_serv_prepare_fork();
  }
};
const testing::Environment *const process = testing::AddGlobalTestEnvironment(new Process);

// ---- Calls, checked ----

struct Size {
  QtbInt m, n, k;
};

template <class T>
GemmProblem<T> problem(Size size, std::uint64_t seed, double beta = 2) {
  constexpr char letters[] = {'N', 'T', 'C'};
  GemmShape s;
  s.transa = letters[seed % 3], s.transb = letters[seed / 3 % 3];
  s.m = size.m, s.n = size.n, s.k = size.k;
  s.whole_numbers = true;
  s.seed = seed;
  return GemmProblem<T>(s, number<T>(2, -1), number<T>(beta));
}

template <class T>
void exact_call(Size size, std::uint64_t seed) {
  GemmProblem<T> p = problem<T>(size, seed);
  call(p);
  p.expect_exact();
}

// One size of each kind: a square, one that is wide, one of many rows and few columns, one with a shared A on 8 threads
// of the tier that has it, and one with own panels where complex types have them.
constexpr Size sizes[] = {{64, 60, 40}, {33, 190, 20}, {190, 32, 20}, {203, 140, 201}};

void calls_of_every_type(std::uint64_t seed) {
  for (const Size &size : sizes) {
    exact_call<float>(size, seed);
    exact_call<double>(size, seed + 1);
    exact_call<cfloat>(size, seed + 2);
    exact_call<cdouble>(size, seed + 3);
    seed += 4;
  }
}

// ---- A runtime that delivers less ----

TEST(GemmTeams, EverySizeOfTeam) {
  omp_set_dynamic(0);
  for (int team = 1; team <= 9; ++team) {
    omp_set_num_threads(team);
    calls_of_every_type(static_cast<std::uint64_t>(team));
  }
}

TEST(GemmTeams, RuntimeThatAdjustsTeams) {
  omp_set_dynamic(1);
  for (const int team : {3, 8, 25}) {
    omp_set_num_threads(team);
    calls_of_every_type(1);
  }
  omp_set_dynamic(0);
}

// Runs tests of this program in a process with another environment.
void in_process(const std::string &tests, const std::map<std::string, std::string> &environment) {
  RunOptions options;
  options.environment = environment;
  options.environment["GTEST_TOTAL_SHARDS"] = options.environment["GTEST_SHARD_INDEX"] = "";
  options.seconds = most_seconds;
  const Run run =
      run_program({"/proc/self/exe", "--gtest_also_run_disabled_tests", "--gtest_filter=" + tests}, options);
  EXPECT_EQ(run.status, 0) << run.output;
  EXPECT_NE(run.output.find("[  PASSED  ]"), std::string::npos) << run.output;
}

TEST(GemmTeams, DISABLED_UnderAThreadLimit) {
  for (const int team : {2, 3, 4, 8, 25}) {
    omp_set_num_threads(team);
    calls_of_every_type(2);
  }
}

// A limit of 1 makes the main region a team of one behind a scaling pass that has its own.
TEST(GemmTeams, ThreadLimitBelowWhatIsAskedFor) {
  for (const char *limit : {"1", "2", "3", "5"})
    in_process("GemmTeams.DISABLED_UnderAThreadLimit", {{"OMP_THREAD_LIMIT", limit}, {"QTB_DYNAMIC", "FALSE"}});
}

TEST(GemmTeams, DISABLED_OfTheNumberInTheEnvironment) { calls_of_every_type(3); }

TEST(GemmTeams, NumberOfThreadsFromTheEnvironment) {
  for (const char *threads : {"1", "2", "3", "4", "8"})
    in_process("GemmTeams.DISABLED_OfTheNumberInTheEnvironment",
               {{"QTB_NUM_THREADS", threads}, {"QTB_DYNAMIC", "FALSE"}});
}

// ---- Many callers ----

TEST(GemmTeams, EightThreadsOfTheApplicationCallAtOnce) {
  on_threads(8, [](int caller) {
    omp_set_num_threads(2 + caller % 3);
    calls_of_every_type(static_cast<std::uint64_t>(10 * caller));
  });
}

void from_inside_a_region(int levels) {
  omp_set_max_active_levels(levels);
  omp_set_num_threads(3);
#pragma omp parallel num_threads(3)
  {
    omp_set_num_threads(3);
    calls_of_every_type(static_cast<std::uint64_t>(10 * omp_get_thread_num()));
  }
  omp_set_max_active_levels(1);
}

TEST(GemmTeams, InsideARegionWithoutNestingTeamsAreOfOne) { from_inside_a_region(1); }
TEST(GemmTeams, InsideARegionTeamsAreNested) { from_inside_a_region(2); }
TEST(GemmTeams, InsideNestedRegions) {
  omp_set_max_active_levels(3);
#pragma omp parallel num_threads(2)
#pragma omp parallel num_threads(2)
  {
    omp_set_num_threads(2);
    exact_call<double>({64, 60, 40}, 5);
    exact_call<cdouble>({64, 60, 40}, 6);
  }
  omp_set_max_active_levels(1);
}

TEST(GemmTeams, DISABLED_InsideARegion) {
  from_inside_a_region(1);
  from_inside_a_region(2);
}
TEST(GemmTeams, InsideARegionInDynamicMode) {
  in_process("GemmTeams.DISABLED_InsideARegion", {{"QTB_DYNAMIC", ""}, {"QTB_NUM_THREADS", "4"}});
}

// ---- Forked children ----

TEST(GemmTeams, ForkedChildComputesOnItsOneThread) {
  omp_set_num_threads(4);
  calls_of_every_type(1);
  ASSERT_GE(threads_of_this_process(), 4);
  for (int i = 0; i < 5; ++i)
    in_child([] {
      const int before = threads_of_this_process();
      omp_set_num_threads(4);
      calls_of_every_type(2);
      EXPECT_EQ(threads_of_this_process(), before);
      in_child([] { calls_of_every_type(3); });
    });
  calls_of_every_type(4);
}

// ---- Many calls ----

#ifndef QTB_TEST_WATCHED
// Sanitizers have allocators of their own, which tell nothing here.
TEST(GemmTeams, TenThousandCallsLeakNothing) {
  omp_set_num_threads(4);
  GemmProblem<float> s = problem<float>({40, 40, 20}, 1, 1);
  GemmProblem<double> d = problem<double>({40, 40, 20}, 2, 1);
  GemmProblem<cfloat> c = problem<cfloat>({70, 64, 20}, 3, 1);
  GemmProblem<cdouble> z = problem<cdouble>({150, 64, 20}, 4, 1);
  GemmProblem<double> shared_a = problem<double>({203, 140, 201}, 5, 1);
  // The teams stay as large as they are, since a thread that comes has a list of buffers of its own.
  const auto small_calls = [&] { call(s), call(d), call(c), call(z); };
  const auto held = [] { return mallinfo2().uordblks + mallinfo2().hblkhd; };
  for (int i = 0; i < 100; ++i) small_calls();
  std::size_t before = held();
  for (int i = 0; i < 2500; ++i) small_calls();
  EXPECT_LT(held(), before + 10000) << "a byte a call";

  // Whichever thread comes first allocates the shared panels and keeps them: at most one set of them for each thread.
  constexpr std::size_t sets = 64 << 20;
  omp_set_num_threads(8);
  for (int i = 0; i < 10; ++i) call(shared_a);
  before = held();
  for (int i = 0; i < 400; ++i) call(shared_a);
  EXPECT_LT(held(), before + sets) << "a set of panels for every few calls";
}
#endif

}  // namespace
}  // namespace qtb::test
