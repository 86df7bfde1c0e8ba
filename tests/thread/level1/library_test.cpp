// The Level-1 front ends in the whole library, on made-up machines: environment, core count, tier and cache table are
// read by the services themselves, real slots are filled and real teams run.
//
// The library decides all that once per process, so that every machine gets a process of its own. Its slots are filled
// ahead with procedures that note the team and call the tier's implementation.

#include <gtest/gtest.h>
#include <omp.h>
#include <unistd.h>

#include <atomic>
#include <cstdlib>
#include <map>
#include <string>
#include <vector>

#include "blas/dispatch/slots.h"
#include "blas/thread/drivers.h"
#include "service/cpu.h"
#include "service/threads.h"
#include "tests/platform/fake.h"
#include "tests/support/tiers.h"

namespace {

using namespace qtb::test;

std::atomic<int> calls{0}, team{0};

// A slot's content that notes the team of the call.
#define QTB_NOTING(name, shape, T)                                                                          \
  QTB_FUNCTION(shape, T, noting_##name) {                                                                   \
    static constexpr QTB_RESULT_##shape(T) (*const targets[])(QTB_PARAMS_##shape(T)) = QTB_ALL_TIERS(name); \
    ++calls;                                                                                                \
    team = omp_get_num_threads();                                                                           \
    return targets[qtb_serv_cpu_detect()](QTB_ARGS(shape));                                                 \
  }
QTB_NOTING(daxpy, axpy, double)
QTB_NOTING(zaxpy, axpy, cdouble)
QTB_NOTING(ddot, dot, double)

void note_teams() {
  qtb::dispatch_slots[qtb::slot_daxpy] = reinterpret_cast<qtb::CodePointer>(&noting_daxpy);
  qtb::dispatch_slots[qtb::slot_zaxpy] = reinterpret_cast<qtb::CodePointer>(&noting_zaxpy);
  qtb::dispatch_slots[qtb::slot_ddot] = reinterpret_cast<qtb::CodePointer>(&noting_ddot);
}

// A machine of so many cores of one thread each, with a second-level cache.
struct Machine {
  std::map<std::string, std::string> environment;
  int cores = 8;
  std::uint32_t second_level_kib = 2048;
};

void set_up(const Machine &machine) {
  fake.environment = machine.environment;
  fake.processors.clear();
  for (int p = 0; p < machine.cores; ++p) {
    FakeProcessor processor;
    processor.vendor = "AnyoneElse12";
    processor.identifier = static_cast<std::uint32_t>(p);
    processor.caches = {fake_cache(1, 64, 1, 8, 64), fake_cache(2, 64, 1, 8, 64),
                        fake_cache(3, 64, 1, 16, machine.second_level_kib)};
    fake.processors.push_back(processor);
  }
  insert_processors(&fake.process, 0, machine.cores - 1);
  fake.online = fake.process;
  note_teams();
}

// Calls on whole numbers, whose results are exact, and the number of threads that ran them; -1 for a wrong result.
int daxpy_team(QtbInt n) {
  std::vector<double> x(static_cast<std::size_t>(n), 3), y(static_cast<std::size_t>(n), 1);
  const double alpha = 2;
  const QtbInt one = 1;
  qtb_blas_daxpy(&n, &alpha, x.data(), &one, y.data(), &one);
  for (const double value : y)
    if (value != 7) return -1;
  return team;
}

int zaxpy_team(QtbInt n) {
  std::vector<cdouble> x(static_cast<std::size_t>(n), {3, 1}), y(static_cast<std::size_t>(n), {1, 1});
  const cdouble alpha = {2, 0};
  const QtbInt one = 1;
  qtb_blas_zaxpy(&n, &alpha, x.data(), &one, y.data(), &one);
  for (const cdouble &value : y)
    if (value.re != 7 || value.im != 3) return -1;
  return team;
}

int ddot_team(QtbInt n) {
  std::vector<double> x(static_cast<std::size_t>(n), 3), y(static_cast<std::size_t>(n), 2);
  const QtbInt one = 1;
  const double result = qtb_blas_ddot(&n, x.data(), &one, y.data(), &one);
  return result == static_cast<double>(6 * n) ? team.load() : -1;
}

// Runs a question on a machine in a process of its own; its answer is the exit code.
#define EXPECT_ON(machine, want, question) \
  EXPECT_EXIT(                             \
      {                                    \
        alarm(seconds_per_process);        \
        set_up(machine);                   \
        std::_Exit(question);              \
      },                                   \
      testing::ExitedWithCode((want)), "")

class Level1Library : public testing::Test {
 protected:
  static constexpr unsigned seconds_per_process = 60;
  void SetUp() override {
    testing::GTEST_FLAG(death_test_style) = "threadsafe";
    if (!processor_runs(tier_sse42)) GTEST_SKIP() << "the tiers with a parallel path need SSE4.2";
  }
};

Machine machine(const char *tier, const char *threads, const char *dynamic = nullptr, int cores = 8) {
  Machine m;
  m.environment["QTB_DEBUG_CPU_TYPE"] = tier;
  m.environment["QTB_NUM_THREADS"] = threads;
  if (dynamic != nullptr) m.environment["QTB_DYNAMIC"] = dynamic;
  m.cores = cores;
  return m;
}

TEST_F(Level1Library, DynamicModeCapsAtFourThreadsAndItsAbsenceTakesAll) {
  EXPECT_ON(machine("3", "8"), 4, daxpy_team(10000));
  EXPECT_ON(machine("3", "8", "FALSE"), 8, daxpy_team(10000));
  EXPECT_ON(machine("3", "8"), 8, daxpy_team(20000));
}

TEST_F(Level1Library, DynamicModeGoesNoHigherThanTheCores) {
  EXPECT_ON(machine("3", "64", nullptr, 6), 6, daxpy_team(50000));
  EXPECT_ON(machine("3", "64", "FALSE", 6), 64, daxpy_team(50000));
}

TEST_F(Level1Library, TwoCoresAreSerialBelowTheLimitOfTwo) {
  EXPECT_ON(machine("3", "2", nullptr, 2), 1, daxpy_team(3000));
  EXPECT_ON(machine("3", "3", nullptr, 3), 3, daxpy_team(3000));
}

TEST_F(Level1Library, PairRoutineTakesTwoThreadsOrOne) {
  EXPECT_ON(machine("3", "8"), 2, zaxpy_team(100000));
  EXPECT_ON(machine("3", "8"), 1, zaxpy_team(2000));
  EXPECT_ON(machine("3", "8", "FALSE"), 1, zaxpy_team(100000));
}

TEST_F(Level1Library, SecondLevelCacheDecidesOnTierSsse3) {
  Machine large = machine("2", "8"), small = machine("2", "32", nullptr, 32);
  large.second_level_kib = 4096;
  small.second_level_kib = 2048;
  EXPECT_ON(large, 2, daxpy_team(2600));
  EXPECT_ON(small, 4, daxpy_team(2600));
  EXPECT_ON(small, 16, daxpy_team(30000));
  EXPECT_ON(small, 32, daxpy_team(35000));
}

TEST_F(Level1Library, OtherTiersOpenNoRegion) {
  for (const char *tier : {"0", "1", "4"})
    if (processor_runs(std::atoi(tier))) {
      EXPECT_ON(machine(tier, "8", "FALSE"), 1, daxpy_team(100000)) << tier;
      EXPECT_ON(machine(tier, "8", "FALSE"), 1, ddot_team(100000)) << tier;
    }
}

TEST_F(Level1Library, DotOfManyThreadsTakesItsArrayFromTheMemoryService) {
  EXPECT_ON(machine("3", "129", "FALSE"), 129, ddot_team(100000));
  EXPECT_ON(machine("3", "128", "FALSE"), 128, ddot_team(100000));
}

TEST_F(Level1Library, ShortVectorReadsNoThreadSettings) {
  EXPECT_ON(machine("3", "8"), 0, (daxpy_team(2000), static_cast<int>(fake.environment_reads.size()) - 1));
  EXPECT_ON(machine("3", "8"), 1, (daxpy_team(2001), fake.environment_reads.size() > 1 ? 1 : 0));
}

// The number of threads that ran a call from inside a region, the largest over its callers.
int team_inside_a_region(int (*question)(QtbInt)) {
  omp_set_max_active_levels(2);
  std::atomic<int> answer{0};
#pragma omp parallel num_threads(2)
#pragma omp critical
  answer = std::max<int>(answer, question(20000));
  return answer;
}

TEST_F(Level1Library, InsideAParallelRegionDynamicModeStaysOnOneThread) {
  EXPECT_ON(machine("3", "8"), 2, (team_inside_a_region(daxpy_team), static_cast<int>(calls)));
  EXPECT_ON(machine("3", "3", "FALSE"), 3, team_inside_a_region(daxpy_team));
  EXPECT_ON(machine("3", "3", "FALSE"), 6, (team_inside_a_region(ddot_team), static_cast<int>(calls)));
}

}  // namespace
